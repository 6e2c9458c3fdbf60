#include "desk/model/TitleReader.h"

#include "desk/model/TicketTitle.h"
#include <algorithm>

namespace desk
{
namespace
{
constexpr std::size_t Kept = 20'000;      // titles
constexpr std::size_t MostAsked = 1'000;  // more than any screen shows
constexpr std::size_t AtOnce = 50;

using Read = std::vector<std::pair<TitleRequest, std::optional<std::string>>>;

Read TitlesOf(comgui::Tickets const& tickets, std::vector<TitleRequest> const& requests)
{
    Read read;
    for (TitleRequest const& request : requests)
    {
        char const* const key = TitleKeyOf(request.ticket.type);
        auto const value = key ? tickets.Read(request.ticket, key) : comgui::Error();
        read.emplace_back(request, value ? TitleOf(*value) : std::nullopt);
    }
    return read;
}
}  // namespace

TitleReader::TitleReader(comgui::Tickets const& tickets, comgui::Worker const& worker)
    : m_tickets(tickets), m_worker(worker), m_cache(Kept)
{
}

std::string TitleReader::TitleOf(comgui::TicketAddress ticket)
{
    std::string const* const title = m_cache.Find(ticket);
    if (!title && m_asked.size() < MostAsked)
    {
        m_asked.push_back(ticket);
        if (m_asked.size() == 1)
            onAsked();
    }
    return title ? *title : std::string();
}

void TitleReader::Read()
{
    if (m_isReading)
        return;
    if (!m_asked.empty())
    {
        m_cache.SetVisible(m_asked);
        m_asked.clear();
    }
    auto const requests = m_cache.Take(AtOnce);
    if (requests.empty())
        return;
    m_isReading = true;
    m_worker.Do([tickets = m_tickets, requests] { return TitlesOf(tickets, requests); },
                [this, alive = std::weak_ptr(m_alive)](desk::Read const& read)
                {
                    if (!alive.lock())
                        return;
                    m_isReading = false;
                    for (auto const& [request, title] : read)
                        m_cache.Put(request, title);
                    onTitles();
                    Read();
                });
}

void TitleReader::Take(comgui::Event const& event)
{
    if (auto const* const changed = std::get_if<comgui::TicketChanged>(&event))
    {
        char const* const key = TitleKeyOf(changed->ticket.type);
        auto const isTitle = [key](comgui::KeyChange const& change) { return key && change.key == key; };
        if (changed->isWhole || std::any_of(changed->keys.begin(), changed->keys.end(), isTitle))
            TakeChanged(changed->ticket);
    }
    else if (auto const* const deleted = std::get_if<comgui::TicketDeleted>(&event))
        m_cache.Forget(deleted->ticket);
    else if (std::get_if<comgui::ManyTicketsChanged>(&event) || std::get_if<comgui::ServerBack>(&event))
        m_cache.Clear();
    else
        return;
    Read();
}

// Painting asks only for what has no title at all, so a changed one is asked for here.
void TitleReader::TakeChanged(comgui::TicketAddress ticket)
{
    if (m_cache.Changed(ticket) && m_asked.size() < MostAsked)
        m_asked.push_back(ticket);
}

void TitleReader::Clear()
{
    m_cache.Clear();
    m_asked.clear();
    m_isReading = false;
    m_alive = std::make_shared<bool>(true);
}
}  // namespace desk
