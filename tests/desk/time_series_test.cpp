#include "desk/model/TimeSeries.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

using desk::TimeSeries;

TEST(TimeSeries, AnHourFitsInFewPoints)
{
    TimeSeries series(300);
    for (int i = 0; i <= 36000; ++i)
        series.Add(i * 0.1, i);
    EXPECT_LE(series.Points().size(), 300U);
    EXPECT_GE(series.Points().size(), 150U);
    EXPECT_EQ(series.Points().back().time, 3600);
    EXPECT_EQ(series.Last(), 36000);
    EXPECT_EQ(series.Points().front().low, 0);
}

TEST(TimeSeries, APeakStaysVisible)
{
    TimeSeries series(10);
    for (int i = 0; i < 1000; ++i)
        series.Add(i, i == 500 ? 77 : i == 600 ? -5 : 1);
    double high = 0;
    double low = 0;
    for (auto const& point : series.Points())
    {
        high = std::max(high, point.high);
        low = std::min(low, point.low);
    }
    EXPECT_EQ(high, 77);
    EXPECT_EQ(low, -5);
    EXPECT_EQ(series.Highest(), 77);
    EXPECT_EQ(series.Lowest(), -5);
}

TEST(TimeSeries, OfOneSlotTheLatestValueCounts)
{
    TimeSeries series(10, 1.0);
    for (double const value : {3.0, 9.0, 1.0, 4.0})
        series.Add(5, value);
    ASSERT_EQ(series.Points().size(), 1U);
    EXPECT_EQ(series.Points()[0].value, 4);
    EXPECT_EQ(series.Points()[0].low, 1);
    EXPECT_EQ(series.Points()[0].high, 9);
}

TEST(TimeSeries, PointsAreInTheOrderOfTime)
{
    TimeSeries series(20);
    for (int i = 0; i < 500; ++i)
        series.Add(i % 7 == 0 ? i - 20 : i, i);
    ASSERT_GT(series.Points().size(), 2U);
    for (std::size_t i = 1; i < series.Points().size(); ++i)
        EXPECT_LT(series.Points()[i - 1].time, series.Points()[i].time);
}

TEST(TimeSeries, WhatIsNoNumberIsLeftOut)
{
    TimeSeries series;
    series.Add(0, std::nan(""));
    series.Add(std::numeric_limits<double>::infinity(), 1);
    EXPECT_TRUE(series.IsEmpty());
    EXPECT_EQ(series.Last(), 0);
    series.Add(1, 2);
    EXPECT_FALSE(series.IsEmpty());
}

TEST(TimeSeries, AGapOfYearsTakesNoMemory)
{
    TimeSeries series(10);
    for (int i = 0; i < 100; ++i)
        series.Add(std::pow(2.0, i), i);
    EXPECT_LE(series.Points().size(), 10U);
    EXPECT_EQ(series.Last(), 99);
}

TEST(TimeSeries, NearestFindsThePointOnEitherSide)
{
    TimeSeries series;
    EXPECT_EQ(series.Nearest(1), nullptr);
    for (double const time : {1.0, 2.0, 4.0})
        series.Add(time, time * 10);
    EXPECT_EQ(series.Nearest(-9)->value, 10);
    EXPECT_EQ(series.Nearest(2.9)->value, 20);
    EXPECT_EQ(series.Nearest(3.1)->value, 40);
    EXPECT_EQ(series.Nearest(99)->value, 40);
}
