#include "comgui/module/TicketSlots.h"

#include "comgui/module/Handles.h"
#include "comgui/module/Running.h"
#include "comgui/ticket/TICKET_OP.h"

namespace comgui::plugin
{
namespace
{
constinit Handles<TicketSlots, 1> tickets;

template <typename Work>
int ReadSlot(void* instance, Work const& work) noexcept
{
    TicketSlots* const ticket = tickets.Find(instance);
    return ticket ? RunRead(*ticket, [&] { return work(*ticket); }) : 0;
}

template <typename Work>
int Slot(void* instance, Work const& work) noexcept
{
    TicketSlots* const ticket = tickets.Find(instance);
    if (ticket)
        return RunSlot(*ticket, [&] { return work(*ticket); });
    RunStray(Failed);
    return 0;
}

int OnGet(void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
{
    return ReadSlot(instance, [&](TicketSlots& ticket) { return ticket.Get(key, type, value, pos); });
}

int OnGetTable(void* instance, GETMULTIPAR* table)
{
    ClearOk(table);
    return ReadSlot(instance, [&](TicketSlots& ticket) { return ticket.GetTable(table); });
}

int OnWalk(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    return Slot(instance, [&](TicketSlots& ticket) { return ticket.Walk(action, context, prefix, limit); });
}

int OnSet(void* instance, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    return Slot(instance, [&](TicketSlots& ticket) { return ticket.Set(key, type, value, pos); });
}

int OnSetTable(void* instance, SETMULTIPAR* table)
{
    ClearOk(table);
    return Slot(instance, [&](TicketSlots& ticket) { return ticket.SetTable(table); });
}

int OnOption(void* instance, int code, void* out)
{
    return Slot(instance, [&](TicketSlots& ticket) { return ticket.Option(code, out); });
}
}  // namespace

bool AnswerOption(int code, void* out, Address address, clFOLDER_VARIABLES* folders)
{
    if (!out)
        return false;
    if (code == STICKET_OP_FOLDER_VARIABLES && folders)
        *static_cast<clFOLDER_VARIABLES**>(out) = folders;
    else if (code == STICKET_OP_WHOAMI)
    {
        auto const word = [](int number) { return static_cast<unsigned long long>(number); };
        *static_cast<STICKET_OPTION_WHOAMI*>(out) = {word(address.type), word(address.id)};
    }
    else
        return false;
    return true;
}

TicketSlots::TicketSlots()
{
    m_access.Instance = tickets.Add(*this);
    m_access.SGETPARAMETER = OnGet;
    m_access.SGETMULTIPAR = OnGetTable;
    m_access.SWALKPARAMETERS = OnWalk;
    m_access.SSETPARAMETER = OnSet;
    m_access.SSETMULTIPAR = OnSetTable;
    m_access.SOPTION = OnOption;
}

TicketSlots::~TicketSlots() { Withdraw(); }

void TicketSlots::Withdraw() noexcept { tickets.Remove(m_access.Instance); }
}  // namespace comgui::plugin
