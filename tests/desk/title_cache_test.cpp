#include "desk/model/TitleCache.h"

#include <gtest/gtest.h>

using comgui::TicketAddress;
using desk::TitleCache;
using desk::TitleRequest;

namespace
{
std::vector<TicketAddress> Jobs(int first, int count)
{
    std::vector<TicketAddress> jobs;
    for (int id = first; id < first + count; ++id)
        jobs.push_back({3, id});
    return jobs;
}

std::vector<int> IdsOf(std::vector<TitleRequest> const& requests)
{
    std::vector<int> ids;
    for (auto const& request : requests)
        ids.push_back(request.ticket.id);
    return ids;
}

void ReadAll(TitleCache& cache)
{
    for (auto const& request : cache.Take(1000000))
        cache.Put(request, "Job " + std::to_string(request.ticket.id));
}

constexpr TicketAddress Job1{3, 1};
}  // namespace

TEST(TitleCache, NothingVisible_AsksForNothing)
{
    TitleCache cache(10);
    EXPECT_TRUE(cache.Take(10).empty());
    EXPECT_EQ(cache.Find(Job1), nullptr);
}

TEST(TitleCache, AsksForVisibleTicketsOnce_FromTheTop)
{
    TitleCache cache(10);
    cache.SetVisible({{3, 5}, {3, 1}, {3, 9}});
    EXPECT_EQ(IdsOf(cache.Take(2)), (std::vector<int>{5, 1}));
    EXPECT_EQ(IdsOf(cache.Take(2)), std::vector<int>{9});
    EXPECT_TRUE(cache.Take(2).empty());
}

TEST(TitleCache, FindsWhatWasPut)
{
    TitleCache cache(10);
    cache.SetVisible({Job1});
    EXPECT_TRUE(cache.Put(cache.Take(1).at(0), "Cards"));
    ASSERT_NE(cache.Find(Job1), nullptr);
    EXPECT_EQ(*cache.Find(Job1), "Cards");
}

TEST(TitleCache, ATicketWithoutATitle_IsNotAskedForAgain)
{
    TitleCache cache(10);
    cache.SetVisible({Job1});
    EXPECT_TRUE(cache.Put(cache.Take(1).at(0), std::nullopt));
    cache.SetVisible({Job1});
    EXPECT_TRUE(cache.Take(1).empty());
    EXPECT_EQ(cache.Find(Job1), nullptr);
}

TEST(TitleCache, WhatScrolledAway_IsNotAskedFor)
{
    TitleCache cache(10);
    cache.SetVisible(Jobs(0, 3));
    cache.SetVisible(Jobs(100, 2));
    EXPECT_EQ(IdsOf(cache.Take(10)), (std::vector<int>{100, 101}));
}

TEST(TitleCache, WhatComesBackIntoSight_IsStillKnown)
{
    TitleCache cache(10);
    cache.SetVisible(Jobs(0, 3));
    ReadAll(cache);
    cache.SetVisible(Jobs(3, 3));
    cache.SetVisible(Jobs(0, 3));
    EXPECT_TRUE(cache.Take(10).empty());
    EXPECT_NE(cache.Find(Job1), nullptr);
}

TEST(TitleCache, OfMoreThanFit_TheLongestUnseenGo)
{
    TitleCache cache(4);
    cache.SetVisible(Jobs(0, 4));
    ReadAll(cache);
    cache.SetVisible(Jobs(1, 1));
    cache.SetVisible(Jobs(10, 3));
    EXPECT_EQ(cache.Size(), 4U);
    EXPECT_NE(cache.Find({3, 1}), nullptr);
    EXPECT_EQ(cache.Find({3, 0}), nullptr);
    EXPECT_EQ(cache.Find({3, 3}), nullptr);
}

TEST(TitleCache, AScrollThroughHundredThousand_StaysWithinTheCapacity)
{
    TitleCache cache(500);
    for (int top = 0; top < 100000; top += 40)
    {
        cache.SetVisible(Jobs(top, 50));
        ReadAll(cache);
        ASSERT_LE(cache.Size(), 500U);
    }
    EXPECT_NE(cache.Find({3, 99999}), nullptr);
}

TEST(TitleCache, MoreVisibleThanFit_AreCut)
{
    TitleCache cache(3);
    cache.SetVisible(Jobs(0, 100000));
    EXPECT_EQ(IdsOf(cache.Take(10)), (std::vector<int>{0, 1, 2}));
    EXPECT_EQ(cache.Size(), 3U);
}

TEST(TitleCache, ACapacityOfNothing_HoldsOne)
{
    TitleCache cache(0);
    cache.SetVisible(Jobs(0, 5));
    EXPECT_EQ(cache.Size(), 1U);
}

TEST(TitleCache, AChangedTicket_ShowsItsTitleUntilTheNewOneIsThere)
{
    TitleCache cache(10);
    cache.SetVisible({Job1});
    cache.Put(cache.Take(1).at(0), "Old");
    cache.Changed(Job1);
    EXPECT_EQ(*cache.Find(Job1), "Old");
    cache.Put(cache.Take(1).at(0), "New");
    EXPECT_EQ(*cache.Find(Job1), "New");
}

TEST(TitleCache, ATitleReadBeforeAChange_IsRefused)
{
    TitleCache cache(10);
    cache.SetVisible({Job1});
    auto const early = cache.Take(1).at(0);
    cache.Changed(Job1);
    EXPECT_FALSE(cache.Put(early, "Old"));
    auto const late = cache.Take(1).at(0);
    EXPECT_FALSE(cache.Put(early, "Old"));
    EXPECT_TRUE(cache.Put(late, "New"));
    EXPECT_FALSE(cache.Put(late, "Twice"));
    EXPECT_EQ(*cache.Find(Job1), "New");
}

TEST(TitleCache, AForgottenTicket_TakesNoTitle)
{
    TitleCache cache(10);
    cache.SetVisible({Job1});
    auto const request = cache.Take(1).at(0);
    cache.Forget(Job1);
    EXPECT_FALSE(cache.Put(request, "Cards"));
    EXPECT_EQ(cache.Find(Job1), nullptr);
    EXPECT_TRUE(cache.Take(1).empty());
    cache.Forget(Job1);
    EXPECT_EQ(cache.Size(), 0U);
}

TEST(TitleCache, AnotherTicketUnderTheSameId_TakesNoTitleOfTheOld)
{
    TitleCache cache(10);
    cache.SetVisible({Job1});
    auto const old = cache.Take(1).at(0);
    cache.Clear();
    cache.SetVisible({Job1});
    cache.Take(1);
    EXPECT_FALSE(cache.Put(old, "Of another session"));
}

TEST(TitleCache, ATicketThatIsVisibleTwice_IsAskedForOnce)
{
    TitleCache cache(10);
    cache.SetVisible({Job1, Job1});
    EXPECT_EQ(cache.Take(10).size(), 1U);
    EXPECT_EQ(cache.Size(), 1U);
}

TEST(TitleCache, ChangesOfUnknownTickets_AreNothing)
{
    TitleCache cache(10);
    cache.Changed(Job1);
    EXPECT_FALSE(cache.Put({Job1, 1}, "Cards"));
    EXPECT_EQ(cache.Size(), 0U);
}
