// Which keys a partial ticket carries: exact keys, and prefixes that are written with a "*" at the end. Plain
// values with no errors but std::bad_alloc. One thread at a time; many may ask at once while none changes
// anything.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/PATTERN_INDEX.h"
#include <cstddef>
#include <functional>
#include <set>
#include <string>
#include <string_view>

class SETMULTIPAR_LIST;

// Prefixes, of which none begins another: each stands for all keys that begin with it.
class COMGUI_EXPORT STRINGPREFIXSET
{
public:
    // Bytewise, but only as far as the shorter text goes: a text and its beginning count as one. That is no
    // strict weak order of all texts, as "a" is the same as "ab" and as "ac". It is one among the elements.
    struct LESS
    {
        using is_transparent = void;

        // In brackets, since some systems have a macro of that name.
        static std::size_t(min)(std::size_t left, std::size_t right) { return left < right ? left : right; }

        bool operator()(std::string_view left, std::string_view right) const
        {
            std::size_t const size = (min)(left.size(), right.size());
            return left.substr(0, size) < right.substr(0, size);
        }
    };
    using const_iterator = std::set<std::string, LESS>::const_iterator;

    // The element that begins text, or is text; end() if there is none.
    const_iterator find(std::string const& text) const;

    // Whether there is one, for a text that is no std::string.
    bool Covers(std::string_view text) const;

    const_iterator begin() const { return m_prefixes.begin(); }
    const_iterator end() const { return m_prefixes.end(); }
    std::size_t size() const { return m_prefixes.size(); }

    // Nothing is added if an element begins text already. Of the elements that text begins one goes, the
    // lowest; if others remain, text is not added either.
    void insert(std::string const& text);

    // Erases the element that begins text, however much shorter it is. How many went: 0 or 1.
    std::size_t erase(std::string const& text);

    bool empty() const { return m_prefixes.empty(); }
    void clear() { m_prefixes.clear(); }

private:
    std::set<std::string, LESS> m_prefixes;
};

class COMGUI_EXPORT PARTIAL_MODE
{
public:
    // keys: a table of patterns as set() takes it, or null for none.
    explicit PARTIAL_MODE(char const* const* keys);
    PARTIAL_MODE(PARTIAL_MODE const& other);
    PARTIAL_MODE(PARTIAL_MODE&& other) noexcept;
    PARTIAL_MODE& operator=(PARTIAL_MODE const& other);
    PARTIAL_MODE& operator=(PARTIAL_MODE&& other) noexcept;
    ~PARTIAL_MODE();

    // Adds the patterns of the table, which a null pointer ends. If the first one is the empty text, erases
    // those behind it instead. Null clears.
    void set(char const* const* keys);
    void clear();

    // Adds or erases one pattern. The empty text adds none, and "*" adds the one that selects every key. What
    // goes when a prefix is erased is the one that covers it, however much shorter that is.
    void insert(std::string key);
    void erase(std::string key);

    // Whether key is the pattern of a prefix; if so, takes off the "*" at its end.
    static bool wildcard(std::string& key);

    // Whether there is any pattern. Without one, a whole ticket is meant.
    bool partial() const { return !m_keys.empty() || !m_prefixes.empty(); }

    // Whether a pattern selects that key. Without one, none does.
    bool multi_contains(std::string const& key) const;

    // The same for a key that is no std::string.
    bool Selects(std::string_view key) const;

private:
    // Of both below. It stands first, so that an assignment drops it before they change.
    comgui::detail::PATTERN_INDEX m_index;
    std::set<std::string, std::less<>> m_keys;
    STRINGPREFIXSET m_prefixes;
};

// Adds the parameters that mode selects to a list, in the course of one walk; mode and list must outlive it.
class COMGUI_EXPORT PARTIAL_COLLECT_ACTION
{
public:
    PARTIAL_COLLECT_ACTION(SETMULTIPAR_LIST* list, PARTIAL_MODE const& mode);

    // The action of the walk; action: the PARTIAL_COLLECT_ACTION. Passes over records that are no parameters.
    // Always true: the walk goes on.
    static bool CollectAction(void* action, char const* key, PARAM_TYPE type, void const* value, int pos);

    // Adds one value with the list's ySetParameter if mode selects its key. Always 1.
    int SetParameter(char const* key, PARAM_TYPE type, void const* value, int pos);

private:
    SETMULTIPAR_LIST* m_list;
    PARTIAL_MODE const* m_mode;
};

// The same for the parameters that mode does not select.
class COMGUI_EXPORT FILTERED_PARTIAL_COLLECT_ACTION
{
public:
    FILTERED_PARTIAL_COLLECT_ACTION(SETMULTIPAR_LIST* list, PARTIAL_MODE const& mode);

    static bool CollectAction(void* action, char const* key, PARAM_TYPE type, void const* value, int pos);
    int SetParameter(char const* key, PARAM_TYPE type, void const* value, int pos);

private:
    SETMULTIPAR_LIST* m_list;
    PARTIAL_MODE const* m_mode;
};
