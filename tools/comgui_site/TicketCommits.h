// Changes of tickets that an owner makes by the ordinary way of all changes: one transaction with its journal
// record a ticket, by which every program that has the site open hears of it. For one thread.
#pragma once

#include "standin/server/store/Store.h"
#include "standin/server/tickets/TicketXml.h"
#include <optional>
#include <vector>

namespace comgui_site
{
// Every value of a ticket, and the state in which it had them. Nothing if there is no such ticket.
struct LoadedTicket
{
    standin::TicketState state;
    standin::TicketXml values;
};
std::optional<LoadedTicket> Load(standin::Store& store, standin::TicketAddress address);

class TicketCommits
{
public:
    explicit TicketCommits(standin::Store& store) : m_store(store) {}

    enum class Mode
    {
        Merge,    // a key that is wanted gets the values that it is wanted with, and no others
        Replace,  // and what is not wanted goes
    };
    struct Done
    {
        enum Kind
        {
            Unchanged,  // it was so before; nothing was committed
            Created,
            Changed,
        };
        Kind kind = Unchanged;
        std::size_t values = 0;  // written and deleted
    };

    // Brings the ticket at that address to what is wanted, as a whole or not at all. Throws Trouble if the
    // result were a system ticket whose folders clients cannot read, and StoreError.
    Done Bring(standin::TicketAddress address, standin::TicketXml const& wanted, Mode mode);

    // Makes a ticket with the next id of the type. Throws Trouble if none is free, StoreError.
    standin::TicketAddress CreateNext(int type, standin::TicketXml const& values);

    // False if there is no such ticket.
    bool Delete(standin::TicketAddress address);

private:
    // Nothing after a conflict.
    std::optional<standin::CommitOutcome> Commit(standin::TicketChange const& change);

    standin::Store& m_store;
    std::uint64_t m_number = 0;
};
}  // namespace comgui_site
