// Events as subscribers hear them.
#include "tests/client/Client.h"

#include "tests/client/NoThreads.h"
#include <algorithm>
#include <atomic>
#include <chrono>
#include <future>
#include <gmock/gmock.h>
#include <stdexcept>
#include <system_error>
#include <thread>
#include <utility>

using namespace comgui;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
class EventsOfAClient : public Client
{
protected:
    EventsOfAClient() { LogIn(); }

    // Short words for events, "created 3/1", in the order of their arrival.
    Subscription Listen(Interest interest, std::chrono::milliseconds interval = 1ms)
    {
        return connection.Subscribe(
            std::move(interest), queue.GetExecutor(),
            [this](Event const& event) { heard.push_back(WordsOf(event)); }, interval);
    }

    // Runs the queue until there are so many events, and a while longer, for one too many.
    void Hear(std::size_t count)
    {
        for (auto const end = Clock::now() + 20s; heard.size() < count && Clock::now() < end;)
            queue.RunFor(5ms);
        queue.RunFor(50ms);
    }

    void HearUntil(std::string const& words)
    {
        for (auto const end = Clock::now() + 20s;
             (heard.empty() || heard.back() != words) && Clock::now() < end;)
            queue.RunFor(5ms);
        ASSERT_FALSE(heard.empty());
        EXPECT_EQ(heard.back(), words);
    }

    static std::string WordsOf(Event const& event)
    {
        return std::visit(
            [](auto const& what) -> std::string
            {
                using What = std::decay_t<decltype(what)>;
                if constexpr (std::is_same_v<What, TicketCreated>)
                    return "created " + NameOf(what.ticket);
                else if constexpr (std::is_same_v<What, TicketDeleted>)
                    return "deleted " + NameOf(what.ticket);
                else if constexpr (std::is_same_v<What, ManyTicketsChanged>)
                    return "many " + std::to_string(what.type);
                else if constexpr (std::is_same_v<What, ServerLost>)
                    return "lost";
                else if constexpr (std::is_same_v<What, ServerBack>)
                    return what.isNewSession ? "back anew" : "back";
                else if constexpr (std::is_same_v<What, TransferProgressed>)
                    return "progress";
                else if constexpr (std::is_same_v<What, TransferEnded>)
                    return "ended";
                else
                {
                    std::string words = "changed " + NameOf(what.ticket) + (what.isWhole ? " whole" : "");
                    for (KeyChange const& change : what.keys)
                        words += " " + change.key + "=" + (change.value ? ToText(*change.value) : "?");
                    return words;
                }
            },
            event);
    }

    static std::string NameOf(TicketAddress ticket)
    {
        return std::to_string(ticket.type) + "/" + std::to_string(ticket.id);
    }

    using Clock = std::chrono::steady_clock;
    TaskQueue queue;
    std::vector<std::string> heard;
};
}  // namespace

TEST_F(EventsOfAClient, ComeForATicketsWholeLife)
{
    auto const subscription = Listen(Interest::InTypes({JobTickets}), 0ms);
    TicketAddress const job = NewTicket();
    Hear(1);
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 3));
    Hear(2);
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", Value()));
    Hear(3);
    ASSERT_TRUE(tickets.Delete(job));
    Hear(4);
    std::string const name = NameOf(job);
    EXPECT_THAT(heard, ElementsAre("created " + name, "changed " + name + " Job/Copies=3",
                                   "changed " + name + " Job/Copies=", "deleted " + name));
}

TEST_F(EventsOfAClient, CarryWholeLists_ButNotTheirParts)
{
    TicketAddress const job = NewTicket();
    auto const subscription = Listen(Interest::InTickets({job}), 0ms);
    ASSERT_TRUE(tickets.Write(job, "List", MakeList<int>({1, 2, 3})));
    Hear(1);
    ASSERT_TRUE(tickets.Write(job, "List", 9, 1));
    Hear(2);
    EXPECT_THAT(
        heard, ElementsAre("changed " + NameOf(job) + " List=1, 2, 3", "changed " + NameOf(job) + " List=?"));
}

TEST_F(EventsOfAClient, AreThoseOfTheInterest)
{
    TicketAddress const job = NewTicket();
    TicketAddress const other = NewTicket();
    auto const subscription = Listen(Interest::InTickets({job}, {"Job/State", "Page/*"}));
    for (TicketAddress const ticket : {other, job})
        (void)tickets.WriteAll(ticket, {{"Job/Copies", 1}, {"Job/State", 2}, {"Page/1", 3}, {"Page", 4}});
    Hear(1);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " Job/State=2 Page/1=3"));
}

TEST_F(EventsOfAClient, OfTwoSubscriptions_GoToBoth_AndEachKeyOnceToEach)
{
    TicketAddress const job = NewTicket();
    std::vector<std::string> second;
    auto const one = Listen(Interest::InTypes({JobTickets}, {"A"}));
    auto const both = connection.Subscribe(
        {{JobTickets}, {job}, {}, false}, queue.GetExecutor(),
        [&second](Event const& event) { second.push_back(WordsOf(event)); }, 1ms);
    (void)tickets.WriteAll(job, {{"A", 1}, {"B", 2}});
    Hear(1);
    for (auto const end = Clock::now() + 20s; second.empty() && Clock::now() < end;)
        queue.RunFor(5ms);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " A=1"));
    EXPECT_THAT(second, ElementsAre("changed " + NameOf(job) + " A=1 B=2"));
}

TEST_F(EventsOfAClient, OfTwoSubscriptionsToATicket_HaveTheKeysOfEach)
{
    TicketAddress const job = NewTicket();
    auto const a = Listen(Interest::InTickets({job}, {"A"}));
    auto const b = Listen(Interest::InTickets({job}, {"B"}));
    ASSERT_TRUE(tickets.Write(job, "B", 2));
    Hear(1);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    Hear(2);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " B=2", "changed " + NameOf(job) + " A=1"));
}

TEST_F(EventsOfAClient, GoOn_WhenAnotherSubscriptionEnds)
{
    TicketAddress const job = NewTicket();
    auto const stays = Listen(Interest::InTickets({job}));
    {
        auto const ends = Listen(Interest::InTickets({System}));
    }
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    Hear(1);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " A=1"));
}

// To the plug-in the single tickets end with their type: for a moment nothing is heard of them.
TEST_F(EventsOfAClient, GoOn_WhenASubscriptionToTheWholeTypeEnds)
{
    TicketAddress const job = NewTicket();
    auto const stays = Listen(Interest::InTickets({job}));
    {
        auto const ends = Listen(Interest::InTypes({JobTickets}));
    }
    Hear(1);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    Hear(2);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " whole", "changed " + NameOf(job) + " A=1"));
}

TEST_F(EventsOfAClient, OfABurst_ArePutTogether)
{
    TicketAddress const job = NewTicket();
    auto const subscription = Listen(Interest::InTickets({job}), 20ms);
    for (int i = 1; i <= 2000; ++i)
        ASSERT_TRUE(tickets.Write(job, "A", i));
    HearUntil("changed " + NameOf(job) + " A=2000");
    EXPECT_LT(heard.size(), 100u);
}

TEST_F(EventsOfAClient, OfAHandlerThatIsBusy_Wait)
{
    TicketAddress const job = NewTicket();
    auto const subscription = Listen(Interest::InTickets({job}), 0ms);
    TaskQueue another;
    auto const watch = connection.Subscribe(
        Interest::InTickets({job}), another.GetExecutor(),
        [&](Event const& event)
        {
            if (WordsOf(event) == "changed " + NameOf(job) + " A=100")
                another.Stop();
        },
        0ms);
    for (int i = 1; i <= 100; ++i)
        ASSERT_TRUE(tickets.Write(job, "A", i));
    another.RunFor(20s);  // what one has heard of waits for the other
    HearUntil("changed " + NameOf(job) + " A=100");
    EXPECT_LE(heard.size(), 2u);
}

TEST_F(EventsOfAClient, AfterASlowHandler_KeepTheirInterval)
{
    constexpr auto Interval = 200ms;
    TicketAddress const job = NewTicket();
    std::vector<Clock::time_point> begun, ended;
    auto const subscription = connection.Subscribe(
        Interest::InTickets({job}), queue.GetExecutor(),
        [&](Event const&)
        {
            begun.push_back(Clock::now());
            if (begun.size() == 1)
                (void)tickets.Write(job, "A", 2);
            std::this_thread::sleep_for(50ms);  // it has come meanwhile
            ended.push_back(Clock::now());
        },
        Interval);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    for (auto const end = Clock::now() + 20s; ended.size() < 2 && Clock::now() < end;)
        queue.RunFor(5ms);
    ASSERT_EQ(ended.size(), 2u);
    EXPECT_GE(begun[1] - ended[0], Interval);
}

// --- the end of subscriptions

TEST_F(EventsOfAClient, AfterTheEndOfASubscription_DoNotCome)
{
    TicketAddress const job = NewTicket();
    auto subscription = Listen(Interest::InTickets({job}), 0ms);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    std::this_thread::sleep_for(50ms);  // posted, but not run
    subscription.End();
    ASSERT_TRUE(tickets.Write(job, "A", 2));
    queue.RunFor(100ms);
    EXPECT_THAT(heard, IsEmpty());
}

TEST_F(EventsOfAClient, EndOfASubscription_WaitsForItsHandler)
{
    TicketAddress const job = NewTicket();
    std::promise<void> begun;
    std::atomic<bool> isDone = false;
    auto subscription = connection.Subscribe(Interest::InTickets({job}), queue.GetExecutor(),
                                             [&](Event const&)
                                             {
                                                 begun.set_value();
                                                 std::this_thread::sleep_for(100ms);
                                                 isDone = true;
                                             });
    std::thread runner([this] { queue.Run(); });
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    begun.get_future().wait();
    subscription.End();
    EXPECT_TRUE(isDone);
    queue.Stop();
    runner.join();
}

TEST_F(EventsOfAClient, EndOfASubscription_WaitsForItsExecutor_AndFreesItsHandler)
{
    TicketAddress const job = NewTicket();
    std::promise<void> begun;
    std::atomic<bool> isDone = false;
    auto const held = std::make_shared<int>(1);
    auto subscription = connection.Subscribe(
        Interest::InTickets({job}),
        [&](auto const&)
        {
            begun.set_value();
            std::this_thread::sleep_for(100ms);
            isDone = true;
        },
        [held](Event const&) {}, 0ms);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    begun.get_future().wait();
    subscription.End();
    EXPECT_TRUE(isDone);
    EXPECT_EQ(held.use_count(), 1);
}

// What a handler holds may use the kit when it goes.
TEST_F(EventsOfAClient, EndOfASubscriptionInItsExecutor_FreesItsHandlerWithNothingLocked)
{
    TicketAddress const job = NewTicket();
    Subscription subscription;
    std::promise<void> freed;
    std::shared_ptr<int> held(new int(1),
                              [&](int const* number)
                              {
                                  delete number;
                                  Subscription const another =
                                      connection.Subscribe({}, queue.GetExecutor(), [](Event const&) {});
                                  freed.set_value();
                              });
    std::mutex made;
    std::unique_lock whileMade(made);
    subscription = connection.Subscribe(
        Interest::InTickets({job}),
        [&](auto const&)
        {
            std::lock_guard const wait(made);
            subscription = {};
        },
        [held = std::move(held)](Event const&) {}, 0ms);
    whileMade.unlock();
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    EXPECT_EQ(freed.get_future().wait_for(20s), std::future_status::ready);
}

TEST_F(EventsOfAClient, SubscriptionWithoutAThread_Throws_AndIsNone)
{
    Connection fresh;
    auto const held = std::make_shared<int>(1);
    auto const subscribe = [&]
    { return fresh.Subscribe(Interest::InServer(), queue.GetExecutor(), [held](Event const&) {}); };
    {
        NoThreads const none;
        EXPECT_THROW((void)subscribe(), std::system_error);
    }
    EXPECT_EQ(held.use_count(), 1);
    EXPECT_NO_THROW((void)subscribe());
}

TEST_F(EventsOfAClient, AfterOneThatTheHandlerThrowsAt_StillCome)
{
    TicketAddress const first = NewTicket();
    TicketAddress const second = NewTicket();
    bool hasThrown = false;
    auto const subscription = connection.Subscribe(Interest::InTickets({first, second}), queue.GetExecutor(),
                                                   [&](Event const& event)
                                                   {
                                                       if (!std::exchange(hasThrown, true))
                                                           throw std::runtime_error("of the handler");
                                                       heard.push_back(WordsOf(event));
                                                   });
    ASSERT_TRUE(tickets.Write(first, "A", 1));
    ASSERT_TRUE(tickets.Write(second, "A", 2));
    std::this_thread::sleep_for(50ms);  // both are in one batch
    EXPECT_THROW(queue.RunFor(1s), std::runtime_error);
    Hear(1);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(second) + " A=2"));
}

TEST_F(EventsOfAClient, EndOfAConnection_WaitsForHandlers_AlsoWhenLoggedOut)
{
    auto other = std::make_unique<Connection>();
    ASSERT_TRUE(other->LogIn(Here(), Admin()));
    TicketAddress const job = NewTicket();
    std::promise<void> begun;
    std::atomic<bool> isDone = false;
    auto const subscription = other->Subscribe(Interest::InTickets({job}), queue.GetExecutor(),
                                               [&](Event const&)
                                               {
                                                   (void)other->LogOut();
                                                   begun.set_value();
                                                   std::this_thread::sleep_for(100ms);
                                                   isDone = true;
                                               });
    std::thread runner([this] { queue.Run(); });
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    begun.get_future().wait();
    other.reset();
    EXPECT_TRUE(isDone);
    queue.Stop();
    runner.join();
}

TEST_F(EventsOfAClient, Subscription_MayEndInItsOwnHandler)
{
    TicketAddress const job = NewTicket();
    Subscription subscription;
    int calls = 0;
    subscription = connection.Subscribe(
        Interest::InTickets({job}), queue.GetExecutor(),
        [&](Event const&)
        {
            ++calls;
            subscription.End();
        },
        0ms);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    for (auto const end = Clock::now() + 20s; calls == 0 && Clock::now() < end;)
        queue.RunFor(5ms);
    ASSERT_TRUE(tickets.Write(job, "A", 2));
    queue.RunFor(100ms);
    EXPECT_EQ(calls, 1);
}

TEST_F(EventsOfAClient, Handler_MayLogOut)
{
    TicketAddress const job = NewTicket();
    Outcome loggedOut = Error{};
    auto const subscription = connection.Subscribe(
        Interest::InTickets({job}), queue.GetExecutor(),
        [&](Event const&) { loggedOut = connection.LogOut(); }, 0ms);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    for (auto const end = Clock::now() + 20s; !loggedOut && Clock::now() < end;)
        queue.RunFor(10ms);
    EXPECT_TRUE(loggedOut);
}

// --- sessions

TEST_F(EventsOfAClient, OfAnOldSession_NeverArrive_AndTheInterestLasts)
{
    TicketAddress const job = NewTicket();
    auto const subscription = Listen(Interest::InTickets({job}), 0ms);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    std::this_thread::sleep_for(50ms);
    ASSERT_TRUE(connection.LogOut());
    LogIn();
    queue.RunFor(100ms);
    EXPECT_THAT(heard, IsEmpty());
    ASSERT_TRUE(tickets.Write(job, "A", 2));
    Hear(1);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " A=2"));
}

// The first event of a batch ends the session, or begins another.
TEST_F(EventsOfAClient, OfTransfers_AreHeard_WhenASessionEndsAmongThem)
{
    for (bool const logsInAnew : {false, true})
    {
        LogIn();
        heard.clear();
        TicketAddress const first = NewTicket();
        TicketAddress const second = NewTicket();
        auto const subscription = connection.Subscribe({{}, {first, second}, {}, true}, queue.GetExecutor(),
                                                       [&](Event const& event)
                                                       {
                                                           if (heard.empty())
                                                               (void)connection.LogOut();
                                                           if (heard.empty() && logsInAnew)
                                                               LogIn();
                                                           if (WordsOf(event) != "progress")
                                                               heard.push_back(WordsOf(event));
                                                       });
        ASSERT_TRUE(tickets.Write(first, "A", 1));
        ASSERT_TRUE(tickets.Write(second, "A", 2));
        ASSERT_TRUE(connection.GetTransfers().Put(folder.Write("a", "b").string(), "$(TEMP)/a").Wait());
        std::this_thread::sleep_for(50ms);  // the queue has its task by now
        Hear(2);
        EXPECT_THAT(heard, ElementsAre("changed " + NameOf(first) + " A=1", "ended"));
    }
}

TEST_F(EventsOfAClient, BeforeALogin_CanBeSubscribedTo)
{
    TicketAddress const job = NewTicket();
    ASSERT_TRUE(connection.LogOut());
    auto const subscription = Listen(Interest::InTickets({job}));
    LogIn();
    ASSERT_TRUE(tickets.Write(job, "A", 3));
    Hear(1);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " A=3"));
}

TEST_F(EventsOfAClient, OfAnotherConnection_AreHeard)
{
    TicketAddress const job = NewTicket();
    auto const subscription = Listen(Interest::InTickets({job}));
    Connection other;
    ASSERT_TRUE(other.LogIn(Here(), Admin()));
    ASSERT_TRUE(other.GetTickets().Write(job, "A", 4));
    Hear(1);
    EXPECT_THAT(heard, ElementsAre("changed " + NameOf(job) + " A=4"));
}

// --- executors

TEST_F(EventsOfAClient, Queue_ThatIsGone_TakesNothing)
{
    TicketAddress const job = NewTicket();
    auto gone = std::make_unique<TaskQueue>();
    auto const subscription = connection.Subscribe(
        Interest::InTickets({job}), gone->GetExecutor(), [](Event const&) { FAIL(); }, 0ms);
    gone.reset();
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    queue.RunFor(50ms);
}

TEST(TaskQueue, RunsTasksInTheirOrder_UntilStopped)
{
    TaskQueue queue;
    std::string order;
    auto const post = queue.GetExecutor();
    post([&] { order += "a"; });
    post(
        [&]
        {
            order += "b";
            post(
                [&]
                {
                    order += "c";
                    queue.Stop();
                });
        });
    queue.Run();
    EXPECT_EQ(order, "abc");
    post([&] { order += "d"; });
    queue.RunFor(1ms);
    EXPECT_EQ(order, "abcd");
}
