// Copies a few bytes in line: most keys and texts are short, and a call would cost more than the copy.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace comgui::detail
{
inline constexpr std::size_t ShortCopy = 16;

// From WORD's size up to twice that.
template <typename WORD>
void CopyEnds(char* to, char const* from, std::size_t size)
{
    WORD first;
    WORD last;
    std::memcpy(&first, from, sizeof first);
    std::memcpy(&last, from + size - sizeof last, sizeof last);
    std::memcpy(to, &first, sizeof first);
    std::memcpy(to + size - sizeof last, &last, sizeof last);
}

// Up to ShortCopy bytes.
inline void CopyShort(char* to, char const* from, std::size_t size)
{
    if (size >= sizeof(std::uint64_t))
        CopyEnds<std::uint64_t>(to, from, size);
    else if (size >= sizeof(std::uint32_t))
        CopyEnds<std::uint32_t>(to, from, size);
    else if (size >= sizeof(std::uint16_t))
        CopyEnds<std::uint16_t>(to, from, size);
    else if (size != 0)
        *to = *from;
}

// Any number of bytes, of which few are the most common.
inline void Copy(char* to, char const* from, std::size_t size)
{
    struct WORDS
    {
        std::uint64_t words[2];
    };
    if (size <= ShortCopy)
        CopyShort(to, from, size);
    else if (size <= 2 * sizeof(WORDS))
        CopyEnds<WORDS>(to, from, size);
    else
        std::memcpy(to, from, size);
}
}  // namespace comgui::detail
