#include "standin/server/site/Server.h"

#include "standin/server/files/RefusableCall.h"
#include "standin/server/files/Report.h"
#include "standin/server/jobs/JobFolder.h"
#include <thread>

namespace standin
{
Server::Server(Store& store, std::filesystem::path const& site, KeptTexts::Clock clock)
    : m_store(store), m_texts(std::move(clock)), m_notifications(m_troubles),
      m_listener(m_troubles, m_notifications), m_feed(store, m_listener, m_texts),
      m_writer(store, m_feed, *this, m_troubles), m_tickets(m_feed, m_writer),
      m_mirror(store, m_tickets, site), m_transfers(store, m_tickets, m_notifications, site, m_troubles),
      m_jobs(store, m_tickets, m_writer, m_transfers),
      m_caretaker(store, m_feed, m_tickets, m_writer, m_jobs, m_mirror, site)
{
}

Server::~Server() = default;

std::shared_ptr<Session> Server::Login(std::string const& user, std::string const& password)
{
    if (auto known = Verified(user, password))
        return Open(std::move(*known));
    std::this_thread::sleep_for(m_failures.Note(std::chrono::steady_clock::now()));
    return nullptr;
}

// Slow by intent; and as slow for a user who does not exist.
std::optional<User> Server::Verified(std::string const& user, std::string const& password)
{
    std::optional<User> known = m_store.FindUser(user);
    if (!known)
        Password::VerifyNobody(password);
    else if (!Password::Verify(password, known->passwordHash))
        known.reset();
    return known;
}

std::shared_ptr<Session> Server::Open(User user)
{
    auto const number = static_cast<unsigned long long>(m_store.OpenSession(user.name));
    m_troubles.NoteSession(number);
    auto session = std::make_shared<Session>(number, std::move(user));
    session->KeepTexts(m_texts.Open(session->Reader()));
    return session;
}

bool Server::Logout(Session& session)
{
    if (!session.End())
        return false;
    m_transfers.End(session);
    m_jobs.End(session);
    m_notifications.Remove(session);
    try
    {
        m_store.CloseSession(static_cast<long long>(session.Number()));
    }
    catch (StoreError const& error)
    {
        Report(error.what());  // the row goes with this program
    }
    session.ReleaseTexts();
    return true;
}

void Server::FollowRules()
{
    std::string rules;
    m_tickets.LookAt(SystemTicket, 0,
                     [&](TicketSnapshot const& system)
                     {
                         KeyValues const* const values = system.Find(std::string_view(TroubleKey));
                         TicketElement const* const first = values ? values->At(0) : nullptr;
                         if (first && first->type == PARAM_STRING)
                             rules = first->ToStored().bytes;
                         return true;
                     });
    m_troubles.Begin(rules);
}

bool Server::IsReachable() const noexcept
{
    if (m_store.IsReachable())
        return true;
    RefusableCall::Note({"the site's database cannot be reached"});
    return false;
}

void Server::Stop(std::chrono::milliseconds patience)
{
    m_transfers.Stop(patience);
    m_notifications.Stop(patience);
    m_writer.Stop();  // lest the caretaker waits for a store that is lost
    m_caretaker.Stop();
    m_feed.Stop();
}

// A job's folder goes with its ticket. If a power cut brings back a ticket that tells of a file, that has to
// be there, also if the ticket told of it before its last changes only; so the end of the ticket comes to the
// disk first, or the folder stays until it is swept.
std::function<void()> Server::WhenDeleted(TicketAddress ticket, TicketSnapshot const& last)
{
    std::string mark = ticket.type == JobTicketType ? TextOf(last, JobMarkKey) : "";
    if (mark.empty())
        return {};
    return [this, id = ticket.id, mark = std::move(mark)]
    {
        try
        {
            m_store.Sync();
            RemoveJobFolder(FolderTable(m_tickets.Folders().values), id, mark);
        }
        catch (StoreError const& error)
        {
            Report(error.what());
        }
    };
}
}  // namespace standin
