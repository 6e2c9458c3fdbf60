// The events that wait for one subscriber, merged: what a subscriber who was busy has to know, in memory that
// does not grow with the number of changes. For one thread at a time.
#pragma once

#include "comgui/client/Event.h"
#include "comgui/client/Subscription.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include <cstddef>
#include <map>
#include <set>
#include <string_view>
#include <vector>

namespace comgui::detail
{
// One notification, as the plug-in brings it.
struct TicketEvent
{
    enum KIND
    {
        Changed = 1,
        Created = 4,
        Deleted = 5,
    };
    KIND kind;
    TicketAddress ticket;
    std::vector<KeyChange> keys{};
};

// The records of a change, ended by a null key, as one change a key.
std::vector<KeyChange> ChangesOf(SETMULTIPAR const* records);

class PendingEvents
{
public:
    // With more than this the rest is reported as a whole.
    static constexpr std::size_t MostKeysOfATicket = 1000;
    static constexpr std::size_t MostTickets = 10000;
    static constexpr std::size_t MostBytes = std::size_t{16} << 20;  // of keys and values

    void Add(Interest const& interest, TicketEvent const& event);
    void Add(Interest const& interest, Event const& event);  // of the server and of transfers

    // Something may have happened to the ticket, or to any of the type: TICKET_ID_ALL.
    void AddUnheard(Interest const& interest, TicketAddress ticket);

    bool IsEmpty() const;
    void DropTickets();
    void DropServer() { m_server.clear(), m_isNewSession = false; }

    // Everything, in this order: the server, the tickets, by their first change, the transfers.
    std::vector<Event> Take();

private:
    struct TICKET
    {
        TicketAddress address;
        bool isDeleted = false;  // first
        bool isCreated = false;  // then
        bool isWhole = false;
        std::map<std::string, std::optional<Value>> keys{};  // at last
    };

    TICKET* Place(TicketAddress ticket);  // null: in a crowd
    void AddChange(TICKET& ticket, KeyChange const& change);
    void DropKeys(TICKET& ticket);
    void Collapse(int type);
    void AddServerEvent(Event const& event);

    std::vector<TICKET> m_tickets;
    std::map<TicketAddress, std::size_t> m_places;  // in m_tickets
    std::set<int> m_crowds;                         // types of which too many tickets have changed
    std::size_t m_bytes = 0;
    std::vector<Event> m_server;
    bool m_isNewSession = false;
    std::map<int, TransferProgress> m_progress;
    std::vector<TransferEnded> m_ended;
};
}  // namespace comgui::detail
