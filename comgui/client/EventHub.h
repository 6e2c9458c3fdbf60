// Takes notifications from the plug-in's thread, merges them for each subscriber, and hands them to the
// subscribers' executors at their pace. For any thread. No handler, executor or entry of the plug-in is
// called while a lock is held.
//
// The library's own queue is not used: it takes one notification in 2 milliseconds, holds its lock while
// handlers run, has no bound, and what an old session has left there reaches the next one. A registration of
// the hub's own is as good to the plug-in.
#pragma once

#include "comgui/client/PendingEvents.h"
#include "comgui/client/Subscription.h"
#include <condition_variable>
#include <map>
#include <mutex>
#include <set>
#include <thread>

namespace comgui::detail
{
class EventHub : public std::enable_shared_from_this<EventHub>
{
public:
    EventHub() = default;
    ~EventHub();
    EventHub(EventHub const&) = delete;
    EventHub& operator=(EventHub const&) = delete;

    // What a session registers with the plug-in: the callback, and its first argument. Both end the session
    // before: nothing of it is delivered any more.
    using Callback = void (*)(void* token, int kind, int id, int notification, int type, void* data);
    static Callback GetCallback() { return &Notified; }
    void* BeginSession();
    void EndSession();

    // EndSession for good: the loss and the return of the server are not delivered any more either.
    void LeaveServer();

    // When it returns, no handler runs that was called for a session that has ended, unless it is the one
    // that calls this.
    void WaitForHandlers() const;

    std::shared_ptr<Subscriber> Add(Interest interest, Executor executor, Subscription::Handler handler,
                                    std::chrono::milliseconds interval);
    void Remove(Subscriber& subscriber);
    std::vector<Interest> Interests() const;

    // To all subscribers, or to those that want transfers.
    void Publish(Event const& event);

    // These tickets, or types by TICKET_ID_ALL, may have changed unheard: told to those that want them.
    void PublishUnheard(std::set<TicketAddress> const& tickets);

    // Begins no delivery any more. When it returns, the hub's thread is over, and no handler runs, unless it
    // is the one that calls this.
    void Stop();

private:
    friend class Subscriber;
    using Clock = std::chrono::steady_clock;
    using Lock = std::unique_lock<std::mutex>;

    static void Notified(void* token, int kind, int id, int notification, int type, void* data);
    void Take(std::uintptr_t session, TicketEvent const& event);
    void Run();
    Clock::time_point PostWhatIsDue(Lock& lock);
    void Post(std::shared_ptr<Subscriber> subscriber, Lock& lock);
    bool IsCalledByAnother(Subscriber const& subscriber) const;

    mutable std::mutex m_lock;
    std::vector<std::shared_ptr<Subscriber>> m_subscribers;
    std::uintptr_t m_session = 0;  // 0: none
    std::uintptr_t m_epoch = 0;    // goes up with every session
    std::uintptr_t m_visit = 0;    // goes up when a server is left
    std::condition_variable m_work;
    mutable std::condition_variable m_handled;
    bool m_isStopped = false;
    Subscriber const* m_posting = nullptr;  // whose executor is being called
    std::thread::id m_poster{};             // by this thread
    std::thread m_thread;                   // begun with the first subscriber
};

// One subscription. All of it is guarded by the hub's lock, but for what never changes.
class Subscriber : public std::enable_shared_from_this<Subscriber>
{
public:
    Subscriber(std::weak_ptr<EventHub> hub, Interest interest, Executor executor,
               Subscription::Handler handler, std::chrono::milliseconds interval);

    // Called with no lock held, from any thread; waits as Subscription's destructor does.
    void End();

    // Set before the first use, called by End: tells the connection that the interest is gone.
    std::function<void()> onEnd;

private:
    friend class EventHub;

    // Taken for delivery. For the thread that delivers, while m_isPosted.
    struct Batch
    {
        std::uintptr_t epoch = 0;
        std::uintptr_t visit = 0;
        std::vector<Event> events{};
        std::size_t next = 0;

        bool IsEmpty() const { return next == events.size(); }
    };

    void Deliver();
    bool HasNothing() const { return m_pending.IsEmpty() && m_batch.IsEmpty(); }
    bool IsOver() const;
    bool IsOld(Event const& event, Batch const& batch) const;

    std::weak_ptr<EventHub> const m_hub;
    Interest const m_interest;
    Executor m_executor;  // both until the subscription ends
    Subscription::Handler m_handler;
    std::chrono::milliseconds const m_interval;

    PendingEvents m_pending;
    Batch m_batch;
    EventHub::Clock::time_point m_due{};
    bool m_isPosted = false;
    bool m_isOver = false;
    std::thread::id m_runner{};
};
}  // namespace comgui::detail
