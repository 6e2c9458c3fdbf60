// Notifies sessions of what changes in the tickets of a site. The feed posts the changes here, in their
// order; one thread of the service's own passes them on, one callback at a time. No lock is held during a
// callback, which may use the server and this service as it likes.
//
// For any thread. A session that is slow to take its notifications never keeps anybody from writing: while
// too many wait for it there is no room for more, and the feed brings them when there is.
#pragma once

#include "standin/server/feed/ChangeListener.h"
#include "standin/server/sessions/Session.h"
#include "standin/server/trouble/Troubles.h"
#include <chrono>
#include <condition_variable>
#include <deque>
#include <thread>

namespace standin
{
// The numbers are those that clients know.
enum NotificationKind : int
{
    ParametersChanged = 1,
    TicketCreated = 4,
    TicketDeleted = 5,
    TransferEnded = 6,
};

// What a callback is told; all of it dies when the callback returns.
struct Notification
{
    NotificationKind kind;
    TicketAddress ticket;                 // type 0 and id 0 of a transfer
    int code;                             // how a transfer ended; else 0
    int id;                               // under which it was asked for
    ChangedParameters const& parameters;  // of a change, or of a transfer; those of one key are neighbours
};

class NotificationService final : public ChangeListener
{
public:
    // With so many records waiting for one session there is no room for another change; a text counts as one
    // for every KiB of it.
    static constexpr std::size_t PendingLimit = 65536;

    using Callback = std::function<void(Notification const&)>;

    explicit NotificationService(Troubles& troubles = Troubles::None()) : m_troubles(troubles) {}
    ~NotificationService() override;  // not from a callback
    NotificationService(NotificationService const&) = delete;
    NotificationService& operator=(NotificationService const&) = delete;

    int NewId() { return ++m_newestId; }

    // From now on the session is told under that id, and under no earlier one. False for an ended session,
    // and after Stop. Throws std::system_error if there can be no thread.
    bool Register(Session const& session, int id, Callback callback);

    // One ticket, or with TICKET_ID_ALL every ticket of the type. Enabling again replaces the keys. Tickets
    // need not exist. False for an id that is not the session's, and for no such address.
    bool Enable(Session const& session, int id, TicketAddress tickets, KeyFilter keys);

    // The same the other way round; a whole type takes its single tickets along, and AllTickets everything.
    // When it returns no callback about them runs or will come, unless it is called from a callback itself.
    bool Disable(Session const& session, int id, TicketAddress tickets);

    // No callback of the session runs or will come when it returns, with the same exception.
    void Remove(Session const& session);

    // From the feed. Costs next to nothing while nobody wants anything.
    bool Wants(TicketAddress ticket) const override;
    bool HasRoom() const override;
    void Created(TicketAddress ticket) noexcept override { Post(TicketCreated, ticket, {}); }
    void Written(TicketAddress ticket, ChangedParameters&& parameters) noexcept override
    {
        Post(ParametersChanged, ticket, std::move(parameters));
    }
    void Deleted(TicketAddress ticket) noexcept override { Post(TicketDeleted, ticket, {}); }

    // Notifies one session of the end of a transfer, whatever it has switched on or off; nothing if it has
    // not registered.
    void TransferHasEnded(unsigned long long session, int code, ChangedParameters parameters) noexcept;
    std::size_t UntoldEnds(Session const& session) const;  // of its transfers

    // Begins no further callback, for good, and waits for a running one, but no longer than told. Unless that
    // goes on, the thread is gone when this returns.
    void Stop(std::chrono::milliseconds patience);

private:
    using Clock = std::chrono::steady_clock;

    struct Listener
    {
        unsigned long long session;
        std::string user;
        int id;
        Callback callback;
        std::map<TicketAddress, KeyFilter> subscriptions{};
        std::size_t pending = 0;
        std::size_t ends = 0;  // of transfers, among those that are pending
        bool gone = false;
        Clock::time_point heldUntil{};  // nothing comes before what is late

        bool Wants(TicketAddress ticket) const;
        bool Wants(TicketAddress ticket, std::string_view key) const;
    };
    struct Message
    {
        std::shared_ptr<Listener> listener;
        NotificationKind kind;
        TicketAddress ticket;
        int code;
        ChangedParameters changes;
        std::size_t weight;
        Clock::time_point due{};  // of most, long ago
        bool isSwapped = false;   // goes behind the next one of its listener
    };
    using Lock = std::unique_lock<std::mutex>;

    Listener* Find(Session const& session, int id) const;
    bool RemoveOne(Session const& session, Lock& lock);
    void Withdraw(Listener& listener);
    void Post(NotificationKind kind, TicketAddress ticket, ChangedParameters changes) noexcept;
    void Append(Message message);
    void AppendTroubled(Message message);
    void Enqueue(Message message);
    bool IsUnreachable(Listener const& listener) const;
    bool HasSwapped(Listener const& listener) const;
    void ReleaseSwapped(Listener const& listener, Clock::time_point due);
    void WaitForWork(Lock& lock);
    std::deque<Message>::iterator FirstDue();
    void Unqueue(Message& message);
    void WaitFor(int id, Lock& lock);
    void Queue(std::shared_ptr<Listener> const& listener, NotificationKind kind, TicketAddress ticket,
               ChangedParameters const& changes);
    void Run();
    static void Deliver(Message& message) noexcept;

    Troubles& m_troubles;
    std::atomic<int> m_newestId{0};
    std::atomic<std::size_t> m_subscriptions{0};  // of all listeners

    mutable std::mutex m_lock;  // the members below; taken last, but for that of the troubles
    std::vector<std::shared_ptr<Listener>> m_listeners;
    std::deque<Message> m_waiting;
    bool m_hasSwapped = false;  // perhaps among them
    std::condition_variable m_work;
    std::condition_variable m_done;
    int m_running = 0;             // the id whose callback runs, 0 for none
    unsigned long long m_run = 0;  // counts callbacks: a wait for one must not become one for the next
    bool m_stopped = false;
    std::thread m_thread;  // begun at the first registration
};

// Every ticket of every type, for Disable.
inline constexpr TicketAddress AllTickets{-3, -3};
}  // namespace standin
