#include "desk/model/TicketComparison.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <map>
#include <numeric>
#include <random>
#include <stdexcept>

using namespace comgui;
using namespace desk;

namespace
{
Snapshot Left() { return Snapshot({{"a", 1}, {"b", 2}, {"d", "same"}}); }
Snapshot Right() { return Snapshot({{"b", 3}, {"c", 4}, {"d", "same"}}); }

char const* SignOf(RowState state)
{
    constexpr char const* Signs[] = {"<", ">", "=", "!"};
    return Signs[static_cast<int>(state)];
}

std::string RowsOf(TicketComparison const& comparison)
{
    std::string rows;
    for (std::size_t i = 0; i < comparison.Rows(); ++i)
    {
        ComparedRow const row = comparison.Row(i);
        rows += row.key + SignOf(row.state) + " ";
    }
    return rows;
}

std::string ShownOf(TicketComparison& comparison, RowFilter filter)
{
    comparison.Show(filter);
    return RowsOf(comparison);
}

void ExpectChange(RowChange change, RowChange::Kind kind, std::size_t row)
{
    EXPECT_EQ(change.kind, kind);
    EXPECT_EQ(change.row, row);
}

Snapshot Large(int count)
{
    std::vector<SnapshotEntry> entries;
    for (int i = 0; i < count; ++i)
        entries.push_back({"Key/" + std::to_string(1000000 + i), i});
    return Snapshot(std::move(entries));
}
}  // namespace

TEST(TicketComparison, RowsAreAlignedByKey)
{
    TicketComparison const comparison(Left(), Right());
    EXPECT_EQ(RowsOf(comparison), "a< b! c> d= ");
}

TEST(TicketComparison, Differences_LeaveOutWhatIsEqual)
{
    TicketComparison comparison(Left(), Right());
    EXPECT_EQ(ShownOf(comparison, RowFilter::Differences), "a< b! c> ");
    EXPECT_EQ(ShownOf(comparison, RowFilter::All), "a< b! c> d= ");
}

TEST(TicketComparison, ARow_HasTheValuesOfBothSides)
{
    TicketComparison const comparison(Left(), Right());
    EXPECT_EQ(*comparison.Row(1).left, Value(2));
    EXPECT_EQ(*comparison.Row(1).right, Value(3));
    EXPECT_EQ(comparison.Row(0).right, nullptr);
    EXPECT_EQ(comparison.Row(2).left, nullptr);
    EXPECT_THROW(comparison.Row(4), std::out_of_range);
}

TEST(TicketComparison, CountsDoNotDependOnTheFilter)
{
    TicketComparison comparison(Left(), Right());
    comparison.Show(RowFilter::Differences);
    EXPECT_EQ(comparison.Count(RowState::OnlyLeft), 1U);
    EXPECT_EQ(comparison.Count(RowState::OnlyRight), 1U);
    EXPECT_EQ(comparison.Count(RowState::Equal), 1U);
    EXPECT_EQ(comparison.Count(RowState::Different), 1U);
}

TEST(TicketComparison, OfNothing_HasNoRows)
{
    TicketComparison const comparison{Snapshot(), Snapshot()};
    EXPECT_EQ(comparison.Rows(), 0U);
    EXPECT_EQ(comparison.RowOf("a"), std::nullopt);
}

TEST(TicketComparison, AnotherTypeIsADifference)
{
    TicketComparison const comparison(Snapshot({{"a", 1}}), Snapshot({{"a", 1.0}}));
    EXPECT_EQ(RowsOf(comparison), "a! ");
}

TEST(TicketComparison, RowOf_GoesByTheFilter)
{
    TicketComparison comparison(Left(), Right());
    EXPECT_EQ(comparison.RowOf("d"), 3U);
    EXPECT_EQ(comparison.RowOf("bb"), std::nullopt);
    comparison.Show(RowFilter::Differences);
    EXPECT_EQ(comparison.RowOf("d"), std::nullopt);
    EXPECT_EQ(comparison.RowOf("c"), 2U);
}

TEST(TicketComparison, AValueThatBecomesEqual_LeavesTheDifferences)
{
    TicketComparison comparison(Left(), Right());
    comparison.Show(RowFilter::Differences);
    ExpectChange(comparison.Update(Side::Left, "b", 3), RowChange::Removed, 1);
    EXPECT_EQ(RowsOf(comparison), "a< c> ");
    EXPECT_EQ(ShownOf(comparison, RowFilter::All), "a< b= c> d= ");
}

TEST(TicketComparison, AValueThatBecomesDifferent_ComesAmongTheDifferences)
{
    TicketComparison comparison(Left(), Right());
    comparison.Show(RowFilter::Differences);
    ExpectChange(comparison.Update(Side::Right, "d", "other"), RowChange::Inserted, 3);
    EXPECT_EQ(RowsOf(comparison), "a< b! c> d! ");
}

TEST(TicketComparison, AChangedValue_ChangesItsRow)
{
    TicketComparison comparison(Left(), Right());
    ExpectChange(comparison.Update(Side::Right, "d", "other"), RowChange::Changed, 3);
    EXPECT_EQ(*comparison.Row(3).right, Value("other"));
}

TEST(TicketComparison, AnEqualRowThatStaysEqual_IsNoneOfTheDifferences)
{
    TicketComparison comparison(Left(), Right());
    comparison.Show(RowFilter::Differences);
    ExpectChange(comparison.Update(Side::Right, "d", "same"), RowChange::None, 0);
    EXPECT_EQ(RowsOf(comparison), "a< b! c> ");
}

TEST(TicketComparison, ANewKey_IsInsertedWhereItBelongs)
{
    TicketComparison comparison(Left(), Right());
    ExpectChange(comparison.Update(Side::Right, "bb", 5), RowChange::Inserted, 2);
    EXPECT_EQ(RowsOf(comparison), "a< b! bb> c> d= ");
    EXPECT_EQ(comparison.Count(RowState::OnlyRight), 2U);
}

TEST(TicketComparison, AKeyThatLeavesOneSide_StaysOnTheOther)
{
    TicketComparison comparison(Left(), Right());
    ExpectChange(comparison.Update(Side::Right, "d", std::nullopt), RowChange::Changed, 3);
    EXPECT_EQ(RowsOf(comparison), "a< b! c> d< ");
}

TEST(TicketComparison, AKeyThatLeavesBothSides_IsGone)
{
    TicketComparison comparison(Left(), Right());
    ExpectChange(comparison.Update(Side::Left, "a", std::nullopt), RowChange::Removed, 0);
    EXPECT_EQ(RowsOf(comparison), "b! c> d= ");
    EXPECT_EQ(comparison.Count(RowState::OnlyLeft), 0U);
    ExpectChange(comparison.Update(Side::Left, "a", std::nullopt), RowChange::None, 0);
}

TEST(TicketComparison, WhatIsThereAlready_ChangesNothing)
{
    TicketComparison comparison(Left(), Right());
    ExpectChange(comparison.Update(Side::Left, "a", 1), RowChange::None, 0);
    ExpectChange(comparison.Update(Side::Right, "a", std::nullopt), RowChange::None, 0);
    EXPECT_EQ(RowsOf(comparison), "a< b! c> d= ");
}

TEST(TicketComparison, UpdateAll_MakesTheSameRows)
{
    TicketComparison comparison(Left(), Right());
    comparison.UpdateAll(Side::Left, {{"a", {}}, {"b", 3}, {"e", 5}, {"e", 6}, {"f", 1}, {"f", {}}});
    EXPECT_EQ(RowsOf(comparison), "b= c> d= e< ");
    EXPECT_EQ(ShownOf(comparison, RowFilter::Differences), "c> e< ");
    EXPECT_EQ(comparison.Count(RowState::Equal), 2U);
    EXPECT_EQ(comparison.Count(RowState::OnlyLeft), 1U);
}

TEST(TicketComparison, AnyChanges_MakeTheRowsOfTheirSnapshots)
{
    std::mt19937 random(3);
    std::map<std::string, Value> sides[2];
    TicketComparison comparison{Snapshot(), Snapshot()};
    for (int round = 0; round < 3000; ++round)
    {
        std::size_t const side = random() % 2;
        std::string const key = "k" + std::to_string(random() % 40);
        if (random() % 3 == 0)
            sides[side].erase(key);
        else
            sides[side][key] = static_cast<int>(random() % 3);
        auto const found = sides[side].find(key);
        comparison.Show(random() % 2 == 0 ? RowFilter::All : RowFilter::Differences);
        std::string const before = RowsOf(comparison);
        RowChange const change =
            comparison.Update(static_cast<Side>(side), key,
                              found == sides[side].end() ? std::nullopt : std::optional(found->second));
        if (change.kind == RowChange::None)
        {
            ASSERT_EQ(RowsOf(comparison), before);
        }
        else if (change.kind != RowChange::Removed)
        {
            ASSERT_EQ(comparison.Row(change.row).key, key);
        }
    }
    auto const snapshotOf = [](auto const& side)
    {
        std::vector<SnapshotEntry> entries;
        for (auto const& [key, value] : side)
            entries.push_back({key, value});
        return Snapshot(std::move(entries));
    };
    TicketComparison fresh(snapshotOf(sides[0]), snapshotOf(sides[1]));
    for (RowFilter const filter : {RowFilter::All, RowFilter::Differences})
        EXPECT_EQ(ShownOf(comparison, filter), ShownOf(fresh, filter));
    for (RowState const state :
         {RowState::OnlyLeft, RowState::OnlyRight, RowState::Equal, RowState::Different})
        EXPECT_EQ(comparison.Count(state), fresh.Count(state));
}

TEST(TicketComparison, HundredThousandKeys_TakeAsManyChanges)
{
    Snapshot const ticket = Large(100000);
    TicketComparison comparison(ticket, ticket);
    comparison.Show(RowFilter::Differences);
    for (auto const& entry : ticket.Entries())
        comparison.Update(Side::Right, entry.key, 7);
    EXPECT_EQ(comparison.Rows(), 99999U);  // one was 7
    EXPECT_EQ(comparison.Row(99998).key, "Key/1099999");
    comparison.Show(RowFilter::All);
    EXPECT_EQ(comparison.Rows(), 100000U);
}

TEST(TicketComparison, ManyNewKeysInAnyOrder_TakeTheirPlaces)
{
    std::vector<int> numbers(20000);
    std::iota(numbers.begin(), numbers.end(), 0);
    std::shuffle(numbers.begin(), numbers.end(), std::mt19937(5));
    TicketComparison comparison{Snapshot(), Snapshot()};
    for (int const number : numbers)
        comparison.Update(Side::Left, "Key/" + std::to_string(1000000 + number), number);
    ASSERT_EQ(comparison.Rows(), numbers.size());
    for (std::size_t row = 0; row < comparison.Rows(); ++row)
        ASSERT_EQ(*comparison.Row(row).left, Value(static_cast<int>(row)));
}

TEST(TicketComparison, HundredThousandChangesAtOnce_TakeTheirPlaces)
{
    std::vector<KeyValue> changes;
    Snapshot const ticket = Large(100000);
    for (auto const& [key, value] : ticket.Entries())
        changes.push_back({key, value});
    std::shuffle(changes.begin(), changes.end(), std::mt19937(5));
    TicketComparison comparison(ticket, Snapshot());
    comparison.UpdateAll(Side::Right, changes);
    EXPECT_EQ(comparison.Rows(), 100000U);
    EXPECT_EQ(comparison.Count(RowState::Equal), 100000U);
    EXPECT_EQ(ShownOf(comparison, RowFilter::Differences), "");
}
