#include "standin/server/site/SiteFolders.h"

#include "standin/server/files/SiteFiles.h"
#include "standin/server/jobs/JobFolder.h"
#include "standin/server/jobs/JobIntake.h"
#include "standin/server/transfer/PartFile.h"
#include <set>

namespace standin
{
namespace
{
using std::filesystem::path;

// The names in a folder, and of what is a folder itself, links not followed. None if it cannot be read.
std::vector<path> FoldersBelow(path const& folder)
{
    std::vector<path> found;
    std::error_code error;
    std::filesystem::directory_iterator entry(folder, error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error))
        if (std::error_code unknown; is_directory(entry->symlink_status(unknown)))
            found.push_back(entry->path());
    return found;
}

// The job that a folder of that name belongs to; nothing for other names.
std::optional<int> JobOf(std::string const& name)
{
    bool const isNumber =
        !name.empty() && name.size() <= 8 && name.find_first_not_of("0123456789") == name.npos;
    if (!isNumber || (name.size() > 1 && name[0] == '0') || std::stoi(name) > LargestId)
        return std::nullopt;
    return std::stoi(name);
}

// Links on the way there count: what they lead to may belong to another site, too.
bool IsBelow(path const& folder, path const& site)
{
    std::error_code error;
    auto const relative = canonical(folder, error).lexically_relative(canonical(site, error));
    return !error && !relative.empty() && *relative.begin() != "..";
}

void RemovePartFilesBelow(path const& folder)
{
    RemovePartFiles(folder, true);
    for (path const& below : FoldersBelow(folder))
        RemovePartFilesBelow(below);
}

// A client may have written the mark of a prepared job into the ticket of one that has arrived: that stays.
void SweepPreparedJobs(Storage& storage, FolderTable const& table)
{
    for (TicketAddress const job : storage.TicketsWith(JobTicketType, JobPreparedKey))
    {
        bool hasArrived = false;
        std::string mark;
        storage.Load(job,
                     [&](std::string_view key, int pos, StoredValue const& value)
                     {
                         hasArrived = hasArrived || key == JobFileKey;
                         if (key == JobMarkKey && pos == 0)
                             mark = value.bytes;
                     });
        if (hasArrived)
            continue;
        RemoveJobFolder(table, job.id, mark);
        storage.Apply({{Change::DeleteTicket, job}});
    }
}

void SweepJobFolders(Storage& storage, path const& jobs)
{
    std::set<int> ids;
    for (TicketAddress const ticket : storage.Tickets())
        if (ticket.type == JobTicketType)
            ids.insert(ticket.id);
    for (path const& folder : FoldersBelow(jobs))
        if (auto const id = JobOf(folder.filename().string()); id && !ids.contains(*id))
            RemoveStrayJobFolder(folder);
}
}  // namespace

FolderSettings FoldersIn(Storage& storage)
{
    FolderSettings settings;
    storage.Load(SystemTicket,
                 [&](std::string_view key, int pos, StoredValue const& value)
                 {
                     if (FolderSettings::Concern(key, pos))
                         settings.Put(key, value);
                 });
    return settings;
}

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
        fault.value.type = PARAM_INT;
        return {fault};
    }
    std::vector<FolderFault> faults;
    for (std::size_t const row : FolderTable(settings.values).Unresolved())
    {
        FolderFault fault{
            FolderRows[row].key,
            std::string(FolderRows[row].key) + " is \"" + ForMessages(settings.values[row]) +
                "\", which leans on no folder above it, and is switched off; give it an absolute "
                "path, or the variable of a folder that stands above it"};
        fault.value.type = PARAM_STRING;
        faults.push_back(fault);
    }
    return faults;
}

void SweepTransfers(Storage& storage, path const& site)
{
    FolderTable const table(FoldersIn(storage).values);
    SweepPreparedJobs(storage, table);
    if (auto const jobs = table.FolderOf("JOB"); jobs && path(*jobs) == site / "job")
        SweepJobFolders(storage, *jobs);
    for (FolderRow const row : FolderRows)
    {
        auto const folder = table.FolderOf(row.variable);
        if (!folder || !folder->starts_with('/') || row.variable == std::string_view("INSTALL"))
            continue;
        if (IsBelow(*folder, site))
            RemovePartFilesBelow(*folder);
        else
            RemovePartFiles(*folder, false);
    }
}

void SetJobFoldersAside(path const& jobs)
{
    for (path const& folder : FoldersBelow(jobs))
        if (JobOf(folder.filename().string()))
            SetAside(folder, {""});
}
}  // namespace standin
