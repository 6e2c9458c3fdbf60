#include "standin/module/Container.h"

#include "standin/module/Guard.h"

namespace standin
{
namespace
{
// Runs a slot on its container; 0 for a null one, too.
template <typename Work>
int Slot(void* instance, Work const& work) noexcept
{
    auto const* const container = static_cast<Container const*>(instance);
    return container
               ? Guarded<int>(0, [&] { return work(container->Server(), container->Session()) ? 1 : 0; })
               : 0;
}

int OnGet(void* instance, int type, int id, char const* key, PARAM_TYPE ptype, void* value, int pos)
{
    return Slot(instance,
                [&](TicketServer& server, Session& session) {
                    return server.Get(session, {type, id}, key, ptype, value, pos);
                });
}

int OnGetTable(void* instance, int type, int id, GETMULTIPAR* table)
{
    return Slot(instance,
                [&](TicketServer& server, Session& session) {
                    return server.GetTable(session, {type, id}, table);
                });
}

int OnSet(void* instance, int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos)
{
    return Slot(instance,
                [&](TicketServer& server, Session& session) {
                    return server.Set(session, {type, id}, key, ptype, value, pos);
                });
}

int OnSetTable(void* instance, int type, int id, SETMULTIPAR* table)
{
    return Slot(instance,
                [&](TicketServer& server, Session& session) {
                    return server.SetTable(session, {type, id}, table);
                });
}

int OnOperation(void* instance, int type, int id, TICKET_OP op, void*)
{
    return Slot(instance,
                [&](TicketServer& server, Session& session) {
                    return op.GetInt() == MTICKET_OP_DELETE && server.Delete(session, {type, id});
                });
}

int OnWalk(void*, MWALKTICKETS_ACTION, void*, int) { return 0; }

int OnSwitch(void*, int, int, int, bool, char const* const*) { return 0; }
}  // namespace

Container::Container(TicketServer& server, std::shared_ptr<standin::Session> session)
    : m_server(server), m_session(std::move(session))
{
    m_access.Instance = this;
    m_access.MGETPARAMETER = OnGet;
    m_access.MGETMULTIPAR = OnGetTable;
    m_access.MWALKTICKETS = OnWalk;
    m_access.MSETPARAMETER = OnSet;
    m_access.MSETMULTIPAR = OnSetTable;
    m_access.MOPERATION = OnOperation;
    m_access.MENDISNOTIF = OnSwitch;
}
}  // namespace standin
