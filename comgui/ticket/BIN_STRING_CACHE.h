// Keeps each distinct binary string once and gives out the address of a BIN_STRING of the copy. All that are
// not valid are one, with a null view. Otherwise as STRINGCACHE.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/VALUE_INDEX.h"
#include <new>

namespace comgui::detail
{
struct BINARY
{
    using VALUE = BIN_STRING;  // of size 0 if it is not valid
    using STORED = BIN_STRING;

    static HASH Hash(VALUE value, HASH seed)
    {
        return HashOfBytes(static_cast<char const*>(value.data), value.size, seed);
    }
    static bool Same(STORED const& stored, VALUE value)
    {
        return stored.size == value.size &&
               (value.size == 0 || std::memcmp(stored.data, value.data, value.size) == 0);
    }
    static STORED const* Store(POOL& pool, VALUE value)
    {
        BIN_STRING* const stored = new (pool.Take(sizeof(BIN_STRING), alignof(BIN_STRING))) BIN_STRING;
        if (value.size != 0)
        {
            stored->data = std::memcpy(pool.Take(value.size, 1), value.data, value.size);
            stored->size = value.size;
        }
        return stored;
    }
};
}  // namespace comgui::detail

class BIN_STRING_CACHE
{
public:
    // Replaces value by the address of the cached copy, and returns that address. Null stays null.
    BIN_STRING const* operator()(BIN_STRING const*& value) { return value ? value = Keep(*value) : nullptr; }

    // The address of the cached copy.
    BIN_STRING const* Keep(BIN_STRING value) { return m_values.Keep(value.valid() ? value : BIN_STRING()); }

    // Drops all values; every address given out dies.
    void clear() { m_values.Clear(); }

private:
    comgui::detail::VALUE_INDEX<comgui::detail::BINARY> m_values;
};
