#include "tests/corefoundation/Held.h"

#include <gtest/gtest.h>

namespace
{
struct UTF8_FACT
{
    char const* name;
    char const* bytes;
    bool valid;
};

class CFStringCreateWithCStringOf : public testing::TestWithParam<UTF8_FACT>
{
};

TEST_P(CFStringCreateWithCStringOf, UTF8_IsValidOrNull)
{
    EXPECT_EQ(MakeString(GetParam().bytes) != nullptr, GetParam().valid);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, CFStringCreateWithCStringOf,
    testing::Values(
        UTF8_FACT{"Empty", "", true}, UTF8_FACT{"Ascii", "ComGUI.Bundle", true},
        UTF8_FACT{"LastOfOneByte", "\x7F", true}, UTF8_FACT{"LoneContinuation", "\x80", false},
        UTF8_FACT{"LastContinuation", "\xBF", false}, UTF8_FACT{"OverlongTwo", "\xC1\xBF", false},
        UTF8_FACT{"FirstOfTwo", "\xC2\x80", true}, UTF8_FACT{"LastOfTwo", "\xDF\xBF", true},
        UTF8_FACT{"OverlongThree", "\xE0\x9F\xBF", false}, UTF8_FACT{"FirstOfThree", "\xE0\xA0\x80", true},
        UTF8_FACT{"BeforeSurrogates", "\xED\x9F\xBF", true},
        UTF8_FACT{"FirstSurrogate", "\xED\xA0\x80", false}, UTF8_FACT{"LastSurrogate", "\xED\xBF\xBF", false},
        UTF8_FACT{"AfterSurrogates", "\xEE\x80\x80", true}, UTF8_FACT{"LastOfThree", "\xEF\xBF\xBF", true},
        UTF8_FACT{"OverlongFour", "\xF0\x8F\xBF\xBF", false},
        UTF8_FACT{"FirstOfFour", "\xF0\x90\x80\x80", true}, UTF8_FACT{"LastOfFour", "\xF4\x8F\xBF\xBF", true},
        UTF8_FACT{"PastTheLast", "\xF4\x90\x80\x80", false}, UTF8_FACT{"LeadF5", "\xF5\x80\x80\x80", false},
        UTF8_FACT{"LeadFF", "\xFF", false}, UTF8_FACT{"CutTwo", "a\xC3", false},
        UTF8_FACT{"CutThree", "a\xE2\x82", false}, UTF8_FACT{"CutFour", "a\xF0\x9F\x96", false},
        UTF8_FACT{"ThirdByteNoContinuation", "\xE2\x82\x41", false},
        UTF8_FACT{"FourthByteNoContinuation", "\xF0\x9F\x96\xC0", false},
        UTF8_FACT{"BadAfterGood", "gr\xC3\xBC\xC3\x9F\x65\xFE", false}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(CFStringCreateWithCStringOfStandIn, NullText_EndsTheProgram)
{
    EXPECT_DEATH(CFStringCreateWithCString(kCFAllocatorDefault, nullptr, kCFStringEncodingUTF8),
                 "CFStringCreateWithCString of a null text");
}

TEST(CFStringCreateWithCStringOfStandIn, OtherEncoding_IsNull)
{
    CFStringEncoding const latin1 = 0x0201;
    EXPECT_EQ(CFStringCreateWithCString(kCFAllocatorDefault, "plain", latin1), nullptr);
}

TEST(CFStringCreateWithCString, CallersText_MayGoAfterwards)
{
    std::string text = "5CDEF0B8-6CFC-11D8-A365-003065B1346E";
    auto const string = MakeString(text);
    text.assign(text.size(), 'x');
    EXPECT_TRUE(Held<CFUUIDRef>(CFUUIDCreateFromString(kCFAllocatorDefault, string.get())));
}
}  // namespace
