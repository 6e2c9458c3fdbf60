// The tickets that one session has open. A ticket has one table, however often it is opened, and keeps it
// for the next time when it is closed, so that a client's stale pointer leads to a table that answers 0 and
// never to freed memory. For any thread.
#pragma once

#include "standin/module/OpenTicket.h"
#include <map>

namespace standin
{
class OpenTickets
{
public:
    OpenTickets(TicketService& tickets, Session const& session, Gate const& gate, FolderTranslator& folders,
                std::weak_ptr<WalkedNumbers> numbers)
        : m_tickets(tickets), m_session(session), m_gate(gate), m_folders(folders),
          m_numbers(std::move(numbers))
    {
    }

    // Null if there is no such ticket, or no session any more.
    STICKET_ACCESS const* Open(TicketAddress address);

    // That one of the tickets that have or had the address; null for 0, and without a session.
    STICKET_ACCESS const* Open(TicketAddress address, Incarnation incarnation);

    // Undoes one Open; false if the ticket is not open. Works for a ticket that has been deleted, too.
    bool Close(TicketAddress address);

    // The session has ended: every table answers 0 for good.
    void Withdraw() noexcept;

private:
    struct Entry
    {
        std::unique_ptr<OpenTicket> ticket;
        unsigned openings = 0;
    };

    TicketService& m_tickets;
    Session const& m_session;
    Gate const& m_gate;
    FolderTranslator& m_folders;
    std::weak_ptr<WalkedNumbers> const m_numbers;
    std::mutex m_lock;
    std::map<TicketAddress, Entry> m_open;
    std::vector<std::unique_ptr<OpenTicket>> m_outlived;  // open when their ticket was made anew
};
}  // namespace standin
