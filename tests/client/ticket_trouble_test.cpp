// What the kit makes of tickets that a plug-in does not give as it should.
#include "tests/client/TroubledClient.h"

#include <gmock/gmock.h>

using namespace comgui;
using namespace std::chrono_literals;
using testing::ElementsAre;

namespace
{
class TroubledTicket : public TroubledClient
{
protected:
    TroubledTicket()
    {
        LogIn();
        (void)tickets.WriteAll(job, {{"A", 1}, {"B", MakeList<int>({1, 2})}, {"C", "text"}});
    }

    TICKET_TROUBLE& orders = trouble.tickets;
    TicketAddress job{JobTickets, 1};
};
}  // namespace

// --- walks that end early

TEST_F(TroubledTicket, WalkThatIsRefused_IsAFailure)
{
    auto const all = [this]
    {
        return std::vector{CodeOf(tickets.ReadAll(job)), CodeOf(tickets.Keys(job)),
                           CodeOf(tickets.Read(job, "B"))};
    };
    ASSERT_THAT(all(), ElementsAre(0, 0, 0));
    orders.refusedWalks = 3;
    EXPECT_THAT(all(), ElementsAre(BadAnswer, BadAnswer, BadAnswer));
}

TEST_F(TroubledTicket, TicketThatIsDeletedWhileItIsOpened_IsNoEmptyOne)
{
    orders.afterOpening = [this] { ASSERT_TRUE(tickets.Delete(job)); };
    EXPECT_EQ(CodeOf(tickets.ReadAll(job)), NoSuchTicket);
    EXPECT_FALSE(orders.afterOpening);
}

TEST_F(TroubledTicket, WalkThatALogoutCuts_IsAFailure)
{
    orders.afterFirstValue = [this] { ASSERT_TRUE(connection.LogOut()); };
    EXPECT_EQ(CodeOf(tickets.ReadAll(job)), NotLoggedIn);
    LogIn();
    orders.afterFirstValue = [this] { ASSERT_TRUE(connection.LogOut()); };
    EXPECT_EQ(CodeOf(tickets.Keys(job)), NotLoggedIn);
}

TEST_F(TroubledTicket, WalkThatTheEndOfTheSessionCuts_IsAFailure)
{
    orders.afterFirstValue = [this] { orders.sessionIsOver = true; };
    EXPECT_EQ(CodeOf(tickets.ReadAll(job)), ServerAway);
}

TEST_F(TroubledTicket, OfASessionThatIsOver_IsNeitherEmptyNorMissing)
{
    orders.sessionIsOver = true;
    EXPECT_EQ(CodeOf(tickets.Types()), ServerAway);
    EXPECT_EQ(CodeOf(tickets.List(JobTickets)), ServerAway);
    EXPECT_EQ(CodeOf(tickets.Keys(job)), ServerAway);
    EXPECT_EQ(CodeOf(tickets.ReadAll(job)), ServerAway);
    EXPECT_EQ(CodeOf(tickets.Read(job, "A")), ServerAway);
    EXPECT_EQ(CodeOf(tickets.ReadAs<int>(job, "A")), ServerAway);
    EXPECT_EQ(CodeOf(tickets.Create(JobTickets)), ServerAway);
    EXPECT_EQ(CodeOf(tickets.Delete(job)), ServerAway);
}

// --- following

TEST_F(TroubledTicket, FollowedOneThatCouldNotBeRead_IsReadAtTheNextChange)
{
    Worker const worker(queue.GetExecutor());
    std::vector<int> told;
    orders.refusedWalks = 1;
    LiveTicket const live(connection, worker, job,
                          [&](TicketUpdate const& update) { told.push_back(CodeOf(update.outcome)); });
    auto const hear = [&](std::size_t count)
    {
        for (auto const end = Clock::now() + 5s; told.size() < count && Clock::now() < end;)
            queue.RunFor(5ms);
    };
    hear(1);
    ASSERT_THAT(told, ElementsAre(BadAnswer));
    ASSERT_TRUE(tickets.Write(job, "A", 2));
    hear(2);
    EXPECT_THAT(told, ElementsAre(BadAnswer, 0));
    EXPECT_EQ(live.Now(), *tickets.ReadAll(job, Paths::AsStored));
}

TEST_F(TroubledTicket, FollowedOneThatChangesWhileItIsRead_HasTheChange)
{
    for (int const refused : {0, 1})
    {
        Worker const worker(queue.GetExecutor());
        std::atomic<bool> isHeard = false;
        orders.refusedWalks = refused;
        orders.afterWalk = [&]
        {
            (void)tickets.Write(job, "A", 10 + refused);
            Await([&] { return isHeard.load(); });
        };
        auto const behind = connection.Subscribe(
            Interest::InTickets({job}), queue.GetExecutor(), [&](Event const&) { isHeard = true; }, 100ms);
        LiveTicket const live(connection, worker, job, [](TicketUpdate const&) {});
        auto const now = [&live] { return live.Now().Find("A"); };
        for (auto const end = Clock::now() + 20s;
             (!now() || *now() != Value(10 + refused)) && Clock::now() < end;)
            queue.RunFor(5ms);
        queue.RunFor(50ms);
        EXPECT_TRUE(isHeard);
        EXPECT_EQ(live.Now(), *tickets.ReadAll(job, Paths::AsStored));
    }
}

TEST_F(TroubledTicket, BytesThatNoMemoryHolds_AreABadAnswer)
{
    orders.bytesAreEndless = true;
    EXPECT_EQ(CodeOf(tickets.ReadAll(job)), BadAnswer);
    orders.bytesAreEndless = false;
    EXPECT_TRUE(tickets.ReadAll(job));
}

// --- nonsense

TEST_F(TroubledTicket, WalkWithoutAnEnd_IsEnded)
{
    orders.walksNeverEnd = true;
    EXPECT_EQ(CodeOf(tickets.List(JobTickets)), BadAnswer);
    EXPECT_EQ(CodeOf(tickets.Keys(job)), BadAnswer);
}

TEST_F(TroubledTicket, ValueThatGetsAnotherTypeWhileItIsRead_IsRead)
{
    orders.afterTypeQuery = [this] { ASSERT_TRUE(tickets.Write(job, "A", "one")); };
    EXPECT_EQ(*tickets.Read(job, "A"), Value("one"));
    orders.afterTypeQuery = [this] { ASSERT_TRUE(tickets.Write(job, "A", MakeList<int>({1, 2}))); };
    EXPECT_EQ(*tickets.Read(job, "A"), Value(MakeList<int>({1, 2})));
}

TEST_F(TroubledTicket, TextThatIsNull_IsEmpty)
{
    orders.textsAreNull = true;
    EXPECT_EQ(*tickets.Read(job, "C"), Value(""));
    EXPECT_EQ(*tickets.ReadAs<std::string>(job, "C"), "");
    EXPECT_EQ(*tickets.ReadAll(job)->Find("C"), Value(""));
    EXPECT_EQ(*tickets.ReadAll(job)->Find("A"), Value(1));
}
