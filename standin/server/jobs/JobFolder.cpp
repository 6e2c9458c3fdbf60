#include "standin/server/jobs/JobFolder.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/RemoveTree.h"
#include "standin/server/files/Report.h"
#include "standin/server/tickets/TicketAddress.h"
#include "standin/server/transfer/TransferError.h"
#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>
#include <thread>

namespace standin
{
namespace
{
using std::filesystem::path;

constexpr std::string_view MarkBeginning = ".job-";
constexpr std::string_view RemovalBeginning = ".removed-";

// An empty folder may be swept before it is marked, and a dead job's may come back to its name for a moment;
// hardly so often.
constexpr int Attempts = 10;
constexpr std::chrono::milliseconds Pause(5);

// A client may have written anything into the ticket.
bool IsMark(std::string_view mark)
{
    return mark.size() == RandomNameSize && mark.find_first_not_of("0123456789abcdef") == mark.npos;
}

bool IsMarkFile(std::string const& name)
{
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

Descriptor OpenFolder(path const& folder)
{
    return Descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
}

bool HasMark(Descriptor const& folder, std::string_view mark)
{
    struct stat file = {};
    return folder.Number() >= 0 &&
           fstatat(folder.Number(), FileOf(mark).c_str(), &file, AT_SYMLINK_NOFOLLOW) == 0;
}

// The mark of a folder, and whether there is anything in it. Nothing if nobody can tell.
struct FolderContent
{
    std::string mark;
    bool isEmpty = true;
};
std::optional<FolderContent> ContentOf(path const& folder)
{
    Descriptor const opened = OpenFolder(folder);
    if (opened.Number() < 0)
        return std::nullopt;
    auto const names = NamesIn(opened.Number());
    if (errno != 0)
        return std::nullopt;
    auto const mark = std::find_if(names.begin(), names.end(), IsMarkFile);
    return FolderContent{mark == names.end() ? std::string() : mark->substr(MarkBeginning.size()),
                         names.empty()};
}

// The mark goes last: as long as anything is left, it tells whose that was.
void RemoveWithMarkLast(path const& folder, Descriptor const& opened)
{
    bool const isGone = RemoveContent(opened.Number(), IsMarkFile) && rmdir(folder.c_str()) == 0;
    if (!isGone && errno != ENOENT)
        Report(FileFault(folder, "the job's folder cannot be removed", errno));
}

// Not in the place of another; where the file system has no such rename, a plain one has to do.
bool GiveBack(path const& apart, path const& folder)
{
    if (renameat2(AT_FDCWD, apart.c_str(), AT_FDCWD, folder.c_str(), RENAME_NOREPLACE) == 0)
        return true;
    bool const isUnknown = errno == EINVAL || errno == ENOSYS || errno == EPERM;
    return isUnknown && rename(apart.c_str(), folder.c_str()) == 0;
}

// First it gets a name that no job has, so that whoever makes the next job of that id is in nobody's way.
// Then it is looked at once more: since the last look another program may have removed the folder, and a
// third one made the next one. The name tells where such a one belongs, should this process die before it is
// back. True if it was another one, which is back.
bool RemoveMarkedFolder(path const& folder, int id, std::string_view mark)
{
    path const apart =
        folder.parent_path() / (std::string(RemovalBeginning) + std::to_string(id) + "-" + NewJobMark());
    std::error_code error;
    std::filesystem::rename(folder, apart, error);
    if (error == std::errc::no_such_file_or_directory)
        return false;  // somebody else was faster
    if (error)
    {
        Report(FileFault(folder, "the job's folder cannot be removed", error.value()));
        return false;
    }
    Descriptor const opened = OpenFolder(apart);
    if (!HasMark(opened, mark))
        return GiveBack(apart, folder);
    RemoveWithMarkLast(apart, opened);
    return false;
}

std::optional<int> IdIn(std::string_view text)
{
    bool const isNumber =
        !text.empty() && text.size() <= 8 && text.find_first_not_of("0123456789") == text.npos;
    if (!isNumber || (text.size() > 1 && text[0] == '0') || std::stoi(std::string(text)) > LargestId)
        return std::nullopt;
    return std::stoi(std::string(text));
}

// The job whose folder was being removed under that name; nothing for other names.
std::optional<int> JobOnItsWayOut(std::string_view name)
{
    std::size_t const dash = name.rfind('-');
    if (!name.starts_with(RemovalBeginning) || dash < RemovalBeginning.size() ||
        !IsMark(name.substr(dash + 1)))
        return std::nullopt;
    return IdIn(name.substr(RemovalBeginning.size(), dash - RemovalBeginning.size()));
}

// The names in a folder of what is a folder itself, links not followed. None if it cannot be read.
std::vector<path> FoldersBelow(path const& folder)
{
    std::error_code error;
    std::vector<path> found = EntriesOf(folder, error);
    std::erase_if(found,
                  [](path const& entry)
                  {
                      std::error_code unknown;
                      return !is_directory(symlink_status(entry, unknown));
                  });
    return found;
}

// Whoever deleted the job of a folder that was away for a moment did not find it, and left it to us.
void RemoveTheDead(path const& folder, int id, std::string mark, KnownJobs const& known)
{
    while (RemoveMarkedFolder(folder, id, mark))
    {
        auto const back = ContentOf(folder);
        bool const isSame = back && back->mark == mark;  // one that can be listed and not looked into
        if (!back || back->mark.empty() || isSame || known.hasMark(id, back->mark))
            return;
        mark = back->mark;
    }
}

// The look comes before the question: a mark that is seen before its ticket is missing is a dead job's, as no
// mark comes twice. Whoever makes a job of that id meanwhile has another one.
void SweepNumbered(path const& folder, int id, KnownJobs const& known)
{
    auto const content = ContentOf(folder);
    if (!content || known.exists(id))
        return;
    if (content->isEmpty)
        rmdir(folder.c_str());  // and not if something has come into it
    else if (!content->mark.empty())
        RemoveTheDead(folder, id, content->mark, known);
}

// What was taken away by mistake goes back to its place.
void SweepOnItsWayOut(path const& folder, int id, KnownJobs const& known)
{
    auto const content = ContentOf(folder);
    if (!content)
        return;
    if (content->isEmpty)
        rmdir(folder.c_str());
    else if (content->mark.empty() || known.hasMark(id, content->mark))
        GiveBack(folder, folder.parent_path() / std::to_string(id));
    else if (Descriptor const opened = OpenFolder(folder); HasMark(opened, content->mark))
        RemoveWithMarkLast(folder, opened);
}

// An empty one is what a process leaves that is killed before it can mark it.
bool MakeFolder(path const& folder)
{
    if (mkdir(folder.c_str(), 0700) == 0)
        return true;
    return errno == EEXIST && rmdir(folder.c_str()) == 0 && mkdir(folder.c_str(), 0700) == 0;
}

bool IsOccupied(int reason) { return reason == EEXIST || reason == ENOTEMPTY || reason == ENOTDIR; }

bool Mark(Descriptor const& folder, std::string_view mark)
{
    std::string const file = FileOf(mark);
    return Descriptor(openat(folder.Number(), file.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600))
               .Number() >= 0;
}
}  // namespace

std::string NewJobMark() { return RandomName(); }

Descriptor MakeJobFolder(FolderTable const& table, int id, std::string_view mark)
{
    auto const folder = PathOf(table, id);
    if (!folder)
        throw TransferError(TargetUnwritable,
                            "$(JOB): no folder for jobs; give System/Folders/Job an absolute path");
    int reason = ENOENT;
    for (int attempt = 0; attempt < Attempts && (reason == ENOENT || IsOccupied(reason)); ++attempt)
    {
        if (IsOccupied(reason))
            std::this_thread::sleep_for(Pause);
        bool const isMade = MakeFolder(*folder);
        Descriptor opened = isMade ? OpenFolder(*folder) : Descriptor();
        if (opened.Number() >= 0 && Mark(opened, mark))
            return opened;
        reason = errno;
        if (isMade)
            rmdir(folder->c_str());
    }
    if (IsOccupied(reason))
        throw TransferError(TargetUnwritable,
                            ForMessages(folder->string()) +
                                ": something else has the name of the job's folder; move it away, or "
                                "give System/Folders/Job a folder of its own");
    throw TransferError(TargetUnwritable, FileFault(*folder, "the job's folder cannot be made", reason));
}

bool IsJobFolderFree(FolderTable const& table, int id)
{
    auto const folder = PathOf(table, id);
    return !folder || rmdir(folder->c_str()) == 0 || errno == ENOENT;
}

void FlushFolderForJobs(FolderTable const& table)
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
    if (folder && IsMark(mark) && HasMark(OpenFolder(*folder), mark))
        RemoveMarkedFolder(*folder, id, mark);
}

std::map<int, path> NumberedFolders(path const& jobs)
{
    std::map<int, path> found;
    for (path const& folder : FoldersBelow(jobs))
        if (auto const id = IdIn(folder.filename().string()))
            found[*id] = folder;
    return found;
}

void SweepJobFolders(path const& jobs, KnownJobs const& known)
{
    for (auto const& [id, folder] : NumberedFolders(jobs))
        SweepNumbered(folder, id, known);
    for (path const& folder : FoldersBelow(jobs))
        if (auto const id = JobOnItsWayOut(folder.filename().string()))
            SweepOnItsWayOut(folder, *id, known);
}
}  // namespace standin
