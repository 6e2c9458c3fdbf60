#include "standin/module/OpenTickets.h"

namespace standin
{
STICKET_ACCESS const* OpenTickets::Open(TicketAddress address)
{
    return Open(address, m_tickets.IncarnationOf(address));
}

STICKET_ACCESS const* OpenTickets::Open(TicketAddress address, Incarnation incarnation)
{
    if (incarnation == 0 || m_session.Ended())
        return nullptr;
    std::lock_guard const lock(m_lock);
    Entry& entry = m_open[address];
    bool const isAnother = entry.ticket && entry.openings && entry.ticket->Which() != incarnation;
    if (isAnother)
    {
        m_outlived.push_back(std::move(entry.ticket));
        entry.openings = 0;
    }
    if (!entry.ticket)
        entry.ticket = std::make_unique<OpenTicket>(m_tickets, m_session, m_gate, m_folders, m_numbers,
                                                    address, incarnation);
    entry.ticket->StandFor(incarnation);
    ++entry.openings;
    return entry.ticket->Access();
}

bool OpenTickets::Close(TicketAddress address)
{
    std::lock_guard const lock(m_lock);
    auto const entry = m_open.find(address);
    if (m_session.Ended() || entry == m_open.end() || !entry->second.openings)
        return false;
    if (--entry->second.openings == 0)
        entry->second.ticket->StandFor(NoTicket);
    return true;
}

void OpenTickets::Withdraw() noexcept
{
    std::lock_guard const lock(m_lock);
    for (auto const& [address, entry] : m_open)
        if (entry.ticket)
            entry.ticket->Withdraw();
    for (auto const& ticket : m_outlived)
        ticket->Withdraw();
}
}  // namespace standin
