// Where tasks run.
#include "comgui/client/Executor.h"

#include <chrono>
#include <future>
#include <gtest/gtest.h>
#include <thread>

using namespace comgui;
using namespace std::chrono_literals;

namespace
{
// Posts a task when it goes.
struct Poster
{
    ~Poster()
    {
        post([has = hasRun] { has->set_value(); });
    }

    Executor const post;
    std::shared_ptr<std::promise<void>> const hasRun;
};
}  // namespace

// On a thread that nobody waits for: one that locks twice never ends.
TEST(TaskQueueOfAProgram, TaskWhoseEndPostsAnother_RunsThatToo)
{
    auto const queue = std::make_shared<TaskQueue>();
    auto const hasRun = std::make_shared<std::promise<void>>();
    queue->GetExecutor()([poster = std::shared_ptr<Poster>(new Poster{queue->GetExecutor(), hasRun})] {});
    std::thread([queue] { queue->RunFor(10s); }).detach();
    EXPECT_EQ(hasRun->get_future().wait_for(5s), std::future_status::ready);
}
