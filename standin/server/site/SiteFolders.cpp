#include "standin/server/site/SiteFolders.h"

#include "standin/server/files/Report.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/jobs/JobFolder.h"

namespace standin
{
namespace
{
using std::filesystem::path;

// Of a ticket that cannot be read nobody knows.
bool MayHaveMark(TicketService& tickets, int id, std::string_view mark)
{
    TicketAddress const job{JobTicketType, id};
    if (tickets.IncarnationOf(job) == 0)
        return false;
    bool hasMark = false;
    bool const isRead = tickets.LookAt(job, 0,
                                       [&](TicketSnapshot const& ticket)
                                       {
                                           hasMark = TextOf(ticket, JobMarkKey) == mark;
                                           return true;
                                       });
    return hasMark || !isRead;
}

// The mark of a job as the store has it now; nothing if there is no such job. What others do reaches the
// cache later where no memory is shared, and not at all while their bell cannot be heard.
std::optional<std::string> StoredMark(Store& store, int id)
{
    std::string mark;
    auto const take = [&mark](std::string_view key, int, StoredValue const& value)
    {
        if (key == JobMarkKey)
            mark = value.bytes;
    };
    return store.Load({JobTicketType, id}, take) ? std::optional(mark) : std::nullopt;
}
}  // namespace

std::vector<FolderFault> FaultsOf(FolderSettings const& settings)
{
    if (settings.CanBeRead())
        return {};
    if (settings.MustBePlain())
    {
        FolderFault fault{
            UseFolderVariablesKey,
            std::string(UseFolderVariablesKey) + " is " + std::to_string(settings.use) +
                ", and with that no folder may begin with a variable; it is 0 now: set it to 3, or "
                "give the folders without variables first"};
        fault.value = TicketValue::Int(0);
        std::vector<FolderFault> faults;
        faults.push_back(std::move(fault));
        return faults;
    }
    std::vector<FolderFault> faults;
    for (std::size_t const row : FolderTable(settings.values).Unresolved())
    {
        FolderFault fault{
            FolderRows[row].key,
            std::string(FolderRows[row].key) + " is \"" + ForMessages(settings.values[row]) +
                "\", which leans on no folder above it, and is switched off; give it an absolute "
                "path, or the variable of a folder that stands above it"};
        fault.value = TicketValue::String("");
        faults.push_back(std::move(fault));
    }
    return faults;
}

void SweepJobFolders(Store& store, TicketService& tickets, path const& site)
{
    auto const jobs = FolderTable(tickets.Folders().values).FolderOf("JOB");
    if (!jobs || path(*jobs) != site / "job")
        return;
    // A ticket that a power cut brings back must find its folder.
    auto const orIsGoneForGood = [&store](bool isThere)
    {
        if (!isThere)
            store.Sync();
        return isThere;
    };
    SweepJobFolders(
        *jobs,
        {[&](int id) {
             return orIsGoneForGood(tickets.IncarnationOf({JobTicketType, id}) != 0 || StoredMark(store, id));
         },
         [&](int id, std::string_view mark)
         { return orIsGoneForGood(MayHaveMark(tickets, id, mark) || StoredMark(store, id) == mark); }});
}

void SetJobFoldersAside(path const& jobs)
{
    for (auto const& [id, folder] : NumberedFolders(jobs))
        SetAside(folder, {""});
}
}  // namespace standin
