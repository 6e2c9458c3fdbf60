// Hashes of numbers and bytes, for tables in memory: they differ between machines and, by their seed, between
// runs.
#pragma once

#include "comgui/foundation/short_compare.h"
#include <cstddef>
#include <cstdint>

namespace comgui::detail
{
using HASH = std::uint64_t;

// Both halves of the product, so that every bit of either factor counts.
inline HASH Mix(HASH left, HASH right)
{
    __extension__ using WIDE = unsigned __int128;
    WIDE const product = static_cast<WIDE>(left) * right;
    return static_cast<HASH>(product) ^ static_cast<HASH>(product >> 64);
}

inline HASH HashOfNumber(HASH bits, HASH seed) { return Mix(bits ^ seed, 0x9E3779B97F4A7C15); }

// Sixteen bytes a step; the last step looks at the last bytes, which may overlap those before.
inline HASH HashOfBytes(char const* bytes, std::size_t size, HASH seed)
{
    HASH hash = seed ^ size * 0xD6E8FEB86659FD93;
    HASH head = 0;
    HASH tail = 0;
    if (size >= 8)
    {
        char const* const last = bytes + size - 8;
        for (; size > 16; size -= 16, bytes += 16)
            hash = Mix(LoadWord<std::uint64_t>(bytes) ^ seed, LoadWord<std::uint64_t>(bytes + 8) ^ hash);
        head = LoadWord<std::uint64_t>(size >= 8 ? bytes : last);
        tail = LoadWord<std::uint64_t>(last);
    }
    else if (size >= 4)
    {
        head = LoadWord<std::uint32_t>(bytes);
        tail = LoadWord<std::uint32_t>(bytes + size - 4);
    }
    else if (size > 0)
    {
        head = LoadWord<unsigned char>(bytes);
        tail = LoadWord<unsigned char>(bytes + size / 2) << 8 | LoadWord<unsigned char>(bytes + size - 1);
    }
    return Mix(Mix(head ^ seed, tail ^ hash), 0x9E3779B97F4A7C15);
}
}  // namespace comgui::detail
