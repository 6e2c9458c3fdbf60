#include "desk/model/TicketIndex.h"

#include <gtest/gtest.h>

using namespace comgui;
using desk::TicketIndex;

TEST(TicketIndex, TypesAreSorted)
{
    TicketIndex index;
    index.Show(JobTickets, {2, 1});
    index.Show(SystemTickets, {0});
    index.Add({99, 7});
    EXPECT_EQ(index.Types(), (std::vector<int>{0, 3, 99}));
}

TEST(TicketIndex, CountsByTypeAndInAll)
{
    TicketIndex index;
    index.Show(JobTickets, {2, 1, 2});
    index.Show(QueueTickets, {5});
    EXPECT_EQ(index.Count(JobTickets), 2U);
    EXPECT_EQ(index.Count(QueueTickets), 1U);
    EXPECT_EQ(index.Count(PaperTickets), 0U);
    EXPECT_EQ(index.Count(), 3U);
}

TEST(TicketIndex, AddAndRemove_GiveThePlaceWithinTheType)
{
    TicketIndex index;
    index.Show(JobTickets, {1, 5});
    index.Show(SystemTickets, {0, 1, 2});
    EXPECT_EQ(index.Add({JobTickets, 3}), 1U);
    EXPECT_EQ(index.Add({JobTickets, 3}), std::nullopt);
    EXPECT_EQ(index.Count(), 6U);
    EXPECT_EQ(index.Remove({JobTickets, 5}), 2U);
    EXPECT_EQ(index.Remove({JobTickets, 5}), std::nullopt);
    EXPECT_EQ(index.Remove({PaperTickets, 5}), std::nullopt);
    EXPECT_EQ(index.Count(), 5U);
}

TEST(TicketIndex, AtAndIndexOf_AreInverse)
{
    TicketIndex index;
    index.Show(JobTickets, {10, 20, 30});
    EXPECT_EQ(index.At(JobTickets, 1), (TicketAddress{JobTickets, 20}));
    EXPECT_EQ(index.IndexOf({JobTickets, 20}), 1U);
    EXPECT_EQ(index.At(JobTickets, 3), std::nullopt);
    EXPECT_EQ(index.At(PaperTickets, 0), std::nullopt);
    EXPECT_EQ(index.IndexOf({JobTickets, 25}), std::nullopt);
    EXPECT_EQ(index.IndexOf({PaperTickets, 20}), std::nullopt);
}

TEST(TicketIndex, ATypeStaysAfterItsLastTicket)
{
    TicketIndex index;
    index.Add({JobTickets, 1});
    index.Remove({JobTickets, 1});
    EXPECT_EQ(index.Types(), std::vector<int>{JobTickets});
    EXPECT_EQ(index.Count(JobTickets), 0U);
}

TEST(TicketIndex, ShowAgain_ReplacesTheIds)
{
    TicketIndex index;
    index.Show(JobTickets, {1, 2, 3});
    index.Show(JobTickets, {4});
    EXPECT_EQ(index.Count(), 1U);
    EXPECT_EQ(index.At(JobTickets, 0), (TicketAddress{JobTickets, 4}));
}

TEST(TicketIndex, Clear_ForgetsTypesToo)
{
    TicketIndex index;
    index.Show(JobTickets, {1});
    index.Clear();
    EXPECT_TRUE(index.Types().empty());
    EXPECT_EQ(index.Count(), 0U);
}
