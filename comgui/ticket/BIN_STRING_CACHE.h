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
    struct ENTRY
    {
        BIN_STRING view;
        HASH hash;
    };

    static HASH Hash(VALUE value, HASH seed)
    {
        return HashOfBytes(static_cast<char const*>(value.data), value.size, seed);
    }
    static HASH HashOf(ENTRY const& entry, HASH) { return entry.hash; }
    static bool Same(ENTRY const& entry, VALUE value)
    {
        return entry.view.size == value.size && SameBytes(static_cast<char const*>(entry.view.data),
                                                          static_cast<char const*>(value.data), value.size);
    }
    static ENTRY* Make(void* place, VALUE value, HASH hash, POOL& pool)
    {
        if (value.size != 0)
            value.data = std::memcpy(pool.Take(value.size, 1), value.data, value.size);
        return new (place) ENTRY{value, hash};
    }
};
}  // namespace comgui::detail

class BIN_STRING_CACHE
{
public:
    BIN_STRING_CACHE() : m_values(m_ownPool) {}

    // Takes all memory from that pool, where it stays when the cache is cleared.
    explicit BIN_STRING_CACHE(comgui::detail::POOL& pool) : m_values(pool) {}

    // Replaces value by the address of the cached copy, and returns that address. Null stays null.
    BIN_STRING const* operator()(BIN_STRING const*& value) { return value ? value = Keep(*value) : nullptr; }

    // The address of the cached copy.
    BIN_STRING const* Keep(BIN_STRING value)
    {
        return &m_values.Keep(value.valid() ? value : BIN_STRING()).view;
    }

    // Drops all values; every address given out dies.
    void clear()
    {
        m_values.Clear();
        m_ownPool.Clear();
    }

private:
    comgui::detail::POOL m_ownPool;
    comgui::detail::VALUE_INDEX<comgui::detail::BINARY> m_values;
};
