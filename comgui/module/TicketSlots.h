// The function table of one ticket, and the virtual functions behind its slots, with the slots' own
// arguments. Derive from it to answer slots directly; Ticket.h has the same with values.
//
// An object has its table for as long as it lives. While it may be called it must not be destroyed: a host
// that closes a ticket may still hold the table.
#pragma once

#include "comgui/module/Called.h"
#include "comgui/module/Value.h"
#include "comgui/ticket/STICKET_ACCESS.h"

class clFOLDER_VARIABLES;

namespace comgui::plugin
{
class TicketSlots : public Called
{
public:
    TicketSlots();
    ~TicketSlots() override;

    STICKET_ACCESS const* Access() const { return &m_access; }

    // From now on every slot answers 0 and calls nothing here. Calls under way go on.
    void Withdraw() noexcept;

    // Arguments and results are those of the slots in STICKET_ACCESS.h, true for success. Nothing has been
    // looked at but the table's Instance: keys, tables and places of values may be null. No record of a table
    // is ok.
    virtual bool Get(char const* key, PARAM_TYPE type, void* value, int pos) = 0;
    virtual bool GetTable(GETMULTIPAR* table) = 0;
    virtual bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) = 0;
    virtual bool SetTable(SETMULTIPAR* table) = 0;
    virtual bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit) = 0;
    virtual bool Option(int code, void* out) = 0;

private:
    STICKET_ACCESS m_access{};
};

// What a ticket of that address answers to STICKET_OP_WHOAMI, and with a translator to
// STICKET_OP_FOLDER_VARIABLES. False for other options and for a null out.
bool AnswerOption(int code, void* out, Address address, clFOLDER_VARIABLES* folders);
}  // namespace comgui::plugin
