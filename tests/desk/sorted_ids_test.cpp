#include "desk/model/SortedIds.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <limits>
#include <random>
#include <set>

using desk::SortedIds;

namespace
{
// Every operation and both look-ups agree with a set.
void ExpectSame(SortedIds const& ids, std::set<int> const& expected)
{
    ASSERT_EQ(ids.Size(), expected.size());
    std::size_t index = 0;
    for (int const id : expected)
    {
        ASSERT_EQ(ids.At(index), id);
        ASSERT_EQ(ids.IndexOf(id), index);
        ++index;
    }
    EXPECT_EQ(ids.At(index), std::nullopt);
}

std::vector<int> Shuffled(int count)
{
    std::vector<int> ids(static_cast<std::size_t>(count));
    for (int i = 0; i < count; ++i)
        ids[static_cast<std::size_t>(i)] = i * 3;
    std::shuffle(ids.begin(), ids.end(), std::mt19937(1));
    return ids;
}
}  // namespace

TEST(SortedIds, Nothing_HasNoPlaces)
{
    SortedIds ids;
    EXPECT_EQ(ids.Size(), 0U);
    EXPECT_EQ(ids.At(0), std::nullopt);
    EXPECT_EQ(ids.IndexOf(0), std::nullopt);
    EXPECT_EQ(ids.Erase(0), std::nullopt);
}

TEST(SortedIds, Insert_GivesThePlace)
{
    SortedIds ids;
    EXPECT_EQ(ids.Insert(5), 0U);
    EXPECT_EQ(ids.Insert(9), 1U);
    EXPECT_EQ(ids.Insert(7), 1U);
    EXPECT_EQ(ids.Insert(7), std::nullopt);
    ExpectSame(ids, {5, 7, 9});
}

TEST(SortedIds, Erase_GivesTheOldPlace)
{
    SortedIds ids;
    ids.Assign({1, 2, 3});
    EXPECT_EQ(ids.Erase(2), 1U);
    EXPECT_EQ(ids.Erase(2), std::nullopt);
    ExpectSame(ids, {1, 3});
}

TEST(SortedIds, Assign_SortsAndCountsRepeatedOnesOnce)
{
    SortedIds ids;
    ids.Assign({4, -1, 4, std::numeric_limits<int>::max(), std::numeric_limits<int>::min(), 0});
    ExpectSame(ids, {std::numeric_limits<int>::min(), -1, 0, 4, std::numeric_limits<int>::max()});
}

TEST(SortedIds, Assign_ReplacesWhatWasThere)
{
    SortedIds ids;
    ids.Assign({1, 2, 3});
    ids.Assign({});
    ExpectSame(ids, {});
    ids.Assign({8});
    ExpectSame(ids, {8});
}

TEST(SortedIds, AnyOrderOfManyChanges_AgreesWithASet)
{
    std::mt19937 random(7);
    SortedIds ids;
    std::set<int> expected;
    for (int round = 0; round < 60000; ++round)
    {
        int const id = static_cast<int>(random() % 20000);
        bool const isGrowing = round < 40000;
        bool const isInserted = random() % 4 < (isGrowing ? 3U : 1U);
        auto const place = isInserted ? ids.Insert(id) : ids.Erase(id);
        bool const isChanged = isInserted ? expected.insert(id).second : expected.erase(id) == 1;
        ASSERT_EQ(place.has_value(), isChanged);
    }
    ASSERT_GT(expected.size(), 3000U);
    ExpectSame(ids, expected);
}

TEST(SortedIds, ErasedToTheLast_IsEmpty)
{
    SortedIds ids;
    auto const all = Shuffled(5000);
    ids.Assign(all);
    for (int const id : all)
        ASSERT_TRUE(ids.Erase(id));
    ExpectSame(ids, {});
    EXPECT_EQ(ids.Insert(1), 0U);
}

TEST(SortedIds, HundredThousandOneByOne_TakeTheirPlaces)
{
    auto const all = Shuffled(100000);
    SortedIds ids;
    for (int const id : all)
        ids.Insert(id);
    ExpectSame(ids, std::set<int>(all.begin(), all.end()));
}
