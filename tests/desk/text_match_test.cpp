#include "desk/model/TextMatch.h"

#include <clocale>
#include <gtest/gtest.h>

using desk::TextMatch;

namespace
{
struct MATCH_FACT
{
    char const* name;
    std::string wanted;
    std::string text;
    bool isIn;
};

class Matching : public testing::TestWithParam<MATCH_FACT>
{
protected:
    void SetUp() override
    {
        // As a program with windows has it; without one that knows them, letters beyond ASCII have no case.
        ASSERT_NE(std::setlocale(LC_CTYPE, "C.UTF-8"), nullptr);
    }
    void TearDown() override { std::setlocale(LC_CTYPE, "C"); }
};
}  // namespace

TEST_P(Matching, IsThat) { EXPECT_EQ(TextMatch(GetParam().wanted).IsIn(GetParam().text), GetParam().isIn); }

INSTANTIATE_TEST_SUITE_P(
    Facts, Matching,
    testing::Values(
        MATCH_FACT{"Same", "Copies", "Copies", true}, MATCH_FACT{"Within", "opi", "Job/Copies", true},
        MATCH_FACT{"AtTheEnd", "es", "Copies", true}, MATCH_FACT{"Absent", "sec", "Copies", false},
        MATCH_FACT{"OtherCase", "cOpIeS", "CoPiEs", true},
        MATCH_FACT{"NoLetters", "[", "{", false},  // bit 5 is no case there
        MATCH_FACT{"Longer", "Copiess", "Copies", false}, MATCH_FACT{"InNothing", "a", "", false},
        MATCH_FACT{"Umlaut", "GRÜN", "Visitenkarten grün", true},
        MATCH_FACT{"OtherUmlaut", "GRUN", "Visitenkarten grün", false},
        MATCH_FACT{"Cyrillic", "ПЕЧАТЬ", "печать", true}, MATCH_FACT{"Greek", "Σίγμα", "ΣΊΓΜΑ", true},
        MATCH_FACT{"Kanji", "印刷", "大量印刷", true}, MATCH_FACT{"KelvinSign", "k", "\xE2\x84\xAA", true},
        MATCH_FACT{"NoUtf8", "a", "\xFF\xFE a \xC3", true},
        MATCH_FACT{"ZeroByte", std::string("b\0c", 3), std::string("a\0B\0C", 5), true},
        MATCH_FACT{"BehindAZeroByte", "c", std::string("a\0C", 3), true}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(TextMatch, OfNothing_IsEmpty)
{
    EXPECT_TRUE(TextMatch("").IsEmpty());
    EXPECT_FALSE(TextMatch(" ").IsEmpty());
}

TEST(TextMatch, AnEquation_TakesTheWholeKeyAndTheWholeValue)
{
    TextMatch const match("Job/Copies=3");
    EXPECT_TRUE(match.HasEquation());
    EXPECT_TRUE(match.IsEquation("Job/Copies", "3"));
    EXPECT_TRUE(match.IsEquation("JOB/copies", "3"));
    EXPECT_FALSE(match.IsEquation("Job/Copies", "30"));
    EXPECT_FALSE(match.IsEquation("Copies", "3"));
    EXPECT_FALSE(match.IsEquation("Job/Copies", ""));
}

TEST(TextMatch, AnEquation_MayHaveMoreThanOneSign)
{
    TextMatch const match("a=b=c");
    EXPECT_TRUE(match.IsEquation("a", "b=c"));
    EXPECT_TRUE(match.IsEquation("a=b", "c"));
    EXPECT_FALSE(match.IsEquation("a=b=c", ""));
}

TEST(TextMatch, AnEquationWithNothingBehind_WantsTheEmptyValue)
{
    EXPECT_TRUE(TextMatch("a=").IsEquation("a", ""));
    EXPECT_FALSE(TextMatch("a=").IsEquation("a", "b"));
}

TEST(TextMatch, WithoutAKey_IsNoEquation)
{
    EXPECT_FALSE(TextMatch("=3").HasEquation());
    EXPECT_FALSE(TextMatch("=").HasEquation());
    EXPECT_FALSE(TextMatch("a").HasEquation());
}

TEST(TextMatch, AMegabyte_IsSearchedToItsEnd)
{
    std::string text(1 << 20, 'x');
    text += "end";
    EXPECT_TRUE(TextMatch("xEND").IsIn(text));
}
