#include "standin/server/files/SiteFiles.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include <algorithm>
#include <cerrno>
#include <ctime>
#include <set>
#include <sys/stat.h>
#include <system_error>

namespace standin
{
namespace
{
std::string Now()
{
    std::time_t const seconds = std::time(nullptr);
    std::tm local = {};
    localtime_r(&seconds, &local);
    char text[32];
    return {text, std::strftime(text, sizeof(text), "%Y%m%d-%H%M%S", &local)};
}

std::filesystem::path Suffixed(std::filesystem::path path, std::string const& suffix)
{
    path += suffix;
    return path;
}

using Folders = std::set<std::filesystem::path>;

// changed gets the folders in which a name is new.
void MakeAbove(std::filesystem::path const& folder, Folders& changed)
{
    std::filesystem::path const above = folder.parent_path();
    std::error_code error;
    if (above.empty() || std::filesystem::exists(above, error))
        return;
    MakeAbove(above, changed);
    if (mkdir(above.c_str(), 0700) == 0)
        changed.insert(above.parent_path());
    else if (errno != EEXIST)
        throw FileError(FileFault(folder, "the folder cannot be made", errno));
}

void MakePrivateFolder(std::filesystem::path const& folder, Folders& changed)
{
    MakeAbove(folder, changed);
    if (mkdir(folder.c_str(), 0700) == 0)
    {
        changed.insert(folder.parent_path());
        return;
    }
    int const reason = errno;
    if (reason != EEXIST)
        throw FileError(FileFault(folder, "the folder cannot be made", reason));
    std::error_code error;
    if (!std::filesystem::is_directory(folder, error))
        throw FileError(FileFault(folder, "the folder cannot be made", ENOTDIR));
}
}  // namespace

void MakePrivateFolders(std::vector<std::filesystem::path> const& folders, bool flushesAll)
{
    Folders changed;
    for (std::filesystem::path const& folder : folders)
    {
        MakePrivateFolder(folder, changed);
        if (flushesAll)
            changed.insert(folder.parent_path());
    }
    for (std::filesystem::path const& folder : changed)
        FlushFolder(folder);
}

void FlushFoldersAbove(std::filesystem::path const& folder)
{
    for (auto above = folder; above.has_relative_path();)
    {
        above = above.parent_path();
        FlushFolder(above);
    }
}

std::filesystem::path FreeName(std::filesystem::path const& file, std::string const& word,
                               std::vector<std::string> const& suffixes)
{
    std::filesystem::path const stamped = Suffixed(file, "." + word + "-" + Now());
    auto const isTaken = [&suffixes](std::filesystem::path const& name)
    {
        return std::any_of(
            suffixes.begin(), suffixes.end(),
            [&name](std::string const& suffix)
            { return std::filesystem::exists(std::filesystem::symlink_status(Suffixed(name, suffix))); });
    };
    std::filesystem::path name = stamped;
    for (int n = 2; isTaken(name); ++n)
        name = Suffixed(stamped, "-" + std::to_string(n));
    return name;
}

void SetAside(std::filesystem::path const& file, std::vector<std::string> const& suffixes)
{
    std::filesystem::path const name = FreeName(file, "damaged", suffixes);
    for (std::string const& suffix : suffixes)
    {
        std::error_code error;
        std::filesystem::rename(Suffixed(file, suffix), Suffixed(name, suffix), error);
        if (error && error != std::errc::no_such_file_or_directory)
            throw FileError(
                FileFault(Suffixed(file, suffix), "damaged, and cannot be set aside", error.value()));
    }
    Report(file.string() + ": set aside as " + name.filename().string());
}
}  // namespace standin
