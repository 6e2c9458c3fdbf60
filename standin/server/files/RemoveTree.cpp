#include "standin/server/files/RemoveTree.h"

#include "standin/server/files/Descriptor.h"
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <dirent.h>
#include <memory>

namespace standin
{
namespace
{
struct CloseFolder
{
    void operator()(DIR* folder) const noexcept { closedir(folder); }
};

// What has gone meanwhile is as good as removed.
bool IsGone(int result) { return result == 0 || errno == ENOENT; }

bool RemoveEntry(int folder, char const* name)
{
    if (IsGone(unlinkat(folder, name, 0)))
        return true;
    bool const mayBeFolder = errno == EISDIR || errno == EPERM;
    int const error = errno;
    Descriptor const inner(mayBeFolder ? openat(folder, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC)
                                       : -1);
    if (mayBeFolder && inner.Number() >= 0)
        return RemoveContent(inner.Number()) && IsGone(unlinkat(folder, name, AT_REMOVEDIR));
    errno = mayBeFolder && errno != ENOTDIR ? errno : error;
    return false;
}
}  // namespace

std::vector<std::string> NamesIn(int folder)
{
    std::vector<std::string> names;
    int const again = openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);  // read from its beginning
    std::unique_ptr<DIR, CloseFolder> const opened(again < 0 ? nullptr : fdopendir(again));
    if (!opened)
    {
        int const error = errno;
        if (again >= 0)
            close(again);
        errno = error;
        return names;
    }
    errno = 0;
    while (dirent const* const entry = readdir(opened.get()))
        if (std::strcmp(entry->d_name, ".") != 0 && std::strcmp(entry->d_name, "..") != 0)
            names.emplace_back(entry->d_name);
    return names;
}

bool RemoveContent(int folder, std::function<bool(std::string const& name)> const& last)
{
    auto names = NamesIn(folder);
    if (errno != 0)
        return false;
    auto const lasts = std::stable_partition(names.begin(), names.end(),
                                             [&](auto const& name) { return !last || !last(name); });
    int reason = 0;
    auto const remove = [&](std::string const& name)
    {
        if (!RemoveEntry(folder, name.c_str()) && reason == 0)
            reason = errno;
    };
    std::for_each(names.begin(), lasts, remove);
    if (reason == 0)
        std::for_each(lasts, names.end(), remove);
    errno = reason;
    return reason == 0;
}
}  // namespace standin
