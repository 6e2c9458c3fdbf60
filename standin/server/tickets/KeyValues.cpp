#include "standin/server/tickets/KeyValues.h"

#include <algorithm>

namespace standin
{
namespace
{
void Remove(TicketValue& value, TicketTexts& removed)
{
    if (value.text)
        removed.push_back(std::move(value.text));
}
}  // namespace

// The index of the first entry at pos or behind. Positions never repeat, so no entry stands farther back
// than its position says; without gaps it stands right there.
std::size_t KeyValues::LowerBound(int pos) const
{
    auto const limit = std::min(static_cast<std::size_t>(pos), m_entries.size());
    if (limit < m_entries.size() && m_entries[limit].pos == pos)
        return limit;
    auto const end = m_entries.begin() + static_cast<std::ptrdiff_t>(limit);
    auto const found =
        std::partition_point(m_entries.begin(), end, [pos](Entry const& entry) { return entry.pos < pos; });
    return static_cast<std::size_t>(found - m_entries.begin());
}

TicketValue const* KeyValues::At(int pos) const
{
    auto const index = LowerBound(pos);
    return index < m_entries.size() && m_entries[index].pos == pos ? &m_entries[index].value : nullptr;
}

KeyValues::Entry const* KeyValues::From(int pos) const
{
    auto const index = LowerBound(pos);
    return index < m_entries.size() ? &m_entries[index] : nullptr;
}

void KeyValues::Put(int pos, TicketValue value, TicketTexts& removed)
{
    auto const index = LowerBound(pos);
    if (index == m_entries.size() || m_entries[index].pos != pos)
    {
        m_entries.insert(m_entries.begin() + static_cast<std::ptrdiff_t>(index),
                         Entry{pos, std::move(value)});
        return;
    }
    Remove(m_entries[index].value, removed);
    m_entries[index].value = std::move(value);
}

void KeyValues::Erase(int pos, TicketTexts& removed)
{
    auto const index = LowerBound(pos);
    if (index == m_entries.size() || m_entries[index].pos != pos)
        return;
    Remove(m_entries[index].value, removed);
    m_entries.erase(m_entries.begin() + static_cast<std::ptrdiff_t>(index));
}

void KeyValues::Clear(TicketTexts& removed)
{
    for (Entry& entry : m_entries)
        Remove(entry.value, removed);
    m_entries.clear();
}
}  // namespace standin
