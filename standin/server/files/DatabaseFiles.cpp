#include "standin/server/files/DatabaseFiles.h"

#include "standin/server/files/ForkedChild.h"
#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <mutex>
#include <utility>

namespace standin
{
namespace
{
constinit std::mutex lock;
std::vector<std::vector<std::filesystem::path> const*>& OpenDatabases()
{
    static auto& all = *new std::vector<std::vector<std::filesystem::path> const*>;
    return all;
}

bool IsTheFileAt(std::filesystem::path const& path, struct stat const& file)
{
    struct stat named = {};
    return stat(path.c_str(), &named) == 0 && named.st_dev == file.st_dev && named.st_ino == file.st_ino;
}
}  // namespace

DatabaseFiles::DatabaseFiles(std::vector<std::filesystem::path> files) : m_files(std::move(files))
{
    std::lock_guard const guard(lock);
    OpenDatabases().push_back(&m_files);
}

DatabaseFiles::~DatabaseFiles()
{
    if (IsForkedChild())
        return;  // the lock may be a thread's that is not here, and nobody will look any more
    std::lock_guard const guard(lock);
    std::erase(OpenDatabases(), &m_files);
}

void DatabaseFiles::RefuseIfOpen(struct stat const& file, std::string const& shown)
{
    std::lock_guard const guard(lock);
    for (auto const* const files : OpenDatabases())
        if (std::any_of(files->begin(), files->end(),
                        [&](auto const& path) { return IsTheFileAt(path, file); }))
            throw FileError(
                shown + ": belongs to the database of a site that is open; choose another file, or copy the "
                        "site with comgui_site backup");
}

// A descriptor that is good for nothing but looking holds no locks, and what was looked at is what is opened.
Descriptor OpenToRead(int folder, std::filesystem::path const& file, int flags)
{
#ifdef O_PATH
    Descriptor const look(openat(folder, file.c_str(), O_PATH | O_CLOEXEC | (flags & O_NOFOLLOW)));
    if (look.Number() < 0)
        return Descriptor();
    struct stat found = {};
    if (fstat(look.Number(), &found) != 0)
        return Descriptor();
    DatabaseFiles::RefuseIfOpen(found, file.string());
    if (S_ISLNK(found.st_mode))
    {
        errno = ELOOP;
        return Descriptor();
    }
    std::string const same = "/proc/self/fd/" + std::to_string(look.Number());
    Descriptor opened(open(same.c_str(), flags & ~O_NOFOLLOW));
    if (opened.Number() >= 0 || errno != ENOENT)  // which it is without /proc
        return opened;
#else
    struct stat found = {};
    if (fstatat(folder, file.c_str(), &found, (flags & O_NOFOLLOW) ? AT_SYMLINK_NOFOLLOW : 0) == 0)
        DatabaseFiles::RefuseIfOpen(found, file.string());
#endif
    return Descriptor(openat(folder, file.c_str(), flags));
}
}  // namespace standin
