#include "comgui/module/TicketSlots.h"

#include "comgui/module/Handles.h"
#include "comgui/module/Running.h"

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
    return ticket ? RunSlot(*ticket, [&] { return work(*ticket); }) : 0;
}

int OnGet(void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
{
    return ReadSlot(instance, [&](TicketSlots& ticket) { return ticket.Get(key, type, value, pos); });
}

int OnGetTable(void* instance, GETMULTIPAR* table)
{
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
    return Slot(instance, [&](TicketSlots& ticket) { return ticket.SetTable(table); });
}

int OnOption(void* instance, int code, void* out)
{
    return Slot(instance, [&](TicketSlots& ticket) { return ticket.Option(code, out); });
}
}  // namespace

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
