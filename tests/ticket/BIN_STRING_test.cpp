#include "comgui/ticket/BIN_STRING.h"

#include <gtest/gtest.h>

TEST(BIN_STRING, Default_IsNullAndInvalid)
{
    BIN_STRING const empty;
    EXPECT_EQ(empty.data, nullptr);
    EXPECT_EQ(empty.size, 0u);
    EXPECT_FALSE(empty.valid());
}

TEST(BIN_STRING, NullWithALength_IsInvalid) { EXPECT_FALSE(BIN_STRING(nullptr, 3).valid()); }

TEST(BIN_STRING, BytesOfNoLength_AreInvalid_ByDesign) { EXPECT_FALSE(BIN_STRING("abc", 0).valid()); }

TEST(BIN_STRING, FromAString_PointsAtItsBytes)
{
    std::string const bytes("a\0c", 3);
    BIN_STRING const view(bytes);
    EXPECT_EQ(view.data, bytes.data());
    EXPECT_EQ(view.size, 3u);
    EXPECT_TRUE(view.valid());
}

TEST(BIN_STRING, Assign_PointsAtTheOtherString)
{
    std::string const first = "first";
    std::string const second = "second";
    BIN_STRING view(first);
    view.assign(second);
    EXPECT_EQ(view.data, second.data());
    EXPECT_EQ(view.size, 6u);
}

TEST(BIN_STRING, BeginAndEnd_SpanTheBytes)
{
    std::string const bytes("\0\xFF", 2);
    BIN_STRING const view(bytes);
    EXPECT_EQ(std::string(view.begin(), view.end()), bytes);
}
