// How many bytes two texts begin with alike, found block by block: a writer asks it of every key.
#pragma once

#include <bit>
#include <cstdint>
#include <cstring>
#ifdef __SSE2__
#    include <emmintrin.h>
#endif

namespace comgui::detail
{
// A block of each text: how many of its bytes they share, Size if all.
struct WORD_BLOCK
{
    static constexpr unsigned long Size = sizeof(std::uint64_t);

    static unsigned long Shared(char const* left, char const* right)
    {
        std::uint64_t leftWord;
        std::uint64_t rightWord;
        std::memcpy(&leftWord, left, Size);
        std::memcpy(&rightWord, right, Size);
        // The lowest byte that differs is the first, as the target is little-endian.
        return static_cast<unsigned int>(std::countr_zero(leftWord ^ rightWord)) / 8;
    }
};

#ifdef __SSE2__
struct WIDE_BLOCK
{
    static constexpr unsigned long Size = sizeof(__m128i);

    static unsigned long Shared(char const* left, char const* right)
    {
        __m128i const leftBytes = _mm_loadu_si128(reinterpret_cast<__m128i const*>(left));
        __m128i const rightBytes = _mm_loadu_si128(reinterpret_cast<__m128i const*>(right));
        auto const equal =
            static_cast<unsigned int>(_mm_movemask_epi8(_mm_cmpeq_epi8(leftBytes, rightBytes)));
        return static_cast<unsigned int>(std::countr_one(equal));
    }
};
#else
using WIDE_BLOCK = WORD_BLOCK;
#endif

// limit: at least one block.
template <typename BLOCK>
unsigned long SharedBlocks(char const* left, char const* right, unsigned long limit)
{
    unsigned long const last = limit - BLOCK::Size;  // may overlap the block before
    for (unsigned long at = 0; at < last; at += BLOCK::Size)
        if (unsigned long const shared = BLOCK::Shared(left + at, right + at); shared != BLOCK::Size)
            return at + shared;
    return last + BLOCK::Shared(left + last, right + last);
}

// limit: bytes of the shorter text. None behind them is looked at.
inline unsigned long SharedBytes(char const* left, char const* right, unsigned long limit)
{
    if (limit >= WIDE_BLOCK::Size)
        return SharedBlocks<WIDE_BLOCK>(left, right, limit);
    if (limit >= WORD_BLOCK::Size)
        return SharedBlocks<WORD_BLOCK>(left, right, limit);
    unsigned long shared = 0;
    while (shared < limit && left[shared] == right[shared])
        ++shared;
    return shared;
}
}  // namespace comgui::detail
