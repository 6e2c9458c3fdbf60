// A ticket as it is now, without reading it again and again.
#include "tests/client/Client.h"

#include <gmock/gmock.h>

using namespace comgui;
using namespace std::chrono_literals;
using testing::ElementsAre;

namespace
{
class LiveTicketOfAClient : public Client
{
protected:
    LiveTicketOfAClient() { LogIn(); }

    std::unique_ptr<LiveTicket> Follow(TicketAddress ticket)
    {
        return std::make_unique<LiveTicket>(connection, *worker, ticket,
                                            [this](TicketUpdate const& update) { Hear(update); });
    }
    void Hear(TicketUpdate const& update)
    {
        if (!update.outcome)
            heard.push_back("failure " + std::to_string(update.outcome.GetError().code));
        for (auto const& [key, before, after] : update.differences)
            heard.push_back(key + ": " + (before ? ToText(*before) : "-") + " > " +
                            (after ? ToText(*after) : "-"));
        if (update.outcome && update.differences.empty())
            heard.push_back("nothing differs");
    }

    // Runs the queue until so much was heard, and a while longer, for one too many.
    void Await(std::size_t count)
    {
        for (auto const end = std::chrono::steady_clock::now() + 20s;
             heard.size() < count && std::chrono::steady_clock::now() < end;)
            queue.RunFor(5ms);
        queue.RunFor(100ms);
    }

    TaskQueue queue;
    std::optional<Worker> worker{std::in_place, queue.GetExecutor()};
    std::vector<std::string> heard;
};
}  // namespace

TEST_F(LiveTicketOfAClient, TellsFirstWhatThereIs_ThenWhatChanges)
{
    TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    ASSERT_TRUE(tickets.Write(job, "B", "text"));
    auto const live = Follow(job);
    Await(2);
    ASSERT_TRUE(tickets.Write(job, "A", 2));
    Await(3);
    ASSERT_TRUE(tickets.Write(job, "C", 0.5));
    Await(4);
    ASSERT_TRUE(tickets.Write(job, "B", Value()));
    Await(5);
    EXPECT_THAT(heard, ElementsAre("A: - > 1", "B: - > text", "A: 1 > 2", "C: - > 0.5", "B: text > -"));
    EXPECT_EQ(live->Now(), *tickets.ReadAll(job));
}

TEST_F(LiveTicketOfAClient, TellsThatThereIsNothing)
{
    auto const live = Follow(NewTicket());
    Await(1);
    EXPECT_THAT(heard, ElementsAre("nothing differs"));
}

TEST_F(LiveTicketOfAClient, ReadsWhatEventsDoNotCarry)
{
    TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "List", MakeList<int>({1, 2, 3})));
    auto const live = Follow(job);
    Await(1);
    ASSERT_TRUE(tickets.Write(job, "List", 9, 1));
    Await(2);
    EXPECT_THAT(heard, ElementsAre("List: - > 1, 2, 3", "List: 1, 2, 3 > 1, 9, 3"));
}

TEST_F(LiveTicketOfAClient, TellsThatTheTicketIsGone)
{
    TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    auto const live = Follow(job);
    Await(1);
    ASSERT_TRUE(tickets.Delete(job));
    Await(3);
    EXPECT_THAT(heard, ElementsAre("A: - > 1", "failure " + std::to_string(NoSuchTicket), "A: 1 > -"));
    EXPECT_TRUE(live->Now().Entries().empty());
}

TEST_F(LiveTicketOfAClient, WaitsForATicketThatIsNotThereYet)
{
    TicketAddress const job{JobTickets, NewTicket().id + 1};
    auto const live = Follow(job);
    Await(1);
    ASSERT_EQ(NewTicket(), job);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    for (int tries = 0; tries < 1000 && !live->Now().Find("A"); ++tries)
        queue.RunFor(10ms);
    EXPECT_EQ(heard.front(), "failure " + std::to_string(NoSuchTicket));
    EXPECT_EQ(heard.back(), "A: - > 1");
}

TEST_F(LiveTicketOfAClient, KeepsUpWithManyWriters)
{
    TicketAddress const job = NewTicket();
    auto const live = Follow(job);
    std::vector<std::thread> writers;
    for (int writer = 0; writer < 2; ++writer)
        writers.emplace_back(
            [this, job, writer]
            {
                for (int i = 0; i < 300; ++i)
                {
                    (void)tickets.Write(job, "Key" + std::to_string(i % 7), writer * 1000 + i);
                    (void)tickets.Write(job, "List", i, i % 5);
                }
            });
    queue.RunFor(50ms);  // so that it reads and hears while they write
    for (std::thread& writer : writers)
        writer.join();
    Snapshot const all = *tickets.ReadAll(job);
    for (int tries = 0; tries < 1000 && !(live->Now() == all); ++tries)
        queue.RunFor(10ms);
    EXPECT_EQ(live->Now(), all);
}

TEST_F(LiveTicketOfAClient, MayBeEndedByItsHandler)
{
    TicketAddress const job = NewTicket();
    std::unique_ptr<LiveTicket> live;
    live = std::make_unique<LiveTicket>(connection, *worker, job,
                                        [&](TicketUpdate const& update)
                                        {
                                            live.reset();
                                            Hear(update);
                                        });
    Await(1);
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    Await(1);
    EXPECT_THAT(heard, ElementsAre("nothing differs"));
}

TEST_F(LiveTicketOfAClient, AfterItsEnd_TellsNothing)
{
    TicketAddress const job = NewTicket();
    Follow(job).reset();
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    queue.RunFor(200ms);
    EXPECT_TRUE(heard.empty());
}

TEST_F(LiveTicketOfAClient, AfterALogin_IsReadWhenToldSo)
{
    TicketAddress const job = NewTicket();
    ASSERT_TRUE(connection.LogOut());
    auto const live = Follow(job);
    Await(1);
    EXPECT_THAT(heard, ElementsAre("failure " + std::to_string(NotLoggedIn)));
    LogIn();
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    live->Refresh();
    Await(2);
    EXPECT_EQ(heard.back(), "A: - > 1");
}
