// The ticket server of one site, put together: what a client can ask for, over one store. Users log in here;
// all else is done by the services. For any thread.
#pragma once

#include "standin/server/jobs/JobIntake.h"
#include "standin/server/sessions/KeptTexts.h"
#include "standin/server/sessions/Password.h"
#include "standin/server/site/Caretaker.h"
#include "standin/server/site/SystemTicketMirror.h"
#include "standin/server/site/TroubleListener.h"

namespace standin
{
class Server final : private AfterChange
{
public:
    // site: its folder. The store outlives the server. clock: by which texts grow old. Throws StoreError.
    Server(Store& store, std::filesystem::path const& site,
           KeptTexts::Clock clock = std::chrono::steady_clock::now);
    ~Server() override;  // not while a call is on its way
    Server(Server const&) = delete;
    Server& operator=(Server const&) = delete;

    // Null for a wrong user or password, which are not told apart; the more of that, the later it is told.
    // Throws StoreError.
    std::shared_ptr<Session> Login(std::string const& user, std::string const& password);

    // A session of a user who need not prove who he is.
    std::shared_ptr<Session> Open(User user);

    // False if it had ended before. Waits for the end of a notification callback that runs for the session,
    // and of its transfers, which are cut. Jobs that it has prepared and not sent go, and so do texts that it
    // alone has read and that are gone from their tickets.
    bool Logout(Session& session);

    // Whether the store answers: without it nothing can be written, and nobody hears of others' changes.
    bool IsReachable() const noexcept;

    KeptTexts const& Texts() const { return m_texts; }
    TicketService& Tickets() { return m_tickets; }
    NotificationService& Notifications() { return m_notifications; }
    TransferService& Transfers() { return m_transfers; }
    JobIntake& Jobs() { return m_jobs; }
    SystemTicketMirror& Mirror() { return m_mirror; }

    // How it misbehaves for its clients, as the system ticket says. Calls ask for themselves.
    standin::Troubles& Troubles() { return m_troubles; }

    // The site's own changes of a ticket, whoever may write it; false as those of TicketWriter.
    bool Write(TicketAddress ticket, std::span<TicketWrite> writes)
    {
        return m_writer.Write({ticket, 0}, writes, {});
    }
    bool Create(TicketAddress ticket) { return m_writer.Create({ticket}).has_value(); }

    // From now on the server misbehaves as the system ticket may say already. What comes later is followed in
    // any case.
    void FollowRules();

    // Clears up at once what programs that died have left.
    void Tidy() { m_caretaker.Tidy(); }

    // From now on that happens every now and then. Not before the system ticket tells where this site is: in
    // a copy of another one it may still name that one's folders.
    void StartCare() { m_caretaker.Start(); }

    // For the end of the process: transfers are cut and no callback begins any more. What runs is waited for,
    // but not longer than that.
    void Stop(std::chrono::milliseconds patience);

private:
    std::optional<User> Verified(std::string const& user, std::string const& password);
    void SystemTicketChanged() noexcept override { m_mirror.Write(); }
    std::function<void()> WhenDeleted(TicketAddress ticket, TicketSnapshot const& last) override;

    // In the order in which one leans on the other.
    Store& m_store;
    KeptTexts m_texts;
    Password::Failures m_failures;
    standin::Troubles m_troubles;
    NotificationService m_notifications;
    TroubleListener m_listener;
    Feed m_feed;
    TicketWriter m_writer;
    TicketService m_tickets;
    SystemTicketMirror m_mirror;
    TransferService m_transfers;
    JobIntake m_jobs;
    Caretaker m_caretaker;
};
}  // namespace standin
