#include "standin/module/Container.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/module/Guard.h"

namespace standin
{
namespace
{
// Runs a slot on its container; 0 for a null one, too.
template <typename Work>
int Slot(void* instance, Work const& work) noexcept
{
    auto* const container = static_cast<Container*>(instance);
    RefusableCall call;
    int const result = container ? Guarded<int>(0, [&] { return work(*container) ? 1 : 0; }) : 0;
    return call.Ended(result, result != 0);
}

template <typename Work>
int ReadSlot(void* instance, Work const& work) noexcept
{
    auto* const container = static_cast<Container*>(instance);
    return container ? GuardedRead<int>(0, [&] { return work(*container) ? 1 : 0; }) : 0;
}

int OnGet(void* instance, int type, int id, char const* key, PARAM_TYPE ptype, void* value, int pos)
{
    return ReadSlot(instance,
                    [&](Container& container)
                    {
                        return ReadTicket(container.Server().Tickets(), container.Session(), {type, id}, 0,
                                          key, ptype, value, pos);
                    });
}

int OnGetTable(void* instance, int type, int id, GETMULTIPAR* table)
{
    return ReadSlot(
        instance,
        [&](Container& container) {
            return ReadTable(container.Server().Tickets(), container.Session(), {type, id}, 0, table);
        });
}

int OnSet(void* instance, int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos)
{
    return Slot(instance,
                [&](Container& container)
                {
                    return WriteTicket(container.Server().Tickets(), container.Session(), {type, id}, 0, key,
                                       ptype, value, pos);
                });
}

int OnSetTable(void* instance, int type, int id, SETMULTIPAR* table)
{
    return Slot(
        instance,
        [&](Container& container) {
            return WriteTable(container.Server().Tickets(), container.Session(), {type, id}, 0, table);
        });
}

bool Open(Container& container, TicketAddress address, void* arg)
{
    STICKET_ACCESS const* const access = arg ? container.Opened().Open(address) : nullptr;
    if (!access)
        return false;
    *static_cast<STICKET_ACCESS const**>(arg) = access;
    return true;
}

bool CreateNext(Container& container, TicketAddress address, void* arg)
{
    if (address.id != TICKET_ID_NEXT || !arg)
        return false;
    int const id = container.Server().Tickets().CreateNext(container.Session(), address.type);
    if (id < 0)
        return false;
    container.Session().Limit({address.type, id},
                              KeyFilter(nullptr));  // one of that address may have had one
    *static_cast<int*>(arg) = id;
    return true;
}

bool SetPartial(Container& container, TicketAddress address, void* arg)
{
    if (container.Session().Ended() || container.Server().Tickets().IncarnationOf(address) == 0)
        return false;
    container.Session().Limit(address, KeyFilter(static_cast<char const* const*>(arg)));
    return true;
}

bool HandOutFolders(Container& container, TicketAddress address, void* arg)
{
    bool const isOfTheContainer = address == TicketAddress{TICKET_ID_NONE, TICKET_ID_NONE};
    return isOfTheContainer && !container.Session().Ended() && container.Folders().HandOut(arg);
}

int OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg)
{
    return Slot(instance,
                [&](Container& container)
                {
                    switch (op.GetInt())
                    {
                    case STICKET_OP_SET_PARTIAL:
                        return SetPartial(container, {type, id}, arg);
                    case MTICKET_OP_OPEN:
                        return Open(container, {type, id}, arg);
                    case MTICKET_OP_CREATE_NEXT:
                        return CreateNext(container, {type, id}, arg);
                    case MTICKET_OP_DELETE:
                        return container.Server().Tickets().Delete(container.Session(), {type, id});
                    case MTICKET_OP_CLOSE:  // whatever the flag says: there is one way of closing
                        return container.Opened().Close({type, id});
                    case MTICKET_OP_FOLDER_VARIABLES:
                        return HandOutFolders(container, {type, id}, arg);
                    default:
                        return false;
                    }
                });
}

// Over the tickets that there are at the beginning, so that a walk that makes tickets comes to an end.
bool Walk(Container& container, MWALKTICKETS_ACTION action, void* context, int type)
{
    TicketService& tickets = container.Server().Tickets();
    if (!action || container.Session().Ended() || !IsValid({type, 0}))
        return false;
    std::vector<int> ids;
    for (int id = tickets.NextTicket(type, -1); id >= 0; id = tickets.NextTicket(type, id))
        ids.push_back(id);
    for (int const id : ids)
    {
        Incarnation const incarnation = tickets.IncarnationOf({type, id});
        if (container.Session().Ended())
            break;
        if (incarnation == 0)
            continue;
        OpenTicket ticket(tickets, container.Session(), container.Folders(), container.Numbers(), {type, id},
                          incarnation);
        if (!action(context, type, id, ticket.Access()))
            break;
    }
    return true;
}

int OnWalk(void* instance, MWALKTICKETS_ACTION action, void* context, int type)
{
    return Slot(instance, [&](Container& container) { return Walk(container, action, context, type); });
}

int OnSwitch(void* instance, int type, int id, int notification, bool enable, char const* const* keys)
{
    return Slot(
        instance,
        [&](Container& container)
        {
            NotificationService& service = container.Server().Notifications();
            if (!enable)
                return service.Disable(container.Session(), notification, {type, id});
            container.Server().Tickets().CatchUp();  // what came before is not for this subscription
            return keys && service.Enable(container.Session(), notification, {type, id}, KeyFilter(keys));
        });
}

STICKET_ACCESS const* OnCreate(void* instance, int type, int id, char const* const* keys)
{
    STICKET_ACCESS const* access = nullptr;
    Slot(instance,
         [&](Container& container)
         {
             auto const made = container.Server().Tickets().Create(container.Session(), {type, id});
             if (!made)
                 return false;
             container.Session().Limit({type, id}, KeyFilter(keys));
             access = container.Opened().Open({type, id}, *made);  // whatever others make of the address now
             return access != nullptr;
         });
    return access;
}
}  // namespace

Container::Container(standin::Server& server, std::shared_ptr<standin::Session> session)
    : m_server(server), m_session(std::move(session)), m_folders(server.Tickets()),
      m_opened(server.Tickets(), *m_session, m_folders, m_numbers)
{
    m_access.Instance = this;
    m_access.MGETPARAMETER = OnGet;
    m_access.MGETMULTIPAR = OnGetTable;
    m_access.MWALKTICKETS = OnWalk;
    m_access.MSETPARAMETER = OnSet;
    m_access.MSETMULTIPAR = OnSetTable;
    m_access.MOPERATION = OnOperation;
    m_access.MENDISNOTIF = OnSwitch;
    m_access.MCREATETICKET = OnCreate;
}

bool Container::EndSession()
{
    if (!m_server.Logout(*m_session))
        return false;
    m_ownNumbers.reset();
    return true;
}
}  // namespace standin
