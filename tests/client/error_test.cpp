// Failures as values.
#include "comgui/client/Result.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using namespace comgui;
using testing::HasSubstr;

TEST(ErrorTexts, AreInOrder_AndEachHasWords)
{
    int last = ErrorTexts()[0].code - 1;
    int count = 0;
    for (ERROR_TEXT const* known = ErrorTexts(); known->text; ++known, ++count)
    {
        EXPECT_GT(known->code, last);
        EXPECT_GT(std::string_view(known->text).size(), 5u);
        last = known->code;
    }
    EXPECT_GT(count, 40);
}

TEST(ErrorTexts, HaveAllCodesOfTheKit)
{
    for (int code = TooLong; code <= NoPlugIn; ++code)
        EXPECT_THAT((Error{code, {}, {}}).Text(), testing::Not(HasSubstr("code"))) << code;
}

TEST(Error, Text_IsOneLineOfAllItsParts)
{
    EXPECT_EQ((Error{107, "admin", {}}).Text(), "admin: wrong user or password");
    EXPECT_EQ((Error{106, {}, "disk full"}).Text(), "the server cannot reach its data (disk full)");
    EXPECT_EQ((Error{777, {}, {}}).Text(), "the server refuses, with code 777");
}

TEST(Error, OfAServerThatIsAway_IsTransient)
{
    EXPECT_TRUE((Error{ServerAway, {}, {}}).IsTransient());
    EXPECT_TRUE((Error{106, {}, {}}).IsTransient());
    EXPECT_FALSE((Error{107, {}, {}}).IsTransient());
    EXPECT_FALSE((Error{OutOfRange, {}, {}}).IsTransient());
}

TEST(Result, HoldsEitherOne)
{
    Result<int> const good = 5;
    EXPECT_TRUE(good);
    EXPECT_EQ(*good, 5);
    EXPECT_THROW((void)good.GetError(), std::bad_variant_access);
    Result<int> const bad = Error{WrongType, {}, {}};
    EXPECT_FALSE(bad);
    EXPECT_EQ(bad.GetError().code, WrongType);
    EXPECT_EQ(bad.ValueOr(9), 9);
    EXPECT_THROW((void)*bad, std::bad_variant_access);
    EXPECT_TRUE(Outcome());
    EXPECT_THROW((void)Outcome().GetError(), std::bad_optional_access);
}
