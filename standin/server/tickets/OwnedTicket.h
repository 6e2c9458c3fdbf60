// A ticket of nobody's but its holder's: no server, session, lock or storage behind it. It reads and writes
// by the very rules of the server's tickets, and has its own keys. For one thread at a time.
//
// A text or BIN_STRING that was read or walked over stays where it is as long as the ticket, also when its
// value has been replaced or deleted since.
#pragma once

#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include "standin/server/tickets/Ticket.h"
#include "standin/server/tickets/TicketXml.h"

namespace standin
{
class OwnedTicket
{
public:
    OwnedTicket() = default;
    explicit OwnedTicket(TicketXml const& content);
    OwnedTicket(OwnedTicket const&) = delete;
    OwnedTicket& operator=(OwnedTicket const&) = delete;

    // As the slots in STICKET_ACCESS.h promise, with true for success.
    bool Get(char const* key, PARAM_TYPE type, void* value, int pos) const;
    bool GetTable(GETMULTIPAR* table) const;
    bool Set(char const* key, PARAM_TYPE type, void const* value, int pos);
    bool SetTable(SETMULTIPAR* table);

    // Every value of the keys that begin with the prefix (a null one begins all), by key, bytewise, and by
    // position from 0 up. False for a null action. The action may read and write the ticket: keys that it
    // makes are not walked over any more, values behind the one in hand are as they are when their turn
    // comes. A number's address dies when its key is written to.
    bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix) const;

    bool Changed() const { return m_changed; }  // since it was made; deleting what is not there is no change
    TicketXml Content() const;                  // without the pointers

    std::optional<TicketAddress> const& Address() const { return m_address; }

private:
    std::optional<TicketAddress> m_address;
    KeyPool m_keys;
    Ticket m_ticket;
    TicketTexts m_retired;  // texts that are gone from the ticket, but not from those who read them
    bool m_changed = false;
};
}  // namespace standin
