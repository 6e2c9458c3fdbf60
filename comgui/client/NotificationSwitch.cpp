#include "comgui/client/NotificationSwitch.h"

#include "comgui/access/MTICKET_ADMIN.h"
#include "comgui/ticket/TICKET_ID.h"
#include <algorithm>
#include <utility>

namespace comgui::detail
{
void NotificationSwitch::BeginSession(MTICKET_ACCESS const* container, int notification)
{
    Interrupt();
    std::lock_guard const lock(m_switching);
    m_container = container;
    m_notification = notification;
    m_enabled.clear();
    m_refused.clear();
    m_isRefused = false;
    m_isLeaving = false;
}

void NotificationSwitch::EndSession()
{
    Interrupt();
    std::lock_guard const lock(m_switching);
    m_container = nullptr;
    m_enabled.clear();
}

// What is switched on between the question of what subscribers want and the end of the turn may be for a turn
// that was asked for meanwhile; hence the news that are kept.
void NotificationSwitch::Switch()
{
    std::lock_guard const switching(m_switching);
    std::unique_lock waiting(m_waiting);
    auto const turn = m_asked;
    waiting.unlock();
    Wanted const wanted = Union(m_hub.Interests());
    auto unheard = SwitchOff(wanted);
    unheard.merge(SwitchOn(wanted));
    waiting.lock();
    bool const isLate = m_late > std::exchange(m_done, turn);
    m_served.notify_all();
    bool const isLast = turn == m_asked;
    waiting.unlock();
    if (isLate)
        unheard.merge(m_news);
    if (isLate || isLast)
        m_news.clear();
    if (!m_isLeaving)
        m_hub.PublishUnheard(unheard);
}

void NotificationSwitch::Start()
{
    std::lock_guard const lock(m_waiting);
    if (!m_worker && !m_isStopped)
        m_worker = std::make_unique<Worker>([](std::function<void()> const& task) { task(); });
}

std::uint64_t NotificationSwitch::Ask()
{
    std::lock_guard const lock(m_waiting);
    if (m_worker)
    {
        auto const turn = m_asked + 1;
        m_worker->Do([this, turn] { Serve(turn); }, [] {});
        m_asked = turn;
    }
    return m_asked;
}

void NotificationSwitch::Await(std::uint64_t turn, std::chrono::milliseconds patience)
{
    std::unique_lock lock(m_waiting);
    if (!m_served.wait_for(lock, patience, [this, turn] { return m_done >= turn || m_isStopped; }))
        m_late = std::max(m_late, turn);
}

// Many that were asked for while one was under way are one.
void NotificationSwitch::Serve(std::uint64_t turn)
{
    std::unique_lock lock(m_waiting);
    bool const isDone = m_done >= turn;
    lock.unlock();
    if (!isDone)
        Switch();
}

void NotificationSwitch::Stop()
{
    Interrupt();
    std::unique_lock lock(m_waiting);
    m_isStopped = true;
    m_served.notify_all();
    std::unique_ptr<Worker> const worker = std::move(m_worker);
    lock.unlock();  // its work takes the lock
}

// By ticket, or by type: the keys that somebody wants.
NotificationSwitch::Wanted NotificationSwitch::Union(std::vector<Interest> const& interests)
{
    Wanted wanted;
    auto const add = [&wanted](TicketAddress ticket, Interest const& interest)
    {
        auto const [place, isNew] = wanted.try_emplace(ticket, interest.keys.begin(), interest.keys.end());
        if (isNew)
            return;
        if (interest.keys.empty())
            place->second.clear();
        else if (!place->second.empty())
            place->second.insert(interest.keys.begin(), interest.keys.end());
    };
    for (Interest const& interest : interests)
    {
        for (int const type : interest.types)
            add({type, TICKET_ID_ALL}, interest);
        for (TicketAddress const ticket : interest.tickets)
            add(ticket, interest);
    }
    return wanted;
}

// Gives what went off although it may be wanted, and is not heard of until it is on again.
std::set<TicketAddress> NotificationSwitch::SwitchOff(Wanted const& wanted)
{
    std::set<TicketAddress> unheard;
    auto const* const admin = m_container ? MTICKET_ADMIN::Of(m_container) : nullptr;
    for (auto known = m_enabled.begin(); admin && !m_isLeaving && known != m_enabled.end();)
    {
        TicketAddress const address = known->first;
        if (wanted.count(address) != 0)
        {
            ++known;
            continue;
        }
        admin->DisableNotification(address.type, address.id, m_notification);
        known = m_enabled.erase(known);
        if (address.id != TICKET_ID_ALL)
            continue;
        // Single tickets of the type went with it.
        auto const end = m_enabled.lower_bound({address.type + 1, TICKET_ID_ALL});
        for (known = m_enabled.lower_bound(address); known != end; known = m_enabled.erase(known))
            unheard.insert(known->first);
    }
    return unheard;
}

// Gives what went on that was refused before, and was not heard of meanwhile.
std::set<TicketAddress> NotificationSwitch::SwitchOn(Wanted const& wanted)
{
    std::set<TicketAddress> unheard;
    std::set<TicketAddress> refused;
    auto const* const admin = m_container ? MTICKET_ADMIN::Of(m_container) : nullptr;
    for (auto const& [address, keys] : wanted)
    {
        auto const known = m_enabled.find(address);
        if (known != m_enabled.end() && known->second == keys)
            continue;
        if (!admin || m_isLeaving)
            return unheard;
        std::vector<char const*> table;
        for (std::string const& key : keys)
            table.push_back(key.c_str());
        table.push_back(nullptr);
        if (!admin->EnableNotification(address.type, address.id, m_notification, table.data()))
        {
            refused.insert(address);
            continue;
        }
        m_enabled[address] = keys;
        m_news.insert(address);
        if (m_refused.count(address) != 0)
            unheard.insert(address);
    }
    m_refused = std::move(refused);
    m_isRefused = !m_refused.empty();
    return unheard;
}
}  // namespace comgui::detail
