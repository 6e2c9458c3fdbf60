// The values under one key of a ticket: positions from 0 up, each with a type of its own, gaps allowed. A
// gap takes no memory, so a far position costs as much as a near one. Its owner locks it.
#pragma once

#include "standin/server/tickets/TicketValue.h"
#include <span>

namespace standin
{
// The largest position of a value; a write beyond is refused.
inline constexpr int LargestPosition = 0xFFFFFF;

class KeyValues
{
public:
    struct Entry
    {
        int pos;
        TicketValue value;
    };

    std::span<Entry const> Entries() const { return m_entries; }                    // by ascending position
    int Count() const { return m_entries.empty() ? 0 : m_entries.back().pos + 1; }  // gaps count, too
    TicketValue const* At(int pos) const;  // null in a gap and past the end
    Entry const* From(int pos) const;      // the first at pos or behind, null past the end

    // The changes. Texts they take out go to removed.
    void Put(int pos, TicketValue value, TicketTexts& removed);
    void Erase(int pos, TicketTexts& removed);
    void Clear(TicketTexts& removed);

private:
    std::size_t LowerBound(int pos) const;

    std::vector<Entry> m_entries;
};
}  // namespace standin
