#include "bench/site/SiteWatch.h"

#include <algorithm>
#include <fstream>
#include <sys/resource.h>

namespace fs = std::filesystem;

namespace
{
// Those whose names are wanted, in all folders; files come and go meanwhile.
std::vector<std::string> FilesIn(fs::path const& folder, bool (*isWanted)(std::string const& name))
{
    std::vector<std::string> found;
    std::error_code error;
    fs::recursive_directory_iterator entry(folder, error);
    for (; !error && entry != fs::recursive_directory_iterator(); entry.increment(error))
        if (isWanted(entry->path().filename().string()))
            found.push_back(entry->path().string());
    return found;
}
}  // namespace

std::vector<std::string> UnfinishedIn(fs::path const& site)
{
    return FilesIn(site, [](std::string const& name)
                   { return name.starts_with(".transfer.") || name.starts_with(".removed-"); });
}

std::vector<std::string> TemporaryIn(fs::path const& site)
{
    return FilesIn(site, [](std::string const& name)
                   { return name.ends_with(".tmp") || name.starts_with(".removed-"); });
}

std::size_t JobFoldersIn(fs::path const& site)
{
    std::error_code error;
    fs::directory_iterator const jobs(site / "job", error);
    return error ? 0
                 : static_cast<std::size_t>(std::count_if(
                       begin(jobs), end(jobs),
                       [](auto const& job) { return job.path().filename().string().front() != '.'; }));
}

std::uintmax_t DatabaseSizeOf(fs::path const& site)
{
    std::uintmax_t size = 0;
    for (char const* const name : {"site.db", "site.db-wal"})
    {
        std::error_code error;
        std::uintmax_t const bytes = fs::file_size(site / name, error);
        size += error ? 0 : bytes;
    }
    return size;
}

std::optional<Footprint> FootprintOf(pid_t process)
{
    fs::path const place = fs::path("/proc") / std::to_string(process);
    Footprint footprint;
    std::error_code error;
    for (fs::directory_iterator file(place / "fd", error); !error && file != fs::directory_iterator();
         file.increment(error))
        ++footprint.files;
    std::ifstream status(place / "status");
    for (std::string line; std::getline(status, line);)
        if (line.starts_with("VmRSS:"))
            footprint.kilobytes = std::stol(line.substr(6));
    if (footprint.kilobytes == 0)
        return std::nullopt;
    return footprint;
}

bool SetDiskFull(pid_t process, bool isFull)
{
    rlimit limit{};
    if (prlimit(process, RLIMIT_FSIZE, nullptr, &limit) != 0)
        return false;
    limit.rlim_cur = isFull ? 4096 : limit.rlim_max;
    return prlimit(process, RLIMIT_FSIZE, &limit, nullptr) == 0;
}
