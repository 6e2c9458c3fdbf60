// Keeps each distinct binary string once and gives out the address of a BIN_STRING of the copy. All that are
// not valid are one, with a null view. Otherwise as STRINGCACHE.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/BIN_STRING.h"
#include <memory>

class COMGUI_EXPORT BIN_STRING_CACHE
{
public:
    BIN_STRING_CACHE() noexcept;
    BIN_STRING_CACHE(BIN_STRING_CACHE const&) = delete;
    BIN_STRING_CACHE& operator=(BIN_STRING_CACHE const&) = delete;
    ~BIN_STRING_CACHE();

    // Replaces value by the address of the cached copy, and returns that address. Null stays null.
    BIN_STRING const* operator()(BIN_STRING const*& value) { return value ? value = Keep(*value) : nullptr; }

    // The address of the cached copy.
    BIN_STRING const* Keep(BIN_STRING value);

    // Drops all values; every address given out dies.
    void clear();

private:
    struct VALUES;
    std::unique_ptr<VALUES> m_values;  // null until the first value comes
};
