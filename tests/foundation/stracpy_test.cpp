#include "comgui/foundation/stracpy.h"

#include <gtest/gtest.h>
#include <memory>
#include <string>

namespace
{
// A buffer in which every untouched byte shows.
class Stracpy : public testing::Test
{
protected:
    std::string Copy(char const* text, unsigned long size)
    {
        stracpy(buffer.data(), text, size);
        return buffer;
    }

    std::string buffer = "########";
};
}  // namespace

TEST_F(Stracpy, SizeZero_TouchesNothing) { EXPECT_EQ(Copy("abc", 0), "########"); }

TEST_F(Stracpy, ShorterText_IsFollowedByZerosToTheEndOfTheBuffer)
{
    EXPECT_EQ(Copy("abc", 6), std::string("abc\0\0\0##", 8));
}

TEST_F(Stracpy, TextThatJustFits_KeepsAllItsBytes)
{
    EXPECT_EQ(Copy("abcde", 6), std::string("abcde\0##", 8));
}

TEST_F(Stracpy, LongerText_IsCutBeforeTheLastByte)
{
    EXPECT_EQ(Copy("abcdef", 6), std::string("abcde\0##", 8));
}

TEST_F(Stracpy, NullText_CountsAsEmpty) { EXPECT_EQ(Copy(nullptr, 3), std::string("\0\0\0#####", 8)); }

TEST_F(Stracpy, SizeOne_WritesTheTerminatorOnly) { EXPECT_EQ(Copy("abc", 1), std::string("\0#######", 8)); }

TEST_F(Stracpy, TextThatLiesInTheBuffer_IsCopied)
{
    stracpy(buffer.data(), "abcdef", 8);
    stracpy(buffer.data(), buffer.data() + 2, 8);
    EXPECT_EQ(buffer, std::string("cdef\0\0\0\0", 8));
}

TEST_F(Stracpy, TextWithoutTerminatorBehindTheLimit_IsNotReadFurther)
{
    // An exact heap block, so that the address sanitizer sees a byte too many.
    std::string const exact(5, 'x');
    std::unique_ptr<char[]> const block(new char[5]);
    exact.copy(block.get(), 5);
    EXPECT_EQ(Copy(block.get(), 6), std::string("xxxxx\0##", 8));
}
