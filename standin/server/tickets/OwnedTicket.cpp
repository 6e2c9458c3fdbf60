#include "standin/server/tickets/OwnedTicket.h"

#include <algorithm>
#include <iterator>

namespace standin
{
OwnedTicket::OwnedTicket()
{
    SnapshotEdit nothing(nullptr);
    Become(nothing, {});
}

OwnedTicket::OwnedTicket(TicketXml const& content) : m_address(content.address)
{
    SnapshotEdit edit(nullptr);
    std::vector<ParameterChange> changes;  // own their texts until the snapshot does
    content.Walk(
        [&](std::string_view key, int pos, StoredValue const& value)
        {
            changes.push_back({std::string(), pos, TicketValue::FromStored(value)});
            edit.Put(m_keys.Intern(key), pos, changes.back().value);
        });
    Become(edit, changes);
}

OwnedTicket::~OwnedTicket() { SnapshotEdit::Destroy(m_snapshot); }

void OwnedTicket::Become(SnapshotEdit& edit, std::span<ParameterChange> changes)
{
    auto const room = m_retired.size() + edit.ReplacedTexts();
    if (room > m_retired.capacity())
        m_retired.reserve(std::max(room, 2 * m_retired.capacity()));
    Garbage garbage;
    m_snapshot = edit.Finish({}, garbage);
    for (ParameterChange& change : changes)
        static_cast<void>(change.value.text.release());
    std::copy_if(std::move_iterator(garbage.texts.begin()), std::move_iterator(garbage.texts.end()),
                 std::back_inserter(m_retired), [](auto const& text) { return text->readers.load() != 0; });
}

void OwnedTicket::Write(std::span<TicketWrite> writes)
{
    WritePlan plan(m_snapshot, writes);
    if (plan.Changes().empty())
        return;
    if (m_keys.IsFull())
        m_keys.TakeUnused();
    SnapshotEdit edit(m_snapshot);
    for (ParameterChange const& change : plan.Changes())
        edit.Make(m_keys.Intern(change.key), change);
    Become(edit, plan.Changes());
    m_changed = true;
}
}  // namespace standin
