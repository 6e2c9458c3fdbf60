#include "desk/model/NiceScale.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

using namespace desk;

namespace
{
struct ScaleFact
{
    char const* name;
    double low;
    double high;
    int pixels;
    Quantity quantity;
    std::vector<double> ticks;
    int digits;
    int power;
};
class NiceScaleOf : public testing::TestWithParam<ScaleFact>
{
};

struct NumberFact
{
    char const* name;
    double value;
    Quantity quantity;
    double number;
    int digits;
    int power;
};
class ScaledOf : public testing::TestWithParam<NumberFact>
{
};
constexpr double Endless = std::numeric_limits<double>::infinity();
}  // namespace

TEST_P(NiceScaleOf, HasTheseTicks)
{
    ScaleFact const& fact = GetParam();
    NiceScale const scale(fact.low, fact.high, fact.pixels, 20, fact.quantity);
    ASSERT_EQ(scale.Ticks().size(), fact.ticks.size()) << testing::PrintToString(scale.Ticks());
    for (std::size_t i = 0; i < fact.ticks.size(); ++i)
        EXPECT_NEAR(scale.Ticks()[i], fact.ticks[i], 1e-9 * std::abs(fact.ticks.back()));
    EXPECT_EQ(scale.Label(scale.High()).digits, fact.digits);
    EXPECT_EQ(scale.Label(scale.High()).power, fact.power);
}
INSTANTIATE_TEST_SUITE_P(
    Facts, NiceScaleOf,
    testing::Values(
        ScaleFact{"Percent", 0, 100, 100, Quantity::Number, {0, 20, 40, 60, 80, 100}, 0, 0},
        ScaleFact{"Short", 0, 100, 20, Quantity::Number, {0, 100}, 0, 0},
        ScaleFact{"NoPixels", 0, 100, 0, Quantity::Number, {0, 100}, 0, 0},
        ScaleFact{"Fractions", 0, 0.9, 100, Quantity::Number, {0, 0.2, 0.4, 0.6, 0.8, 1}, 1, 0},
        ScaleFact{"Hundredths", 0.01, 0.04, 60, Quantity::Number, {0.01, 0.02, 0.03, 0.04}, 2, 0},
        ScaleFact{"Negative", -30, 70, 40, Quantity::Number, {-50, 0, 50, 100}, 0, 0},
        ScaleFact{"Reversed", 10, 0, 40, Quantity::Number, {0, 5, 10}, 0, 0},
        ScaleFact{"Nothing", 0, 0, 40, Quantity::Number, {0, 0.5, 1}, 1, 0},
        ScaleFact{"Bytes", 0, 3, 200, Quantity::DecimalBytes, {0, 1, 2, 3}, 0, 0},
        ScaleFact{"Megabytes", 0, 3e6, 60, Quantity::DecimalBytes, {0, 1e6, 2e6, 3e6}, 0, 2},
        ScaleFact{"Kibibytes", 0, 2048, 40, Quantity::BinaryBytes, {0, 1024, 2048}, 0, 1},
        ScaleFact{"HalfKibibytes", 0, 1536, 60, Quantity::BinaryBytes, {0, 512, 1024, 1536}, 1, 1}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(NiceScale, CopesWithWhatIsNoRange)
{
    for (double const low : {std::nan(""), -Endless, 1e308, -1e308, 0.0, 1e16, 5e-324})
        for (double const high : {std::nan(""), Endless, 1e308, -1e308, 0.0, 1e16 + 2, 5e-324})
        {
            NiceScale const scale(low, high, 500, 10);
            ASSERT_GE(scale.Ticks().size(), 2U);
            ASSERT_LE(scale.Ticks().size(), 23U);
            for (std::size_t i = 1; i < scale.Ticks().size(); ++i)
                EXPECT_LT(scale.Ticks()[i - 1], scale.Ticks()[i]) << low << " to " << high;
            EXPECT_TRUE(std::isfinite(scale.Share(1)));
        }
}

TEST(NiceScale, ContainsTheRange)
{
    for (double high = 0.0007; high < 1e13; high *= 1.37)
        for (Quantity const quantity : {Quantity::Number, Quantity::DecimalBytes, Quantity::BinaryBytes})
        {
            NiceScale const scale(high / 3, high, 120, 30, quantity);
            EXPECT_LE(scale.Low(), high / 3 * (1 + 1e-9));
            EXPECT_GE(scale.High(), high * (1 - 1e-9));
            EXPECT_LE(scale.Ticks().size(), 7U);
        }
}

TEST(NiceScale, ShareIsThePlaceOnTheAxis)
{
    NiceScale const scale(0, 100, 100, 20);
    EXPECT_EQ(scale.Share(0), 0);
    EXPECT_EQ(scale.Share(25), 0.25);
    EXPECT_EQ(scale.Share(100), 1);
}

TEST_P(ScaledOf, HasThisNumber)
{
    NumberFact const& fact = GetParam();
    ScaledNumber const scaled = Scaled(fact.value, fact.quantity);
    EXPECT_NEAR(scaled.number, fact.number, 1e-3);
    EXPECT_EQ(scaled.digits, fact.digits);
    EXPECT_EQ(scaled.power, fact.power);
}
INSTANTIATE_TEST_SUITE_P(
    Facts, ScaledOf,
    testing::Values(NumberFact{"Zero", 0, Quantity::Number, 0, 2, 0},
                    NumberFact{"ZeroBytes", 0, Quantity::DecimalBytes, 0, 0, 0},
                    NumberFact{"Bytes", 999, Quantity::DecimalBytes, 999, 0, 0},
                    NumberFact{"Kilobyte", 1000, Quantity::DecimalBytes, 1, 2, 1},
                    NumberFact{"Kibibyte", 1536, Quantity::BinaryBytes, 1.5, 2, 1},
                    NumberFact{"BelowKibibyte", 1023, Quantity::BinaryBytes, 1023, 0, 0},
                    NumberFact{"Megabytes", 12.34e6, Quantity::DecimalBytes, 12.34, 1, 2},
                    NumberFact{"Hundreds", 123.4e6, Quantity::DecimalBytes, 123.4, 0, 2},
                    NumberFact{"WouldRoundToTheNextUnit", 999.7e3, Quantity::DecimalBytes, 0.9997, 2, 2},
                    NumberFact{"Most", 5e24, Quantity::DecimalBytes, 5e6, 0, 6},
                    NumberFact{"NoNumber", std::nan(""), Quantity::BinaryBytes, 0, 0, 0},
                    NumberFact{"Endless", Endless, Quantity::Number, 0, 2, 0}),
    [](auto const& fact) { return std::string(fact.param.name); });
