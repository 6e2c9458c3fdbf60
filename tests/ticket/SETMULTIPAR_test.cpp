#include "comgui/ticket/SETMULTIPAR.h"

#include <gtest/gtest.h>

namespace
{
SETMULTIPAR Record(char const* key, int pos)
{
    SETMULTIPAR record = {};
    record.key = key;
    record.pos = pos;
    return record;
}
}  // namespace

TEST(SETMULTIPAR, SmallerKey_ComesFirst)
{
    EXPECT_TRUE(Record("a", 5) < Record("b", 1));
    EXPECT_FALSE(Record("b", 1) < Record("a", 5));
}

TEST(SETMULTIPAR, EqualKeys_AreNotOrderedByPosition_ByDesign)
{
    EXPECT_FALSE(Record("a", 0) < Record("a", 1));
    EXPECT_FALSE(Record("a", 1) < Record("a", 0));
}

TEST(SETMULTIPAR, Keys_CompareAsUnsignedBytes) { EXPECT_TRUE(Record("z", 0) < Record("\xC3\xA4", 0)); }
