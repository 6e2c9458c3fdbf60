#include "standin/server/JobFolder.h"

#include "standin/server/AtomicFile.h"
#include "standin/server/SiteFiles.h"
#include "standin/server/TransferError.h"
#include <cerrno>
#include <fcntl.h>
#include <filesystem>
#include <sys/stat.h>

namespace standin
{
namespace
{
std::optional<std::filesystem::path> PathOf(FolderTable const& table, int id)
{
    auto const jobs = table.FolderOf("JOB");
    if (!jobs || !jobs->starts_with('/'))
        return std::nullopt;
    return std::filesystem::path(*jobs) / std::to_string(id);
}
}  // namespace

Descriptor MakeJobFolder(FolderTable const& table, int id)
{
    auto const path = PathOf(table, id);
    if (!path)
        throw TransferError(TargetUnwritable,
                            "$(JOB): no folder for jobs; give System/Folders/Job an absolute path");
    std::error_code error;
    std::filesystem::remove_all(*path, error);
    if (mkdir(path->c_str(), 0700) == 0)
    {
        Descriptor folder(open(path->c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
        if (folder.Number() >= 0)
            return folder;
    }
    throw TransferError(TargetUnwritable, FileError(*path, "the job's folder cannot be made", errno).what());
}

void RemoveJobFolder(FolderTable const& table, int id)
{
    std::error_code error;
    if (auto const path = PathOf(table, id))
        std::filesystem::remove_all(*path, error);
    if (error)
        Report(FileError(*PathOf(table, id), "the job's folder cannot be removed", error.value()).what());
}
}  // namespace standin
