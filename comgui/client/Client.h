// What a connection and its handles share: the session, and what goes on beside it. For any thread.
//
// Locks, in the order in which they are taken: m_lifecycle for whole logins and logouts, m_calls for the
// manager, those of m_switch, m_copying and m_watching. Handlers and executors are called
// under none of them.
#pragma once

#include "comgui/client/Attempts.h"
#include "comgui/client/Connection.h"
#include "comgui/client/EventHub.h"
#include "comgui/client/Manager.h"
#include "comgui/client/NotificationSwitch.h"
#include "comgui/client/SharedManager.h"
#include "comgui/session/TLogin.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <atomic>
#include <condition_variable>
#include <mutex>
#include <optional>
#include <thread>

namespace comgui::detail
{
class TransferPool;

class Client : public std::enable_shared_from_this<Client>
{
public:
    static std::shared_ptr<Client> Make();
    ~Client();
    Client(Client const&) = delete;
    Client& operator=(Client const&) = delete;

    Outcome FindPlugIn();
    Outcome Test(Server const& server);
    Result<User> LogIn(Server const& server, Account const& account);
    Outcome LogOut();
    void End();  // all of it, for good

    bool IsLoggedIn() const { return Container() != nullptr; }
    bool IsServerThere() const { return m_isServerThere; }
    std::string LocalEndPoint() const;

    // Null without a session. One that was given out is the plug-in's, and may end at any time.
    MTICKET_ACCESS const* Container() const { return m_container.load(std::memory_order_acquire); }

    // The ticket as XML.
    Result<std::string> TicketData(TicketAddress ticket);

    // A copy of the session's record, without its password; nothing without a session.
    std::optional<TLogin> Record() const;
    std::optional<TLogin> RecordWithPassword() const;  // whoever asks forgets it when it has served

    // With the reason for the last refusal on this thread.
    Error Failure(int code, std::string about);

    struct SUBSCRIBED
    {
        std::shared_ptr<Subscriber> subscriber;
        std::uint64_t turn;  // to wait for until the plug-in reports
    };
    SUBSCRIBED Subscribe(Interest interest, Executor executor, Subscription::Handler handler,
                         std::chrono::milliseconds interval);

    // Waits until the plug-in reports what was wanted at that turn, or for a quarter of a second.
    void AwaitReports(std::uint64_t turn) { m_switch.Await(turn, SwitchPatience); }
    EventHub& Hub() { return *m_hub; }
    TransferPool& Pool() { return *m_pool; }

private:
    static constexpr std::chrono::milliseconds SwitchPatience{250};  // about what a user does not notice

    Client() = default;

    struct FREE
    {
        void operator()(TLogin* record) const;
    };

    Outcome Prepare(Server const& server);
    Outcome Enter(ComGUIManager& ender);
    Outcome Register();
    void Leave();
    void StopWatching();
    bool IsWatchOver() const;
    void Watch();
    void Look(ComGUIManager& watcher);
    void NoteLoss(Error error);
    void NoteRefusal(Error error);
    std::optional<Outcome> EnterAgain(ComGUIManager& watcher);
    void SwitchAgain();

    std::shared_ptr<EventHub> const m_hub = std::make_shared<EventHub>();
    std::shared_ptr<TransferPool> m_pool;
    NotificationSwitch m_switch{*m_hub};
    SharedManager m_tester;   // for servers that are only tested
    SharedManager m_watcher;  // for the watch
    SharedManager m_helper;   // for reasons
    SharedManager m_writer;   // for tickets as XML
    std::atomic<MTICKET_ACCESS const*> m_container{nullptr};
    std::atomic<bool> m_isServerThere{false};

    std::mutex m_lifecycle;

    mutable std::mutex m_calls;                 // the members below
    std::unique_ptr<TLogin, FREE> m_ownRecord;  // until the first login, when it becomes the manager's
    std::unique_ptr<ComGUIManager> m_manager;
    TLogin* m_record = nullptr;

    mutable std::mutex m_copying;    // the member below
    std::optional<TLogin> m_copy{};  // of the session's record, for those who must not wait for a login

    mutable std::mutex m_watching;  // the members below
    std::condition_variable m_watchEnds;
    bool m_isWatchOver = false;
    std::thread m_watch;

    // The watch's own.
    int m_loss = 0;    // the code of the last loss that was reported
    Attempts m_entry;  // to log in anew
    Attempts m_switching;
};
}  // namespace comgui::detail
