#include "comgui/module/Container.h"

#include "comgui/module/Answers.h"
#include "comgui/module/Session.h"
#include "comgui/module/TicketSlots.h"
#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/TICKET_OP.h"
#include <atomic>

namespace comgui::plugin
{
namespace
{
// One ticket of a container, as a source of values.
struct At
{
    Container& container;
    Address ticket;

    Value Read(std::string_view key, int pos) { return container.Read(ticket, key, pos); }
    int Count(std::string_view key) { return container.Count(ticket, key); }
    bool Write(std::string_view key, Value const& value, int pos)
    {
        return container.Write(ticket, key, value, pos);
    }
    std::vector<Parameter> All(std::string_view prefix) { return container.All(ticket, prefix); }
};
}  // namespace

// All openings of a ticket share its table. While none is open every slot answers 0.
class Container::Opened : public TicketSlots
{
public:
    Opened(Container& container, Address ticket) : m_container(container), m_ticket(ticket) {}

    void Open() { ++m_openings; }
    bool Close()  // one opening; false if there is none
    {
        bool const isOpen = m_openings > 0;
        if (isOpen)
            --m_openings;
        return isOpen;
    }

    void Around(Call const& call) override { m_container.Around(call); }
    void OnException(char const* reason) noexcept override { m_container.OnException(reason); }

    bool Get(char const* key, PARAM_TYPE type, void* value, int pos) override
    {
        return IsOpen() && m_container.Get(m_ticket, key, type, value, pos);
    }
    bool GetTable(GETMULTIPAR* table) override { return IsOpen() && m_container.GetTable(m_ticket, table); }
    bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) override
    {
        return IsOpen() && m_container.Set(m_ticket, key, type, value, pos);
    }
    bool SetTable(SETMULTIPAR* table) override { return IsOpen() && m_container.SetTable(m_ticket, table); }
    bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int) override
    {
        At source{m_container, m_ticket};
        auto const kept = m_container.Kept();
        return kept && IsOpen() && m_container.Exists(m_ticket) &&
               AnswerWalk(source, *kept, action, context, prefix);
    }
    bool Option(int code, void* out) override
    {
        return IsOpen() && m_container.Exists(m_ticket) &&
               AnswerOption(code, out, m_ticket, m_container.Folders());
    }

private:
    bool IsOpen() const { return m_openings.load(std::memory_order_relaxed) > 0; }

    Container& m_container;
    Address const m_ticket;
    std::atomic<int> m_openings{0};  // changed under the container's lock
};

Container::Container(Session& session) : m_session(session) {}

Container::~Container() = default;

int Container::Count(Address ticket, std::string_view key) { return IsNone(Read(ticket, key, 0)) ? 0 : 1; }

bool Container::Write(Address, std::string_view, Value const&, int) { return false; }

std::vector<Parameter> Container::All(Address, std::string_view) { return {}; }

std::vector<int> Container::Ids(int) { return {}; }

std::optional<int> Container::CreateNext(int) { return std::nullopt; }

bool Container::Create(Address) { return false; }

bool Container::Delete(Address) { return false; }

bool Container::Limit(Address, KeySelection const&) { return false; }

bool Container::OtherOperation(Address, int, void*) { return false; }

void Container::Withdraw() noexcept
{
    ContainerSlots::Withdraw();
    std::lock_guard const lock(m_lock);
    for (auto const& [address, ticket] : m_opened)
        ticket->Withdraw();
    m_kept.reset();
}

bool Container::Get(Address ticket, char const* key, PARAM_TYPE type, void* value, int pos)
{
    At source{*this, ticket};
    auto const kept = Kept();
    return kept && IsThere(ticket) && AnswerRead(source, *kept, key, type, value, pos);
}

bool Container::GetTable(Address ticket, GETMULTIPAR* table)
{
    At source{*this, ticket};
    auto const kept = Kept();
    return kept && IsThere(ticket) && AnswerTableRead(source, *this, *kept, table);
}

bool Container::Set(Address ticket, char const* key, PARAM_TYPE type, void const* value, int pos)
{
    At source{*this, ticket};
    return IsThere(ticket) && AnswerWrite(source, key, type, value, pos);
}

bool Container::SetTable(Address ticket, SETMULTIPAR* table)
{
    At source{*this, ticket};
    return IsThere(ticket) && AnswerTableWrite(source, *this, table);
}

std::shared_ptr<KeptValues> Container::Kept()
{
    std::lock_guard const lock(m_lock);
    return m_kept;
}

bool Container::IsThere(Address ticket) { return IsTicket(ticket) && Exists(ticket); }

STICKET_ACCESS const* Container::Open(Address ticket)
{
    if (!IsThere(ticket))
        return nullptr;
    std::lock_guard const lock(m_lock);
    auto& opened = m_opened[ticket];
    if (!opened)
        opened = std::make_unique<Opened>(*this, ticket);
    opened->Open();
    return opened->Access();
}

// Also of a ticket that has been deleted meanwhile.
bool Container::Close(Address ticket)
{
    std::lock_guard const lock(m_lock);
    auto const opened = m_opened.find(ticket);
    return opened != m_opened.end() && opened->second->Close();
}

bool Container::OpenInto(Address ticket, void* arg)
{
    STICKET_ACCESS const* const access = arg ? Open(ticket) : nullptr;
    if (access)
        *static_cast<STICKET_ACCESS const**>(arg) = access;
    return access != nullptr;
}

bool Container::CreateNextInto(Address ticket, void* arg)
{
    if (ticket.id != TICKET_ID_NEXT || !IsTicket({ticket.type, 0}) || !arg)
        return false;
    std::optional<int> const id = CreateNext(ticket.type);
    if (id)
        *static_cast<int*>(arg) = *id;
    return id.has_value();
}

bool Container::Operation(Address ticket, TICKET_OP op, void* arg)
{
    switch (op.GetInt())
    {
    case MTICKET_OP_OPEN:
        return OpenInto(ticket, arg);
    case MTICKET_OP_CLOSE:  // whatever the flag says: there is one way of closing
        return Close(ticket);
    case MTICKET_OP_CREATE_NEXT:
        return CreateNextInto(ticket, arg);
    case MTICKET_OP_DELETE:
        return IsTicket(ticket) && Delete(ticket);
    case STICKET_OP_SET_PARTIAL:
        return IsThere(ticket) && Limit(ticket, KeySelection(static_cast<char const* const*>(arg)));
    case MTICKET_OP_FOLDER_VARIABLES:
        return ticket == Address{TICKET_ID_NONE, TICKET_ID_NONE} &&
               AnswerOption(STICKET_OP_FOLDER_VARIABLES, arg, ticket, Folders());
    default:
        return OtherOperation(ticket, op.GetInt(), arg);
    }
}

// Over the tickets of the beginning, so that a walk that makes tickets comes to an end.
bool Container::WalkTickets(MWALKTICKETS_ACTION action, void* context, int type)
{
    if (!action || !IsTicket({type, 0}))
        return false;
    for (int const id : Ids(type))
    {
        if (!Exists({type, id}))
            continue;
        Opened ticket(*this, {type, id});
        ticket.Open();
        if (!action(context, type, id, ticket.Access()))
            break;
    }
    return true;
}

bool Container::Switch(Address tickets, int notification, bool enable, char const* const* keys)
{
    Notifications* const service = m_session.GetNotifications();
    if (!service)
        return false;
    if (!enable)
        return service->Disable(m_session, notification, tickets);
    return keys && service->Enable(m_session, notification, tickets, KeySelection(keys));
}

STICKET_ACCESS const* Container::CreateTicket(Address ticket, char const* const* keys)
{
    if (!IsTicket(ticket) || !Create(ticket))
        return nullptr;
    Limit(ticket, KeySelection(keys));
    return Open(ticket);
}
}  // namespace comgui::plugin
