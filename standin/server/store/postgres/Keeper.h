// A thread that does one thing whenever it is woken, and nothing in between. For any thread.
#pragma once

#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>

namespace standin::postgres
{
class Keeper
{
public:
    // task throws nothing.
    explicit Keeper(std::function<void()> task) : m_task(std::move(task)), m_thread([this] { Run(); }) {}

    ~Keeper()  // waits for the end of the task
    {
        {
            std::lock_guard const lock(m_lock);
            m_isOver = true;
        }
        m_woken.notify_one();
        if (m_thread.joinable())
            m_thread.join();
    }
    Keeper(Keeper const&) = delete;
    Keeper& operator=(Keeper const&) = delete;

    // Has the task done soon; once more if it is being done.
    void Wake() noexcept
    {
        std::lock_guard const lock(m_lock);
        m_isDue = true;
        m_woken.notify_one();
    }

    // For a child made by fork, which has not inherited the thread.
    void Abandon() noexcept { m_thread.detach(); }

private:
    void Run() noexcept
    {
        for (std::unique_lock lock(m_lock);;)
        {
            m_woken.wait(lock, [this] { return m_isDue || m_isOver; });
            if (m_isOver)
                return;
            m_isDue = false;
            lock.unlock();
            m_task();
            lock.lock();
        }
    }

    std::function<void()> const m_task;
    std::mutex m_lock;
    std::condition_variable m_woken;
    bool m_isDue = false, m_isOver = false;
    std::thread m_thread;
};
}  // namespace standin::postgres
