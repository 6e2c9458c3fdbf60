#include "standin/module/TicketTable.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/module/Guard.h"

namespace standin
{
namespace
{
// Runs a slot on its ticket; 0 for a null one, too.
template <typename Work>
int Slot(void* instance, Work const& work) noexcept
{
    auto* const subject = static_cast<TicketSubject*>(instance);
    RefusableCall call;
    int const result = subject ? Guarded<int>(0, [&] { return work(*subject) ? 1 : 0; }) : 0;
    return call.Ended(result, result != 0);
}

template <typename Work>
int ReadSlot(void* instance, Work const& work) noexcept
{
    auto* const subject = static_cast<TicketSubject*>(instance);
    return subject ? GuardedRead<int>(0, [&] { return work(*subject) ? 1 : 0; }) : 0;
}

int OnGet(void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
{
    return ReadSlot(instance, [&](TicketSubject& ticket) { return ticket.Get(key, type, value, pos); });
}

int OnGetTable(void* instance, GETMULTIPAR* table)
{
    return ReadSlot(instance, [&](TicketSubject& ticket) { return ticket.GetTable(table); });
}

int OnWalk(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    return Slot(instance, [&](TicketSubject& ticket) { return ticket.Walk(action, context, prefix, limit); });
}

int OnSet(void* instance, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    return Slot(instance, [&](TicketSubject& ticket) { return ticket.Set(key, type, value, pos); });
}

int OnSetTable(void* instance, SETMULTIPAR* table)
{
    return Slot(instance, [&](TicketSubject& ticket) { return ticket.SetTable(table); });
}

int OnOption(void* instance, int code, void* out)
{
    return Slot(instance, [&](TicketSubject& ticket) { return ticket.Option(code, out); });
}
}  // namespace

TicketTable::TicketTable(TicketSubject& subject)
{
    m_access.Instance = &subject;
    m_access.SGETPARAMETER = OnGet;
    m_access.SGETMULTIPAR = OnGetTable;
    m_access.SWALKPARAMETERS = OnWalk;
    m_access.SSETPARAMETER = OnSet;
    m_access.SSETMULTIPAR = OnSetTable;
    m_access.SOPTION = OnOption;
}

bool TellWhoAmI(std::optional<TicketAddress> const& address, void* out)
{
    if (!out)
        return false;
    TicketAddress const told = address.value_or(TicketAddress{TICKET_ID_NONE, TICKET_ID_NONE});
    auto const word = [](int number) { return static_cast<unsigned long long>(number); };
    *static_cast<STICKET_OPTION_WHOAMI*>(out) = {word(told.type), word(told.id)};
    return true;
}
}  // namespace standin
