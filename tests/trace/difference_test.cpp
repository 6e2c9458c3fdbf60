#include "tools/comgui_trace/Difference.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <random>

using namespace tracing;

namespace
{
using Lines = std::vector<std::string>;

std::string Told(Lines const& before, Lines const& after, std::size_t around)
{
    std::string told;
    for (DifferingLine const& line : Difference(before, after, around))
        told += (line.kind == DifferingLine::Same      ? " "
                 : line.kind == DifferingLine::Removed ? "-"
                                                       : "+") +
                *line.line;
    return told;
}

// The length of the longest common subsequence, by the table.
std::size_t Common(Lines const& one, Lines const& two)
{
    std::vector<std::vector<std::size_t>> table(one.size() + 1, std::vector<std::size_t>(two.size() + 1));
    for (std::size_t i = 1; i <= one.size(); ++i)
        for (std::size_t j = 1; j <= two.size(); ++j)
            table[i][j] = one[i - 1] == two[j - 1] ? table[i - 1][j - 1] + 1
                                                   : std::max(table[i - 1][j], table[i][j - 1]);
    return table[one.size()][two.size()];
}
}  // namespace

TEST(DifferenceOfLines, OfTheSame_IsNone)
{
    EXPECT_EQ(Told({}, {}, 3), "");
    EXPECT_EQ(Told({"a", "b"}, {"a", "b"}, 3), "");
}

TEST(DifferenceOfLines, ShowsWhatWentAndWhatCame)
{
    EXPECT_EQ(Told({"a", "b", "c"}, {"a", "x", "c"}, 0), "-b+x");
    EXPECT_EQ(Told({}, {"a"}, 0), "+a");
    EXPECT_EQ(Told({"a"}, {}, 0), "-a");
}

TEST(DifferenceOfLines, ShowsSoManyLinesAround)
{
    EXPECT_EQ(Told({"a", "b", "c", "d", "e"}, {"a", "b", "d", "e"}, 1), " b-c d");
}

TEST(DifferenceOfLines, OfRandomLines_IsTheShortestAndMakesOneOfTheOther)
{
    std::mt19937 random(7);
    for (int round = 0; round < 500; ++round)
    {
        Lines before(random() % 12);
        Lines after(random() % 12);
        for (Lines* const lines : {&before, &after})
            for (std::string& line : *lines)
                line = std::string(1, static_cast<char>('a' + random() % 4));
        Lines made;
        std::size_t same = 0;
        auto const taken = Difference(before, after, 100);
        for (DifferingLine const& line : taken)
        {
            same += line.kind == DifferingLine::Same ? 1U : 0U;
            if (line.kind != DifferingLine::Removed)
                made.push_back(*line.line);
        }
        if (before == after)
            continue;
        EXPECT_EQ(made, after);
        EXPECT_EQ(same, Common(before, after));
    }
}
