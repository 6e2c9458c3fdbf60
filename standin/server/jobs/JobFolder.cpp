#include "standin/server/jobs/JobFolder.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include "standin/server/transfer/TransferError.h"
#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <functional>
#include <random>
#include <sys/stat.h>

namespace standin
{
namespace
{
using std::filesystem::path;

constexpr std::string_view MarkBeginning = ".job-";
constexpr std::size_t MarkSize = 16;
constexpr std::string_view RemovalBeginning = ".removed-";

// A client may have written anything into the ticket.
bool IsMark(std::string_view mark)
{
    return mark.size() == MarkSize && mark.find_first_not_of("0123456789abcdef") == mark.npos;
}

bool IsMarkFile(path const& file)
{
    std::string const name = file.filename();
    return name.starts_with(MarkBeginning) && IsMark(std::string_view(name).substr(MarkBeginning.size()));
}

std::string FileOf(std::string_view mark) { return std::string(MarkBeginning).append(mark); }

std::optional<path> PathOf(FolderTable const& table, int id)
{
    auto const jobs = table.FolderOf("JOB");
    if (!jobs || !jobs->starts_with('/'))
        return std::nullopt;
    return path(*jobs) / std::to_string(id);
}

std::vector<path> EntriesOf(path const& folder, std::error_code& error)
{
    std::vector<path> entries;
    std::filesystem::directory_iterator entry(folder, error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error))
        entries.push_back(entry->path());
    return entries;
}

// Under a name that no job has any more: whoever makes the next job of that id is in nobody's way. If this is
// broken off, the name shows what the folder was. isIt: looks once more, at what has now that name and no
// other, since another program may have removed the folder, and a third made the next one, since the last
// look.
void RemoveUnder(path const& named, std::function<bool(path const& folder)> const& isIt)
{
    path const folder = named.parent_path() / (std::string(RemovalBeginning) + NewJobMark());
    std::error_code error;
    std::filesystem::rename(named, folder, error);
    if (error == std::errc::no_such_file_or_directory)
        return;  // somebody else was faster
    if (error)
        return Report(FileFault(named, "the job's folder cannot be removed", error.value()));
    if (!isIt(folder))
        return std::filesystem::rename(folder, named, error);
    std::vector<path> entries = EntriesOf(folder, error);
    std::stable_partition(entries.begin(), entries.end(),
                          [](path const& entry) { return !IsMarkFile(entry); });
    entries.push_back(folder);
    for (path const& entry : entries)
        if (!error)
            std::filesystem::remove_all(entry, error);
    if (error)
        Report(FileFault(folder, "the job's folder cannot be removed", error.value()));
}

// An empty one is what a process leaves that is killed before it can mark it.
bool MakeFolder(path const& folder)
{
    if (mkdir(folder.c_str(), 0700) == 0)
        return true;
    return errno == EEXIST && rmdir(folder.c_str()) == 0 && mkdir(folder.c_str(), 0700) == 0;
}

Descriptor OpenFolder(path const& folder)
{
    return Descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
}

bool Mark(Descriptor const& folder, std::string_view mark)
{
    std::string const file = FileOf(mark);
    return Descriptor(openat(folder.Number(), file.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600))
               .Number() >= 0;
}
}  // namespace

std::string NewJobMark()
{
    std::random_device random;
    std::string mark;
    while (mark.size() < MarkSize)
        mark += "0123456789abcdef"[random() % 16];
    return mark;
}

Descriptor MakeJobFolder(FolderTable const& table, int id, std::string_view mark)
{
    auto const folder = PathOf(table, id);
    if (!folder)
        throw TransferError(TargetUnwritable,
                            "$(JOB): no folder for jobs; give System/Folders/Job an absolute path");
    bool const isMade = MakeFolder(*folder);
    if (!isMade && (errno == EEXIST || errno == ENOTEMPTY || errno == ENOTDIR))
        throw TransferError(TargetUnwritable,
                            folder->string() +
                                ": something else has the name of the job's folder; move it away, "
                                "or give System/Folders/Job a folder of its own");
    Descriptor opened = isMade ? OpenFolder(*folder) : Descriptor();
    if (opened.Number() >= 0 && Mark(opened, mark))
        return opened;
    int const reason = errno;
    if (isMade)
        rmdir(folder->c_str());
    throw TransferError(TargetUnwritable, FileFault(*folder, "the job's folder cannot be made", reason));
}

bool IsJobFolderFree(FolderTable const& table, int id)
{
    auto const folder = PathOf(table, id);
    std::error_code error;
    if (!folder || !exists(symlink_status(*folder, error)))
        return true;
    return is_directory(symlink_status(*folder, error)) && std::filesystem::is_empty(*folder, error) &&
           !error;
}

void FlushJobFolder(FolderTable const& table)
{
    auto const jobs = table.FolderOf("JOB");
    if (!jobs)
        return;
    Descriptor const folder(open(jobs->c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.Number() < 0 || !FlushFolder(folder.Number()))
        throw TransferError(TargetUnwritable, FileFault(*jobs, "cannot be flushed to the disk", errno));
}

void RemoveJobFolder(FolderTable const& table, int id, std::string_view mark)
{
    auto const folder = PathOf(table, id);
    auto const hasMark = [&](path const& found)
    {
        struct stat file = {};
        return lstat((found / FileOf(mark)).c_str(), &file) == 0;
    };
    if (folder && IsMark(mark) && hasMark(*folder))
        RemoveUnder(*folder, hasMark);
}

bool IsJobFolderOnItsWayOut(path const& folder)
{
    std::string const name = folder.filename().string();
    return name.starts_with(RemovalBeginning) &&
           IsMark(std::string_view(name).substr(RemovalBeginning.size()));
}

void RemoveStrayJobFolder(path const& folder)
{
    auto const isStray = [](path const& found)
    {
        std::error_code error;
        auto const entries = EntriesOf(found, error);
        return !error && (entries.empty() || std::any_of(entries.begin(), entries.end(), IsMarkFile));
    };
    bool const isOnItsWayOut = IsJobFolderOnItsWayOut(folder);
    if (isOnItsWayOut || isStray(folder))
        RemoveUnder(folder, [&](path const& found) { return isOnItsWayOut || isStray(found); });
}
}  // namespace standin
