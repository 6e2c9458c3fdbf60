#include "comgui/foundation/filter_bytes.h"

#ifdef __x86_64__
#    include <immintrin.h>
#endif

namespace comgui::detail
{
// Each entry is written, and the next one over it if it was 0: no branch depends on the text. A block counts
// for itself, so that it need not wait for the last byte of the one before.
std::size_t FilterBytesOneByOne(char const* table, char const* from, std::size_t size, char* to)
{
    constexpr std::size_t Block = 16;  // compilers still unroll as many
    char* end = to;
    auto const take = [&](std::size_t count)
    {
        std::size_t taken = 0;
        for (std::size_t i = 0; i < count; ++i)
        {
            char const entry = table[static_cast<unsigned char>(from[i])];
            end[taken] = entry;
            taken += entry != 0;
        }
        from += count;
        end += taken;
    };
    for (; size >= Block; size -= Block)
        take(Block);
    take(size);
    return static_cast<std::size_t>(end - to);
}

#ifdef __x86_64__
namespace
{
#    define COMGUI_WIDE [[gnu::target("avx512f,avx512bw,avx512vbmi,avx512vbmi2,popcnt,bmi2")]]

constexpr std::size_t Wide = 64;

// The first count bits.
COMGUI_WIDE __mmask64 First(std::size_t count) { return _bzhi_u64(~0ull, static_cast<unsigned>(count)); }

// The table lies in four registers; a lookup of 7 bits takes two of them, and the eighth bit chooses.
COMGUI_WIDE __m512i EntriesOf(__m512i bytes, __m512i const* quarters)
{
    __m512i const low = _mm512_permutex2var_epi8(quarters[0], bytes, quarters[1]);
    __m512i const high = _mm512_permutex2var_epi8(quarters[2], bytes, quarters[3]);
    return _mm512_mask_blend_epi8(_mm512_movepi8_mask(bytes), low, high);
}

COMGUI_WIDE std::size_t FilterBytesWide(char const* table, char const* from, std::size_t size, char* to)
{
    __m512i const quarters[] = {_mm512_loadu_si512(table), _mm512_loadu_si512(table + Wide),
                                _mm512_loadu_si512(table + 2 * Wide), _mm512_loadu_si512(table + 3 * Wide)};
    char* end = to;
    // No more than was read can have been written, so there is room for a whole register.
    for (; size >= Wide; size -= Wide, from += Wide)
    {
        __m512i const entries = EntriesOf(_mm512_loadu_si512(from), quarters);
        __mmask64 const kept = _mm512_test_epi8_mask(entries, entries);
        _mm512_storeu_si512(end, _mm512_maskz_compress_epi8(kept, entries));
        end += _mm_popcnt_u64(kept);
    }
    __mmask64 const there = First(size);
    __m512i const entries = EntriesOf(_mm512_maskz_loadu_epi8(there, from), quarters);
    __mmask64 const kept = _mm512_mask_test_epi8_mask(there, entries, entries);
    auto const count = static_cast<std::size_t>(_mm_popcnt_u64(kept));
    _mm512_mask_storeu_epi8(end, First(count), _mm512_maskz_compress_epi8(kept, entries));
    return static_cast<std::size_t>(end + count - to);
}
}  // namespace
#endif

FILTER_BYTES* QuickestFilterBytes()
{
#ifdef __x86_64__
    if (__builtin_cpu_supports("avx512vbmi2") && __builtin_cpu_supports("avx512vbmi") &&
        __builtin_cpu_supports("avx512bw") && __builtin_cpu_supports("bmi2"))
        return FilterBytesWide;
#endif
    return FilterBytesOneByOne;
}
}  // namespace comgui::detail
