// Where tasks run.
#include "comgui/client/Executor.h"

#include <chrono>
#include <future>
#include <gtest/gtest.h>
#include <memory>
#include <thread>
#include <vector>
#include <wx/app.h>
#include <wx/apptrait.h>
#include <wx/evtloop.h>
#include <wx/init.h>

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

// A window's events are handled by the loop of the program; this program's loop has no windows.
TEST(OnThreadOfAHandler, RunsTasksInTheEventLoop_InTheirOrder)
{
    wxInitializer const wx;
    ASSERT_TRUE(wx.IsOk());
    wxEventLoopBase* const loop = wxTheApp->GetTraits()->CreateEventLoop();
    std::unique_ptr<wxEventLoopBase> const owner(loop);
    wxEventLoopActivator const active(loop);
    wxEvtHandler handler;
    std::vector<int> order;
    std::vector<std::thread::id> threads;
    auto const note = [&](int number)
    {
        order.push_back(number);
        threads.push_back(std::this_thread::get_id());
    };
    std::thread poster(
        [&, post = OnThreadOf(handler)]
        {
            for (int i = 0; i < 3; ++i)
                post([&note, i] { note(i); });
            post([loop] { loop->ScheduleExit(7); });
        });
    EXPECT_EQ(loop->Run(), 7);
    poster.join();
    EXPECT_EQ(order, (std::vector{0, 1, 2}));
    EXPECT_EQ(threads, std::vector(3, std::this_thread::get_id()));
}
