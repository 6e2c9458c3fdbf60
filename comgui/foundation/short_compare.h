// Loads, compares and searches a few bytes in line, as short_copy.h copies them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace comgui::detail
{
template <typename WORD>
std::uint64_t LoadWord(char const* from)
{
    WORD word;
    std::memcpy(&word, from, sizeof word);
    return word;
}

// From WORD's size up to twice that.
template <typename WORD>
bool SameEnds(char const* left, char const* right, std::size_t size)
{
    std::size_t const last = size - sizeof(WORD);
    return LoadWord<WORD>(left) == LoadWord<WORD>(right) &&
           LoadWord<WORD>(left + last) == LoadWord<WORD>(right + last);
}

// Texts of one ticket tend to begin alike, so the ends of longer ones are compared first.
inline bool SameBytes(char const* left, char const* right, std::size_t size)
{
    using WORD = std::uint64_t;
    if (size > 2 * sizeof(WORD))
    {
        std::size_t const last = size - sizeof(WORD);
        return LoadWord<WORD>(left + last) == LoadWord<WORD>(right + last) &&
               std::memcmp(left, right, last) == 0;
    }
    if (size >= sizeof(WORD))
        return SameEnds<WORD>(left, right, size);
    if (size >= sizeof(std::uint32_t))
        return SameEnds<std::uint32_t>(left, right, size);
    if (size >= sizeof(std::uint16_t))
        return SameEnds<std::uint16_t>(left, right, size);
    return size == 0 || *left == *right;
}

// Whether a byte of the word is 0. To take 1 from every byte borrows from the next one only where a byte is
// 0.
template <typename WORD>
bool HoldsZero(char const* from)
{
    auto const word = LoadWord<WORD>(from);
    constexpr std::uint64_t Ones = 0x0101010101010101 & static_cast<WORD>(-1);
    return ((word - Ones) & ~word & Ones << 7) != 0;
}

// How many bytes are in front of the first that is 0, or all of them.
inline std::size_t SizeToZero(char const* bytes, std::size_t size)
{
    using WORD = std::uint64_t;
    bool holdsZero = size != 0;
    if (size >= sizeof(WORD))
    {
        holdsZero = HoldsZero<WORD>(bytes + size - sizeof(WORD));
        for (std::size_t at = 0; at + sizeof(WORD) < size; at += sizeof(WORD))
            holdsZero |= HoldsZero<WORD>(bytes + at);
    }
    else if (size >= sizeof(std::uint32_t))
        holdsZero =
            HoldsZero<std::uint32_t>(bytes) || HoldsZero<std::uint32_t>(bytes + size - sizeof(std::uint32_t));
    if (!holdsZero)
        return size;
    void const* const zero = std::memchr(bytes, 0, size);
    return zero ? static_cast<std::size_t>(static_cast<char const*>(zero) - bytes) : size;
}

// Below 0, 0 or above 0, as the first byte tells in which they differ, taken as unsigned.
inline int CompareBytes(char const* left, char const* right, std::size_t size)
{
    using WORD = std::uint64_t;
    for (std::size_t at = 0; at + sizeof(WORD) <= size; at += sizeof(WORD))
    {
        WORD const ours = LoadWord<WORD>(left + at);
        WORD const theirs = LoadWord<WORD>(right + at);
        if (ours != theirs)
            return __builtin_bswap64(ours) < __builtin_bswap64(theirs) ? -1 : 1;
    }
    std::size_t const rest = size % sizeof(WORD);
    return rest == 0 ? 0 : std::memcmp(left + size - rest, right + size - rest, rest);
}
}  // namespace comgui::detail
