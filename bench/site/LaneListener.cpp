#include "bench/site/LaneListener.h"

#include <unistd.h>

void PrintLine(std::string line)
{
    line += '\n';
    if (write(STDOUT_FILENO, line.data(), line.size()) != static_cast<ssize_t>(line.size()))
        _exit(1);
}

bool LaneListener::Listen(SiteClient& client, std::vector<int> const& types)
{
    bool isEnabled = client.Listen([this](::Heard const& heard) { Hear(heard); });
    for (int const type : types)
        isEnabled = isEnabled && client.Enable(type);
    return isEnabled;
}

std::int64_t LaneListener::Heard(int type, int lane) const
{
    std::lock_guard const lock(m_lock);
    auto const last = m_last.find({type, lane});
    return last == m_last.end() ? 0 : last->second;
}

void LaneListener::Hear(::Heard const& heard)
{
    std::lock_guard const lock(m_lock);
    ++m_changes;
    if (heard.kind == ::Heard::Created || heard.kind == ::Heard::Deleted)
        return HearTicket(heard);
    if (heard.kind != ::Heard::Changed)
        return;
    if (heard.ticket.type == TableType)
        return HearTable(heard);
    for (SETMULTIPAR const* record = heard.records; record->key; ++record)
    {
        std::int64_t const value =
            record->type == PARAM_INT64 ? *static_cast<long long const*>(record->value) : 0;
        if (heard.ticket.type == CounterType)
            Take(CounterType, heard.ticket.id - 1, value);
        else if (heard.ticket.type == ListType)
            Take(ListType, LaneOf(value), CountOf(value));
    }
}

// All of a table is one call.
void LaneListener::HearTable(::Heard const& heard)
{
    std::vector<std::int64_t> table;
    for (SETMULTIPAR const* record = heard.records; record->key; ++record)
        if (record->type == PARAM_INT64)
            table.push_back(*static_cast<long long const*>(record->value));
    if (table.empty() || !SiteClient::IsWhole(table))
        PrintLine("misheard a part of table " + std::to_string(heard.ticket.id));
    else if (heard.ticket.id != SharedTable.id)
        Take(TableType, heard.ticket.id - 1, table.front());
}

void LaneListener::HearTicket(::Heard const& heard)
{
    std::pair const ticket(heard.ticket.type, heard.ticket.id);
    if (heard.kind == ::Heard::Deleted)
        m_created.erase(ticket);
    else if (!m_created.insert(ticket).second)
        PrintLine("misheard the creation of ticket " + std::to_string(ticket.first) + "/" +
                  std::to_string(ticket.second) + " twice");
}

// Counts increase by one; the first that is heard is unknown.
void LaneListener::Take(int type, int lane, std::int64_t value)
{
    auto const [last, isFirst] = m_last.try_emplace({type, lane}, value);
    if (!isFirst && value != last->second + 1)
        PrintLine("misheard " + std::to_string(value) + " of type " + std::to_string(type) + ", lane " +
                  std::to_string(lane) + " behind " + std::to_string(last->second));
    last->second = value;
}
