// Lets changes that wait for the disk at the same time go there together: one of their threads makes them all
// in one transaction and flushes once, while the others wait for it. For any thread.
#pragma once

#include "standin/server/store/Store.h"
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <exception>
#include <functional>
#include <mutex>
#include <span>
#include <utility>
#include <vector>

namespace standin
{
struct PendingChange
{
    TicketChange const& change;
    std::uint64_t number;  // the caller's own
    CommitOutcome outcome{};
};

class GroupCommit
{
public:
    using Group = std::span<PendingChange* const>;

    // make: makes all of a group and fills in their outcomes, or throws and has made none of them.
    // flush: brings everything up to that change to the disk, or throws.
    GroupCommit(std::function<void(Group)> make, std::function<void(Sequence)> flush)
        : m_make(std::move(make)), m_flush(std::move(flush))
    {
    }
    GroupCommit(GroupCommit const&) = delete;
    GroupCommit& operator=(GroupCommit const&) = delete;

    // The outcome, once it is on the disk; Unknown if it was made and nobody knows whether it will last. What
    // make throws passes through, to the one whose change it is about.
    CommitOutcome Commit(TicketChange const& change, std::uint64_t number);

private:
    struct Member
    {
        PendingChange pending;
        std::exception_ptr error{};
        bool isDone = false;
        std::condition_variable changed{};  // it is done, or somebody is to lead
    };
    using Clock = std::chrono::steady_clock;

    void Lead(std::unique_lock<std::mutex>& lock);
    void Gather(std::unique_lock<std::mutex>& lock);
    void Make(std::vector<Member*> const& members);
    void Flush(std::vector<Member*> const& members) noexcept;

    std::function<void(Group)> const m_make;
    std::function<void(Sequence)> const m_flush;

    std::mutex m_lock;                  // the members below
    std::condition_variable m_arrival;  // of all who are expected
    std::vector<Member*> m_waiting;
    bool m_isLed = false;
    std::size_t m_expected = 1;     // as many as took part in the last group or waited at its end
    Clock::duration m_lastTime{0};  // that the last group took
};
}  // namespace standin
