#include "tests/corefoundation/Held.h"

#include <cstring>
#include <gtest/gtest.h>
#include <iomanip>
#include <sstream>

namespace
{
std::string HexOf(CFUUIDBytes const& bytes)
{
    unsigned char raw[sizeof bytes];
    std::memcpy(raw, &bytes, sizeof raw);
    std::ostringstream text;
    for (unsigned const byte : raw)
        text << std::hex << std::uppercase << std::setw(2) << std::setfill('0') << byte;
    return text.str();
}

TEST(CFUUIDGetUUIDBytes, AnyUUID_AreInTheOrderOfTheText)
{
    auto const uuid = MakeUUID("33FC3B14-6CFF-11D8-AB09-003065B1346E");
    ASSERT_TRUE(uuid);
    EXPECT_EQ(HexOf(CFUUIDGetUUIDBytes(uuid.get())), "33FC3B146CFF11D8AB09003065B1346E");
    EXPECT_EQ(CFUUIDGetUUIDBytes(uuid.get()).byte0, 0x33);
    EXPECT_EQ(CFUUIDGetUUIDBytes(uuid.get()).byte15, 0x6E);
}

TEST(CFUUIDGetUUIDBytes, AllDigits_KeepTheirValue)
{
    EXPECT_EQ(HexOf(CFUUIDGetUUIDBytes(MakeUUID("01234567-89AB-CDEF-0123-456789ABCDEF").get())),
              "0123456789ABCDEF0123456789ABCDEF");
}

TEST(CFUUIDGetUUIDBytes, SmallLetters_MeanTheSame)
{
    EXPECT_EQ(HexOf(CFUUIDGetUUIDBytes(MakeUUID("01234567-89ab-cDef-0123-456789abcdef").get())),
              "0123456789ABCDEF0123456789ABCDEF");
}

TEST(CFUUIDGetUUIDBytesOfStandIn, NullUUID_EndsTheProgram)
{
    EXPECT_DEATH(CFUUIDGetUUIDBytes(nullptr), "CFUUIDGetUUIDBytes of a null reference");
}

TEST(CFUUIDCreateFromString, NullText_IsNull)
{
    EXPECT_EQ(CFUUIDCreateFromString(kCFAllocatorDefault, nullptr), nullptr);
}

struct MALFORMED_UUID
{
    char const* name;
    char const* text;
};

class CFUUIDCreateFromStringOf : public testing::TestWithParam<MALFORMED_UUID>
{
};

TEST_P(CFUUIDCreateFromStringOf, MalformedText_IsNull) { EXPECT_FALSE(MakeUUID(GetParam().text)); }

INSTANTIATE_TEST_SUITE_P(
    Facts, CFUUIDCreateFromStringOf,
    testing::Values(MALFORMED_UUID{"Empty", ""}, MALFORMED_UUID{"Word", "ComGUI"},
                    MALFORMED_UUID{"OneTooShort", "01234567-89AB-CDEF-0123-456789ABCDE"},
                    MALFORMED_UUID{"OneTooLong", "01234567-89AB-CDEF-0123-456789ABCDEF0"},
                    MALFORMED_UUID{"NoHyphens", "0123456789ABCDEF0123456789ABCDEF"},
                    MALFORMED_UUID{"HyphenMoved", "0123456-789AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"DigitForHyphen", "01234567089AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"HyphenForDigit", "01234567-89AB-CDEF-0123-456789ABCDE-"},
                    MALFORMED_UUID{"LetterG", "G1234567-89AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"LetterBeforeA", "@1234567-89AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"SmallLetterG", "g1234567-89AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"Colon", ":1234567-89AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"Braces", "{01234567-89AB-CDEF-0123-456789ABCDEF}"},
                    MALFORMED_UUID{"SpaceInFront", " 1234567-89AB-CDEF-0123-456789ABCDEF"},
                    MALFORMED_UUID{"Utf8", "\xC3\xA9"
                                           "234567-89AB-CDEF-0123-456789ABCDEF"}),
    [](auto const& fact) { return std::string(fact.param.name); });
}  // namespace
