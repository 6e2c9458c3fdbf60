#include "comgui/foundation/short_copy.h"

#include <gtest/gtest.h>
#include <numeric>
#include <vector>

using namespace comgui::detail;

namespace
{
// Exact blocks on the heap, so that a sanitizer sees every byte too many.
void ExpectCopied(void (*copy)(char*, char const*, std::size_t), std::size_t size)
{
    std::vector<char> from(size);
    std::iota(from.begin(), from.end(), '\1');
    std::vector<char> to(size);
    copy(to.data(), from.data(), size);
    EXPECT_EQ(to, from) << size << " bytes";
}

TEST(CopyShort, EverySizeUpToItsLimit_IsCopiedAndNothingElseTouched)
{
    for (std::size_t size = 0; size <= ShortCopy; ++size)
        ExpectCopied(CopyShort, size);
}

TEST(Copy, EverySize_IsCopiedAndNothingElseTouched)
{
    for (std::size_t size = 0; size <= 100; ++size)
        ExpectCopied(Copy, size);
}
}  // namespace
