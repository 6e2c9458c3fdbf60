#include "standin/server/site/SiteLock.h"

#include "standin/server/files/AtomicFile.h"
#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <fcntl.h>
#include <string>
#include <sys/file.h>
#include <unistd.h>

namespace standin
{
namespace
{
std::string ProgramName()
{
#if defined(__GLIBC__)
    return program_invocation_short_name;
#else
    return getprogname();
#endif
}

// "process 4711 (session_tour)", as the owner has left it in the file.
std::string Owner(int descriptor)
{
    char text[256];
    ssize_t const size = pread(descriptor, text, sizeof(text), 0);
    std::string owner(text, size < 0 ? 0 : static_cast<std::size_t>(size));
    owner.erase(std::min(owner.find('\n'), owner.size()));
    return owner.empty() ? "another process" : "process " + owner;
}
}  // namespace

SiteLock::SiteLock(std::filesystem::path const& folder)
{
    std::filesystem::path const file = folder / "site.lock";
    m_descriptor = open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    if (m_descriptor < 0)
        throw FileError(file, "cannot be opened", errno);
    if (flock(m_descriptor, LOCK_EX | LOCK_NB) != 0)
    {
        int const error = errno;
        std::string const owner = Owner(m_descriptor);
        close(m_descriptor);
        if (error != EWOULDBLOCK)
            throw FileError(file, "cannot be locked", error);
        throw StorageError(folder.string() + ": in use by " + owner +
                           "; end it first, or choose another site with COMGUI_SITE");
    }
    // Who has it is a help to people; the lock holds without it, on a full disk too.
    std::string const owner = std::to_string(getpid()) + " (" + ProgramName() + ")\n";
    if (ftruncate(m_descriptor, 0) != 0 || pwrite(m_descriptor, owner.data(), owner.size(), 0) < 0)
        return;
}

SiteLock::~SiteLock() { close(m_descriptor); }
}  // namespace standin
