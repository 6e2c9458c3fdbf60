// A search beside whatever else the worker has to do.
#include "desk/model/SearchRun.h"

#include "tests/client/TroubledClient.h"
#include <algorithm>
#include <functional>
#include <future>
#include <gmock/gmock.h>
#include <thread>

using namespace desk;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
class SearchAtAServer : public TroubledClient
{
protected:
    SearchAtAServer()
    {
        LogIn();
        for (int i = 0; i < 120; ++i)
            jobs.push_back(NewTicket());
        EXPECT_TRUE(tickets.Write(jobs[7], "Job/Note", "find me"));
        EXPECT_TRUE(tickets.Write(jobs[110], "Job/Find Me", 1));
    }

    std::unique_ptr<SearchRun> Search(std::string const& text)
    {
        return std::make_unique<SearchRun>(worker, tickets, SearchQuery{text}, jobs,
                                           [this](SearchBatch const& batch)
                                           {
                                               last = batch;
                                               for (SearchMatch const& match : batch.matches)
                                                   found.push_back(match.ticket);
                                           });
    }
    void AwaitEnd(SearchState other = SearchState::Running)
    {
        for (auto const end = std::chrono::steady_clock::now() + 20s;
             (last.state == SearchState::Running || last.state == other) &&
             std::chrono::steady_clock::now() < end;)
            queue.RunFor(2ms);
    }

    comgui::Worker const worker{queue.GetExecutor()};
    std::vector<comgui::TicketAddress> jobs;
    std::vector<comgui::TicketAddress> found;
    SearchBatch last;
};
}  // namespace

TEST_F(SearchAtAServer, FindsKeysAndValues)
{
    auto const search = Search("find me");
    AwaitEnd();
    EXPECT_THAT(found, ElementsAre(jobs[7], jobs[110]));
    EXPECT_EQ(last.state, SearchState::Finished);
    EXPECT_EQ(last.done, jobs.size());
}

TEST_F(SearchAtAServer, LetsOtherWorkInBetween_HoweverSlowTheTicketsAre)
{
    std::function<void()> const beSlow = [&]
    {
        std::this_thread::sleep_for(20ms);
        trouble.tickets.afterOpening = beSlow;
    };
    trouble.tickets.afterOpening = beSlow;
    auto const search = Search("find me");
    std::optional<std::size_t> doneThen;
    worker.Do([] {}, [&] { doneThen = last.done; });
    AwaitEnd();
    ASSERT_TRUE(doneThen);
    EXPECT_LE(*doneThen, 4u);
}

TEST_F(SearchAtAServer, AtItsEnd_TellsNothing)
{
    Search("find me").reset();
    queue.RunFor(200ms);
    EXPECT_THAT(found, IsEmpty());
    EXPECT_EQ(last.total, 0u);
}

TEST_F(SearchAtAServer, GoesOnWhenTheServerIsBack)
{
    trouble.tickets.sessionIsOver = true;
    auto const search = Search("find me");
    AwaitEnd();
    ASSERT_EQ(last.state, SearchState::Interrupted);
    EXPECT_EQ(last.error->code, comgui::ServerAway);
    queue.RunFor(50ms);
    EXPECT_EQ(last.done, 0u);
    trouble.tickets.sessionIsOver = false;
    search->GoOn();
    AwaitEnd(SearchState::Interrupted);
    EXPECT_THAT(found, ElementsAre(jobs[7], jobs[110]));
    EXPECT_EQ(last.done, jobs.size());
}

TEST_F(SearchAtAServer, GoesOnWhenTheServerWasBackBeforeTheInterruptionWasKnown)
{
    trouble.tickets.sessionIsOver = true;
    auto const search = Search("find me");
    std::promise<void> stepped;
    worker.Do([&stepped] { stepped.set_value(); }, [] {});
    stepped.get_future().wait();
    trouble.tickets.sessionIsOver = false;
    search->GoOn();
    AwaitEnd(SearchState::Interrupted);
    EXPECT_EQ(last.state, SearchState::Finished);
    EXPECT_THAT(found, ElementsAre(jobs[7], jobs[110]));
}
