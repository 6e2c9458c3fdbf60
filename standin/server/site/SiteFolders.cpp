#include "standin/server/site/SiteFolders.h"

#include "standin/server/files/Report.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/jobs/JobFolder.h"
#include <optional>

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

void SweepJobFolders(TicketService& tickets, path const& site)
{
    auto const jobs = FolderTable(tickets.Folders().values).FolderOf("JOB");
    if (!jobs || path(*jobs) != site / "job")
        return;
    // A job's ticket is there before its folder, so a folder that is seen here and has no ticket then has
    // lost it.
    for (path const& folder : FoldersBelow(*jobs))
    {
        std::string const name = folder.filename().string();
        auto const id = JobOf(name);
        if (IsJobFolderOnItsWayOut(folder) || (id && tickets.IncarnationOf({JobTicketType, *id}) == 0))
            RemoveStrayJobFolder(folder);
    }
}

void SetJobFoldersAside(path const& jobs)
{
    for (path const& folder : FoldersBelow(jobs))
        if (JobOf(folder.filename().string()))
            SetAside(folder, {""});
}
}  // namespace standin
