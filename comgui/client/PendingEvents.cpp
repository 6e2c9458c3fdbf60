#include "comgui/client/PendingEvents.h"

#include "comgui/client/SlotValue.h"
#include "comgui/ticket/TICKET_ID.h"
#include <algorithm>

namespace comgui::detail
{
namespace
{
bool Matches(std::string_view key, std::string_view pattern)
{
    if (pattern.empty() || pattern.back() != '*')
        return key == pattern;
    pattern.remove_suffix(1);
    return key.substr(0, pattern.size()) == pattern;
}

template <typename Element>
bool Contains(std::vector<Element> const& elements, Element const& element)
{
    return std::find(elements.begin(), elements.end(), element) != elements.end();
}

bool Wants(Interest const& interest, TicketAddress ticket)
{
    return Contains(interest.types, ticket.type) || Contains(interest.tickets, ticket);
}

bool Wants(Interest const& interest, std::string_view key)
{
    return interest.keys.empty() || std::any_of(interest.keys.begin(), interest.keys.end(),
                                                [key](auto const& pattern) { return Matches(key, pattern); });
}

std::size_t SizeOf(std::optional<Value> const& value)
{
    if (!value)
        return 0;
    if (auto const* const text = std::get_if<std::string>(&*value))
        return text->size();
    if (auto const* const bytes = std::get_if<Bytes>(&*value))
        return bytes->bytes.size();
    std::size_t size = 0;
    if (auto const* const list = std::get_if<List>(&*value))
        for (Element const& element : *list)
            size += sizeof element + SizeOf(element.value);
    return size;
}

// A key without what its value points at: most changes are of numbers, which are nothing but that.
std::size_t SizeOf(std::string const& key)
{
    constexpr std::size_t Node =
        4 * sizeof(void*) + sizeof(std::pair<std::string const, std::optional<Value>>);
    constexpr std::size_t Inside = 15;  // a text that needs no memory of its own
    return Node + (key.size() > Inside ? key.size() + 1 : 0);
}
}  // namespace

// A run of records with one key pointer is one change of that key. One that begins with -1 carries the whole
// value: what follows was appended to it.
std::vector<KeyChange> ChangesOf(SETMULTIPAR const* records)
{
    std::vector<KeyChange> changes;
    while (records && records->key)
    {
        SETMULTIPAR const* const first = records;
        bool isWhole = first->pos == -1;
        List list;
        for (; records->key == first->key; ++records)
        {
            isWhole = isWhole && records->type != PARAM_COUNT && (records == first || records->pos > 0) &&
                      (records->type != PARAM_NONE || records == first);
            if (isWhole && records->type != PARAM_NONE)
                list.push_back({std::max(records->pos, 0), ValueOf(records->type, records->value)});
        }
        KeyChange change{first->key, std::nullopt};
        if (isWhole && list.empty())
            change.value = Value();
        else if (isWhole)
            change.value =
                list.size() == 1 && list[0].pos == 0 ? std::move(list[0].value) : Value(std::move(list));
        changes.push_back(std::move(change));
    }
    return changes;
}

void PendingEvents::Add(Interest const& interest, TicketEvent const& event)
{
    TICKET* const place = Wants(interest, event.ticket) ? Place(event.ticket) : nullptr;
    if (!place)
        return;
    TICKET& ticket = *place;
    switch (event.kind)
    {
    case TicketEvent::Changed:
        for (KeyChange const& change : event.keys)
            if (Wants(interest, change.key))
                AddChange(ticket, change);
        break;
    case TicketEvent::Created:
        DropKeys(ticket);
        ticket.isCreated = true;
        break;
    case TicketEvent::Deleted:
        DropKeys(ticket);
        ticket.isDeleted = ticket.isDeleted || !ticket.isCreated;  // else nobody has heard of it
        ticket.isCreated = false;
        break;
    }
    if (m_tickets.size() > MostTickets)
        Collapse(event.ticket.type);
}

void PendingEvents::AddUnheard(Interest const& interest, TicketAddress ticket)
{
    if (ticket.id == TICKET_ID_ALL)
    {
        if (Contains(interest.types, ticket.type))
            Collapse(ticket.type);
    }
    else if (TICKET* const place = Contains(interest.tickets, ticket) ? Place(ticket) : nullptr)
    {
        DropKeys(*place);
        place->isWhole = true;
    }
}

PendingEvents::TICKET* PendingEvents::Place(TicketAddress ticket)
{
    if (m_crowds.count(ticket.type) != 0)
        return nullptr;
    auto const [place, isNew] = m_places.try_emplace(ticket, m_tickets.size());
    if (isNew)
        m_tickets.push_back({ticket});
    return &m_tickets[place->second];
}

void PendingEvents::AddChange(TICKET& ticket, KeyChange const& change)
{
    if (ticket.isWhole)
        return;
    auto place = ticket.keys.find(change.key);
    if (place == ticket.keys.end())
    {
        if (ticket.keys.size() >= MostKeysOfATicket || m_bytes + SizeOf(change.key) > MostBytes)
        {
            DropKeys(ticket);
            ticket.isWhole = true;
            return;
        }
        place = ticket.keys.try_emplace(change.key).first;
        m_bytes += SizeOf(change.key);
    }
    std::optional<Value>& value = place->second;
    m_bytes -= SizeOf(value);
    value = m_bytes + SizeOf(change.value) <= MostBytes ? change.value : std::nullopt;
    m_bytes += SizeOf(value);
}

void PendingEvents::DropKeys(TICKET& ticket)
{
    for (auto const& [key, value] : ticket.keys)
        m_bytes -= SizeOf(key) + SizeOf(value);
    ticket.keys.clear();
    ticket.isWhole = false;
}

void PendingEvents::Collapse(int type)
{
    m_crowds.insert(type);
    std::vector<TICKET> others;
    for (TICKET& ticket : m_tickets)
        if (ticket.address.type == type)
            DropKeys(ticket);
        else
            others.push_back(std::move(ticket));
    m_tickets = std::move(others);
    m_places.clear();
    for (std::size_t i = 0; i < m_tickets.size(); ++i)
        m_places[m_tickets[i].address] = i;
}

void PendingEvents::Add(Interest const& interest, Event const& event)
{
    if (std::holds_alternative<ServerLost>(event) || std::holds_alternative<ServerBack>(event))
        AddServerEvent(event);
    else if (!interest.transfers)
        return;
    else if (auto const* const progressed = std::get_if<TransferProgressed>(&event))
        m_progress[progressed->transfer] = progressed->progress;
    else if (auto const* const ended = std::get_if<TransferEnded>(&event))
    {
        m_progress.erase(ended->transfer);
        m_ended.push_back(*ended);
    }
}

// At most one loss and one return: those in between say no more, but that there was a new session.
void PendingEvents::AddServerEvent(Event const& event)
{
    if (!m_server.empty() && m_server.back().index() == event.index() &&
        std::holds_alternative<ServerLost>(event))
        m_server.pop_back();  // the same loss, with another reason
    m_server.push_back(event);
    if (auto* const back = std::get_if<ServerBack>(&m_server.back()))
        back->isNewSession = m_isNewSession = m_isNewSession || back->isNewSession;
    if (m_server.size() > 2)
        m_server.erase(m_server.begin(), m_server.begin() + 2);
}

bool PendingEvents::IsEmpty() const
{
    return m_tickets.empty() && m_crowds.empty() && m_server.empty() && m_progress.empty() && m_ended.empty();
}

void PendingEvents::DropTickets()
{
    m_tickets.clear();
    m_places.clear();
    m_crowds.clear();
    m_bytes = 0;
}

std::vector<Event> PendingEvents::Take()
{
    std::vector<Event> events = std::move(m_server);
    for (TICKET& ticket : m_tickets)
    {
        if (ticket.isDeleted)
            events.emplace_back(TicketDeleted{ticket.address});
        if (ticket.isCreated)
            events.emplace_back(TicketCreated{ticket.address});
        if (!ticket.isWhole && ticket.keys.empty())
            continue;
        TicketChanged changed{ticket.address, {}, ticket.isWhole};
        changed.keys.reserve(ticket.keys.size());
        while (!ticket.keys.empty())  // one by one: nothing is there twice
        {
            auto node = ticket.keys.extract(ticket.keys.begin());
            changed.keys.push_back({std::move(node.key()), std::move(node.mapped())});
        }
        events.emplace_back(std::move(changed));
    }
    for (int const type : m_crowds)
        events.emplace_back(ManyTicketsChanged{type});
    for (auto const& [transfer, progress] : m_progress)
        events.emplace_back(TransferProgressed{transfer, progress});
    for (TransferEnded& ended : m_ended)
        events.emplace_back(std::move(ended));
    *this = {};
    return events;
}
}  // namespace comgui::detail
