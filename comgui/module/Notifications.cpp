#include "comgui/module/Notifications.h"

#include "comgui/ticket/TICKET_ID.h"
#include <algorithm>
#include <cstdio>
#include <exception>
#include <iterator>
#include <utility>

namespace comgui::plugin
{
namespace
{
constexpr Address AllTypes{-3, TICKET_ID_ALL};

Address WholeType(int type) { return {type, TICKET_ID_ALL}; }

bool CanBeSwitched(Address tickets)
{
    return IsTicket(tickets) || (tickets.id == TICKET_ID_ALL && IsTicket({tickets.type, 0}));
}
}  // namespace

KeySelection const* Notifications::Listener::Wants(Address ticket) const
{
    auto const one = wanted.find(ticket);
    auto const type = wanted.find(WholeType(ticket.type));
    if (one != wanted.end())
        return &one->second;
    return type == wanted.end() ? nullptr : &type->second;
}

Notifications::~Notifications() { Stop(std::chrono::hours(24)); }

void Notifications::Changed(Address ticket, std::vector<Parameter> const& parameters)
{
    Post(ParametersChanged, ticket, parameters);
}

void Notifications::Created(Address ticket) { Post(TicketCreated, ticket, {}); }

void Notifications::Deleted(Address ticket) { Post(TicketDeleted, ticket, {}); }

void Notifications::Tell(Session const& session, int kind, int argA, int code,
                         std::vector<Parameter> const& parameters)
{
    std::lock_guard const lock(m_lock);
    for (auto const& listener : m_listeners)
        if (listener->session == &session)
            Queue({listener, kind, argA, code, parameters});
}

void Notifications::Post(int kind, Address ticket, std::vector<Parameter> const& parameters)
{
    std::lock_guard const lock(m_lock);
    for (auto const& listener : m_listeners)
    {
        KeySelection const* const keys = listener->Wants(ticket);
        if (!keys)
            continue;
        std::vector<Parameter> selected;
        std::copy_if(parameters.begin(), parameters.end(), std::back_inserter(selected),
                     [keys](Parameter const& parameter) { return keys->Selects(parameter.key); });
        if (kind != ParametersChanged || !selected.empty())
            Queue({listener, kind, ticket.id, ticket.type, std::move(selected), ticket});
    }
}

void Notifications::Queue(Message message)
{
    if (m_isStopped)
        return;
    m_waiting.push_back(std::move(message));
    m_work.notify_one();
}

int Notifications::NewId()
{
    std::lock_guard const lock(m_lock);
    return ++m_newestId;
}

bool Notifications::IsStopped()
{
    std::lock_guard const lock(m_lock);
    return m_isStopped;
}

bool Notifications::Register(Session const& session, int id, Callback callback)
{
    if (IsStopped())  // asked before Remove, which waits for a call that may hang
        return false;
    Remove(session);
    std::lock_guard const lock(m_lock);
    if (m_isStopped)
        return false;
    auto listener = std::make_shared<Listener>(Listener{&session, id, callback});
    if (!m_thread.joinable())
        m_thread = std::thread([this] { Run(); });
    m_listeners.push_back(std::move(listener));
    return true;
}

std::shared_ptr<Notifications::Listener> Notifications::Find(Session const& session, int id) const
{
    auto const found = std::find_if(m_listeners.begin(), m_listeners.end(),
                                    [&](auto const& listener)
                                    { return listener->session == &session && listener->id == id; });
    return found == m_listeners.end() ? nullptr : *found;
}

bool Notifications::Enable(Session const& session, int id, Address tickets, KeySelection keys)
{
    std::lock_guard const lock(m_lock);
    auto const listener = Find(session, id);
    if (!listener || !CanBeSwitched(tickets))
        return false;
    listener->wanted.insert_or_assign(tickets, std::move(keys));
    return true;
}

bool Notifications::Disable(Session const& session, int id, Address tickets)
{
    Lock lock(m_lock);
    auto const listener = Find(session, id);
    bool const isAll = tickets == AllTypes;
    if (!listener || !(isAll || CanBeSwitched(tickets)))
        return false;
    std::erase_if(listener->wanted,
                  [&](auto const& entry)
                  {
                      bool const isOfTheType = tickets == WholeType(entry.first.type);
                      return isAll || isOfTheType || entry.first == tickets;
                  });
    Withdraw(*listener, false);
    WaitFor(*listener, lock);
    return true;
}

void Notifications::Remove(Session const& session)
{
    Lock lock(m_lock);
    auto const found = std::find_if(m_listeners.begin(), m_listeners.end(),
                                    [&](auto const& listener) { return listener->session == &session; });
    if (found == m_listeners.end())
        return;
    auto const listener = *found;
    m_listeners.erase(found);
    Withdraw(*listener, true);
    WaitFor(*listener, lock);
}

// Takes back what waits for the listener: all of it, or what it no longer wants.
void Notifications::Withdraw(Listener const& listener, bool all)
{
    std::erase_if(m_waiting,
                  [&](Message const& message)
                  {
                      if (message.listener.get() != &listener)
                          return false;
                      return all || (message.ticket && !listener.Wants(*message.ticket));
                  });
}

void Notifications::WaitFor(Listener const& listener, Lock& lock)
{
    if (m_thread.get_id() == std::this_thread::get_id())
        return;
    unsigned long long const call = m_calls;
    m_done.wait(lock, [&] { return m_running != &listener || m_calls != call; });
}

void Notifications::Run()
{
    Lock lock(m_lock);
    for (;;)
    {
        m_work.wait(lock, [this] { return m_isStopped || !m_waiting.empty(); });
        if (m_isStopped)
            break;
        Message const message = std::move(m_waiting.front());
        m_waiting.pop_front();
        m_running = message.listener.get();
        ++m_calls;
        lock.unlock();
        try
        {
            message.listener->callback.Tell(message.kind, message.argA, message.listener->id, message.code,
                                            message.parameters);
        }
        catch (...)
        {
            std::fputs("communication plug-in: a client's callback threw\n", stderr);
        }
        lock.lock();
        m_running = nullptr;
        m_done.notify_all();
    }
    m_isOver = true;
    m_done.notify_all();
}

void Notifications::Stop(std::chrono::milliseconds patience)
{
    Lock lock(m_lock);
    m_isStopped = true;
    m_waiting.clear();
    m_work.notify_all();
    if (!m_thread.joinable())
        return;
    std::thread thread = std::exchange(m_thread, {});
    bool const isOver = thread.get_id() != std::this_thread::get_id() &&
                        m_done.wait_for(lock, patience, [this] { return m_isOver; });
    lock.unlock();
    if (isOver)
        thread.join();
    else
        thread.detach();
}
}  // namespace comgui::plugin
