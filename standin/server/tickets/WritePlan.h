// A table of writes, looked through before any of it is carried out: which records can be carried out, and
// what the ticket will be like then. Each record sees the ticket as those before it will leave it.
#pragma once

#include "standin/server/tickets/FolderTable.h"
#include "standin/server/tickets/KeyFilter.h"
#include "standin/server/tickets/ParameterChange.h"
#include "standin/server/tickets/TicketSnapshot.h"
#include <map>
#include <optional>
#include <span>

namespace standin
{
// One record of such a table.
struct TicketWrite
{
    std::string_view key;
    int pos = -1;                      // -1 the key as a whole, 0 and up one value, -2 appends
    std::optional<TicketValue> value;  // PARAM_NONE deletes; nothing: what was given cannot be written
    bool ok = false;                   // out: it can be carried out, and was
};

class WritePlan
{
public:
    // before: null for a ticket that begins empty. A record whose key is outside the limit is not carried
    // out. folders: as the ticket has them, if it is the system ticket; a record that would leave them such
    // that clients cannot read them is refused, unless they were before: they are mended one by one.
    WritePlan(TicketSnapshot const* before, std::span<TicketWrite> writes, KeyFilter const* limit = nullptr,
              std::optional<FolderSettings> folders = std::nullopt);

    // What becomes different. A deletion of what is not there succeeds, and is no change.
    std::vector<ParameterChange>& Changes() { return m_changes; }

private:
    // What earlier records of the table did to a key.
    struct Draft
    {
        KeyValues const* before;
        std::map<int, bool> touched{};  // position: is there a value now?

        int Count() const;
        bool Has(int pos) const;
        bool HasOthersThan0() const;
    };
    Draft& DraftOf(std::string_view key);
    bool Add(TicketWrite const& write);
    bool AddDeletion(TicketWrite const& write);
    bool AddValue(TicketWrite const& write);
    bool FoldersAllow(std::string_view key, int pos, TicketValue const& value);

    TicketSnapshot const* const m_before;
    std::optional<FolderSettings> m_folders;
    std::unordered_map<std::string_view, Draft> m_drafts;
    std::vector<ParameterChange> m_changes;
};

// The folders as a system ticket has them; null for a missing one.
FolderSettings FoldersOf(TicketSnapshot const* systemTicket);
}  // namespace standin
