// What the desk does at a server, whatever shows it: logs in, keeps the list of tickets up to date, follows
// the server's coming and going. Everything is called, and calls back, on the thread of one executor.
#pragma once

#include <chrono>
#include <comgui/client.h>
#include <functional>
#include <utility>
#include <vector>

namespace desk
{
class DeskSession
{
public:
    enum class State
    {
        LoggedOut,
        LoggedIn,
        Lost,  // logged in, but the server does not answer
    };

    explicit DeskSession(comgui::Executor here);

    // Called whenever it has come to that. error: why, if the server is lost.
    std::function<void(State, comgui::Error const& error)> onState = [](State, comgui::Error const&) {};

    // A ticket has come or gone. Also of those that a list named already.
    std::function<void(comgui::TicketAddress, bool isThere)> onTicket = [](comgui::TicketAddress, bool) {};

    // Every event, after it has been taken into account here. While logged out, of transfers alone: what is
    // left of the others belongs to a session that has ended.
    std::function<void(comgui::Event const&)> onEvent = [](comgui::Event const&) {};

    // All tickets of a type, in ascending order.
    std::function<void(int type, std::vector<int> const& ids)> onList = [](int, std::vector<int> const&) {};

    // A failure that belongs to nothing the user sees.
    std::function<void(comgui::Error const&)> onProblem = [](comgui::Error const&) {};

    void LoggedIn();  // the connection has been logged in: what there is is listed
    void LogOut();
    void LoginFailed();  // or was given up: the session that was there before it may have ended
    void Made(comgui::TicketAddress ticket) { TakeTicket(ticket, true); }  // before the server's event comes
    void List(int type);
    void ListAll();

    // For results of the worker's that mean nothing to another session: calls `then` only if neither a login
    // nor a logout has come since.
    template <typename Then>
    auto InThisSession(Then then) const
    {
        return [this, session = m_session, then = std::move(then)](auto const&... result)
        {
            if (session == m_session)
                then(result...);
        };
    }

    State Now() const { return m_state; }
    comgui::Connection& Connection() { return m_connection; }
    comgui::Tickets const& Tickets() const { return m_tickets; }
    comgui::Worker const& Worker() const { return m_worker; }

private:
    void Take(comgui::Event const& event);
    void TakeTicket(comgui::TicketAddress ticket, bool isThere);
    void NoteFailure(comgui::Error const& error);
    void EndListing();
    void EndSession();
    void ForgetSession();
    void Become(State state, comgui::Error const& error = {});

    comgui::Connection m_connection;
    comgui::Tickets const m_tickets = m_connection.GetTickets();
    State m_state = State::LoggedOut;
    unsigned long m_session = 0;   // which one, the times between them included
    bool m_isListMissing = false;  // a type, or more
    int m_listings = 0;            // under way; what is heard meanwhile may be newer, so it is told once more
    std::vector<std::pair<comgui::TicketAddress, bool>> m_late;
    comgui::Worker const m_worker;
    comgui::Subscription m_events;
};
}  // namespace desk
