// Keeps each distinct text once and gives out its address, so that equal texts share one. An address stays
// valid until clear() or the end of the cache. Running out of memory throws std::bad_alloc. One thread at a
// time.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/foundation/short_copy.h"
#include "comgui/ticket/VALUE_INDEX.h"
#include <string_view>

namespace comgui::detail
{
struct TEXT
{
    using VALUE = std::string_view;  // without zero bytes
    struct ENTRY
    {
        char const* text;
        std::size_t size;
        HASH hash;
    };

    static HASH Hash(VALUE text, HASH seed) { return HashOfBytes(text.data(), text.size(), seed); }
    static HASH HashOf(ENTRY const& entry, HASH) { return entry.hash; }
    static bool Same(ENTRY const& entry, VALUE text)
    {
        return entry.size == text.size() && SameBytes(entry.text, text.data(), text.size());
    }
    static ENTRY* Make(void* place, VALUE text, HASH hash, POOL& pool)
    {
        char* const copy = static_cast<char*>(pool.Take(text.size() + 1, 1));
        Copy(copy, text.data(), text.size());
        copy[text.size()] = '\0';
        return new (place) ENTRY{copy, text.size(), hash};
    }
};
}  // namespace comgui::detail

class COMGUI_EXPORT STRINGCACHE
{
public:
    STRINGCACHE() : m_texts(m_ownPool) {}

    // Takes all memory from that pool, where it stays when the cache is cleared.
    explicit STRINGCACHE(comgui::detail::POOL& pool) : m_texts(pool) {}

    // Replaces text by the address of the cached copy, and returns that address. Null stays null.
    char const* operator()(char const*& text) { return text = (*this)[text]; }

    // The same, with the argument left alone.
    char const* operator[](char const* text) { return text ? m_texts.Keep(text).text : nullptr; }

    // The same for a text, not null, that holds no zero byte; none need follow.
    char const* Keep(std::string_view text) { return m_texts.Keep(text).text; }

    // Drops all texts; every address given out dies.
    void clear()
    {
        m_texts.Clear();
        m_ownPool.Clear();
    }

private:
    comgui::detail::POOL m_ownPool;
    comgui::detail::VALUE_INDEX<comgui::detail::TEXT> m_texts;
};
