#include "standin/module/Container.h"

#include "comgui/ticket/TICKET_ID.h"

namespace standin
{
namespace
{
TicketAddress Of(comgui::plugin::Address address) { return {address.type, address.id}; }
}  // namespace

Container::Container(standin::Server& server, std::shared_ptr<standin::Session> session)
    : m_server(server), m_session(std::move(session)),
      m_gate(server.Tickets(), server.Troubles(), *m_session), m_folders(server.Tickets()),
      m_opened(server.Tickets(), *m_session, m_gate, m_folders, m_numbers)
{
}

bool Container::EndSession()
{
    if (!m_server.Logout(*m_session))
        return false;
    m_ownNumbers.reset();
    return true;
}

void Container::Withdraw() noexcept
{
    ContainerSlots::Withdraw();
    m_opened.Withdraw();
}

bool Container::Get(Address ticket, char const* key, PARAM_TYPE type, void* value, int pos)
{
    if (!MayRead())
        return false;
    m_gate.PassFresh("MGETPARAMETER", Of(ticket));
    return ReadTicket(Tickets(), *m_session, Of(ticket), 0, key, type, value, pos);
}

bool Container::GetTable(Address ticket, GETMULTIPAR* table)
{
    if (!MayRead())
        return false;
    m_gate.PassFresh("MGETMULTIPAR", Of(ticket));
    return ReadTable(Tickets(), *m_session, Of(ticket), 0, table);
}

bool Container::Set(Address ticket, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    m_gate.PassFresh("MSETPARAMETER", Of(ticket));
    return WriteTicket(Tickets(), *m_session, Of(ticket), 0, key, type, value, pos);
}

bool Container::SetTable(Address ticket, SETMULTIPAR* table)
{
    m_gate.PassFresh("MSETMULTIPAR", Of(ticket));
    return WriteTable(Tickets(), *m_session, Of(ticket), 0, table);
}

bool Container::Open(TicketAddress address, void* arg)
{
    STICKET_ACCESS const* const access = arg ? m_opened.Open(address) : nullptr;
    if (!access)
        return false;
    *static_cast<STICKET_ACCESS const**>(arg) = access;
    return true;
}

bool Container::CreateNext(TicketAddress address, void* arg) const
{
    if (address.id != TICKET_ID_NEXT || !arg)
        return false;
    int const id = Tickets().CreateNext(*m_session, address.type);
    if (id < 0)
        return false;
    m_session->Limit({address.type, id}, KeyFilter(nullptr));  // one of that address may have had one
    *static_cast<int*>(arg) = id;
    return true;
}

bool Container::SetPartial(TicketAddress address, void* arg) const
{
    if (m_session->Ended() || Tickets().IncarnationOf(address) == 0)
        return false;
    m_session->Limit(address, KeyFilter(static_cast<char const* const*>(arg)));
    return true;
}

bool Container::HandOutFolders(TicketAddress address, void* arg)
{
    bool const isOfTheContainer = address == TicketAddress{TICKET_ID_NONE, TICKET_ID_NONE};
    return isOfTheContainer && !m_session->Ended() &&
           comgui::plugin::AnswerOption(STICKET_OP_FOLDER_VARIABLES, arg, {}, &m_folders);
}

bool Container::Operation(Address ticket, TICKET_OP op, void* arg)
{
    TicketAddress const address = Of(ticket);
    m_gate.Pass("MOPERATION", address);
    switch (op.GetInt())
    {
    case STICKET_OP_SET_PARTIAL:
        return SetPartial(address, arg);
    case MTICKET_OP_OPEN:
        return Open(address, arg);
    case MTICKET_OP_CREATE_NEXT:
        return CreateNext(address, arg);
    case MTICKET_OP_DELETE:
        return Tickets().Delete(*m_session, address);
    case MTICKET_OP_CLOSE:  // whatever the flag says: there is one way of closing
        return m_opened.Close(address);
    case MTICKET_OP_FOLDER_VARIABLES:
        return HandOutFolders(address, arg);
    default:
        return false;
    }
}

// Over the tickets that there are at the beginning, so that a walk that makes tickets comes to an end.
bool Container::WalkTickets(MWALKTICKETS_ACTION action, void* context, int type)
{
    m_gate.PassFresh("MWALKTICKETS");
    if (!action || m_session->Ended() || !IsValid({type, 0}))
        return false;
    std::vector<int> ids;
    for (int id = Tickets().NextTicket(type, -1); id >= 0; id = Tickets().NextTicket(type, id))
        ids.push_back(id);
    for (int const id : ids)
    {
        Incarnation const incarnation = Tickets().IncarnationOf({type, id});
        if (m_session->Ended())
            break;
        if (incarnation == 0)
            continue;
        OpenTicket ticket(Tickets(), *m_session, m_gate, m_folders, m_numbers, {type, id}, incarnation);
        if (!action(context, type, id, ticket.Access()))
            break;
    }
    return true;
}

bool Container::Switch(Address tickets, int notification, bool enable, char const* const* keys)
{
    m_gate.Pass("MENDISNOTIF", Of(tickets));
    NotificationService& service = m_server.Notifications();
    if (!enable)
        return service.Disable(*m_session, notification, Of(tickets));
    Tickets().CatchUp();  // what came before is not for this subscription
    return keys && service.Enable(*m_session, notification, Of(tickets), KeyFilter(keys));
}

STICKET_ACCESS const* Container::CreateTicket(Address ticket, char const* const* keys)
{
    m_gate.PassFresh("MCREATETICKET", Of(ticket));
    auto const made = Tickets().Create(*m_session, Of(ticket));
    if (!made)
        return nullptr;
    m_session->Limit(Of(ticket), KeyFilter(keys));
    return m_opened.Open(Of(ticket), *made);  // whatever others make of the address now
}
}  // namespace standin
