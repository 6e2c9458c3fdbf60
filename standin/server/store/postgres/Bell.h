// How the programs of a site wake each other: a connection that listens, and a thread of its own that rings
// and hears. A ring is a notification with the number of the newest change. Anybody may ring who may connect
// to the database, so what a ring tells is looked up in the journal, which is the truth.
//
// PostgreSQL commits one notification at a time in the whole cluster, so the changes do not carry them: a
// ring keeps a distance from those before, whoever's they were, and the changes committed meanwhile share it:
// who hears of his own change, or of a later one, need not ring any more.
//
// As this connection is always there, it shows whether the server is: what it does not answer for two
// seconds, a ring or else a question a second, or connecting again, is noted as a loss. For any thread.
#pragma once

#include "standin/server/store/postgres/Connection.h"
#include "standin/server/store/postgres/Reach.h"
#include "standin/server/store/postgres/Wakeup.h"
#include <array>
#include <atomic>
#include <functional>
#include <memory>
#include <optional>
#include <random>
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
    static constexpr std::chrono::milliseconds Longest{1000};

    std::chrono::milliseconds m_next = Shortest;
};

// How fast the rings of all programs may follow each other: each wakes every program, so if all rang for
// themselves the cost would grow with the square of their number. For one thread.
class RingPace
{
public:
    void NoteRing()
    {
        m_last[m_next] = Clock::now() + std::chrono::microseconds(m_lag(m_random));
        m_next = (m_next + 1) % m_last.size();
    }
    Clock::time_point Next() const { return m_last[m_next] + Span; }

private:
    static constexpr std::chrono::milliseconds Span{16};

    std::array<Clock::time_point, 8> m_last{};
    std::size_t m_next = 0;  // the oldest

    // Those who wait do not all ring in the same moment: most of them then hear the first.
    std::uniform_int_distribution<int> m_lag{0, 2000};
    std::minstd_rand m_random{std::random_device{}()};
};

class Bell
{
public:
    struct Limits
    {
        std::chrono::milliseconds connect;
        std::chrono::milliseconds statement;
        std::chrono::milliseconds pulse;
    };

    struct Calls
    {
        // For each new connection, before anything is heard over it; what it throws makes that of no use.
        std::function<void(Connection&)> check;

        // The others are called by the bell's thread, throw nothing and wait for nobody: nothing is heard
        // meanwhile. This one with the number of a change that was committed; also after a break, when there
        // may have been rings that nobody has heard.
        std::function<void(Sequence)> heard;

        // At every pulse, and when the server is found to be lost or to be back.
        std::function<void()> look;
    };

    // Listens when this returns. reach and hurry live longer. Throws StoreError.
    Bell(Target target, Limits const& limits, Calls calls, Reach& reach, Hurry& hurry);
    ~Bell();  // begins the hurry; what was to be rung is rung, if the server answers at once
    Bell(Bell const&) = delete;
    Bell& operator=(Bell const&) = delete;

    // Wakes the other programs soon: that change was committed.
    void Ring(Sequence newest) noexcept;

    // For a child made by fork, which has inherited the connection but not the thread.
    void Abandon() noexcept;

private:
    void Listen(std::chrono::milliseconds limit);
    void Run() noexcept;
    void ListenAgain();
    void NoteBreak(std::exception const& failure);
    void PauseAfterBreak();
    void Serve();
    void Ask(char const* sql, Parameters const& parameters);
    void NoteAnswer();
    void Hear(Clock::time_point end);
    void HearRings();
    Sequence NewestRing();
    void LookAtJournal();
    void SendRing();

    Target const m_target;
    Limits const m_limits;
    Calls const m_calls;
    Reach& m_reach;
    Hurry& m_hurry;
    Wakeup m_wakeup;
    std::atomic<Sequence> m_toRing{0};
    std::atomic<bool> m_isAsked{false};  // to ring
    std::atomic<bool> m_isOver{false};

    // The thread's own.
    std::unique_ptr<Connection> m_connection;
    Sequence m_known = 0;  // to be in the journal
    Sequence m_rung = 0;   // by whomever
    RingPace m_pace;
    Clock::time_point m_nextRing{}, m_nextLook{};
    Clock::time_point m_lastAnswer{};
    std::optional<Clock::time_point> m_brokenSince;
    GrowingPause m_pause;

    std::thread m_thread;
};
}  // namespace standin::postgres
