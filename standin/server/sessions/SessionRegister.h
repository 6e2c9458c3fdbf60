// Numbers the sessions of a server and keeps the texts that left their tickets while a session may still
// hold their addresses: until every session that lived at that moment has ended. For any thread.
#pragma once

#include "standin/server/tickets/TicketValue.h"
#include <deque>
#include <mutex>
#include <set>

namespace standin
{
class SessionRegister
{
public:
    unsigned long long Open();
    void Close(unsigned long long number);

    // Takes over texts that no reader can reach any more. One that was never handed out goes at once.
    void Retire(TicketTexts texts);

    std::size_t Kept() const;  // texts that still wait

private:
    struct Retired
    {
        unsigned long long newest;  // the newest session that can have seen it
        std::unique_ptr<TicketText> text;
    };
    mutable std::mutex m_lock;
    unsigned long long m_newest = 0;
    std::set<unsigned long long> m_open;
    std::deque<Retired> m_retired;  // newest never falls from front to back
};
}  // namespace standin
