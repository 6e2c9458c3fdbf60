#include "tests/module/PlainTicket.h"

#include "tests/module/ValueText.h"

namespace
{
constexpr int LargestPosition = 0xFFFFFF;

// Whether there is something to write; a deletion has no value.
bool CanBeWritten(MODEL_RECORD const& record)
{
    switch (record.type)
    {
    case PARAM_NONE:
        return record.isNull;
    case PARAM_POINTER:
        return true;
    case PARAM_INT:
    case PARAM_DOUBLE:
    case PARAM_STRING:
    case PARAM_INT64:
    case PARAM_UNSIGNED:
    case PARAM_UNSIGNED64:
        return !record.isNull;
    case PARAM_BINSTRING:
        return !record.isNull && !record.text.empty();
    default:
        return false;
    }
}
}  // namespace

std::string WalkedLine(std::string const& key, int pos, std::string const& value)
{
    return key + "@" + std::to_string(pos) + "=" + value;
}

int PLAIN_TICKET::Count(std::string const& key) const
{
    auto const values = m_keys.find(key);
    return values == m_keys.end() ? 0 : values->second.rbegin()->first + 1;
}

std::optional<std::string> PLAIN_TICKET::Read(MODEL_RECORD const& record) const
{
    int const count = record.key ? Count(*record.key) : 0;
    if (count == 0 || record.isNull || record.pos < -1)
        return std::nullopt;
    if (record.type == PARAM_COUNT)
        return record.pos == -1 ? std::optional("count " + std::to_string(count)) : std::nullopt;
    if (record.type == PARAM_NONE && record.pos == -1 && count > 1)
        return "type " + std::to_string(PARAM_COUNT);
    auto const& values = m_keys.at(*record.key);
    auto const value = values.find(record.pos == -1 ? 0 : record.pos);
    if (value == values.end())
        return std::nullopt;
    if (record.type == PARAM_NONE)
        return "type " + std::to_string(value->second.type);
    return record.type == value->second.type ? std::optional(value->second.text) : std::nullopt;
}

bool PLAIN_TICKET::Write(MODEL_RECORD const& record, std::vector<PLAIN_CHANGE>& changes)
{
    bool const isDeletion = record.type == PARAM_NONE;
    if (!record.key || record.key->empty() || !CanBeWritten(record) || record.pos < (isDeletion ? -1 : -2) ||
        record.pos > LargestPosition)
        return false;
    int const count = Count(*record.key);
    PLAIN_CHANGE change{*record.key, record.pos == -2 ? count : record.pos};
    if (change.pos > LargestPosition)
        return false;
    bool const isThere = record.pos == -1
                             ? count > 0
                             : From(*record.key, record.pos).value_or(std::pair(-1, "")).first == record.pos;
    if (isDeletion && !isThere)
        return true;
    change.value = {record.type, TextOf(record.type, VALUE_WORD(record).Get())};
    Make(change);
    changes.push_back(std::move(change));
    return true;
}

void PLAIN_TICKET::Make(PLAIN_CHANGE const& change)
{
    auto& values = m_keys[change.key];
    if (change.pos == -1)
        values.clear();
    if (change.value.type == PARAM_NONE)
        values.erase(change.pos);
    else
        values.insert_or_assign(std::max(change.pos, 0), change.value);
    if (values.empty())
        m_keys.erase(change.key);
}

std::optional<std::pair<int, std::string>> PLAIN_TICKET::From(std::string const& key, int pos) const
{
    auto const values = m_keys.find(key);
    if (values == m_keys.end())
        return std::nullopt;
    auto const value = values->second.lower_bound(pos);
    if (value == values->second.end())
        return std::nullopt;
    return std::pair(value->first, value->second.text);
}

std::vector<std::string> PLAIN_TICKET::KeysWith(std::string const& prefix) const
{
    std::vector<std::string> keys;
    for (auto const& [key, values] : m_keys)
        if (key.starts_with(prefix))
            keys.push_back(key);
    return keys;
}

std::vector<std::string>
PLAIN_TICKET::Lines(std::function<bool(std::string const& key)> const& isChosen) const
{
    std::vector<std::string> lines;
    for (auto const& [key, values] : m_keys)
        for (auto const& [pos, value] : values)
            if (isChosen(key))
                lines.push_back(WalkedLine(key, pos, value.text));
    return lines;
}

void PLAIN_TICKET::DropPointers()
{
    for (auto& [key, values] : m_keys)
        std::erase_if(values, [](auto const& each) { return each.second.type == PARAM_POINTER; });
    std::erase_if(m_keys, [](auto const& each) { return each.second.empty(); });
}
