#include "standin/server/sessions/NotificationService.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/server/files/Report.h"
#include <algorithm>
#include <functional>

namespace standin
{
namespace
{
bool IsTypeAsAWhole(TicketAddress tickets)
{
    return tickets.id == TICKET_ID_ALL && IsValid(TicketAddress{tickets.type, 0});
}

bool Covers(TicketAddress tickets, TicketAddress subscription)
{
    return tickets == AllTickets || tickets == subscription ||
           (tickets.id == TICKET_ID_ALL && tickets.type == subscription.type);
}

std::size_t WeightOf(ChangedParameters const& changes)
{
    std::size_t weight = changes.empty() ? 1 : 0;
    for (ChangedParameter const& change : changes)
        weight += 1 + (change.value.text ? change.value.text->bytes.size() / 1024 : 0);
    return weight;
}

// Records of one key come in the order of their writes, keys in the order of their first.
void GroupByKey(ChangedParameters& changes)
{
    std::unordered_map<Key, std::size_t> first;
    for (ChangedParameter const& change : changes)
        first.try_emplace(change.key.Get(), first.size());
    std::stable_sort(changes.begin(), changes.end(),
                     [&](auto const& left, auto const& right)
                     { return first.find(left.key.Get())->second < first.find(right.key.Get())->second; });
}

// So long a notification waits for the next one, behind which it is to come.
constexpr std::chrono::seconds LongestSwap(1);

ChangedParameter Copy(ChangedParameter const& change)
{
    return {change.key, change.pos, change.value.Copy()};
}

ChangedParameters CopyOf(ChangedParameters const& changes)
{
    ChangedParameters copy;
    copy.reserve(changes.size());
    for (ChangedParameter const& change : changes)
        copy.push_back(Copy(change));
    return copy;
}
}  // namespace

bool NotificationService::Listener::Wants(TicketAddress ticket) const
{
    return subscriptions.contains(ticket) || subscriptions.contains({ticket.type, TICKET_ID_ALL});
}

bool NotificationService::Listener::Wants(TicketAddress ticket, std::string_view key) const
{
    auto const selects = [&](TicketAddress tickets)
    {
        auto const subscription = subscriptions.find(tickets);
        return subscription != subscriptions.end() && subscription->second.Selects(key);
    };
    return selects(ticket) || selects({ticket.type, TICKET_ID_ALL});
}

NotificationService::~NotificationService()
{
    {
        std::lock_guard const lock(m_lock);
        m_stopped = true;
    }
    m_work.notify_all();
    if (m_thread.joinable())
        m_thread.join();
}

void NotificationService::Stop(std::chrono::milliseconds patience)
{
    Lock lock(m_lock);
    m_stopped = true;
    m_work.notify_all();
    if (std::this_thread::get_id() == m_thread.get_id())
        return;
    if (!m_done.wait_for(lock, patience, [this] { return m_running == 0; }))
        return;
    // What the client's code keeps for the thread goes with the thread, not in the middle of the process's
    // end.
    std::thread ending = std::exchange(m_thread, {});
    lock.unlock();
    if (ending.joinable())
        ending.join();
}

NotificationService::Listener* NotificationService::Find(Session const& session, int id) const
{
    auto const found = std::find_if(m_listeners.begin(), m_listeners.end(),
                                    [&](auto const& listener)
                                    { return listener->id == id && listener->session == session.Number(); });
    return found == m_listeners.end() ? nullptr : found->get();
}

bool NotificationService::Register(Session const& session, int id, Callback callback)
{
    auto listener =
        std::make_shared<Listener>(Listener{session.Number(), session.Who().name, id, std::move(callback)});
    Lock lock(m_lock);
    if (m_stopped)
        return false;
    if (!m_thread.joinable())
        m_thread = std::thread([this] { Run(); });
    while (RemoveOne(session, lock))
        ;
    // Whoever ends a session does so before removing it, so it cannot slip in behind.
    if (session.Ended())
        return false;
    m_listeners.push_back(std::move(listener));
    return true;
}

void NotificationService::Remove(Session const& session)
{
    Lock lock(m_lock);
    while (RemoveOne(session, lock))
        ;
}

// Lets go of the lock where it waits for a callback.
bool NotificationService::RemoveOne(Session const& session, Lock& lock)
{
    auto const found =
        std::find_if(m_listeners.begin(), m_listeners.end(),
                     [&](auto const& listener) { return listener->session == session.Number(); });
    if (found == m_listeners.end())
        return false;
    auto const listener = *found;
    m_listeners.erase(found);
    listener->gone = true;
    m_subscriptions -= listener->subscriptions.size();
    listener->subscriptions.clear();
    Withdraw(*listener);
    WaitFor(listener->id, lock);
    return true;
}

bool NotificationService::Enable(Session const& session, int id, TicketAddress tickets, KeyFilter keys)
{
    if (!IsValid(tickets) && !IsTypeAsAWhole(tickets))
        return false;
    std::lock_guard const lock(m_lock);
    Listener* const listener = Find(session, id);
    if (!listener)
        return false;
    if (listener->subscriptions.insert_or_assign(tickets, std::move(keys)).second)
        ++m_subscriptions;
    return true;
}

bool NotificationService::Disable(Session const& session, int id, TicketAddress tickets)
{
    if (tickets != AllTickets && !IsValid(tickets) && !IsTypeAsAWhole(tickets))
        return false;
    Lock lock(m_lock);
    Listener* const listener = Find(session, id);
    if (!listener)
        return false;
    m_subscriptions -= std::erase_if(listener->subscriptions, [&](auto const& subscription)
                                     { return Covers(tickets, subscription.first); });
    Withdraw(*listener);
    WaitFor(id, lock);
    return true;
}

// Takes back what waits for a listener and is wanted no longer.
void NotificationService::Withdraw(Listener& listener)
{
    std::erase_if(m_waiting,
                  [&](Message& message)
                  {
                      bool const isSwitched = listener.gone || message.kind != TransferEnded;
                      if (message.listener.get() != &listener || !isSwitched)
                          return false;
                      Unqueue(message);
                      auto const isUnwanted = [&](ChangedParameter const& change)
                      { return !listener.Wants(message.ticket, change.key->Text()); };
                      bool const hadChanges = !message.changes.empty();
                      std::erase_if(message.changes, isUnwanted);
                      if (!listener.Wants(message.ticket) || (hadChanges && message.changes.empty()))
                          return true;
                      message.weight = WeightOf(message.changes);
                      listener.pending += message.weight;
                      return false;
                  });
    listener.heldUntil = {};
    for (Message const& message : m_waiting)
        if (message.listener.get() == &listener && !message.isSwapped)
            listener.heldUntil = std::max(listener.heldUntil, message.due);
}

void NotificationService::Unqueue(Message& message)
{
    message.listener->pending -= message.weight;
    message.listener->ends -= message.kind == TransferEnded ? 1 : 0;
}

std::size_t NotificationService::UntoldEnds(Session const& session) const
{
    std::lock_guard const lock(m_lock);
    std::size_t ends = 0;
    for (auto const& listener : m_listeners)
        ends += listener->session == session.Number() ? listener->ends : 0;
    return ends;
}

void NotificationService::WaitFor(int id, Lock& lock)
{
    if (std::this_thread::get_id() == m_thread.get_id())
        return;  // from the callback itself, which cannot wait for its own end
    m_done.wait(lock, [this, id, run = m_run] { return m_running != id || m_run != run; });
}

bool NotificationService::Wants(TicketAddress ticket) const
{
    if (m_subscriptions.load(std::memory_order_relaxed) == 0)
        return false;
    std::lock_guard const lock(m_lock);
    return std::any_of(m_listeners.begin(), m_listeners.end(),
                       [&](auto const& listener) { return listener->Wants(ticket); });
}

bool NotificationService::HasRoom() const
{
    std::lock_guard const lock(m_lock);
    return std::all_of(m_listeners.begin(), m_listeners.end(),
                       [](auto const& listener) { return listener->pending < PendingLimit; });
}

void NotificationService::Post(NotificationKind kind, TicketAddress ticket,
                               ChangedParameters changes) noexcept
{
    if (m_subscriptions.load(std::memory_order_relaxed) == 0)
        return;
    try
    {
        GroupByKey(changes);
        std::lock_guard const lock(m_lock);
        for (auto const& listener : m_listeners)
            Queue(listener, kind, ticket, changes);
        m_work.notify_one();
    }
    catch (std::exception const& error)
    {
        Report({"a notification of ticket ", std::to_string(ticket.type), "/", std::to_string(ticket.id),
                " is lost: ", error.what(), "; clients should read it anew"});
    }
}

void NotificationService::TransferHasEnded(unsigned long long session, int code,
                                           ChangedParameters parameters) noexcept
{
    try
    {
        std::lock_guard const lock(m_lock);
        auto const found = std::find_if(m_listeners.begin(), m_listeners.end(),
                                        [&](auto const& listener) { return listener->session == session; });
        if (found == m_listeners.end() || m_stopped)
            return;
        Append({*found, TransferEnded, {}, code, std::move(parameters), 0});
        m_work.notify_one();
    }
    catch (std::exception const& error)
    {
        Report({"a notification is lost: ", error.what()});
    }
}

void NotificationService::Queue(std::shared_ptr<Listener> const& listener, NotificationKind kind,
                                TicketAddress ticket, ChangedParameters const& changes)
{
    if (m_stopped || !listener->Wants(ticket))
        return;
    Message message{listener, kind, ticket, 0, {}, 0};
    for (ChangedParameter const& change : changes)
        if (listener->Wants(ticket, change.key->Text()))
            message.changes.push_back(Copy(change));
    if (message.changes.empty() && !changes.empty())
        return;
    Append(std::move(message));
}

void NotificationService::Append(Message message)
{
    message.weight = WeightOf(message.changes);
    message.due = message.listener->heldUntil;
    if (m_troubles.Any()) [[unlikely]]
        AppendTroubled(std::move(message));
    else
        Enqueue(std::move(message));
}

void NotificationService::AppendTroubled(Message message)
{
    Listener& listener = *message.listener;
    if (IsUnreachable(listener))
        return;
    bool const isOfTicket = message.kind != TransferEnded;
    Troubles::Telling const telling = m_troubles.OnNotification(
        {.ticket = isOfTicket ? std::optional(message.ticket) : std::nullopt, .user = listener.user});
    if (telling.isLost)
        return;
    auto const now = Clock::now();
    if (telling.late.count() > 0)
        message.due = listener.heldUntil = std::max(listener.heldUntil, now + telling.late);
    if (telling.isTwice)
        Enqueue({message.listener, message.kind, message.ticket, message.code, CopyOf(message.changes),
                 message.weight, message.due});
    if (telling.isSwapped && !HasSwapped(listener))
    {
        message.due = std::max(message.due, now + LongestSwap);
        message.isSwapped = true;
    }
    Enqueue(std::move(message));
}

void NotificationService::Enqueue(Message message)
{
    Listener& listener = *message.listener;
    listener.pending += message.weight;
    listener.ends += message.kind == TransferEnded ? 1 : 0;
    bool const isSwapped = message.isSwapped;
    auto const due = message.due;
    m_waiting.push_back(std::move(message));
    if (m_hasSwapped && !isSwapped)
        ReleaseSwapped(listener, due);
    m_hasSwapped = m_hasSwapped || isSwapped;
}

// The server is away, or was meanwhile and knows the session no more.
bool NotificationService::IsUnreachable(Listener const& listener) const
{
    return m_troubles.Any() && (m_troubles.IsAway() || m_troubles.HasLost(listener.session));
}

bool NotificationService::HasSwapped(Listener const& listener) const
{
    return std::any_of(m_waiting.begin(), m_waiting.end(),
                       [&](Message const& message)
                       { return message.isSwapped && message.listener.get() == &listener; });
}

// They go behind what was put into the queue last.
void NotificationService::ReleaseSwapped(Listener const& listener, Clock::time_point due)
{
    auto const isHeld = [&](Message const& message)
    { return message.isSwapped && message.listener.get() == &listener; };
    auto const held = std::stable_partition(m_waiting.begin(), m_waiting.end(), std::not_fn(isHeld));
    for (auto message = held; message != m_waiting.end(); ++message)
    {
        message->isSwapped = false;
        message->due = due;
    }
    m_hasSwapped = std::any_of(m_waiting.begin(), m_waiting.end(),
                               [](Message const& message) { return message.isSwapped; });
}

// Most are due at once, and need no clock.
std::deque<NotificationService::Message>::iterator NotificationService::FirstDue()
{
    if (!m_waiting.empty() && m_waiting.front().due == Clock::time_point{})
        return m_waiting.begin();
    auto const now = Clock::now();
    return std::find_if(m_waiting.begin(), m_waiting.end(),
                        [now](Message const& message) { return message.due <= now; });
}

// Until there is something due, or the end.
void NotificationService::WaitForWork(Lock& lock)
{
    while (!m_stopped && FirstDue() == m_waiting.end())
    {
        if (m_waiting.empty())
        {
            m_work.wait(lock);
            continue;
        }
        auto const next =
            std::min_element(m_waiting.begin(), m_waiting.end(),
                             [](Message const& left, Message const& right) { return left.due < right.due; });
        m_work.wait_until(lock, Clock::time_point(next->due));
    }
}

void NotificationService::Run()
{
    Lock lock(m_lock);
    for (;;)
    {
        WaitForWork(lock);
        if (m_stopped)
            return;
        {
            auto const next = FirstDue();
            Message message = std::move(*next);
            m_waiting.erase(next);
            Unqueue(message);
            if (IsUnreachable(*message.listener)) [[unlikely]]
                continue;
            m_running = message.listener->id;
            ++m_run;
            lock.unlock();
            Deliver(message);
        }
        lock.lock();
        m_running = 0;
        m_done.notify_all();
    }
}

void NotificationService::Deliver(Message& message) noexcept
{
    try
    {
        message.listener->callback(
            {message.kind, message.ticket, message.code, message.listener->id, message.changes});
    }
    catch (std::exception const& error)
    {
        Report({"notification id ", std::to_string(message.listener->id),
                ": the callback failed: ", error.what()});
    }
    catch (...)
    {
        Report({"notification id ", std::to_string(message.listener->id), ": the callback failed"});
    }
}
}  // namespace standin
