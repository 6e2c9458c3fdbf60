#include "standin/server/store/sqlite/LockFile.h"

#include "standin/server/files/FileError.h"
#include "standin/server/files/ForkedChild.h"
#include "standin/server/store/Store.h"
#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <mutex>
#include <pthread.h>
#include <string>
#include <sys/file.h>
#include <sys/stat.h>
#include <thread>
#include <vector>

#ifndef F_OFD_SETLK
#    error "locks that belong to an open file (F_OFD_SETLK) are needed"
#endif

namespace standin
{
namespace
{
constexpr std::chrono::milliseconds DeathLimit(500);
constexpr std::chrono::milliseconds Pause(5);

// "process 4711 (session_tour)", as the version that knew only one owner has left it in the file.
std::string OnlyOwner(int descriptor)
{
    char text[256];
    ssize_t const size = pread(descriptor, text, sizeof text, 0);
    std::string owner(text, size < 0 ? 0 : static_cast<std::size_t>(size));
    owner.erase(std::min(owner.find('\n'), owner.size()));
    bool const isNumbered = !owner.empty() && owner[0] >= '1' && owner[0] <= '9';
    return isNumbered ? "process " + owner : "another process";
}
}  // namespace

// All lock files of the process, for what is due when it forks.
class LockFile::Registry
{
public:
    static void Add(LockFile& file)
    {
        static int const registered = pthread_atfork(&Lock, &Unlock, &CloseInChild);
        std::lock_guard const lock(mutex);
        if (registered != 0)
            throw StoreError(file.m_path.string() + ": no memory; end other programs, then try again");
        file.m_next = first;
        first = &file;
    }

    static void Remove(LockFile& file)
    {
        std::lock_guard const lock(mutex);
        for (LockFile** link = &first; *link != nullptr; link = &(*link)->m_next)
            if (*link == &file)
            {
                *link = file.m_next;
                return;
            }
    }

private:
    static void Lock() { mutex.lock(); }
    static void Unlock() { mutex.unlock(); }
    static void CloseInChild()
    {
        for (LockFile* file = first; file != nullptr; file = file->m_next)
        {
            if (file->m_file.Number() >= 0)
                NoteForkedChild();
            file->m_file.Close();
            file->m_folder.Close();
            file->m_isForeign = true;
        }
        mutex.unlock();
    }

    static constinit std::mutex mutex;
    static constinit LockFile* first;
};
constinit std::mutex LockFile::Registry::mutex;
constinit LockFile* LockFile::Registry::first = nullptr;

LockFile::LockFile(std::filesystem::path const& folder) : m_path(folder / "site.lock")
{
    // SQLite's own notes of the parent's locks would lead it astray, and its mutexes, which it has for all
    // databases together, may be those of threads that are not here.
    if (IsForkedChild())
        throw StoreError(folder.string() +
                         ": this process is a copy of one that has a site open; open it in a "
                         "program that was started anew");
    m_folder = Descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (m_folder.Number() < 0)
        throw StoreError(FileFault(folder, "cannot be opened", errno));
    m_file = Descriptor(open(m_path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
    struct stat found = {};
    if (m_file.Number() < 0 || fstat(m_file.Number(), &found) != 0)
        Fail("cannot be opened", errno);
    m_inode = static_cast<std::int64_t>(found.st_ino);
    // The older version holds this lock exclusively; with ours it refuses as well, and leaves the page alone.
    if (flock(m_file.Number(), LOCK_SH | LOCK_NB) != 0)
    {
        int const error = errno;
        if (error != EWOULDBLOCK)
            Fail("cannot be locked", error);
        throw StoreError(
            folder.string() + ": in use by " + OnlyOwner(m_file.Number()) +
            ", of an older version that shares with nobody; end it first, or choose another site");
    }
    Registry::Add(*this);
}

LockFile::~LockFile() { Registry::Remove(*this); }

void LockFile::Close()
{
    m_file = Descriptor();
    m_folder = Descriptor();
}

bool LockFile::Set(short type, off_t byte)
{
    struct flock lock = {};  // l_pid has to be 0
    lock.l_type = type;
    lock.l_whence = SEEK_SET;
    lock.l_start = byte;
    lock.l_len = 1;
    while (fcntl(m_file.Number(), F_OFD_SETLK, &lock) != 0)
    {
        if (errno == EAGAIN || errno == EACCES)
            return false;
        if (errno != EINTR)
            Fail("cannot be locked", errno);
    }
    return true;
}

bool LockFile::TryLock(off_t byte, Hold hold)
{
    return Set(static_cast<short>(hold == Hold::Shared ? F_RDLCK : F_WRLCK), byte);
}

// By asking again and again: a lock that is waited for knows no time limit.
bool LockFile::LockWithin(off_t byte, Hold hold, std::chrono::milliseconds limit)
{
    using namespace std::chrono_literals;
    auto const end = std::chrono::steady_clock::now() + limit;
    for (std::chrono::milliseconds pause = 1ms; !TryLock(byte, hold); pause = std::min(2 * pause, 32ms))
    {
        if (std::chrono::steady_clock::now() >= end)
            return false;
        std::this_thread::sleep_for(pause);
    }
    return true;
}

void LockFile::Unlock(off_t byte) { Set(F_UNLCK, byte); }

bool LockFile::IsLockedElsewhere(off_t byte) const
{
    struct flock lock = {};
    lock.l_type = F_WRLCK;
    lock.l_whence = SEEK_SET;
    lock.l_start = byte;
    lock.l_len = 1;
    if (fcntl(m_file.Number(), F_OFD_GETLK, &lock) != 0)
        Fail("cannot be asked for locks", errno);
    return lock.l_type != F_UNLCK;
}

void LockFile::HoldFolder() { flock(m_folder.Number(), LOCK_SH | LOCK_NB); }

// Of a program that dies the locks go one after the other, that of the folder perhaps behind those of the
// file. A file system that locks no folders has no opinion.
bool LockFile::IsFolderHeldElsewhere()
{
    auto const end = std::chrono::steady_clock::now() + DeathLimit;
    while (flock(m_folder.Number(), LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK)
    {
        if (std::chrono::steady_clock::now() > end)
            return true;
        std::this_thread::sleep_for(Pause);
    }
    return false;
}

bool LockFile::IsAtItsPath() const
{
    struct stat named = {};
    struct stat ours = {};
    return stat(m_path.c_str(), &named) == 0 && fstat(m_file.Number(), &ours) == 0 &&
           named.st_dev == ours.st_dev && named.st_ino == ours.st_ino;
}

void LockFile::Fail(char const* failed, int error) const
{
    throw StoreError(FileFault(m_path, failed, error));
}
}  // namespace standin
