// Hears of what changes in a site before its clients do: rules of trouble come with the system ticket, from
// whichever program.
#pragma once

#include "standin/server/feed/ChangeListener.h"
#include "standin/server/tickets/TicketAddress.h"
#include "standin/server/trouble/Troubles.h"
#include <utility>

namespace standin
{
class TroubleListener final : public ChangeListener
{
public:
    // Both outlive it. clients: who hears of everything afterwards.
    TroubleListener(Troubles& troubles, ChangeListener& clients) : m_troubles(troubles), m_clients(clients) {}

    bool Notices(TicketAddress ticket) const override { return ticket == SystemTicket; }
    void Noticed(TicketAddress ticket, ChangedParameters const& parameters) noexcept override;

    bool Wants(TicketAddress ticket) const override { return m_clients.Wants(ticket); }
    bool HasRoom() const override { return m_clients.HasRoom(); }
    void Created(TicketAddress ticket) noexcept override { m_clients.Created(ticket); }
    void Written(TicketAddress ticket, ChangedParameters&& parameters) noexcept override
    {
        m_clients.Written(ticket, std::move(parameters));
    }
    void Deleted(TicketAddress ticket) noexcept override { m_clients.Deleted(ticket); }

private:
    Troubles& m_troubles;
    ChangeListener& m_clients;
};
}  // namespace standin
