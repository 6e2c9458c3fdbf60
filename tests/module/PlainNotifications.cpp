#include "tests/module/PlainNotifications.h"

#include "comgui/ticket/TICKET_ID.h"
#include <algorithm>

bool PLAIN_FILTER::Selects(std::string const& key) const
{
    auto const matches = [&](std::string const& pattern)
    {
        bool const isBeginning = pattern.ends_with('*');
        return isBeginning ? key.starts_with(pattern.substr(0, pattern.size() - 1)) : key == pattern;
    };
    return keys.empty() || std::any_of(keys.begin(), keys.end(), matches);
}

std::string PLAIN_NOTIFICATIONS::NOTIFICATION::Text() const
{
    std::string text = kind + " " + std::to_string(ticket.first) + "/" + std::to_string(ticket.second);
    for (PLAIN_CHANGE const& change : changes)
        text += " " + WalkedLine(change.key, change.pos, change.value.text);
    return text;
}

bool PLAIN_NOTIFICATIONS::CLIENT_MODEL::Wants(PLAIN_ADDRESS ticket) const
{
    return wanted.contains(ticket) || wanted.contains({ticket.first, TICKET_ID_ALL});
}

bool PLAIN_NOTIFICATIONS::CLIENT_MODEL::Wants(PLAIN_ADDRESS ticket, std::string const& key) const
{
    auto const selects = [&](PLAIN_ADDRESS tickets)
    {
        auto const found = wanted.find(tickets);
        return found != wanted.end() && found->second.Selects(key);
    };
    return selects(ticket) || selects({ticket.first, TICKET_ID_ALL});
}

std::size_t PLAIN_NOTIFICATIONS::Add(int id)
{
    m_clients.push_back({id});
    return m_clients.size() - 1;
}

void PLAIN_NOTIFICATIONS::End(std::size_t client)
{
    m_clients[client].isGone = true;
    m_clients[client].wanted.clear();
    Withdraw(client);
}

void PLAIN_NOTIFICATIONS::Enable(std::size_t client, PLAIN_ADDRESS tickets, PLAIN_FILTER keys)
{
    m_clients[client].wanted.insert_or_assign(tickets, std::move(keys));
}

void PLAIN_NOTIFICATIONS::Disable(std::size_t client, PLAIN_ADDRESS tickets)
{
    bool const isAll = tickets == PLAIN_ADDRESS(TICKET_ID_ALL, TICKET_ID_ALL);
    std::erase_if(m_clients[client].wanted,
                  [&](auto const& each)
                  {
                      bool const isOfType =
                          tickets.second == TICKET_ID_ALL && each.first.first == tickets.first;
                      return isAll || isOfType || each.first == tickets;
                  });
    Withdraw(client);
}

// Records of one key are neighbours.
void PLAIN_NOTIFICATIONS::Written(PLAIN_ADDRESS ticket, std::vector<PLAIN_CHANGE> const& changes)
{
    std::vector<PLAIN_CHANGE> grouped;
    for (PLAIN_CHANGE const& change : changes)
    {
        auto const isOfKey = [&](PLAIN_CHANGE const& each) { return each.key == change.key; };
        auto const last = std::find_if(grouped.rbegin(), grouped.rend(), isOfKey);
        grouped.insert(last == grouped.rend() ? grouped.end() : last.base(), change);
    }
    if (!grouped.empty())
        Post({"changed", ticket, std::move(grouped)});
}

void PLAIN_NOTIFICATIONS::TransferEnded(std::size_t client, int code,
                                        std::vector<PLAIN_CHANGE> const& records)
{
    Give(client, {"ended", {0, code}, records});
}

void PLAIN_NOTIFICATIONS::Post(NOTIFICATION const& notification)
{
    for (std::size_t client = 0; client < m_clients.size(); ++client)
        if (m_clients[client].Wants(notification.ticket))
            Give(client, notification);
}

void PLAIN_NOTIFICATIONS::Give(std::size_t client, NOTIFICATION notification)
{
    bool const hadChanges = !notification.changes.empty();
    if (!notification.IsTransfer())
        std::erase_if(notification.changes, [&](PLAIN_CHANGE const& change)
                      { return !m_clients[client].Wants(notification.ticket, change.key); });
    if (hadChanges && notification.changes.empty())
        return;
    if (m_isHeld)
        m_waiting.emplace_back(client, std::move(notification));
    else
        m_clients[client].news += notification.Text() + "\n";
}

// Of the end of a transfer a client is told whatever it has switched off, but not once it is gone.
void PLAIN_NOTIFICATIONS::Withdraw(std::size_t client)
{
    auto const waiting = std::exchange(m_waiting, {});
    for (auto const& [whose, notification] : waiting)
    {
        CLIENT_MODEL const& other = m_clients[whose];
        bool const isAsBefore = whose != client || (notification.IsTransfer() && !other.isGone);
        if (isAsBefore)
            m_waiting.emplace_back(whose, notification);
        else if (other.Wants(notification.ticket))
            Give(whose, notification);
    }
}

void PLAIN_NOTIFICATIONS::Release()
{
    m_isHeld = false;
    for (auto const& [client, notification] : std::exchange(m_waiting, {}))
        m_clients[client].news += notification.Text() + "\n";
}

std::string PLAIN_NOTIFICATIONS::News()
{
    std::string news;
    for (CLIENT_MODEL& client : m_clients)
        if (std::string const own = std::exchange(client.news, {}); !own.empty())
            news += "notification id " + std::to_string(client.id) + ":\n" + own;
    return news;
}
