// The function table of one ticket, over whatever knows how to answer its slots: a ticket of the server as
// one session sees it, or a ticket file. No exception leaves a slot.
#pragma once

#include "comgui/ticket/STICKET_ACCESS.h"
#include "standin/server/tickets/TicketAddress.h"
#include <optional>

namespace standin
{
// What a ticket has to answer. Arguments and results are those of the slots in STICKET_ACCESS.h, with true
// for success; nothing but the table's pointers themselves has been looked at.
class TicketSubject
{
public:
    virtual ~TicketSubject() = default;

    virtual bool Get(char const* key, PARAM_TYPE type, void* value, int pos) = 0;
    virtual bool GetTable(GETMULTIPAR* table) = 0;
    virtual bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) = 0;
    virtual bool SetTable(SETMULTIPAR* table) = 0;
    virtual bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit) = 0;
    virtual bool Option(int code, void* out) = 0;
};

class TicketTable
{
public:
    // The subject outlives the table.
    explicit TicketTable(TicketSubject& subject);
    TicketTable(TicketTable const&) = delete;
    TicketTable& operator=(TicketTable const&) = delete;

    STICKET_ACCESS const* Access() const { return &m_access; }

private:
    STICKET_ACCESS m_access{};
};

// Answers STICKET_OP_WHOAMI into a STICKET_OPTION_WHOAMI: the ticket's type and its id, both TICKET_ID_NONE
// for a ticket without an address. False for a null out.
bool TellWhoAmI(std::optional<TicketAddress> const& address, void* out);
}  // namespace standin
