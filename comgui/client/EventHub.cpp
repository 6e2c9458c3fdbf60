#include "comgui/client/EventHub.h"

#include <algorithm>
#include <atomic>
#include <utility>

namespace comgui::detail
{
namespace
{
// The hubs by what the plug-in was given for their sessions: a number, so that a late call finds nothing, and
// nothing that is gone.
class Sessions
{
public:
    static Sessions& Instance()
    {
        static auto* const all = new Sessions;  // the plug-in may call until the very end of the process
        return *all;
    }

    std::uintptr_t Add(std::weak_ptr<EventHub> hub)
    {
        std::lock_guard const lock(m_lock);
        m_hubs[++m_newest] = std::move(hub);
        return m_newest;
    }
    void Remove(std::uintptr_t session)
    {
        std::lock_guard const lock(m_lock);
        m_hubs.erase(session);
    }
    std::shared_ptr<EventHub> Find(std::uintptr_t session)
    {
        std::lock_guard const lock(m_lock);
        auto const found = m_hubs.find(session);
        return found == m_hubs.end() ? nullptr : found->second.lock();
    }

private:
    std::mutex m_lock;
    std::map<std::uintptr_t, std::weak_ptr<EventHub>> m_hubs;
    std::uintptr_t m_newest = 0;
};
}  // namespace

EventHub::~EventHub() { Stop(); }

void* EventHub::BeginSession()
{
    EndSession();
    auto const session = Sessions::Instance().Add(weak_from_this());
    std::lock_guard const lock(m_lock);
    m_session = session;
    return reinterpret_cast<void*>(session);
}

void EventHub::EndSession()
{
    std::lock_guard const lock(m_lock);
    Sessions::Instance().Remove(std::exchange(m_session, 0));
    ++m_epoch;
    for (auto const& subscriber : m_subscribers)
        subscriber->m_pending.DropTickets();
}

void EventHub::LeaveServer()
{
    EndSession();
    std::lock_guard const lock(m_lock);
    ++m_visit;
    for (auto const& subscriber : m_subscribers)
        subscriber->m_pending.DropServer();
}

void EventHub::WaitForHandlers() const
{
    Lock lock(m_lock);
    auto const self = std::this_thread::get_id();
    m_handled.wait(lock,
                   [this, self]
                   {
                       return std::all_of(m_subscribers.begin(), m_subscribers.end(),
                                          [self](auto const& subscriber) {
                                              return subscriber->m_runner == std::thread::id() ||
                                                     subscriber->m_runner == self;
                                          });
                   });
}

// On a thread of the plug-in's.
void EventHub::Notified(void* token, int kind, int id, int, int type, void* data)
{
    auto const session = reinterpret_cast<std::uintptr_t>(token);
    auto const hub = Sessions::Instance().Find(session);
    if (!hub ||
        (kind != TicketEvent::Changed && kind != TicketEvent::Created && kind != TicketEvent::Deleted))
        return;
    TicketEvent event{static_cast<TicketEvent::KIND>(kind), {type, id}};
    if (kind == TicketEvent::Changed)
        event.keys = ChangesOf(static_cast<SETMULTIPAR const*>(data));
    hub->Take(session, event);
}

void EventHub::Take(std::uintptr_t session, TicketEvent const& event)
{
    std::lock_guard const lock(m_lock);
    if (session != m_session)
        return;
    for (auto const& subscriber : m_subscribers)
        subscriber->m_pending.Add(subscriber->m_interest, event);
    m_work.notify_all();
}

void EventHub::Publish(Event const& event)
{
    std::lock_guard const lock(m_lock);
    for (auto const& subscriber : m_subscribers)
        subscriber->m_pending.Add(subscriber->m_interest, event);
    m_work.notify_all();
}

void EventHub::PublishUnheard(std::set<TicketAddress> const& tickets)
{
    std::lock_guard const lock(m_lock);
    for (auto const& subscriber : m_subscribers)
        for (TicketAddress const ticket : tickets)
            subscriber->m_pending.AddUnheard(subscriber->m_interest, ticket);
    m_work.notify_all();
}

std::shared_ptr<Subscriber> EventHub::Add(Interest interest, Executor executor, Subscription::Handler handler,
                                          std::chrono::milliseconds interval)
{
    auto subscriber = std::make_shared<Subscriber>(weak_from_this(), std::move(interest), std::move(executor),
                                                   std::move(handler), interval);
    std::lock_guard const lock(m_lock);
    if (!m_thread.joinable() && !m_isStopped)
        m_thread = std::thread([self = shared_from_this()] { self->Run(); });  // first, since it may throw
    m_subscribers.push_back(subscriber);
    return subscriber;
}

void EventHub::Remove(Subscriber& subscriber)
{
    Lock lock(m_lock);
    subscriber.m_isOver = true;
    subscriber.m_pending = {};
    m_handled.wait(lock, [this, &subscriber] { return !IsCalledByAnother(subscriber); });
    m_subscribers.erase(std::remove_if(m_subscribers.begin(), m_subscribers.end(),
                                       [&subscriber](auto const& each) { return each.get() == &subscriber; }),
                        m_subscribers.end());
    if (subscriber.m_runner != std::thread::id() || m_posting == &subscriber)
        return;  // one of them is what calls this
    Executor const executor = std::exchange(subscriber.m_executor, nullptr);
    Subscription::Handler const handler = std::exchange(subscriber.m_handler, nullptr);
    lock.unlock();  // what the caller has bound to them ends here, on his thread, and under no lock
}

// Whether its handler or its executor runs on another thread than this one.
bool EventHub::IsCalledByAnother(Subscriber const& subscriber) const
{
    auto const self = std::this_thread::get_id();
    return (subscriber.m_runner != std::thread::id() && subscriber.m_runner != self) ||
           (m_posting == &subscriber && m_poster != self);
}

std::vector<Interest> EventHub::Interests() const
{
    std::lock_guard const lock(m_lock);
    std::vector<Interest> interests;
    for (auto const& subscriber : m_subscribers)
        if (!subscriber->m_isOver)
            interests.push_back(subscriber->m_interest);
    return interests;
}

void EventHub::Stop()
{
    {
        std::lock_guard const lock(m_lock);
        m_isStopped = true;
        m_work.notify_all();
    }
    WaitForHandlers();
    if (!m_thread.joinable())
        return;
    if (m_thread.get_id() == std::this_thread::get_id())
        m_thread.detach();  // an executor that ran its task at once, against its rule
    else
        m_thread.join();
}

void EventHub::Run()
{
    Lock lock(m_lock);
    while (!m_isStopped)
    {
        auto const next = PostWhatIsDue(lock);
        if (m_isStopped)
            break;
        if (next == Clock::time_point::max())
            m_work.wait(lock);
        else
            m_work.wait_until(lock, next);
    }
}

// When the next one is due. Unlocks while it posts.
EventHub::Clock::time_point EventHub::PostWhatIsDue(Lock& lock)
{
    auto const now = Clock::now();
    auto next = Clock::time_point::max();
    std::vector<std::shared_ptr<Subscriber>> due;
    for (auto const& subscriber : m_subscribers)
    {
        if (subscriber->m_isPosted || subscriber->m_isOver || subscriber->HasNothing())
            continue;
        if (subscriber->m_due > now)
            next = std::min(next, subscriber->m_due);
        else
            due.push_back(subscriber);
    }
    if (due.empty())
        return next;
    for (auto& subscriber : due)
        Post(std::move(subscriber), lock);
    return now;  // look again: something may have come meanwhile
}

// The end of the subscription waits until its executor has returned: what the executor uses may go then.
void EventHub::Post(std::shared_ptr<Subscriber> subscriber, Lock& lock)
{
    if (subscriber->m_isOver || m_isStopped)
        return;
    subscriber->m_isPosted = true;
    m_posting = subscriber.get();
    m_poster = std::this_thread::get_id();
    lock.unlock();
    subscriber->m_executor(
        [weak = std::weak_ptr<Subscriber>(subscriber)]
        {
            if (auto const target = weak.lock())
                target->Deliver();
        });
    lock.lock();
    m_posting = nullptr;
    m_handled.notify_all();
    lock.unlock();
    subscriber.reset();  // the last one, if the executor itself has ended the subscription
    lock.lock();
}

Subscriber::Subscriber(std::weak_ptr<EventHub> hub, Interest interest, Executor executor,
                       Subscription::Handler handler, std::chrono::milliseconds interval)
    : m_hub(std::move(hub)), m_interest(std::move(interest)), m_executor(std::move(executor)),
      m_handler(std::move(handler)), m_interval(interval)
{
}

void Subscriber::End()
{
    if (auto const hub = m_hub.lock())
        hub->Remove(*this);
    if (onEnd)
        std::exchange(onEnd, nullptr)();
}

bool Subscriber::IsOver() const
{
    auto const hub = m_hub.lock();
    if (!hub)
        return true;
    std::lock_guard const lock(hub->m_lock);
    return m_isOver || hub->m_isStopped;
}

// Whether the event belongs to a session or a stay at a server that has ended since.
bool Subscriber::IsOld(Event const& event, Batch const& batch) const
{
    bool const isOfAServer =
        std::holds_alternative<ServerLost>(event) || std::holds_alternative<ServerBack>(event);
    bool const isOfATransfer =
        std::holds_alternative<TransferProgressed>(event) || std::holds_alternative<TransferEnded>(event);
    auto const hub = m_hub.lock();
    if (isOfATransfer || !hub)
        return !isOfATransfer;
    std::lock_guard const lock(hub->m_lock);
    return isOfAServer ? hub->m_visit != batch.visit : hub->m_epoch != batch.epoch;
}

// In the executor. What a handler throws goes to the executor, and the rest of the batch is delivered next.
void Subscriber::Deliver()
{
    auto const hub = m_hub.lock();
    if (!hub)
        return;
    struct Run
    {
        Subscriber& self;
        EventHub& hub;
        ~Run()
        {
            std::lock_guard const lock(hub.m_lock);
            self.m_runner = {};
            self.m_isPosted = false;
            self.m_due = EventHub::Clock::now() + self.m_interval;
            hub.m_handled.notify_all();
            hub.m_work.notify_all();
        }
    };
    EventHub::Lock lock(hub->m_lock);
    if (m_isOver || hub->m_isStopped)
        return;
    if (m_batch.IsEmpty())
        m_batch = {hub->m_epoch, hub->m_visit, m_pending.Take()};
    m_runner = std::this_thread::get_id();
    Run const run{*this, *hub};
    lock.unlock();
    while (!m_batch.IsEmpty() && !IsOver())
        if (Event const& event = m_batch.events[m_batch.next++]; !IsOld(event, m_batch))
            m_handler(event);
}
}  // namespace comgui::detail
