// Checks what a program hears of the lanes of CrashWriter: each change once, in its order, without a gap.
// What is not so is a line "misheard WHAT" on stdout.
#pragma once

#include "bench/site/LaneTickets.h"
#include <atomic>
#include <map>
#include <mutex>
#include <set>
#include <vector>

class LaneListener
{
public:
    // Checks every change of the tickets of those types from now on; false if that is refused. Once. The
    // client must not outlive this.
    bool Listen(SiteClient& client, std::vector<int> const& types);

    // How far a lane has been heard; 0 before the first change of it.
    std::int64_t Heard(int type, int lane) const;
    std::int64_t Changes() const { return m_changes; }

    // To be called with every notification, on the server's thread.
    void Hear(::Heard const& heard);

private:
    void HearTable(::Heard const& heard);
    void HearTicket(::Heard const& heard);
    void Take(int type, int lane, std::int64_t value);

    std::mutex mutable m_lock;
    std::map<std::pair<int, int>, std::int64_t> m_last;  // by type and lane
    std::set<std::pair<int, int>> m_created;             // and not deleted, of those whose creation was heard
    std::atomic<std::int64_t> m_changes = 0;
};
