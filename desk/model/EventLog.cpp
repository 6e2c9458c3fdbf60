#include "desk/model/EventLog.h"

#include "desk/model/DisplayText.h"
#include <algorithm>
#include <utility>
#include <variant>

namespace desk
{
namespace
{
EventRow RowOf(EventKind kind, comgui::TicketAddress ticket)
{
    EventRow row;
    row.kind = kind;
    row.type = ticket.type;
    row.id = ticket.id;
    return row;
}

EventRow RowOf(comgui::TicketAddress ticket, comgui::KeyChange const& change)
{
    EventRow row = RowOf(!change.value            ? EventKind::KeyToRead
                         : change.value->IsNone() ? EventKind::KeyDeleted
                                                  : EventKind::KeyChanged,
                         ticket);
    row.key = change.key;
    if (change.value)
        row.text = DisplayTextOf(*change.value);
    return row;
}

EventRow RowOf(comgui::TicketCreated const& event) { return RowOf(EventKind::TicketCreated, event.ticket); }
EventRow RowOf(comgui::TicketDeleted const& event) { return RowOf(EventKind::TicketDeleted, event.ticket); }

EventRow RowOf(comgui::ManyTicketsChanged const& event)
{
    EventRow row = RowOf(EventKind::ManyTicketsChanged, {event.type, 0});
    row.id.reset();
    return row;
}

EventRow RowOf(comgui::TransferProgressed const& event)
{
    EventRow row;
    row.kind = EventKind::TransferProgressed;
    row.transfer = event.transfer;
    row.count = event.progress.done;
    row.total = event.progress.total;
    return row;
}

EventRow RowOf(comgui::TransferEnded const& event)
{
    EventRow row;
    row.kind = event.outcome ? EventKind::TransferEnded : EventKind::TransferFailed;
    row.transfer = event.transfer;
    row.job = event.job;
    if (!event.outcome)
        row.text = DisplayText(event.outcome.GetError().Text());
    return row;
}

EventRow RowOf(comgui::ServerLost const& event)
{
    EventRow row;
    row.kind = EventKind::ServerLost;
    row.text = DisplayText(event.error.Text());
    return row;
}

EventRow RowOf(comgui::ServerBack const& event)
{
    EventRow row;
    row.kind = event.isNewSession ? EventKind::ServerBackAnew : EventKind::ServerBack;
    return row;
}

std::size_t SizeOf(EventRow const& row) { return row.key.size() + row.text.size(); }
}  // namespace

void EventLog::ROWS::Push(EventRow row)
{
    bytes += SizeOf(row);
    rows.push_back(std::move(row));
}

void EventLog::ROWS::Pop()
{
    bytes -= SizeOf(rows.front());
    rows.pop_front();
}

// The latest row stays, whatever it takes.
bool EventLog::ROWS::IsOver(Limits limits) const
{
    return rows.size() > 1 && (rows.size() > limits.rows || bytes > limits.bytes);
}

void EventLog::Append(comgui::Event const& event, Time now)
{
    std::visit(
        [this, now](auto const& what)
        {
            if constexpr (std::is_same_v<decltype(what), comgui::TicketChanged const&>)
                AppendKeys(what, now);
            else
            {
                EventRow row = RowOf(what);
                row.time = now;
                Add(std::move(row));
            }
        },
        event);
}

void EventLog::AppendKeys(comgui::TicketChanged const& event, Time now)
{
    auto const add = [this, now](EventRow row)
    {
        row.time = now;
        Add(std::move(row));
    };
    std::size_t const listed = std::min(event.keys.size(), m_limits.keysOfEvent);
    for (std::size_t i = 0; i < listed; ++i)
        add(RowOf(event.ticket, event.keys[i]));
    if (listed < event.keys.size())
    {
        EventRow more = RowOf(EventKind::MoreKeys, event.ticket);
        more.count = static_cast<long long>(event.keys.size() - listed);
        add(std::move(more));
    }
    if (event.isWhole)
        add(RowOf(EventKind::TicketChanged, event.ticket));
}

void EventLog::Add(EventRow row)
{
    if (!m_isPaused)
    {
        AddShown(std::move(row));
        return;
    }
    ++m_cameMeanwhile;
    m_waiting.Push(std::move(row));
    while (m_waiting.IsOver(m_limits))
        m_waiting.Pop();
}

void EventLog::AddShown(EventRow row)
{
    if (IsWanted(row))
        m_shown.push_back(m_gone + m_rows.rows.size());
    m_rows.Push(std::move(row));
    while (m_rows.IsOver(m_limits))
    {
        m_rows.Pop();
        if (!m_shown.empty() && m_shown.front() == m_gone)
        {
            m_shown.pop_front();
            ++m_shownGone;
        }
        ++m_gone;
    }
}

void EventLog::Resume()
{
    m_isPaused = false;
    m_cameMeanwhile = 0;
    for (EventRow& row : std::exchange(m_waiting, {}).rows)
        AddShown(std::move(row));
}

void EventLog::SetFilter(EventFilter filter)
{
    m_filter = std::move(filter);
    Find();
}

void EventLog::Clear()
{
    m_gone += m_rows.rows.size();
    m_rows = {};
    m_waiting = {};
    m_cameMeanwhile = 0;
    Find();
}

void EventLog::Find()
{
    m_shown.clear();
    for (std::size_t i = 0; i < m_rows.rows.size(); ++i)
        if (IsWanted(m_rows.rows[i]))
            m_shown.push_back(m_gone + i);
    m_isReset = true;
}

bool EventLog::IsWanted(EventRow const& row) const
{
    if (m_filter.ticket && (row.type != m_filter.ticket->type || (row.id && *row.id != m_filter.ticket->id)))
        return false;
    return !m_filter.isWanted || m_filter.isWanted(row.key) || m_filter.isWanted(row.text);
}

std::optional<std::size_t> EventLog::IndexOf(std::size_t number) const
{
    auto const place = std::ranges::lower_bound(m_shown, number);
    return place != m_shown.end() && *place == number
               ? std::optional(static_cast<std::size_t>(place - m_shown.begin()))
               : std::nullopt;
}

EventLog::Changes EventLog::TakeChanges()
{
    std::size_t const end = m_shownGone + m_shown.size();
    Changes changes;
    changes.isReset = std::exchange(m_isReset, false);
    if (!changes.isReset)
    {
        changes.gone = std::min(m_shownGone, m_toldEnd) - m_toldGone;
        changes.came = end - std::max(m_shownGone, m_toldEnd);
    }
    m_toldGone = m_shownGone;
    m_toldEnd = end;
    return changes;
}
}  // namespace desk
