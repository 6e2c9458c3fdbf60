#include "desk/model/TitleCache.h"

#include <algorithm>

namespace desk
{
TitleCache::TitleCache(std::size_t capacity) : m_capacity(std::max<std::size_t>(capacity, 1)) {}

std::string const* TitleCache::Find(comgui::TicketAddress ticket) const
{
    auto const found = m_titles.find(ticket);
    return found != m_titles.end() && found->second.title ? &*found->second.title : nullptr;
}

void TitleCache::SetVisible(std::vector<comgui::TicketAddress> const& tickets)
{
    auto const count = static_cast<std::ptrdiff_t>(std::min(tickets.size(), m_capacity));
    m_visible.assign(tickets.begin(), tickets.begin() + count);
    for (comgui::TicketAddress const ticket : m_visible)
        Use(ticket);
    for (; m_titles.size() > m_capacity; m_uses.pop_back())
        m_titles.erase(m_uses.back());
}

std::vector<TitleRequest> TitleCache::Take(std::size_t most)
{
    std::vector<TitleRequest> requests;
    for (comgui::TicketAddress const ticket : m_visible)
    {
        if (requests.size() == most)
            break;
        auto const found = m_titles.find(ticket);  // not there if it was forgotten
        if (found == m_titles.end() || found->second.reading != Reading::Wanted)
            continue;
        found->second.reading = Reading::UnderWay;
        found->second.stamp = ++m_lastStamp;
        requests.push_back({ticket, m_lastStamp});
    }
    return requests;
}

bool TitleCache::Put(TitleRequest const& request, std::optional<std::string> title)
{
    auto const found = m_titles.find(request.ticket);
    if (found == m_titles.end() || found->second.reading != Reading::UnderWay ||
        found->second.stamp != request.stamp)
        return false;
    found->second.title = std::move(title);
    found->second.reading = Reading::Done;
    return true;
}

bool TitleCache::Changed(comgui::TicketAddress ticket)
{
    auto const found = m_titles.find(ticket);
    if (found == m_titles.end())
        return false;
    found->second.reading = Reading::Wanted;
    return true;
}

void TitleCache::Forget(comgui::TicketAddress ticket)
{
    auto const found = m_titles.find(ticket);
    if (found == m_titles.end())
        return;
    m_uses.erase(found->second.use);
    m_titles.erase(found);
}

void TitleCache::Clear()
{
    m_titles.clear();
    m_uses.clear();
    m_visible.clear();
}

void TitleCache::Use(comgui::TicketAddress ticket)
{
    auto const [entry, isNew] = m_titles.try_emplace(ticket);
    if (isNew)
        entry->second.use = m_uses.insert(m_uses.begin(), ticket);
    else
        m_uses.splice(m_uses.begin(), m_uses, entry->second.use);
}
}  // namespace desk
