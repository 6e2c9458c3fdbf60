#include "standin/server/store/sqlite/GroupCommit.h"

#include <algorithm>

namespace standin
{
CommitOutcome GroupCommit::Commit(TicketChange const& change, std::uint64_t number)
{
    Member mine{{change, number}};
    std::unique_lock lock(m_lock);
    m_waiting.push_back(&mine);
    if (m_waiting.size() >= m_expected)
        m_arrival.notify_one();
    while (!mine.isDone)
        if (m_isLed)
            mine.changed.wait(lock);
        else
            Lead(lock);
    if (mine.error)
        std::rethrow_exception(mine.error);
    return mine.pending.outcome;
}

// The lock is open while the group is made.
void GroupCommit::Lead(std::unique_lock<std::mutex>& lock)
{
    m_isLed = true;
    Gather(lock);
    std::vector<Member*> const members = std::exchange(m_waiting, {});
    auto const begin = Clock::now();
    lock.unlock();
    Make(members);
    Flush(members);
    lock.lock();
    m_lastTime = Clock::now() - begin;
    m_expected = members.size() + m_waiting.size();
    m_isLed = false;
    for (Member* const member : members)
    {
        member->isDone = true;
        member->changed.notify_one();  // under the lock, since behind it the member is gone
    }
    if (!m_waiting.empty())
        m_waiting.front()->changed.notify_one();
}

// Those of the last group may come again at once. Waiting for them pays as long as it costs less than a group
// of their own.
void GroupCommit::Gather(std::unique_lock<std::mutex>& lock)
{
    m_arrival.wait_for(lock, m_lastTime / 2, [this] { return m_waiting.size() >= m_expected; });
}

// One change that cannot be made is no reason for the others not to be.
void GroupCommit::Make(std::vector<Member*> const& members)
{
    std::vector<PendingChange*> group;
    group.reserve(members.size());
    for (Member* const member : members)
        group.push_back(&member->pending);
    try
    {
        return m_make(group);
    }
    catch (...)
    {
        if (members.size() == 1)
            members[0]->error = std::current_exception();
    }
    if (members.size() > 1)
        for (Member* const member : members)
            Make({member});
}

void GroupCommit::Flush(std::vector<Member*> const& members) noexcept
{
    auto const isMade = [](Member const* member)
    { return !member->error && member->pending.outcome.kind == CommitOutcome::Committed; };
    Sequence last = 0;
    for (Member const* const member : members)
        if (isMade(member))
            last = std::max(last, member->pending.outcome.sequence);
    if (last == 0)
        return;
    try
    {
        m_flush(last);
    }
    catch (...)
    {
        for (Member* const member : members)
            if (isMade(member))
                member->pending.outcome.kind = CommitOutcome::Unknown;
    }
}
}  // namespace standin
