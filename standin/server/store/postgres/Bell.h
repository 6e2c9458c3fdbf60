// How the programs of a site wake each other: a connection that listens, and a thread of its own that rings
// and hears. A ring is a notification with the number of the newest change; the journal is the truth.
//
// PostgreSQL commits one notification at a time in the whole cluster, so the changes do not carry them: a
// ring keeps a distance from the one before, and the changes committed meanwhile share it. For any thread.
#pragma once

#include "standin/server/files/Descriptor.h"
#include "standin/server/store/postgres/Connection.h"
#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>

namespace standin::postgres
{
// The pause before the next attempt to connect.
class GrowingPause
{
public:
    void Reset() { m_next = Shortest; }
    std::chrono::milliseconds Take()
    {
        auto const pause = m_next;
        m_next = std::min(2 * m_next, Longest);
        return pause;
    }

private:
    static constexpr std::chrono::milliseconds Shortest{50};
    static constexpr std::chrono::milliseconds Longest{2000};

    std::chrono::milliseconds m_next = Shortest;
};

class Bell
{
public:
    struct Limits
    {
        std::chrono::milliseconds connect;
        std::chrono::milliseconds statement;
    };

    // Listens when this returns. heard is called by the bell's thread with the number of a change that was
    // committed; also after a break, when there may have been rings that nobody has heard. Throws StoreError.
    Bell(Target target, Limits const& limits, std::function<void(Sequence)> heard);
    ~Bell();  // what was to be rung is rung, if the server answers at once
    Bell(Bell const&) = delete;
    Bell& operator=(Bell const&) = delete;

    // Wakes the other programs soon: that change was committed.
    void Ring(Sequence newest) noexcept;

    // For a child made by fork, which has inherited the connection but not the thread.
    void Abandon() noexcept;

private:
    void Listen();
    void Run() noexcept;
    void Serve();
    void Hear(Clock::time_point end);
    void HearRings();
    void SendRing(std::chrono::milliseconds limit);
    void Wake() noexcept;

    Target const m_target;
    Limits const m_limits;
    std::function<void(Sequence)> const m_heard;
    Descriptor m_wakingEnd, m_wokenEnd;  // a pipe, so that the thread waits for it and the socket at once
    std::atomic<Sequence> m_toRing{0};
    std::atomic<bool> m_isAsked{false};  // to ring
    std::atomic<bool> m_isOver{false};

    // The thread's own.
    std::unique_ptr<Connection> m_connection;
    Sequence m_rung = 0;
    Clock::time_point m_nextRing{};

    std::thread m_thread;
};
}  // namespace standin::postgres
