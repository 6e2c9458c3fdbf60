#include "desk/model/DeskSession.h"

namespace desk
{
namespace
{
// Enough for a repaint, and for the eye.
constexpr std::chrono::milliseconds Interval(50);

comgui::Interest Everything()
{
    comgui::Interest interest = comgui::Interest::InAllTypes();
    interest.transfers = true;
    return interest;
}

using Lists = std::vector<std::pair<int, std::vector<int>>>;

comgui::Result<std::vector<int>> IdsOf(comgui::Tickets const& tickets, int type)
{
    auto const list = tickets.List(type);
    if (!list)
        return list.GetError();
    std::vector<int> ids;
    ids.reserve(list->size());
    for (comgui::TicketAddress const ticket : *list)
        ids.push_back(ticket.id);
    return ids;
}

// Of every type, so that those which have none any more are known, too.
comgui::Result<Lists> IdsOfAll(comgui::Tickets const& tickets)
{
    Lists lists;
    for (int type = 0; type < comgui::TicketTypes; ++type)
    {
        auto ids = IdsOf(tickets, type);
        if (!ids)
            return ids.GetError();
        lists.emplace_back(type, *std::move(ids));
    }
    return lists;
}

bool IsOfTransfer(comgui::Event const& event)
{
    return std::holds_alternative<comgui::TransferProgressed>(event) ||
           std::holds_alternative<comgui::TransferEnded>(event);
}
}  // namespace

DeskSession::DeskSession(comgui::Executor here) : m_worker(here)
{
    m_events = m_connection.Subscribe(
        Everything(), std::move(here), [this](comgui::Event const& event) { Take(event); }, Interval);
}

void DeskSession::LoggedIn()
{
    ForgetSession();
    if (m_connection.IsServerThere())
        Become(State::LoggedIn);
    else  // lost since, and the news of it came too early
        Become(State::Lost, {comgui::ServerAway, {}, {}});
    ListAll();
}

void DeskSession::LogOut()
{
    m_worker.Do([this] { return m_connection.LogOut(); }, [](comgui::Outcome const&) {});
    EndSession();
}

// Asked behind a login that is given up, but may still be under way.
void DeskSession::LoginFailed()
{
    m_worker.Do([this] { return m_connection.IsLoggedIn(); },
                InThisSession(
                    [this](bool isLoggedIn)
                    {
                        if (!isLoggedIn && m_state != State::LoggedOut)
                            EndSession();
                    }));
}

void DeskSession::EndSession()
{
    ForgetSession();
    Become(State::LoggedOut);
}

void DeskSession::ForgetSession()
{
    ++m_session;
    m_listings = 0;
    m_isListMissing = false;
    m_late.clear();
}

void DeskSession::List(int type)
{
    ++m_listings;
    m_worker.Do([tickets = m_tickets, type] { return IdsOf(tickets, type); },
                InThisSession(
                    [this, type](comgui::Result<std::vector<int>> const& ids)
                    {
                        if (!ids)
                            NoteFailure(ids.GetError());
                        else
                            onList(type, *ids);
                        EndListing();
                    }));
}

void DeskSession::ListAll()
{
    ++m_listings;
    m_worker.Do([tickets = m_tickets] { return IdsOfAll(tickets); },
                InThisSession(
                    [this](comgui::Result<Lists> const& lists)
                    {
                        m_isListMissing = false;
                        if (!lists)
                            NoteFailure(lists.GetError());
                        for (auto const& [type, ids] : lists.ValueOr({}))
                            onList(type, ids);
                        EndListing();
                    }));
}

// What could not be listed is listed when the server is back.
void DeskSession::NoteFailure(comgui::Error const& error)
{
    m_isListMissing = true;
    onProblem(error);
}

void DeskSession::EndListing()
{
    for (auto const& [ticket, isThere] : m_late)
        onTicket(ticket, isThere);
    if (--m_listings == 0)
        m_late.clear();
}

void DeskSession::Take(comgui::Event const& event)
{
    if (m_state == State::LoggedOut && !IsOfTransfer(event))
        return;
    if (auto const* const lost = std::get_if<comgui::ServerLost>(&event))
        Become(State::Lost, lost->error);
    else if (auto const* const back = std::get_if<comgui::ServerBack>(&event))
    {
        Become(State::LoggedIn);
        if (back->isNewSession || m_isListMissing)
            ListAll();
    }
    else if (auto const* const many = std::get_if<comgui::ManyTicketsChanged>(&event))
        List(many->type);
    else if (auto const* const created = std::get_if<comgui::TicketCreated>(&event))
        TakeTicket(created->ticket, true);
    else if (auto const* const deleted = std::get_if<comgui::TicketDeleted>(&event))
        TakeTicket(deleted->ticket, false);
    onEvent(event);
}

void DeskSession::TakeTicket(comgui::TicketAddress ticket, bool isThere)
{
    if (m_listings > 0)
        m_late.emplace_back(ticket, isThere);
    onTicket(ticket, isThere);
}

void DeskSession::Become(State state, comgui::Error const& error)
{
    m_state = state;
    onState(state, error);
}
}  // namespace desk
