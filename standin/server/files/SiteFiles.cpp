#include "standin/server/files/SiteFiles.h"

#include "standin/server/files/AtomicFile.h"
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <ctime>
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

std::filesystem::path FreeName(std::filesystem::path const& file, std::vector<std::string> const& suffixes)
{
    std::filesystem::path const stamped = Suffixed(file, ".damaged-" + Now());
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
}  // namespace

void Report(std::string const& line) noexcept { std::fprintf(stderr, "%s\n", line.c_str()); }

void MakePrivateFolder(std::filesystem::path const& folder)
{
    std::error_code error;
    std::filesystem::create_directories(folder.parent_path(), error);
    if (error)
        throw FileError(folder, "the folder cannot be made", error.value());
    if (mkdir(folder.c_str(), 0700) == 0)
        return;
    int const reason = errno;
    if (reason != EEXIST)
        throw FileError(folder, "the folder cannot be made", reason);
    if (!std::filesystem::is_directory(folder, error))
        throw FileError(folder, "the folder cannot be made", ENOTDIR);
}

void SetAside(std::filesystem::path const& file, std::vector<std::string> const& suffixes)
{
    std::filesystem::path const name = FreeName(file, suffixes);
    for (std::string const& suffix : suffixes)
    {
        std::error_code error;
        std::filesystem::rename(Suffixed(file, suffix), Suffixed(name, suffix), error);
        if (error && error != std::errc::no_such_file_or_directory)
            throw FileError(Suffixed(file, suffix), "damaged, and cannot be set aside", error.value());
    }
    Report(file.string() + ": set aside as " + name.filename().string());
}
}  // namespace standin
