// A ticket of nobody's but its holder's: no server, session, lock or store behind it. It reads and writes by
// the very rules of the server's tickets, and has its own keys. For one thread at a time.
//
// A text that was read stays where it is as long as the ticket, also when its value has been replaced or
// deleted since.
#pragma once

#include "standin/server/tickets/TicketSnapshot.h"
#include "standin/server/tickets/TicketXml.h"
#include "standin/server/tickets/WritePlan.h"

namespace standin
{
class OwnedTicket
{
public:
    OwnedTicket();
    explicit OwnedTicket(TicketXml const& content);
    ~OwnedTicket();
    OwnedTicket(OwnedTicket const&) = delete;
    OwnedTicket& operator=(OwnedTicket const&) = delete;

    // The ticket as it is now; dies at the next Write.
    TicketSnapshot const& Now() const { return *m_snapshot; }

    // Carries out what can be, and tells by ok which that is. Throws bad_alloc, with nothing changed.
    void Write(std::span<TicketWrite> writes);

    bool Changed() const { return m_changed; }  // since it was made; deleting what is not there is no change
    TicketXml Content() const { return TicketXml::Of(m_address, *m_snapshot); }  // without the pointers

    std::optional<TicketAddress> const& Address() const { return m_address; }

private:
    void Become(SnapshotEdit& edit, std::span<ParameterChange> changes);

    std::optional<TicketAddress> m_address;
    KeyPool m_keys;
    TicketSnapshot const* m_snapshot = nullptr;
    TicketTexts m_retired;  // texts that are gone from the ticket, but not from those who read them
    bool m_changed = false;
};
}  // namespace standin
