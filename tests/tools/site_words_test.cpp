#include "tools/comgui_site/words.h"

#include "tests/server/StoredValues.h"
#include <gtest/gtest.h>
#include <limits>

using namespace comgui_site;

TEST(SiteWords, Cleaned_OfPlainText_IsTheSame)
{
    std::string const plain = "A4 quer, Gr\xC3\xBCn \xE2\x82\xAC \xF0\x9F\x96\xA8";
    EXPECT_TRUE(IsPlain(plain));
    EXPECT_EQ(Cleaned(plain), plain);
}

struct CLEANED_FACT
{
    char const* name;
    std::string text;
    char const* cleaned;
};
class SiteWordsCleaned : public testing::TestWithParam<CLEANED_FACT>
{
};
TEST_P(SiteWordsCleaned, IsWithoutControl)
{
    EXPECT_FALSE(IsPlain(GetParam().text));
    EXPECT_EQ(Cleaned(GetParam().text), GetParam().cleaned);
    EXPECT_TRUE(IsPlain(Cleaned(GetParam().text)));
}
INSTANTIATE_TEST_SUITE_P(Facts, SiteWordsCleaned,
                         testing::Values(CLEANED_FACT{"Escape", "a\x1B[31mb", "a\\x1b[31mb"},
                                         CLEANED_FACT{"LineFeed", "a\nb", "a\\x0ab"},
                                         CLEANED_FACT{"Zero", std::string("a\0b", 3), "a\\x00b"},
                                         CLEANED_FACT{"Delete", "a\x7F", "a\\x7f"},
                                         CLEANED_FACT{"FirstOfC1", "\xC2\x80", "\\xc2\\x80"},
                                         CLEANED_FACT{"LastOfC1", "\xC2\x9F", "\\xc2\\x9f"},
                                         CLEANED_FACT{"NoUtf8", "a\xFFz", "a\\xffz"},
                                         CLEANED_FACT{"CutCharacter", "a\xE2\x82", "a\\xe2\\x82"},
                                         CLEANED_FACT{"LoneContinuation", "\x80", "\\x80"},
                                         CLEANED_FACT{"CharacterThatIsCutByAnother", "\xC2z", "\\xc2z"}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST(SiteWords, Cleaned_BehindTheC1Controls_IsTheSame) { EXPECT_EQ(Cleaned("\xC2\xA0"), "\xC2\xA0"); }

TEST(SiteWords, ChoiceOf_TypeAndId)
{
    ASSERT_TRUE(ChoiceOf("3/12"));
    EXPECT_EQ(ChoiceOf("3/12")->type, 3);
    EXPECT_EQ(ChoiceOf("3/12")->id, 12);
    ASSERT_TRUE(ChoiceOf("99/16777215"));
    ASSERT_TRUE(ChoiceOf("17"));
    EXPECT_FALSE(ChoiceOf("17")->id);
}

TEST(SiteWords, ChoiceOf_WhatNoTicketCanHave_IsNone)
{
    for (char const* const text : {"", "/", "3/", "/3", "100", "-1", "3/-1", "3/16777216", "3/1/2", "3 ", "a",
                                   "3/a", "99999999999999999999"})
        EXPECT_FALSE(ChoiceOf(text)) << text;
}

TEST(SiteWords, SizeText_AtTheBorders)
{
    EXPECT_EQ(SizeText(0), "0 bytes");
    EXPECT_EQ(SizeText(1), "1 byte");
    EXPECT_EQ(SizeText(999), "999 bytes");
    EXPECT_EQ(SizeText(1000), "1.0 kB");
    EXPECT_EQ(SizeText(999'949), "999.9 kB");
    EXPECT_EQ(SizeText(999'950), "1.0 MB");
    EXPECT_EQ(SizeText(3'400'000'000), "3.4 GB");
}

TEST(SiteWords, ShownKey_WithWhatCouldMislead_IsQuoted)
{
    EXPECT_EQ(ShownKey("Job/Copies"), "Job/Copies");
    EXPECT_EQ(ShownKey("a=b"), "\"a=b\"");
    EXPECT_EQ(ShownKey("a[1]"), "\"a[1]\"");
    EXPECT_EQ(ShownKey("a\x1B"), "\"a\\u001b\"");
    EXPECT_EQ(ShownKey("\xFF"), "hex:ff");
}

TEST(SiteWords, ShownValue_OfEachType)
{
    EXPECT_EQ(ShownValue(Integer(PARAM_INT, -5)), "-5");
    EXPECT_EQ(ShownValue(Integer(PARAM_UNSIGNED, 4294967295)), "4294967295");
    EXPECT_EQ(ShownValue(Integer(PARAM_UNSIGNED64, -1)), "18446744073709551615");
    EXPECT_EQ(ShownValue(Integer(PARAM_INT64, -1)), "-1");
    EXPECT_EQ(ShownValue(Double(0.1)), "0.1");
    EXPECT_EQ(ShownValue(Double(std::numeric_limits<double>::infinity())), "inf");
    EXPECT_EQ(ShownValue(Bytes(PARAM_STRING, "a\"\n")), "\"a\\\"\\n\"");
    EXPECT_EQ(ShownValue(Bytes(PARAM_BINSTRING, std::string_view("\0\xAB", 2))), "hex:00ab");
}

TEST(SiteWords, ShownValue_OfALongText_IsCut)
{
    std::string const text(61, 'x');
    EXPECT_EQ(ShownValue(Bytes(PARAM_STRING, std::string_view(text).substr(1))), '"' + text.substr(1) + '"');
    EXPECT_EQ(ShownValue(Bytes(PARAM_STRING, text)), '"' + text.substr(1) + "\" ... 61 bytes");
}

TEST(SiteWords, Json_OfEachKindOfText_IsAscii)
{
    Json json;
    AddValue(json, Bytes(PARAM_STRING, "Gr\xC3\xBCn\x1B\x7F\xC2\x9B"));
    EXPECT_EQ(LineOf(json), "{\"type\":\"string\",\"value\":\"Gr\\u00fcn\\u001b\\u007f\\u009b\"}\n");
    Json bytes;
    AddValue(bytes, Bytes(PARAM_STRING, "\xFF"));
    EXPECT_EQ(LineOf(bytes), "{\"type\":\"string\",\"hex\":\"ff\"}\n");
    EXPECT_EQ(LineOf(JsonOf("\xFF")), "\"\\\\xff\"\n");
}

TEST(SiteWords, Json_OfNumbers_KeepsThem)
{
    Json json;
    AddValue(json, Integer(PARAM_UNSIGNED64, -1));
    EXPECT_EQ(LineOf(json), "{\"type\":\"unsigned64\",\"value\":18446744073709551615}\n");
    Json number;
    AddValue(number, Double(-std::numeric_limits<double>::infinity()));
    EXPECT_EQ(LineOf(number), "{\"type\":\"double\",\"value\":\"-inf\"}\n");
}
