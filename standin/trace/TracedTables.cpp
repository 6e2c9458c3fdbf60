#include "standin/trace/TracedTables.h"

#include "comgui/ticket/TICKET_OP.h"
#include "standin/trace/Trace.h"
#include <cstring>
#include <map>
#include <memory>
#include <mutex>
#include <vector>

namespace trace
{
namespace
{
// By the address of the real table. A plug-in may make another table at an address that has become free: it
// gets a copy of its own then.
template <typename Access, typename Copy>
class Copies
{
public:
    static Copies& Get()
    {
        static auto& copies = *new Copies;
        return copies;
    }

    Access const* Of(Access const* real, void* session)
    {
        std::lock_guard const lock(m_lock);
        Entry& entry = m_entries[real];
        if (!entry.copy || entry.copy->session != session ||
            std::memcmp(&entry.seen, real, sizeof *real) != 0)
        {
            if (entry.copy)
                m_outlived.push_back(std::move(entry.copy));
            entry.copy = std::make_unique<Copy>(real, session);
            entry.seen = *real;
            m_reals[entry.copy->Access()] = real;
            m_newest = entry.copy.get();
        }
        return entry.copy->Access();
    }

    Access const* RealOf(void const* copy)
    {
        std::lock_guard const lock(m_lock);
        auto const found = m_reals.find(copy);
        return found == m_reals.end() ? nullptr : found->second;
    }

    Copy const* Newest()  // null for none
    {
        std::lock_guard const lock(m_lock);
        return m_newest;
    }

private:
    struct Entry
    {
        std::unique_ptr<Copy> copy{};
        Access seen{};
    };

    std::mutex m_lock;
    std::map<Access const*, Entry> m_entries;
    std::map<void const*, Access const*> m_reals;
    std::vector<std::unique_ptr<Copy>> m_outlived;
    Copy const* m_newest = nullptr;
};
using Tickets = Copies<STICKET_ACCESS, TracedTicket>;
using Containers = Copies<MTICKET_ACCESS, TracedContainer>;

void const* At(void const* place) { return place; }

template <typename RECORD>
int LengthOf(RECORD const* table)
{
    int length = 0;
    while (table && table[length].key)
        ++length;
    return length;
}

template <typename RECORD>
int OkOf(RECORD const* table)
{
    int ok = 0;
    for (RECORD const* record = table; record && record->key; ++record)
        ok += record->ok ? 1 : 0;
    return ok;
}

void Tell(TracedCall const& call, GETMULTIPAR const* table)
{
    for (GETMULTIPAR const* record = table; record && record->key; ++record)
    {
        Record detail = call.Make(Kind::Detail);
        detail.Add(record->key).Add(int{record->type}).Add(record->pos).Add(record->ok ? 1 : 0);
        record->ok ? detail.AddRead(record->key, record->type, record->value) : detail.AddNone();
        detail.Put();
    }
}

void Tell(TracedCall const& call, SETMULTIPAR const* table)
{
    for (SETMULTIPAR const* record = table; record && record->key; ++record)
        call.Make(Kind::Detail)
            .Add(record->key)
            .Add(int{record->type})
            .Add(record->pos)
            .Add(record->ok ? 1 : 0)
            .AddWritten(record->key, record->type, record->value)
            .Put();
}

int LengthOf(char const* const* keys)
{
    int length = 0;
    while (keys && keys[length])
        ++length;
    return length;
}

// The end of a read, with what has come.
int EndedRead(TracedCall const& call, int result, char const* key, PARAM_TYPE type, void const* value)
{
    if (!call.IsTraced())
        return result;
    Record record = call.Make(Kind::Ended);
    record.Add(result);
    result ? record.AddRead(key, type, value) : record.AddNone();
    record.Put();
    return result;
}

// The end of a table, with its records.
template <typename RECORD>
int EndedTable(TracedCall const& call, int result, RECORD const* table)
{
    if (!call.IsTraced())
        return result;
    Tell(call, table);
    call.Ended(result, OkOf(table));
    return result;
}

// --- a ticket's slots

// The real table behind an Instance. A null one goes on to the plug-in as it is, by the newest table.
struct Ticket
{
    STICKET_ACCESS const* real;
    void* instance;
    void* session;
};

// Of a ticket that nobody has: where only walks have shown any.
STICKET_ACCESS const* Nobodys()
{
    static STICKET_ACCESS const table = []
    {
        STICKET_ACCESS made{};
        made.SGETPARAMETER = [](void*, char const*, PARAM_TYPE, void*, int) { return 0; };
        made.SGETMULTIPAR = [](void*, GETMULTIPAR*) { return 0; };
        made.SWALKPARAMETERS = [](void*, SWALKPARAMETERS_ACTION, void*, char const*, int) { return 0; };
        made.SSETPARAMETER = [](void*, char const*, PARAM_TYPE, void const*, int) { return 0; };
        made.SSETMULTIPAR = [](void*, SETMULTIPAR*) { return 0; };
        made.SOPTION = [](void*, int, void*) { return 0; };
        return made;
    }();
    return &table;
}

Ticket TicketOf(void* instance)
{
    auto const* const copy = instance ? static_cast<TracedTicket const*>(instance) : Tickets::Get().Newest();
    if (!copy)
        return {Nobodys(), nullptr, nullptr};
    return {copy->real, instance ? copy->real->Instance : nullptr, copy->session};
}

int OnGet(void* instance, char const* key, PARAM_TYPE type, void* value, int pos)
{
    if (instance && !Trace::IsOn()) [[likely]]
    {
        STICKET_ACCESS const& words = static_cast<TracedTicket const*>(instance)->words;
        return words.SGETPARAMETER(words.Instance, key, type, value, pos);
    }
    Ticket const ticket = TicketOf(instance);
    TracedCall const call(Call::SGet);
    call.Began(ticket.session, At(ticket.real), key, int{type}, pos);
    return EndedRead(call, ticket.real->SGETPARAMETER(ticket.instance, key, type, value, pos), key, type,
                     value);
}

int OnGetTable(void* instance, GETMULTIPAR* table)
{
    Ticket const ticket = TicketOf(instance);
    TracedCall const call(Call::SGetTable);
    if (call.IsTraced())
        call.Began(ticket.session, At(ticket.real), LengthOf(table));
    return EndedTable(call, ticket.real->SGETMULTIPAR(ticket.instance, table), table);
}

// What a walk hands out passes through here.
struct Walking
{
    TracedCall const& call;
    SWALKPARAMETERS_ACTION action;
    void* context;
    int parameters = 0;
};

bool OnParameter(void* context, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    auto& walking = *static_cast<Walking*>(context);
    ++walking.parameters;
    if (walking.call.IsTraced())
        walking.call.Make(Kind::Detail)
            .Add(key)
            .Add(int{type})
            .Add(pos)
            .Add(1)
            .AddWritten(key, type, value)
            .Put();
    return walking.action(walking.context, key, type, value, pos);
}

int OnWalk(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    Ticket const ticket = TicketOf(instance);
    TracedCall const call(Call::SWalk);
    call.Began(ticket.session, At(ticket.real), prefix, limit);
    Walking walking{call, action, context};
    int const result = ticket.real->SWALKPARAMETERS(ticket.instance, action ? OnParameter : nullptr, &walking,
                                                    prefix, limit);
    call.Ended(result, walking.parameters);
    return result;
}

int OnSet(void* instance, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    Ticket const ticket = TicketOf(instance);
    TracedCall const call(Call::SSet);
    if (call.IsTraced())
        call.Make(Kind::Began)
            .Add(ticket.session)
            .Add(At(ticket.real))
            .Add(key)
            .Add(int{type})
            .Add(pos)
            .AddWritten(key, type, value)
            .Put();
    int const result = ticket.real->SSETPARAMETER(ticket.instance, key, type, value, pos);
    call.Ended(result);
    return result;
}

int OnSetTable(void* instance, SETMULTIPAR* table)
{
    Ticket const ticket = TicketOf(instance);
    TracedCall const call(Call::SSetTable);
    if (call.IsTraced())
        call.Began(ticket.session, At(ticket.real), LengthOf(table));
    return EndedTable(call, ticket.real->SSETMULTIPAR(ticket.instance, table), table);
}

int OnOption(void* instance, int code, void* out)
{
    Ticket const ticket = TicketOf(instance);
    TracedCall const call(Call::SOption);
    call.Began(ticket.session, At(ticket.real), code);
    int const result = ticket.real->SOPTION(ticket.instance, code, out);
    call.Ended(result);
    return result;
}

// --- a container's

struct Container
{
    MTICKET_ACCESS const* real;
    void* instance;
    void* session;
};

Container ContainerOf(void* instance)
{
    auto const* const copy =
        instance ? static_cast<TracedContainer const*>(instance) : Containers::Get().Newest();
    return {copy->real, instance ? copy->real->Instance : nullptr, copy->session};
}

int OnContainerGet(void* instance, int ticketType, int id, char const* key, PARAM_TYPE type, void* value,
                   int pos)
{
    if (instance && !Trace::IsOn()) [[likely]]
    {
        MTICKET_ACCESS const& words = static_cast<TracedContainer const*>(instance)->words;
        return words.MGETPARAMETER(words.Instance, ticketType, id, key, type, value, pos);
    }
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MGet);
    call.Began(container.session, ticketType, id, key, int{type}, pos);
    MTICKET_ACCESS const& real = *container.real;
    return EndedRead(call, real.MGETPARAMETER(real.Instance, ticketType, id, key, type, value, pos), key,
                     type, value);
}

int OnContainerGetTable(void* instance, int type, int id, GETMULTIPAR* table)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MGetTable);
    if (call.IsTraced())
        call.Began(container.session, type, id, LengthOf(table));
    return EndedTable(call, container.real->MGETMULTIPAR(container.instance, type, id, table), table);
}

struct WalkingTickets
{
    TracedCall const& call;
    void* session;
    MWALKTICKETS_ACTION action;
    void* context;
    int tickets = 0;
};

// The table lives until the action returns, and so does its copy.
bool OnWalkedTicket(void* context, int type, int id, STICKET_ACCESS const* real)
{
    auto& walking = *static_cast<WalkingTickets*>(context);
    ++walking.tickets;
    if (walking.call.IsTraced())
        walking.call.Make(Kind::Detail).Add(type).Add(id).Put();
    if (!real)
        return walking.action(walking.context, type, id, real);
    TracedTicket const ticket(real, walking.session);
    return walking.action(walking.context, type, id, ticket.Access());
}

int OnContainerWalk(void* instance, MWALKTICKETS_ACTION action, void* context, int type)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MWalk);
    call.Began(container.session, type);
    WalkingTickets walking{call, container.session, action, context};
    int const result =
        container.real->MWALKTICKETS(container.instance, action ? OnWalkedTicket : nullptr, &walking, type);
    call.Ended(result, walking.tickets);
    return result;
}

int OnContainerSet(void* instance, int ticketType, int id, char const* key, PARAM_TYPE type,
                   void const* value, int pos)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MSet);
    if (call.IsTraced())
        call.Make(Kind::Began)
            .Add(container.session)
            .Add(ticketType)
            .Add(id)
            .Add(key)
            .Add(int{type})
            .Add(pos)
            .AddWritten(key, type, value)
            .Put();
    int const result =
        container.real->MSETPARAMETER(container.instance, ticketType, id, key, type, value, pos);
    call.Ended(result);
    return result;
}

int OnContainerSetTable(void* instance, int type, int id, SETMULTIPAR* table)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MSetTable);
    if (call.IsTraced())
        call.Began(container.session, type, id, LengthOf(table));
    return EndedTable(call, container.real->MSETMULTIPAR(container.instance, type, id, table), table);
}

int OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MOperation);
    call.Began(container.session, type, id, op.GetInt());
    int const result = container.real->MOPERATION(container.instance, type, id, op, arg);
    if (result && arg && op.GetInt() == MTICKET_OP_OPEN)
    {
        auto& opened = *static_cast<STICKET_ACCESS const**>(arg);
        call.Ended(result, At(opened));
        opened = CopyOf(opened, container.session);
    }
    else if (result && arg && op.GetInt() == MTICKET_OP_CREATE_NEXT)
        call.Ended(result, *static_cast<int const*>(arg));
    else
        call.Ended(result);
    return result;
}

int OnSwitch(void* instance, int type, int id, int notification, bool enable, char const* const* keys)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MSwitch);
    if (call.IsTraced())
        call.Began(container.session, type, id, notification, enable ? 1 : 0, LengthOf(keys));
    int const result = container.real->MENDISNOTIF(container.instance, type, id, notification, enable, keys);
    call.Ended(result);
    return result;
}

STICKET_ACCESS const* OnCreate(void* instance, int type, int id, char const* const* keys)
{
    Container const container = ContainerOf(instance);
    TracedCall const call(Call::MCreate);
    if (call.IsTraced())
        call.Began(container.session, type, id, LengthOf(keys));
    STICKET_ACCESS const* const made = container.real->MCREATETICKET(container.instance, type, id, keys);
    call.Ended(At(made));
    return CopyOf(made, container.session);
}

// A slot that the plug-in has left empty stays so.
template <typename Slot>
void Put(Slot& slot, Slot traced)
{
    if (slot)
        slot = traced;
}
}  // namespace

TracedTicket::TracedTicket(STICKET_ACCESS const* realTable, void* ofSession)
    : real(realTable), words(*realTable), session(ofSession), m_access(*realTable)
{
    m_access.Instance = this;
    Put(m_access.SGETPARAMETER, OnGet);
    Put(m_access.SGETMULTIPAR, OnGetTable);
    Put(m_access.SWALKPARAMETERS, OnWalk);
    Put(m_access.SSETPARAMETER, OnSet);
    Put(m_access.SSETMULTIPAR, OnSetTable);
    Put(m_access.SOPTION, OnOption);
}

TracedContainer::TracedContainer(MTICKET_ACCESS const* realTable, void* ofSession)
    : real(realTable), words(*realTable), session(ofSession), m_access(*realTable)
{
    m_access.Instance = this;
    Put(m_access.MGETPARAMETER, OnContainerGet);
    Put(m_access.MGETMULTIPAR, OnContainerGetTable);
    Put(m_access.MWALKTICKETS, OnContainerWalk);
    Put(m_access.MSETPARAMETER, OnContainerSet);
    Put(m_access.MSETMULTIPAR, OnContainerSetTable);
    Put(m_access.MOPERATION, OnOperation);
    Put(m_access.MENDISNOTIF, OnSwitch);
    Put(m_access.MCREATETICKET, OnCreate);
}

STICKET_ACCESS const* CopyOf(STICKET_ACCESS const* real, void* session)
{
    return real ? Tickets::Get().Of(real, session) : nullptr;
}

MTICKET_ACCESS const* CopyOf(MTICKET_ACCESS const* real, void* session)
{
    return real ? Containers::Get().Of(real, session) : nullptr;
}

STICKET_ACCESS const* RealOf(STICKET_ACCESS const* table)
{
    STICKET_ACCESS const* const real = Tickets::Get().RealOf(table);
    return real ? real : table;
}
}  // namespace trace
