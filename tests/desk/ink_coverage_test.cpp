#include "desk/model/InkCoverage.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

using namespace desk;
using comgui::Snapshot;
using comgui::Value;

namespace
{
std::vector<std::string> NamesOf(InkCoverage const& coverage)
{
    std::vector<std::string> names;
    for (Ink const& ink : coverage.Inks())
        names.push_back(ink.name);
    return names;
}

InkCoverage Of(std::vector<comgui::SnapshotEntry> entries)
{
    InkCoverage coverage;
    coverage.Take(Snapshot(std::move(entries)));
    return coverage;
}

struct ValueFact
{
    char const* name;
    Value value;
    std::optional<double> coverage;
};
class CoverageOfValue : public testing::TestWithParam<ValueFact>
{
};

struct ColourFact
{
    char const* name;
    Value value;
    Rgb colour;
};
class ColourOfValue : public testing::TestWithParam<ColourFact>
{
};
constexpr Rgb Grey{128, 128, 128};
}  // namespace

TEST(InkCoverage, MayBeTwoLists)
{
    comgui::Value const names(comgui::MakeList<std::string>({"Cyan", "Gold", "a/b"}));
    auto const coverage = Of({{"Job/InkCoverage", comgui::MakeList<double>({0.25, 0.5, 0.5, 0.5})},
                              {"Job/Inks/Gold/Coverage", 7},
                              {"Job/Separations", names}});
    ASSERT_EQ(NamesOf(coverage), (std::vector<std::string>{"Cyan", "Gold"}));
    EXPECT_EQ(coverage.Inks()[0].coverage, 25);
    EXPECT_EQ(coverage.Inks()[1].coverage, 7);  // the key counts more
}

TEST(InkCoverage, OfListsThatAreNone_IsNone)
{
    comgui::Value const names(comgui::MakeList<std::string>({"Cyan"}));
    EXPECT_TRUE(Of({{"Job/InkCoverage", 0.5}, {"Job/Separations", names}}).Inks().empty());
    EXPECT_TRUE(Of({{"Job/Separations", names}}).Inks().empty());
    EXPECT_TRUE(
        Of({{"Job/InkCoverage", comgui::MakeList<int>({1})}, {"Job/Separations", names}}).Inks().empty());
    EXPECT_TRUE(
        Of({{"Job/InkCoverage", comgui::MakeList<double>({-1})}, {"Job/Separations", names}}).Inks().empty());
}

TEST(InkCoverage, ProcessInksComeInTheOrderOfPrintingThenSpotInks)
{
    auto const coverage = Of({{"Job/Inks/Black/Coverage", 4},
                              {"Job/Inks/Gold/Coverage", 7},
                              {"Job/Inks/Cyan/Coverage", 1},
                              {"Job/Inks/Varnish/Coverage", 6},
                              {"Job/Inks/Acid/Coverage", 8},
                              {"Job/Inks/YELLOW/Coverage", 3},
                              {"Job/Inks/White/Coverage", 5},
                              {"Job/Inks/Magenta/Coverage", 2}});
    EXPECT_EQ(NamesOf(coverage), (std::vector<std::string>{"Cyan", "Magenta", "YELLOW", "Black", "White",
                                                           "Varnish", "Acid", "Gold"}));
    EXPECT_DOUBLE_EQ(coverage.Total(), 36);
}

TEST(InkCoverage, OtherKeysAreNoInks)
{
    auto const coverage = Of({{"Job/Copies", 3},
                              {"Job/Inks", 1},
                              {"Job/Inks/", 1},
                              {"Job/Inks/Coverage", 1},
                              {"Job/Inks//Coverage", 1},
                              {"Job/Inks/Cyan/coverage", 1},
                              {"Job/Inks/Cyan/Coverage/Mean", 1},
                              {"Job/Inks/A/B/Coverage", 1},
                              {"Job/Inks/" + std::string(201, 'x') + "/Coverage", 1},
                              {"Job/InksOf/Cyan/Coverage", 1},
                              {"Job/Inks/Magenta/Colour", "#102030"},
                              {"Job/Inks/" + std::string(200, 'x') + "/Coverage", 1}});
    EXPECT_EQ(NamesOf(coverage), std::vector{std::string(200, 'x')});
}

TEST_P(CoverageOfValue, IsTakenOrLeftOut)
{
    auto const coverage = Of({{"Job/Inks/Cyan/Coverage", GetParam().value}});
    ASSERT_EQ(coverage.Inks().empty(), !GetParam().coverage);
    if (GetParam().coverage)
    {
        EXPECT_DOUBLE_EQ(coverage.Inks()[0].coverage, *GetParam().coverage);
    }
}
INSTANTIATE_TEST_SUITE_P(
    Facts, CoverageOfValue,
    testing::Values(ValueFact{"Double", 12.5, 12.5}, ValueFact{"Int", 40, 40.0},
                    ValueFact{"Int64", 40LL, 40.0}, ValueFact{"Unsigned", 40U, 40.0},
                    ValueFact{"Unsigned64", 40ULL, 40.0}, ValueFact{"Zero", 0, 0.0},
                    ValueFact{"All", 100, 100.0}, ValueFact{"SeveralTimes", 1000.0, 1000.0},
                    ValueFact{"TooMuch", 1000.1, {}}, ValueFact{"Negative", -0.1, {}},
                    ValueFact{"NegativeInt", -1, {}}, ValueFact{"NoNumber", std::nan(""), {}},
                    ValueFact{"Endless", std::numeric_limits<double>::infinity(), {}},
                    ValueFact{"Text", std::string("12"), {}}, ValueFact{"Bytes", comgui::Bytes{"12"}, {}},
                    ValueFact{"List", comgui::MakeList<int>({12}), {}},
                    ValueFact{"Huge", std::numeric_limits<unsigned long long>::max(), {}}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST_P(ColourOfValue, IsTakenOrThatOfAnUnknownInk)
{
    auto const coverage = Of({{"Job/Inks/Gold/Coverage", 1}, {"Job/Inks/Gold/Colour", GetParam().value}});
    ASSERT_EQ(coverage.Inks().size(), 1U);
    EXPECT_EQ(coverage.Inks()[0].colour, GetParam().colour);
}
INSTANTIATE_TEST_SUITE_P(
    Facts, ColourOfValue,
    testing::Values(ColourFact{"Capitals", "#C0A0FF", {192, 160, 255}},
                    ColourFact{"Small", "#c0a0ff", {192, 160, 255}}, ColourFact{"NoHash", "C0A0FF", Grey},
                    ColourFact{"Short", "#C0A", Grey}, ColourFact{"Long", "#C0A0FF00", Grey},
                    ColourFact{"NoDigit", "#C0A0FG", Grey}, ColourFact{"Signed", "#+1+1+1", Grey},
                    ColourFact{"Name", "gold", Grey}, ColourFact{"Empty", "", Grey},
                    ColourFact{"Number", 12632319, Grey}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(InkCoverage, AProcessInkHasAColourOfItsOwnUnlessTheTicketHas)
{
    auto const own = Of({{"Job/Inks/Cyan/Coverage", 1}});
    EXPECT_NE(own.Inks()[0].colour, Grey);
    auto const told = Of({{"Job/Inks/Cyan/Coverage", 1}, {"Job/Inks/Cyan/Colour", "#010203"}});
    EXPECT_EQ(told.Inks()[0].colour, (Rgb{1, 2, 3}));
    auto const bad = Of({{"Job/Inks/Cyan/Coverage", 1}, {"Job/Inks/Cyan/Colour", "blue"}});
    EXPECT_EQ(bad.Inks()[0].colour, own.Inks()[0].colour);
}

TEST(InkCoverage, ASnapshotReplacesAllBefore)
{
    auto coverage = Of({{"Job/Inks/Gold/Coverage", 5}});
    coverage.Take(Snapshot({{"Job/Inks/Cyan/Coverage", 1}}));
    EXPECT_EQ(NamesOf(coverage), std::vector<std::string>{"Cyan"});
}

TEST(InkCoverage, IsBounded)
{
    std::vector<comgui::SnapshotEntry> entries;
    for (int i = 0; i < 100000; ++i)
        entries.push_back({"Job/Inks/Spot " + std::to_string(i) + "/Coverage", 1});
    EXPECT_EQ(Of(std::move(entries)).Inks().size(), InkCoverage::GreatestCount);
}
