#include "standin/server/tickets/OwnedTicket.h"

#include "standin/server/tickets/TicketWrites.h"
#include <algorithm>
#include <iterator>

namespace standin
{
OwnedTicket::OwnedTicket(TicketXml const& content) : m_address(content.address)
{
    TicketTexts none;  // positions are new: nothing is taken out
    content.Walk([&](std::string_view key, int pos, StoredValue const& value)
                 { m_ticket.keys[m_keys.Intern(key)].Put(pos, TicketValue::FromStored(value), none); });
}

bool OwnedTicket::Get(char const* key, PARAM_TYPE type, void* value, int pos) const
{
    KeyValues const* const values = key ? m_ticket.Find(m_keys.Find(key)) : nullptr;
    return values && ReadValue(*values, type, value, pos);
}

bool OwnedTicket::GetTable(GETMULTIPAR* table) const
{
    if (!table)
        return false;
    for (GETMULTIPAR* record = table; record->key; ++record)
        record->ok = Get(record->key, record->type, record->value, record->pos);
    return true;
}

bool OwnedTicket::Set(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    SETMULTIPAR table[2] = {};
    table[0].key = key;
    table[0].type = type;
    table[0].value = value;
    table[0].pos = pos;
    return SetTable(table) && table[0].ok;  // a null key ends the table: ok stays false
}

bool OwnedTicket::SetTable(SETMULTIPAR* table)
{
    if (!table)
        return false;
    for (SETMULTIPAR* record = table; record->key; ++record)
        record->ok = false;
    TicketWrites writes(m_address.value_or(TicketAddress{}), m_ticket, m_keys, table);
    TicketTexts removed;
    for (TicketWrites::Step& step : writes.Steps())
        m_changed = TicketWrites::CarryOut(step, m_ticket, m_keys, removed) || m_changed;
    std::copy_if(std::move_iterator(removed.begin()), std::move_iterator(removed.end()),
                 std::back_inserter(m_retired), [](auto const& text) { return text->handedOut.load(); });
    return true;
}

bool OwnedTicket::Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix) const
{
    if (!action)
        return false;
    for (Key const key : m_ticket.SortedKeys(prefix ? prefix : ""))
    {
        // Looked up anew each time, since the action may have written to the key, or deleted it.
        for (int pos = 0;;)
        {
            KeyValues const* const values = m_ticket.Find(key);
            KeyValues::Entry const* const entry = values ? values->From(pos) : nullptr;
            if (!entry)
                break;
            pos = entry->pos + 1;
            BIN_STRING binary;
            if (!action(context, key->c_str(), entry->value.type, entry->value.Word(binary), entry->pos))
                return true;
        }
    }
    return true;
}

TicketXml OwnedTicket::Content() const
{
    TicketXml content;
    content.address = m_address;
    for (auto const& [key, values] : m_ticket.keys)
        for (KeyValues::Entry const& entry : values.Entries())
            content.Put(*key, entry.pos, entry.value.ToStored());
    return content;
}
}  // namespace standin
