// Texts as one cell shows them.
#include "desk/model/DisplayText.h"

#include <gtest/gtest.h>
#include <limits>

using namespace desk;

namespace
{
struct SHOWN_FACT
{
    char const* name;
    std::string text;
    char const* shown;
};

class TextInACell : public testing::TestWithParam<SHOWN_FACT>
{
};

struct CUT_FACT
{
    char const* name;
    char const* text;
    std::size_t characters;
    char const* shown;
};

class CutText : public testing::TestWithParam<CUT_FACT>
{
};

struct VALUE_FACT
{
    char const* name;
    comgui::Value value;
    char const* shown;
};

class ValueInACell : public testing::TestWithParam<VALUE_FACT>
{
};

std::string Repeated(std::size_t count, std::string const& text)
{
    std::string all;
    for (; count > 0; --count)
        all += text;
    return all;
}

using comgui::List;
}  // namespace

TEST_P(TextInACell, IsThat) { EXPECT_EQ(DisplayText(GetParam().text), GetParam().shown); }

TEST_P(TextInACell, StaysThat) { EXPECT_EQ(DisplayText(GetParam().shown), GetParam().shown); }

INSTANTIATE_TEST_SUITE_P(
    Facts, TextInACell,
    testing::Values(
        SHOWN_FACT{"Empty", "", ""},
        SHOWN_FACT{"Plain", "Größe 字 \xF0\x9F\x98\x80", "Größe 字 \xF0\x9F\x98\x80"},
        SHOWN_FACT{"Newline", "a\r\nb", "a␍␊b"}, SHOWN_FACT{"Tab", "a\tb", "a␉b"},
        SHOWN_FACT{"Zero", std::string("a\0b", 3), "a␀b"}, SHOWN_FACT{"LastControl", "\x1F", "␟"},
        SHOWN_FACT{"Space", " ", " "}, SHOWN_FACT{"Delete", "\x7F", "␡"},
        SHOWN_FACT{"LaterControl", "\xC2\x85", "\\u0085"}, SHOWN_FACT{"NoBreakSpace", "\xC2\xA0", "\xC2\xA0"},
        SHOWN_FACT{"SoftHyphen", "\xC2\xAD", "\\u00AD"}, SHOWN_FACT{"ArabicMark", "\u061C", "\\u061C"},
        SHOWN_FACT{"ZeroWidthSpace", "\u200B", "\\u200B"}, SHOWN_FACT{"LeftToRightMark", "\u200E", "\\u200E"},
        SHOWN_FACT{"Hyphen", "\u2010", "\u2010"}, SHOWN_FACT{"LineSeparator", "a\u2028b", "a\\u2028b"},
        SHOWN_FACT{"ParagraphSeparator", "\u2029", "\\u2029"},
        SHOWN_FACT{"Override", "a\u202Etxt.exe", "a\\u202Etxt.exe"},
        SHOWN_FACT{"Isolate", "\u2066", "\\u2066"}, SHOWN_FACT{"PopIsolate", "\u2069", "\\u2069"},
        SHOWN_FACT{"ByteOrderMark", "\uFEFF", "\\uFEFF"},
        SHOWN_FACT{"NoCharacter", "\xEF\xBF\xBE", "\\uFFFE"},
        SHOWN_FACT{"Tag", "\xF3\xA0\x80\x81", "\\uE0001"}, SHOWN_FACT{"Backslash", "\\n", "\\n"},
        SHOWN_FACT{"NoUtf8", "a\xFF\xFE!", "a\uFFFD\uFFFD!"},
        SHOWN_FACT{"HalfCharacter", "a\xE5\xAD", "a\uFFFD\uFFFD"},
        SHOWN_FACT{"Overlong", "\xC0\x8A", "\uFFFD\uFFFD"},
        SHOWN_FACT{"Surrogate", "\xED\xA0\x80", "\uFFFD\uFFFD\uFFFD"},
        SHOWN_FACT{"PastUnicode", "\xF4\x90\x80\x80", "\uFFFD\uFFFD\uFFFD\uFFFD"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST_P(CutText, IsThat) { EXPECT_EQ(DisplayText(GetParam().text, GetParam().characters), GetParam().shown); }

INSTANTIATE_TEST_SUITE_P(
    Facts, CutText,
    testing::Values(CUT_FACT{"Fits", "abcd", 4, "abcd"}, CUT_FACT{"OneTooMany", "abcde", 4, "abc…"},
                    CUT_FACT{"One", "ab", 1, "…"}, CUT_FACT{"None", "ab", 0, ""},
                    CUT_FACT{"NoneOfNothing", "", 0, ""}, CUT_FACT{"LargeCharacters", "字字字字", 3, "字字…"},
                    // e with an accent of its own, twice: the second does not fit with its accent
                    CUT_FACT{"Accent", "ae\u0301e\u0301b", 5, "ae\u0301…"},
                    CUT_FACT{"AccentThatFits", "ae\u0301b", 4, "ae\u0301b"},
                    CUT_FACT{"Family", "a\U0001F468\u200D\U0001F469\u200D\U0001F467b", 5, "a…"},
                    CUT_FACT{"SkinColour", "\U0001F44D\U0001F3FFab", 3, "\U0001F44D\U0001F3FF…"},
                    CUT_FACT{"Escape", "ab\u202Ecd", 7, "ab…"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(DisplayText, RowOfAccentsWithoutEndIsCut)
{
    EXPECT_EQ(DisplayText("a" + Repeated(1000, "\u0301"), 10), "…");
    EXPECT_EQ(DisplayText("a" + Repeated(1000, "\u0301"), 30), "a" + Repeated(16, "\u0301") + "…");
}

TEST(DisplayText, EveryCutIsAsLongAsAskedForAtMost)
{
    std::string const text = Repeated(300, "\xF0\x9F\x98\x80");
    for (std::size_t characters = 1; characters < 300; ++characters)
        ASSERT_EQ(DisplayText(text, characters), Repeated(characters - 1, "\xF0\x9F\x98\x80") + "…");
    EXPECT_EQ(DisplayText(text, 300), text);
}

// What is read of a long text ends in the middle of a character now and then.
TEST(DisplayText, CutOfCharactersOfThreeBytes_IsTheSame)
{
    std::string const text = Repeated(1000, "\xE5\xAD\x97");
    for (std::size_t characters = 1; characters < 300; ++characters)
        ASSERT_EQ(DisplayText(text, characters), Repeated(characters - 1, "\xE5\xAD\x97") + "…");
}

TEST(DisplayText, LargeTextIsCut)
{
    for (std::string const part : {"a", "\xFF", "\x80", "\u0301", "\n"})
    {
        SCOPED_TRACE(part);
        EXPECT_TRUE(DisplayText(Repeated(1'000'000, part)).ends_with("…"));
    }
}

TEST_P(ValueInACell, IsThat) { EXPECT_EQ(DisplayTextOf(GetParam().value, 10), GetParam().shown); }

INSTANTIATE_TEST_SUITE_P(
    Facts, ValueInACell,
    testing::Values(VALUE_FACT{"None", {}, ""}, VALUE_FACT{"Int", -5, "-5"}, VALUE_FACT{"Double", 0.5, "0.5"},
                    VALUE_FACT{"Text", "a\nb", "a␊b"}, VALUE_FACT{"LongText", "0123456789A", "012345678…"},
                    VALUE_FACT{"Bytes", comgui::Bytes{"A"}, "41"}, VALUE_FACT{"EmptyList", List{}, ""},
                    VALUE_FACT{"List", List{{0, 1}, {1, 2}}, "1, 2"},
                    VALUE_FACT{"Gap", List{{1, 1}, {3, 2}}, ", 1, , 2"},
                    VALUE_FACT{"LargeGap", List{{0, 1}, {std::numeric_limits<int>::max(), 2}}, "1, , , , …"}),
    [](auto const& fact) { return std::string(fact.param.name); });

// No facts as above: those are made at every start of the program, whichever test it is to run.
TEST(DisplayText, LargeValueIsCut)
{
    EXPECT_EQ(DisplayTextOf(comgui::Bytes{std::string(1'000'000, 'A')}, 10), "414141414…");
    EXPECT_EQ(DisplayTextOf(List(1'000'000, {0, 1}), 10), "1, 1, 1, …");
}
