// Keeps each distinct text once and gives out its address, so that equal texts share one. An address stays
// valid until clear() or the end of the cache. Running out of memory throws std::bad_alloc. One thread at a
// time.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/VALUE_INDEX.h"
#include <string_view>

namespace comgui::detail
{
struct TEXT
{
    using VALUE = std::string_view;  // without zero bytes
    using STORED = char;

    static HASH Hash(VALUE text, HASH seed) { return HashOfBytes(text.data(), text.size(), seed); }
    static bool Same(char const& stored, VALUE text)
    {
        return std::strncmp(&stored, text.data(), text.size()) == 0 && (&stored)[text.size()] == '\0';
    }
    static char const* Store(POOL& pool, VALUE text)
    {
        char* const place = static_cast<char*>(pool.Take(text.size() + 1, 1));
        std::memcpy(place, text.data(), text.size());
        place[text.size()] = '\0';
        return place;
    }
};
}  // namespace comgui::detail

class COMGUI_EXPORT STRINGCACHE
{
public:
    // Replaces text by the address of the cached copy, and returns that address. Null stays null.
    char const* operator()(char const*& text) { return text = (*this)[text]; }

    // The same, with the argument left alone.
    char const* operator[](char const* text) { return text ? m_texts.Keep(text) : nullptr; }

    // The same for bytes that no zero byte need follow. The text ends at the first one within.
    char const* Keep(std::string_view bytes) { return m_texts.Keep(bytes.substr(0, bytes.find('\0'))); }

    // Drops all texts; every address given out dies.
    void clear() { m_texts.Clear(); }

private:
    comgui::detail::VALUE_INDEX<comgui::detail::TEXT> m_texts;
};
