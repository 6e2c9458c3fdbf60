// Keeps each distinct text once and gives out its address, so that equal texts share one. An address stays
// valid until clear() or the end of the cache. Running out of memory throws std::bad_alloc. One thread at a
// time.
#pragma once

#include "comgui/foundation/export.h"
#include <memory>
#include <string_view>

class COMGUI_EXPORT STRINGCACHE
{
public:
    STRINGCACHE() noexcept;
    STRINGCACHE(STRINGCACHE const&) = delete;
    STRINGCACHE& operator=(STRINGCACHE const&) = delete;
    ~STRINGCACHE();

    // Replaces text by the address of the cached copy, and returns that address. Null stays null.
    char const* operator()(char const*& text) { return text = (*this)[text]; }

    // The same, with the argument left alone.
    char const* operator[](char const* text) { return text ? Keep(text) : nullptr; }

    // The same for a text, not null, that holds no zero byte; none need follow.
    char const* Keep(std::string_view text);

    // Drops all texts; every address given out dies.
    void clear();

private:
    struct VALUES;
    std::unique_ptr<VALUES> m_values;  // null until the first text comes
};
