// Calls that take long, off the thread that takes their results.
#include "comgui/client/Worker.h"

#include "comgui/client/Result.h"
#include <atomic>
#include <future>
#include <gmock/gmock.h>

using namespace comgui;
using namespace std::chrono_literals;
using testing::ElementsAre;

namespace
{
class WorkerOfAClient : public testing::Test
{
protected:
    // Runs the queue until it holds.
    template <typename Condition>
    bool Await(Condition condition)
    {
        for (auto const end = std::chrono::steady_clock::now() + 20s;
             !condition() && std::chrono::steady_clock::now() < end;)
            queue.RunFor(1ms);
        return condition();
    }

    TaskQueue queue;
    std::vector<int> taken;
};
}  // namespace

TEST_F(WorkerOfAClient, WorksOnItsOwnThread_AndGivesResultsToTheOther)
{
    Worker const worker(queue.GetExecutor());
    std::thread::id taker;
    std::optional<std::thread::id> found;
    worker.Do([] { return std::this_thread::get_id(); },
              [&](std::thread::id id)
              {
                  found = id;
                  taker = std::this_thread::get_id();
              });
    ASSERT_TRUE(Await([&] { return found.has_value(); }));
    EXPECT_NE(*found, taker);
    EXPECT_EQ(taker, std::this_thread::get_id());
}

TEST_F(WorkerOfAClient, WorksInOrder)
{
    Worker const worker(queue.GetExecutor());
    for (int i = 0; i < 3; ++i)
        worker.Do([i] { return i; }, [this](int result) { taken.push_back(result); });
    ASSERT_TRUE(Await([this] { return taken.size() == 3; }));
    EXPECT_THAT(taken, ElementsAre(0, 1, 2));
}

TEST_F(WorkerOfAClient, TakesWorkWithoutAResult)
{
    Worker const worker(queue.GetExecutor());
    std::atomic<bool> isDone{false};
    worker.Do([&isDone] { isDone = true; }, [this] { taken.push_back(1); });
    ASSERT_TRUE(Await([this] { return !taken.empty(); }));
    EXPECT_TRUE(isDone);
}

TEST_F(WorkerOfAClient, TakesFailuresAsResults)
{
    Worker const worker(queue.GetExecutor());
    worker.Do(
        [] {
            return Result<int>(Error{NoSuchKey, {}, {}});
        },
        [this](Result<int> const& result) { taken.push_back(result.GetError().code); });
    ASSERT_TRUE(Await([this] { return !taken.empty(); }));
    EXPECT_THAT(taken, ElementsAre(NoSuchKey));
}

TEST_F(WorkerOfAClient, AtItsEnd_WaitsForTheWorkThatRuns_AndDropsTheRest)
{
    std::promise<void> begun, goOn;
    std::atomic<bool> isOver{false};
    auto worker = std::make_optional<Worker>(queue.GetExecutor());
    worker->Do(
        [&]
        {
            begun.set_value();
            goOn.get_future().wait();
            isOver = true;
        },
        [this] { taken.push_back(1); });
    worker->Do([] { return 2; }, [this](int result) { taken.push_back(result); });
    begun.get_future().wait();
    std::thread helper(
        [&goOn]
        {
            std::this_thread::sleep_for(20ms);
            goOn.set_value();
        });
    worker.reset();
    EXPECT_TRUE(isOver);
    helper.join();
    queue.RunFor(20ms);
    EXPECT_TRUE(taken.empty()) << taken[0];
}

TEST_F(WorkerOfAClient, AfterItsEnd_TakesNoResultThatWaited)
{
    auto worker = std::make_optional<Worker>(queue.GetExecutor());
    std::promise<void> isLast;
    worker->Do([] { return 1; }, [this](int result) { taken.push_back(result); });
    worker->Do([&isLast] { isLast.set_value(); }, [] {});
    isLast.get_future().wait();  // the first result waits in the queue
    worker.reset();
    queue.RunFor(20ms);
    EXPECT_TRUE(taken.empty());
}

TEST_F(WorkerOfAClient, MayBeEndedByAResult)
{
    auto worker = std::make_optional<Worker>(queue.GetExecutor());
    worker->Do([] { return 1; },
               [&](int result)
               {
                   worker.reset();
                   taken.push_back(result);
               });
    ASSERT_TRUE(Await([this] { return !taken.empty(); }));
    EXPECT_FALSE(worker);
}

TEST_F(WorkerOfAClient, AtItsEnd_FreesTheWorkThatWaits)
{
    auto const captured = std::make_shared<int>(1);
    std::promise<void> begun, goOn;
    auto worker = std::make_optional<Worker>(queue.GetExecutor());
    worker->Do(
        [&]
        {
            begun.set_value();
            goOn.get_future().wait();
        },
        [] {});
    begun.get_future().wait();
    worker->Do([captured] {}, [captured] {});
    ASSERT_GT(captured.use_count(), 1);
    std::thread helper(
        [&goOn]
        {
            std::this_thread::sleep_for(20ms);
            goOn.set_value();
        });
    worker.reset();
    helper.join();
    EXPECT_EQ(captured.use_count(), 1);
}
