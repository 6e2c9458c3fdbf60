// Keeps each distinct text once and gives out its address, so that equal texts share one. An address stays
// valid until clear() or the end of the cache. One thread at a time.
#pragma once

#include "comgui/foundation/export.h"
#include <functional>
#include <set>
#include <string>

class COMGUI_EXPORT STRINGCACHE
{
public:
    // Replaces text by the address of the cached copy, and returns that address. Null stays null.
    char const* operator()(char const*& text);

    // The same, with the argument left alone.
    char const* operator[](char const* text);

    // Drops all texts; every address given out dies.
    void clear();

private:
    std::set<std::string, std::less<>> texts;
};
