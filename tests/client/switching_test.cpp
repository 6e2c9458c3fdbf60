// Subscriptions at a plug-in that takes its time to switch notifications on and off.
#include "tests/client/TroubledClient.h"

#include <gmock/gmock.h>

using namespace comgui;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

namespace
{
class SlowSwitching : public TroubledClient
{
protected:
    SlowSwitching()
    {
        LogIn();
        job = NewTicket();
    }
    // Of another session: what it does is counted from here on.
    void LogInAtOneThatStands()
    {
        ASSERT_TRUE(connection.LogOut());
        trouble.tickets.switchesBegun = trouble.tickets.switchesDone = 0;
        trouble.tickets.switchingStands = true;
        LogIn();
    }
    ~SlowSwitching() override { trouble.tickets.switchingStands = false; }

    Subscription Subscribe(Interest interest)
    {
        return connection.Subscribe(std::move(interest), queue.GetExecutor(),
                                    [this](Event const& event) { changes.push_back(WordFor(event)); });
    }

    static std::string WordFor(Event const& event)
    {
        if (auto const* const many = std::get_if<ManyTicketsChanged>(&event))
            return "type " + std::to_string(many->type);
        if (std::holds_alternative<TicketCreated>(event))
            return "created";
        auto const* const changed = std::get_if<TicketChanged>(&event);
        if (!changed)
            return "another";
        return changed->isWhole ? "whole ticket" : changed->keys.at(0).key;
    }

    std::vector<std::string> const& Changes(std::size_t count)
    {
        for (auto const end = Clock::now() + 20s; changes.size() < count && Clock::now() < end;)
            queue.RunFor(5ms);
        queue.RunFor(100ms);  // for one too many
        return changes;
    }

    TicketAddress job{};
    std::vector<std::string> changes;
};
}  // namespace

TEST_F(SlowSwitching, HoldsNoSubscriberUp_AndNoChangeGoesUnnoticed)
{
    trouble.tickets.switchingStands = true;
    auto const subscription = Subscribe(Interest::InTickets({job}));
    Await([this] { return trouble.tickets.switchesBegun == 1; });
    EXPECT_EQ(trouble.tickets.switchesDone, 0);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    EXPECT_THAT(Changes(0), IsEmpty());
    trouble.tickets.switchingStands = false;
    EXPECT_THAT(Changes(1), ElementsAre("whole ticket"));
    ASSERT_TRUE(tickets.Write(job, "B", 1));
    EXPECT_THAT(Changes(2), ElementsAre("whole ticket", "B"));
}

TEST_F(SlowSwitching, OfATypeIsToldAsManyTickets)
{
    trouble.tickets.switchingStands = true;
    auto const subscription = Subscribe(Interest::InTypes({JobTickets, SystemTickets}));
    trouble.tickets.switchingStands = false;
    EXPECT_THAT(Changes(2), UnorderedElementsAre("type " + std::to_string(JobTickets),
                                                 "type " + std::to_string(SystemTickets)));
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    EXPECT_EQ(Changes(3).back(), "A");
}

TEST_F(SlowSwitching, IsNotToldToWhoHasWaitedForIt)
{
    auto const first = Subscribe(Interest::InTickets({job}));
    EXPECT_THAT(Changes(0), IsEmpty());
    EXPECT_EQ(trouble.tickets.switchesDone, 1);
    trouble.tickets.switchingStands = true;
    auto const second = Subscribe(Interest::InTypes({SystemTickets}));
    trouble.tickets.switchingStands = false;
    EXPECT_THAT(Changes(1), ElementsAre("type " + std::to_string(SystemTickets)));
}

// Both wait behind the same call.
TEST_F(SlowSwitching, IsToldToAllWhoHaveNotWaitedForIt)
{
    TicketAddress const other = NewTicket();
    trouble.tickets.switchingStands = true;
    auto const first = Subscribe(Interest::InTickets({job}));
    auto const second = Subscribe(Interest::InTickets({other}));
    ASSERT_TRUE(tickets.Write(other, "A", 1));
    EXPECT_LE(trouble.tickets.switchesBegun, 1);
    trouble.tickets.switchingStands = false;
    EXPECT_THAT(Changes(2), ElementsAre("whole ticket", "whole ticket"));
}

TEST_F(SlowSwitching, ThatIsRefused_IsTriedAgain_AndNoChangeGoesUnnoticed)
{
    trouble.tickets.refusedSwitches = 1;
    auto const subscription = Subscribe(Interest::InTickets({job}));
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    EXPECT_THAT(Changes(1), ElementsAre("whole ticket"));
    ASSERT_TRUE(tickets.Write(job, "B", 1));
    EXPECT_THAT(Changes(2), ElementsAre("whole ticket", "B"));
}

TEST_F(SlowSwitching, ThatIsRefusedInANewSession_IsTriedAgain)
{
    auto const subscription = Subscribe(Interest::InTickets({job}));
    trouble.tickets.refusedSwitches = 1;
    ASSERT_TRUE(connection.LogOut());
    LogIn();
    EXPECT_THAT(Changes(1), ElementsAre("whole ticket"));
}

TEST_F(SlowSwitching, ThatIsAlwaysRefused_IsTriedMoreAndMoreSeldom)
{
    trouble.tickets.refusedSwitches = 1000;
    auto const subscription = Subscribe(Interest::InTickets({job}));
    std::this_thread::sleep_for(4500ms);
    EXPECT_GE(trouble.tickets.switchesBegun, 3);
    EXPECT_LE(trouble.tickets.switchesBegun,
              4);  // at 0, within the first second, one and three seconds later
}

TEST_F(SlowSwitching, ThatWasRefused_IsNotTriedForWhoIsGone)
{
    trouble.tickets.refusedSwitches = 1000;
    Subscribe(Interest::InTickets({job})).End();
    Await([this] { return trouble.tickets.switchesBegun > 0; });
    int const begun = trouble.tickets.switchesBegun;
    std::this_thread::sleep_for(2500ms);
    EXPECT_EQ(trouble.tickets.switchesBegun, begun);
}

TEST_F(SlowSwitching, HoldsNoEndOfASubscriptionUp)
{
    auto subscription = Subscribe(Interest::InTickets({job}));
    trouble.tickets.switchingStands = true;
    subscription.End();
    EXPECT_EQ(trouble.tickets.switchesDone, 1);  // on
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    trouble.tickets.switchingStands = false;
    Await([this] { return trouble.tickets.switchesDone == 2; });
    EXPECT_THAT(Changes(0), IsEmpty());
}

// One call at most.
TEST_F(SlowSwitching, HoldsALogoutUpForOneCallOnly)
{
    trouble.tickets.switchingStands = true;
    auto const subscription = Subscribe(Interest::InAllTypes());
    std::thread leaves([this] { EXPECT_TRUE(connection.LogOut()); });
    Await([this] { return !connection.IsLoggedIn(); });
    std::this_thread::sleep_for(100ms);
    trouble.tickets.switchingStands = false;
    leaves.join();
    EXPECT_EQ(trouble.tickets.switchesBegun, 1);
    EXPECT_THAT(Changes(0), IsEmpty());
    LogIn();
    EXPECT_EQ(trouble.tickets.switchesDone, 1 + TicketTypes);
}

TEST_F(SlowSwitching, IsCaughtUpWithByALiveTicket)
{
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    trouble.tickets.switchingStands = true;
    Worker const worker(queue.GetExecutor());
    LiveTicket const live(connection, worker, job, [](TicketUpdate const&) {});
    auto const shows = [&](Value const& value)
    {
        auto const now = live.Now().Find("A");
        return now && *now == value;
    };
    for (auto const end = Clock::now() + 20s; !shows(1) && Clock::now() < end;)
        queue.RunFor(5ms);
    ASSERT_TRUE(tickets.Write(job, "A", 2));
    queue.RunFor(100ms);
    EXPECT_TRUE(shows(1));
    trouble.tickets.switchingStands = false;
    for (auto const end = Clock::now() + 20s; !shows(2) && Clock::now() < end;)
        queue.RunFor(5ms);
    EXPECT_TRUE(shows(2));
}

TEST_F(SlowSwitching, HoldsNoLiveTicketUp)
{
    trouble.tickets.switchingStands = true;
    Worker const worker(queue.GetExecutor());
    std::vector<std::unique_ptr<LiveTicket>> live;
    auto const start = Clock::now();
    for (int i = 0; i < 40; ++i)
        live.push_back(std::make_unique<LiveTicket>(connection, worker, job, [](TicketUpdate const&) {}));
    EXPECT_LT(Clock::now() - start, 5s);  // with the patience of a subscription ten
}

TEST_F(SlowSwitching, HoldsNoLoginUp_AndNoChangeGoesUnnoticed)
{
    auto const subscription = Subscribe(Interest::InTypes({JobTickets}));
    LogInAtOneThatStands();
    EXPECT_EQ(trouble.tickets.switchesDone, 0);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    trouble.tickets.switchingStands = false;
    EXPECT_THAT(Changes(1), ElementsAre("type " + std::to_string(JobTickets)));
}

TEST_F(SlowSwitching, OfALogin_HoldsALogoutUpForOneCallOnly)
{
    auto const subscription = Subscribe(Interest::InAllTypes());
    LogInAtOneThatStands();
    std::thread leaves([this] { EXPECT_TRUE(connection.LogOut()); });
    Await([this] { return !connection.IsLoggedIn(); });
    std::this_thread::sleep_for(100ms);
    trouble.tickets.switchingStands = false;
    leaves.join();
    EXPECT_EQ(trouble.tickets.switchesBegun, 1);
}

TEST_F(SlowSwitching, DoesNotHideThatTheServerIsBack)
{
    auto const subscription = Subscribe(Interest::InTypes({JobTickets}));
    auto const listens = Listen();
    trouble.tickets.switchingStands = true;
    trouble.sessionIsGone = true;
    EXPECT_THAT(Hear(2), ElementsAre(testing::HasSubstr("lost"), "back anew"));
    EXPECT_EQ(trouble.tickets.switchesDone, 1);
    trouble.tickets.switchingStands = false;
    Await([this] { return trouble.tickets.switchesDone == 2; });
}

TEST_F(SlowSwitching, HoldsTheEndOfAConnectionUpForOneCallOnly)
{
    auto other = std::make_unique<Connection>();
    auto const subscription =
        other->Subscribe(Interest::InAllTypes(), queue.GetExecutor(), [](Event const&) {});
    trouble.tickets.switchingStands = true;
    ASSERT_TRUE(other->LogIn(Here(), Admin()));
    std::atomic<bool> isOver{false};
    std::thread ends(
        [&]
        {
            other.reset();
            isOver = true;
        });
    std::this_thread::sleep_for(200ms);
    EXPECT_FALSE(isOver);
    trouble.tickets.switchingStands = false;
    ends.join();
    EXPECT_EQ(trouble.tickets.switchesBegun, 1);
}
