#include "standin/server/tickets/TicketWrites.h"

namespace standin
{
TicketWrites::TicketWrites(TicketAddress address, Ticket const& ticket, KeyPool const& pool,
                           SETMULTIPAR* table, KeyFilter const* limit, FolderSettings* folders)
    : m_address(address), m_ticket(ticket), m_pool(pool), m_folders(folders)
{
    for (SETMULTIPAR* record = table; record->key; ++record)
    {
        if (!*record->key || record->pos > LargestPosition || (limit && !limit->Selects(record->key)))
            continue;
        if (record->type == PARAM_NONE)
            AddDelete(*record);
        else
            AddPut(*record);
    }
}

int TicketWrites::Draft::Count() const
{
    int count = 0;
    for (auto position = touched.rbegin(); position != touched.rend() && !count; ++position)
        if (position->second)
            count = position->first + 1;
    if (!before)
        return count;
    auto const entries = before->Entries();
    for (auto entry = entries.rbegin(); entry != entries.rend() && entry->pos >= count; ++entry)
        if (!touched.count(entry->pos))
            return entry->pos + 1;
    return count;
}

TicketWrites::Draft& TicketWrites::DraftOf(std::string_view key)
{
    auto const known = m_drafts.find(key);
    if (known != m_drafts.end())
        return known->second;
    return m_drafts.emplace(key, Draft{m_ticket.Find(m_pool.Find(key))}).first->second;
}

void TicketWrites::AddDelete(SETMULTIPAR& record)
{
    if (record.value || record.pos < -1)
        return;
    // What is not there counts as deleted: the caller wants it gone, and gone it is.
    if (record.pos == -1)
        Add(record, Step::EraseKey, 0, {});
    else
        Add(record, Step::Erase, record.pos, {});
}

void TicketWrites::AddPut(SETMULTIPAR& record)
{
    if (record.pos < -2)
        return;
    auto value = TicketValue::FromWrite(record.type, record.value);
    if (!value)
        return;
    int const pos = record.pos == -2 ? DraftOf(record.key).Count() : record.pos;
    if (pos == -1)
        Add(record, Step::StartAnew, 0, std::move(*value));
    else if (pos <= LargestPosition)
        Add(record, Step::Put, pos, std::move(*value));
}

bool TicketWrites::FoldersAllow(Step::Kind kind, std::string_view key, int pos, TicketValue const& value)
{
    if (!m_folders || !FolderSettings::Concern(key, pos))
        return true;
    bool const puts = kind == Step::StartAnew || kind == Step::Put;
    FolderSettings after = *m_folders;
    after.Put(key, puts ? value.ToStored() : StoredValue());
    if (!after.CanBeRead())
        return false;
    *m_folders = std::move(after);
    return true;
}

void TicketWrites::Add(SETMULTIPAR& record, Step::Kind kind, int pos, TicketValue value)
{
    if (!FoldersAllow(kind, record.key, pos, value))
        return;
    Draft& draft = DraftOf(record.key);
    if (kind == Step::StartAnew || kind == Step::EraseKey)
    {
        draft = Draft{nullptr};
        Store(Change::DeleteKey, record.key);
    }
    bool const puts = kind == Step::StartAnew || kind == Step::Put;
    if (puts || kind == Step::Erase)
        draft.touched[pos] = puts;
    if (puts)
        Store(Change::PutValue, record.key, pos, value.ToStored());
    else if (kind == Step::Erase)
        Store(Change::DeleteValue, record.key, pos);
    m_steps.push_back(Step{&record, kind, pos, std::move(value)});
}

bool TicketWrites::CarryOut(Step& step, Ticket& ticket, KeyPool& pool, TicketTexts& removed)
{
    bool const puts = step.kind == Step::StartAnew || step.kind == Step::Put;
    step.record->ok = true;
    Key const key = puts ? pool.Intern(step.record->key) : pool.Find(step.record->key);
    if (!key)
        return false;  // no ticket ever held what is to be deleted
    KeyValues& values = ticket.keys[key];
    auto const before = values.Entries().size();
    if (step.kind == Step::StartAnew || step.kind == Step::EraseKey)
        values.Clear(removed);
    if (step.kind == Step::Erase)
        values.Erase(step.pos, removed);
    if (puts)
        values.Put(step.pos, std::move(step.value), removed);
    bool const changed = puts || values.Entries().size() != before;
    if (values.Count() == 0)
        ticket.keys.erase(key);
    return changed;
}

void TicketWrites::Store(Change::Kind kind, std::string_view key, int pos, StoredValue const& value)
{
    m_changes.push_back(Change{kind, m_address, key, pos, value});
}
}  // namespace standin
