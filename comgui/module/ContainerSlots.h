// The function table of a session's tickets, and the virtual functions behind its slots, with the slots' own
// arguments. Derive from it to answer slots directly; Container.h has the same with values.
//
// An object has its table for as long as it lives, and must not be destroyed while it may be called.
#pragma once

#include "comgui/module/Called.h"
#include "comgui/module/Value.h"
#include "comgui/ticket/MTICKET_ACCESS.h"

namespace comgui::plugin
{
class ContainerSlots : public Called
{
public:
    ContainerSlots();
    ~ContainerSlots() override;

    MTICKET_ACCESS const* Access() const { return &m_access; }

    // From now on every slot answers 0 and calls nothing here. Calls under way go on. The kit does this when
    // the session ends.
    virtual void Withdraw() noexcept;

    // Arguments and results are those of the slots in MTICKET_ACCESS.h, true for success. Nothing has been
    // looked at but the table's Instance: addresses may be no tickets', pointers may be null. No record of a
    // table is ok.
    virtual bool Get(Address ticket, char const* key, PARAM_TYPE type, void* value, int pos) = 0;
    virtual bool GetTable(Address ticket, GETMULTIPAR* table) = 0;
    virtual bool WalkTickets(MWALKTICKETS_ACTION action, void* context, int type) = 0;
    virtual bool Set(Address ticket, char const* key, PARAM_TYPE type, void const* value, int pos) = 0;
    virtual bool SetTable(Address ticket, SETMULTIPAR* table) = 0;
    virtual bool Operation(Address ticket, TICKET_OP op, void* arg) = 0;
    virtual bool Switch(Address tickets, int notification, bool enable, char const* const* keys) = 0;
    virtual STICKET_ACCESS const* CreateTicket(Address ticket, char const* const* keys) = 0;

private:
    MTICKET_ACCESS m_access{};
};
}  // namespace comgui::plugin
