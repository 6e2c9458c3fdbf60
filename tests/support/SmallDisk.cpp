#include "tests/support/SmallDisk.h"

#include <cerrno>
#include <fcntl.h>
#include <sched.h>
#include <sys/mount.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace
{
constexpr char Options[] = "size=512m,mode=0700";
constexpr char Ballast[] = "ballast";
}  // namespace

SmallDisk::SmallDisk(fs::path folder, bool isWanted) : m_folder(std::move(folder))
{
    fs::create_directories(m_folder);
    m_isThere = isWanted && unshare(CLONE_NEWNS) == 0 &&
                mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
                mount("soak", m_folder.c_str(), "tmpfs", 0, Options) == 0;
}

SmallDisk::~SmallDisk()
{
    if (m_isThere)
        umount2(m_folder.c_str(), MNT_DETACH);
}

void SmallDisk::Fill() const
{
    int const file = open((m_folder / Ballast).c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
    off_t size = 0;
    for (off_t piece = off_t{64} << 20; piece >= 4096;)
        if (posix_fallocate(file, size, piece) == 0)
            size += piece;
        else
            piece /= 2;
    close(file);
}

void SmallDisk::Free() const
{
    std::error_code error;
    fs::remove(m_folder / Ballast, error);
}

void SmallDisk::Unload()
{
    if (!m_isThere)
        return;
    fs::path const beside = m_folder.string() + ".unloaded";
    fs::copy(m_folder, beside, fs::copy_options::recursive);
    m_isThere = umount2(m_folder.c_str(), MNT_DETACH) != 0;
    fs::remove(m_folder);
    fs::rename(beside, m_folder);
}
