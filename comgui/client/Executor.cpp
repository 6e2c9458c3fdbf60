#include "comgui/client/Executor.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <utility>
#include <wx/event.h>

namespace comgui
{
Executor OnThreadOf(wxEvtHandler& handler)
{
    return [&handler](std::function<void()> const& task) { handler.CallAfter(task); };
}

struct TaskQueue::STATE
{
    std::mutex lock;
    std::condition_variable changed;
    std::deque<std::function<void()>> tasks;
    bool isStopped = false;
};

TaskQueue::TaskQueue() : m_state(std::make_shared<STATE>()) {}
TaskQueue::~TaskQueue() = default;

Executor TaskQueue::GetExecutor() const
{
    return [weak = std::weak_ptr<STATE>(m_state)](std::function<void()> task)
    {
        auto const state = weak.lock();
        if (!state)
            return;
        std::lock_guard const lock(state->lock);
        state->tasks.push_back(std::move(task));
        state->changed.notify_one();
    };
}

void TaskQueue::Run() { RunUntil(std::chrono::steady_clock::time_point::max()); }

void TaskQueue::RunFor(std::chrono::milliseconds time) { RunUntil(std::chrono::steady_clock::now() + time); }

void TaskQueue::RunUntil(std::chrono::steady_clock::time_point end)
{
    auto const state = m_state;  // a task may destroy the queue
    std::unique_lock lock(state->lock);
    auto const isReady = [&state] { return state->isStopped || !state->tasks.empty(); };
    while (true)
    {
        if (end == std::chrono::steady_clock::time_point::max())
            state->changed.wait(lock, isReady);
        else if (!state->changed.wait_until(lock, end, isReady))
            return;
        if (std::exchange(state->isStopped, false))
            return;
        auto task = std::move(state->tasks.front());
        state->tasks.pop_front();
        lock.unlock();
        task();
        task = nullptr;  // what it holds may post when it goes
        lock.lock();
        if (std::chrono::steady_clock::now() >= end)
            return;
    }
}

void TaskQueue::Stop()
{
    std::lock_guard const lock(m_state->lock);
    m_state->isStopped = true;
    m_state->changed.notify_all();
}
}  // namespace comgui
