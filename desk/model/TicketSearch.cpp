#include "desk/model/TicketSearch.h"

#include <algorithm>
#include <utility>

namespace desk
{
TicketSearch::TicketSearch(SearchQuery const& query, std::vector<comgui::TicketAddress> tickets,
                           SearchReader reader)
    : m_text(query.text), m_where(query.where), m_tickets(std::move(tickets)), m_reader(std::move(reader)),
      m_most(query.most)
{
    if (m_text.IsEmpty())
        m_done = m_tickets.size();
}

SearchBatch TicketSearch::Step(std::size_t tickets, std::chrono::nanoseconds time)
{
    using Clock = std::chrono::steady_clock;
    SearchBatch batch;
    Clock::time_point const begin = Clock::now();
    std::size_t const end = m_done + std::clamp<std::size_t>(tickets, 1, m_tickets.size() - m_done + 1);
    while (m_done < std::min(end, m_tickets.size()) && m_found < m_most && !IsCancelled())
    {
        comgui::TicketAddress const ticket = m_tickets[m_done];
        comgui::Result<comgui::Snapshot> const snapshot = m_reader(ticket);
        if (snapshot)
            m_found += LookAt(ticket, *snapshot, batch) ? 1 : 0;
        else if (!Skip(snapshot.GetError()))
        {
            batch.error = snapshot.GetError();
            break;
        }
        m_done += IsCancelled() ? 0 : 1;
        if (Clock::now() - begin >= time)
            break;
    }
    batch.state = IsCancelled()                ? SearchState::Cancelled
                  : batch.error                ? SearchState::Interrupted
                  : m_done == m_tickets.size() ? SearchState::Finished
                  : m_found >= m_most          ? SearchState::Enough
                                               : SearchState::Running;
    batch.found = m_found;
    batch.done = m_done;
    batch.total = m_tickets.size();
    batch.gone = m_gone;
    batch.unreadable = m_unreadable;
    return batch;
}

// Whether it is found. Nothing of a ticket that was not looked at to its end.
bool TicketSearch::LookAt(comgui::TicketAddress ticket, comgui::Snapshot const& snapshot,
                          SearchBatch& batch) const
{
    SearchMatch match{ticket, {}, 0};
    for (comgui::SnapshotEntry const& entry : snapshot.Entries())
    {
        if (IsCancelled())
            return false;
        if (Matches(entry) && ++match.keys == 1)
            match.key = entry.key;
    }
    if (match.keys == 0)
        return false;
    batch.matches.push_back(std::move(match));
    return true;
}

// False for what is no matter of this ticket alone: all others would fail in the same way.
bool TicketSearch::Skip(comgui::Error const& error)
{
    if (error.IsTransient() || error.code == comgui::NoContainer)
        return false;
    ++(error.code == comgui::NoSuchTicket ? m_gone : m_unreadable);
    return true;
}

bool TicketSearch::Matches(comgui::SnapshotEntry const& entry) const
{
    switch (m_where)
    {
    case SearchIn::Keys:
        return m_text.IsIn(entry.key);
    case SearchIn::Values:
        return MatchesValue(entry.value);
    case SearchIn::Both:
        break;
    }
    return m_text.IsIn(entry.key) || MatchesValue(entry.value) || MatchesEquation(entry);
}

bool TicketSearch::MatchesValue(comgui::Value const& value) const
{
    auto const* const list = std::get_if<comgui::List>(&value);
    return m_text.IsIn(comgui::ToText(value)) ||
           (list && std::any_of(list->begin(), list->end(),
                                [this](comgui::Element const& element)
                                { return m_text.IsIn(comgui::ToText(element.value)); }));
}

bool TicketSearch::MatchesEquation(comgui::SnapshotEntry const& entry) const
{
    auto const holds = [&](comgui::Value const& value)
    { return m_text.IsEquation(entry.key, comgui::ToText(value)); };
    auto const* const list = std::get_if<comgui::List>(&entry.value);
    return m_text.HasEquation() &&
           (holds(entry.value) ||
            (list && std::any_of(list->begin(), list->end(),
                                 [&](comgui::Element const& element) { return holds(element.value); })));
}
}  // namespace desk
