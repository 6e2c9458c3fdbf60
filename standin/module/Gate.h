// Where every call of a session goes through before it is carried out: the server may be told to misbehave,
// see TroubleRule.h. For any thread; while nothing is amiss it costs next to nothing.
#pragma once

#include "standin/server/sessions/TicketService.h"
#include "standin/server/trouble/Troubles.h"

namespace standin
{
// Waits, and throws comgui::plugin::Refused with the code, if that is what the rules want.
void PassTroubled(Troubles& troubles, Occasion const& call);

// By the rules that were there when this was called, whoever has set them on this machine.
inline void Pass(TicketService& tickets, Troubles& troubles, Occasion const& call)
{
    tickets.CatchUp();
    if (troubles.Any()) [[unlikely]]
        PassTroubled(troubles, call);
}

class Gate
{
public:
    // All of them outlive it.
    Gate(TicketService& tickets, Troubles& troubles, Session const& session)
        : m_tickets(tickets), m_troubles(troubles), m_session(session)
    {
    }

    // For calls that look at tickets in any case; so the rules of this very moment are followed.
    void PassFresh(std::string_view call, std::optional<TicketAddress> ticket = {}) const
    {
        m_tickets.CatchUp();
        Pass(call, ticket);
    }
    void Pass(std::string_view call, std::optional<TicketAddress> ticket = {}) const
    {
        if (m_troubles.Any()) [[unlikely]]
            PassTroubledCall({.call = call, .ticket = ticket, .user = m_session.Who().name});
    }
    void PassCommand(std::string_view command) const
    {
        if (m_troubles.Any()) [[unlikely]]
            PassTroubledCall({.call = "SendCommandEntry", .command = command, .user = m_session.Who().name});
    }

    // The server was away, and knows the session no more now that it is back.
    bool HasLostSession() const { return m_troubles.HasLost(m_session.Number()) && !m_troubles.IsAway(); }

private:
    void PassTroubledCall(Occasion const& call) const;

    TicketService& m_tickets;
    Troubles& m_troubles;
    Session const& m_session;
};
}  // namespace standin
