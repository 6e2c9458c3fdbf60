#include "standin/server/tickets/WritePlan.h"

#include "standin/server/files/RefusableCall.h"
#include <algorithm>

namespace standin
{
WritePlan::WritePlan(TicketSnapshot const* before, std::span<TicketWrite> writes, KeyFilter const* limit,
                     std::optional<FolderSettings> folders)
    : m_before(before), m_folders(std::move(folders))
{
    m_changes.reserve(writes.size());
    for (TicketWrite& write : writes)
        write.ok = !write.key.empty() && write.pos <= LargestPosition && write.value &&
                   (!limit || limit->Selects(write.key)) && Add(write);
}

int WritePlan::Draft::Count() const
{
    int count = 0;
    for (auto position = touched.rbegin(); position != touched.rend() && !count; ++position)
        if (position->second)
            count = position->first + 1;
    if (!before)
        return count;
    auto const elements = before->Elements();
    for (auto element = elements.rbegin(); element != elements.rend() && element->pos >= count; ++element)
        if (!touched.contains(element->pos))
            return element->pos + 1;
    return count;
}

bool WritePlan::Draft::Has(int pos) const
{
    auto const known = touched.find(pos);
    return known != touched.end() ? known->second : before && before->At(pos);
}

bool WritePlan::Draft::HasOthersThan0() const
{
    return Count() > 1;  // the last value is never a gap
}

WritePlan::Draft& WritePlan::DraftOf(std::string_view key)
{
    auto const known = m_drafts.find(key);
    if (known != m_drafts.end())
        return known->second;
    return m_drafts.emplace(key, Draft{m_before ? m_before->Find(key) : nullptr}).first->second;
}

bool WritePlan::Add(TicketWrite const& write)
{
    return write.value->type == PARAM_NONE ? AddDeletion(write) : AddValue(write);
}

bool WritePlan::AddDeletion(TicketWrite const& write)
{
    if (write.pos < -1)
        return false;
    if (!FoldersAllow(write.key, std::max(write.pos, 0), *write.value))
        return false;
    Draft& draft = DraftOf(write.key);
    bool const isThere = write.pos == -1 ? draft.Count() > 0 : draft.Has(write.pos);
    if (!isThere)
        return true;
    bool const hadOthers = draft.HasOthersThan0();
    if (write.pos == -1)
        draft = Draft{nullptr};
    else
        draft.touched[write.pos] = false;
    m_changes.push_back({std::string(write.key), write.pos, {}, hadOthers});
    return true;
}

bool WritePlan::AddValue(TicketWrite const& write)
{
    if (write.pos < -2)
        return false;
    int const pos = write.pos == -2 ? DraftOf(write.key).Count() : write.pos;
    if (pos > LargestPosition || !FoldersAllow(write.key, std::max(pos, 0), *write.value))
        return false;
    Draft& draft = DraftOf(write.key);
    bool const hadOthers = draft.HasOthersThan0();
    if (pos == -1)
        draft = Draft{nullptr};
    draft.touched[std::max(pos, 0)] = true;
    m_changes.push_back({std::string(write.key), pos, write.value->Copy(), hadOthers});
    return true;
}

bool WritePlan::FoldersAllow(std::string_view key, int pos, TicketValue const& value)
{
    if (!m_folders || !FolderSettings::Concern(key, pos))
        return true;
    FolderSettings after = *m_folders;
    after.Put(key, value.ToStored());
    if (!after.CanBeRead() && m_folders->CanBeRead())
    {
        RefusableCall::Note({key,
                             ": with this value clients could not resolve the folders; let a folder begin "
                             "only with the variable of one above it"});
        return false;
    }
    *m_folders = std::move(after);
    return true;
}

FolderSettings FoldersOf(TicketSnapshot const* systemTicket)
{
    FolderSettings settings;
    auto const take = [&](std::string_view key)
    {
        KeyValues const* const values = systemTicket->Find(key);
        if (TicketElement const* const element = values ? values->At(0) : nullptr)
            settings.Put(key, element->ToStored());
    };
    if (!systemTicket)
        return settings;
    take(UseFolderVariablesKey);
    for (FolderRow const row : FolderRows)
        take(row.key);
    return settings;
}
}  // namespace standin
