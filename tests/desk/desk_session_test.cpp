// What the desk does at a server, without any window.
#include "desk/model/DeskSession.h"

#include "tests/client/TroubledClient.h"
#include <algorithm>
#include <future>
#include <gmock/gmock.h>
#include <map>
#include <set>
#include <thread>

using namespace desk;
using namespace std::chrono_literals;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;
using testing::SizeIs;

namespace
{
class SessionOfTheDesk : public TroubledClient
{
protected:
    SessionOfTheDesk()
    {
        session.onState = [this](DeskSession::State state, comgui::Error const&) { states.push_back(state); };
        session.onList = [this](int type, std::vector<int> const& ids) { lists[type] = ids; };
        session.onTicket = [this](comgui::TicketAddress ticket, bool isThere)
        { isThere ? static_cast<void>(known.insert(ticket)) : static_cast<void>(known.erase(ticket)); };
        session.onEvent = [this](comgui::Event const& event) { events.push_back(event); };
        session.onProblem = [this](comgui::Error const& error) { problems.push_back(error.code); };
    }

    template <typename Condition>
    bool Await(Condition condition)
    {
        for (auto const end = std::chrono::steady_clock::now() + 20s;
             !condition() && std::chrono::steady_clock::now() < end;)
            queue.RunFor(5ms);
        return condition();
    }
    void Enter()
    {
        ASSERT_TRUE(session.Connection().LogIn(Here(), Admin()));
        session.LoggedIn();
        ASSERT_TRUE(Await([this] { return lists.size() == comgui::TicketTypes; }));
    }

    // What is given to the worker from here on waits.
    void KeepTheWorkerBusy()
    {
        session.Worker().Do([open = gate.get_future().share()] { open.wait_for(20s); }, [] {});
    }

    std::promise<void> gate;  // opens when it has a value
    DeskSession session{queue.GetExecutor()};
    std::vector<DeskSession::State> states;
    std::map<int, std::vector<int>> lists;
    std::set<comgui::TicketAddress> known;  // of which it was told that they have come
    std::vector<comgui::Event> events;
    std::vector<int> problems;
};
}  // namespace

TEST_F(SessionOfTheDesk, ListsEveryTypeAfterTheLogin)
{
    Enter();
    EXPECT_THAT(states, ElementsAre(DeskSession::State::LoggedIn));
    EXPECT_THAT(lists, Contains(Pair(comgui::SystemTickets, ElementsAre(0))));
    EXPECT_THAT(lists, Contains(Pair(comgui::UserTickets,
                                     SizeIs(session.Tickets().List(comgui::UserTickets)->size()))));
    EXPECT_THAT(lists, Contains(Pair(99, IsEmpty())));
}

TEST_F(SessionOfTheDesk, HearsWhatOthersDo)
{
    Enter();
    LogIn();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(Await([this] { return !events.empty(); }));
    auto const* const created = std::get_if<comgui::TicketCreated>(&events[0]);
    ASSERT_NE(created, nullptr);
    EXPECT_EQ(created->ticket, job);
    EXPECT_THAT(known, ElementsAre(job));
    ASSERT_TRUE(tickets.Delete(job));
    EXPECT_TRUE(Await([this] { return known.empty(); }));
}

// Each list is older than what is heard while it is made.
TEST_F(SessionOfTheDesk, TellsOnceMoreWhatHasComeWhileItListed)
{
    Enter();
    LogIn();
    session.onList = [this](int, std::vector<int> const&) { known.clear(); };  // as if it named none
    comgui::TicketAddress const job = NewTicket();
    session.List(comgui::JobTickets);
    std::this_thread::sleep_for(200ms);  // so that the event lies before the list, or behind it
    EXPECT_TRUE(Await([&] { return known.count(job) == 1; }));
    queue.RunFor(100ms);
    EXPECT_THAT(known, ElementsAre(job));
}

TEST_F(SessionOfTheDesk, WhatCouldNotBeListed_IsListedWhenTheServerIsBack)
{
    ASSERT_TRUE(session.Connection().LogIn(Here(), Admin()));
    trouble.tickets.sessionIsOver = true;
    session.LoggedIn();
    ASSERT_TRUE(Await([this] { return !problems.empty(); }));
    EXPECT_THAT(lists, IsEmpty());
    trouble.serverIsAway = true;
    ASSERT_TRUE(Await([this] { return states.back() == DeskSession::State::Lost; }));
    trouble.tickets.sessionIsOver = false;
    trouble.serverIsAway = false;
    EXPECT_TRUE(Await([this] { return lists.size() == comgui::TicketTypes; }));
}

TEST_F(SessionOfTheDesk, ListsATypeAnew)
{
    Enter();
    comgui::TicketAddress const job = *session.Tickets().Create(comgui::JobTickets);
    session.List(comgui::JobTickets);
    auto const& jobs = lists[comgui::JobTickets];
    EXPECT_TRUE(Await([&] { return std::count(jobs.begin(), jobs.end(), job.id) == 1; }));
}

TEST_F(SessionOfTheDesk, WithoutALogin_TellsThatThereIsNone)
{
    session.ListAll();
    EXPECT_TRUE(Await([this] { return !problems.empty(); }));
    EXPECT_THAT(problems, ElementsAre(comgui::NotLoggedIn));
}

TEST_F(SessionOfTheDesk, AfterTheLogout_IsLoggedOut)
{
    Enter();
    session.LogOut();
    EXPECT_THAT(states, ElementsAre(DeskSession::State::LoggedIn, DeskSession::State::LoggedOut));
    EXPECT_TRUE(Await([this] { return !session.Connection().IsLoggedIn(); }));
}

TEST_F(SessionOfTheDesk, WhatWasUnderWayAtTheLogout_IsNotTold)
{
    Enter();
    LogIn();
    KeepTheWorkerBusy();
    session.ListAll();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(Await([&] { return known.count(job) == 1; }));
    session.LogOut();
    lists.clear();
    known.clear();
    gate.set_value();
    ASSERT_TRUE(Await([this] { return !session.Connection().IsLoggedIn(); }));
    queue.RunFor(50ms);
    EXPECT_THAT(lists, IsEmpty());
    EXPECT_THAT(known, IsEmpty());
    EXPECT_THAT(problems, IsEmpty());
}

TEST_F(SessionOfTheDesk, WhatWasUnderWayAtTheNextLogin_IsNotTold)
{
    Enter();
    KeepTheWorkerBusy();
    session.List(comgui::JobTickets);
    lists.clear();
    session.LoggedIn();
    bool isLate = false;
    session.onList = [&](int type, std::vector<int> const& ids)
    {
        isLate = isLate || lists.count(type) == 1;
        lists[type] = ids;
    };
    gate.set_value();
    ASSERT_TRUE(Await([this] { return lists.size() == comgui::TicketTypes; }));
    EXPECT_FALSE(isLate);
}

TEST_F(SessionOfTheDesk, WhatOthersDoWhileTheLogoutWaits_IsNotTold)
{
    Enter();
    LogIn();
    std::vector<comgui::TicketAddress> created;
    comgui::Subscription const later = session.Connection().Subscribe(
        comgui::Interest::InAllTypes(), queue.GetExecutor(),
        [&](comgui::Event const& event)
        {
            if (auto const* const ticket = std::get_if<comgui::TicketCreated>(&event))
                created.push_back(ticket->ticket);
        },
        100ms);
    KeepTheWorkerBusy();
    session.LogOut();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(Await([&] { return std::count(created.begin(), created.end(), job) == 1; }));
    queue.RunFor(100ms);
    EXPECT_THAT(known, IsEmpty());
    EXPECT_THAT(events, IsEmpty());
    gate.set_value();
}

TEST_F(SessionOfTheDesk, ServerThatIsLostWhileTheLogoutWaits_IsNotLookedFor)
{
    Enter();
    KeepTheWorkerBusy();
    session.LogOut();
    trouble.serverIsAway = true;
    ASSERT_TRUE(Await([this] { return !session.Connection().IsServerThere(); }));
    queue.RunFor(200ms);
    EXPECT_THAT(states, ElementsAre(DeskSession::State::LoggedIn, DeskSession::State::LoggedOut));
    gate.set_value();
}

TEST_F(SessionOfTheDesk, ServerThatIsLostBeforeTheLoginIsTaken_IsLost)
{
    ASSERT_TRUE(session.Connection().LogIn(Here(), Admin()));
    trouble.serverIsAway = true;
    ASSERT_TRUE(Await([this] { return !session.Connection().IsServerThere(); }));
    queue.RunFor(200ms);
    session.LoggedIn();
    EXPECT_EQ(session.Now(), DeskSession::State::Lost);
    trouble.serverIsAway = false;
    EXPECT_TRUE(Await([this] { return session.Now() == DeskSession::State::LoggedIn; }));
}

TEST_F(SessionOfTheDesk, AfterALoginThatFailed_IsLoggedOut)
{
    Enter();
    ASSERT_FALSE(session.Connection().LogIn(Here(), {"admin", "wrong"}));
    session.LoginFailed();
    EXPECT_TRUE(Await([this] { return session.Now() == DeskSession::State::LoggedOut; }));
    EXPECT_THAT(states, ElementsAre(DeskSession::State::LoggedIn, DeskSession::State::LoggedOut));
}

TEST_F(SessionOfTheDesk, AfterALoginThatNeverBegan_IsStillLoggedIn)
{
    Enter();
    bool isAsked = false;
    session.LoginFailed();
    session.Worker().Do([] {}, [&] { isAsked = true; });
    ASSERT_TRUE(Await([&] { return isAsked; }));
    EXPECT_THAT(states, ElementsAre(DeskSession::State::LoggedIn));
}

TEST_F(SessionOfTheDesk, PassesResultsOnInTheirSessionOnly)
{
    Enter();
    std::vector<int> taken;
    auto const take = session.InThisSession([&](int result) { taken.push_back(result); });
    take(1);
    session.LogOut();
    take(2);
    session.LoggedIn();
    take(3);
    EXPECT_THAT(taken, ElementsAre(1));
}
