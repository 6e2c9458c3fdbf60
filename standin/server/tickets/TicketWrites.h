// A table of writes, looked through before any of it is carried out: what each record does to the ticket,
// and what the storage has to do for it. Each record sees the ticket as the ones before it will leave it.
#pragma once

#include "comgui/ticket/SETMULTIPAR.h"
#include "standin/server/store/Storage.h"
#include "standin/server/tickets/FolderTable.h"
#include "standin/server/tickets/KeyFilter.h"
#include "standin/server/tickets/Ticket.h"
#include <map>

namespace standin
{
class TicketWrites
{
public:
    struct Step
    {
        enum Kind
        {
            StartAnew,  // value at 0 and nothing else
            Put,
            Erase,
            EraseKey,
        };
        SETMULTIPAR* record;
        Kind kind;
        int pos;
        TicketValue value;
    };

    // Leaves the table's ok bytes alone; a record that cannot be carried out gets no step, nor does one whose
    // key is outside the limit. folders: as the ticket has them, if it is the system ticket; a record that
    // would leave them such that clients cannot read them is refused, and the others go into folders.
    TicketWrites(TicketAddress address, Ticket const& ticket, KeyPool const& pool, SETMULTIPAR* table,
                 KeyFilter const* limit = nullptr, FolderSettings* folders = nullptr);

    // Keys and texts of the changes lie in the table and in the steps, where they stay if the steps are
    // moved.
    std::vector<Change> const& Changes() const { return m_changes; }
    std::vector<Step>& Steps() { return m_steps; }

    // Carries one step out, sets its record's ok and moves its value away. Texts that it takes out of the
    // ticket go to removed. False if it was a deletion of what is not there.
    static bool CarryOut(Step& step, Ticket& ticket, KeyPool& pool, TicketTexts& removed);

private:
    // What earlier records of the table did to a key.
    struct Draft
    {
        KeyValues const* before;
        std::map<int, bool> touched{};  // position: is there a value now?

        int Count() const;
    };
    Draft& DraftOf(std::string_view key);
    void AddDelete(SETMULTIPAR& record);
    void AddPut(SETMULTIPAR& record);
    void Add(SETMULTIPAR& record, Step::Kind kind, int pos, TicketValue value);
    bool FoldersAllow(Step::Kind kind, std::string_view key, int pos, TicketValue const& value);
    void Store(Change::Kind kind, std::string_view key, int pos = 0, StoredValue const& value = {});

    TicketAddress m_address;
    Ticket const& m_ticket;
    KeyPool const& m_pool;
    FolderSettings* m_folders;
    std::unordered_map<std::string_view, Draft> m_drafts;
    std::vector<Step> m_steps;
    std::vector<Change> m_changes;
};
}  // namespace standin
