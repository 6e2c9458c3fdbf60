// A library for LD_PRELOAD that writes down how a program changes files. It takes the place of the calls of
// the C library by which files change, carries each out by the system call itself, and appends what it did to
// the file that COMGUI_DISK_LOG names, if it was below the folder that COMGUI_DISK_ROOT names. The call and
// its record are one step for all threads and all programs that share the log, so that the log has the true
// order.
//
// Not recorded: what is written through a mapping. The programs map the file of locks and SQLite's -shm file
// alone, and whoever opens a site first after a power cut makes both anew without looking at their content.
// Any other file that is mapped for writing, and any call that the log cannot describe, becomes a record of
// its own on which the model gives up. So does a file that is opened by stdio, whose writes cannot be seen.
#include "tests/powercut/DiskRecord.h"

#include <atomic>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <mutex>
#include <string>
#include <string_view>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <unistd.h>

#define RECORDED extern "C" __attribute__((visibility("default")))

namespace
{
[[noreturn]] void GiveUp(char const* what)
{
    std::fprintf(stderr, "the disk recorder: %s\n", what);
    std::abort();
}

class Log
{
public:
    static Log& Get()
    {
        static Log& log = *new Log;  // programs write to their very end
        return log;
    }

    bool Covers(std::string_view path) const
    {
        return !m_root.empty() && path.substr(0, m_root.size()) == m_root &&
               (path.size() == m_root.size() || path[m_root.size()] == '/');
    }

    // From here to its end no other call is carried out.
    class Step
    {
    public:
        Step() : m_lock(Get().m_lock) { flock(Get().m_file, LOCK_EX); }
        ~Step()
        {
            int const error = errno;
            flock(Get().m_file, LOCK_UN);
            errno = error;
        }
        Step(Step const&) = delete;
        Step& operator=(Step const&) = delete;

    private:
        std::lock_guard<std::mutex> m_lock;
    };

    void Append(DiskRecordHead head, std::string_view path, std::string_view other = {},
                std::string_view data = {}) const
    {
        head.pathSize = static_cast<std::uint32_t>(path.size());
        head.otherSize = static_cast<std::uint32_t>(other.size());
        head.dataSize = data.size();
        std::string record(reinterpret_cast<char const*>(&head), sizeof head);
        record.append(path).append(other).append(data);
        if (syscall(SYS_write, m_file, record.data(), record.size()) != static_cast<long>(record.size()))
            GiveUp("the log cannot be written");
    }

private:
    Log()
    {
        char const* const root = std::getenv("COMGUI_DISK_ROOT");
        char const* const file = std::getenv("COMGUI_DISK_LOG");
        if (!root || !file)
            return;
        m_file = static_cast<int>(
            syscall(SYS_openat, AT_FDCWD, file, O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600));
        if (m_file < 0)
            GiveUp("the log cannot be opened");
        m_root = root;
    }

    std::mutex m_lock;
    std::string m_root;
    int m_file = -1;
};

// Restores errno, so that what is asked on the way does not show.
class ErrnoKeeper
{
public:
    ~ErrnoKeeper() { errno = m_error; }

private:
    int m_error = errno;
};

std::string LinkAt(std::string const& link)
{
    char target[PATH_MAX];
    ssize_t const size = readlink(link.c_str(), target, sizeof target);
    return {target, size > 0 ? static_cast<std::size_t>(size) : 0};
}

std::string PathOf(int descriptor) { return LinkAt("/proc/self/fd/" + std::to_string(descriptor)); }

// The path of a name in a folder, with no link in it but the last part.
std::string PathOf(int folder, char const* name)
{
    ErrnoKeeper const keeper;
    std::string path = name;
    if (path.empty() || path[0] != '/')
        path = (folder == AT_FDCWD ? LinkAt("/proc/self/cwd") : PathOf(folder)) + "/" + path;
    std::size_t const slash = path.find_last_of('/');
    char parent[PATH_MAX];
    if (!realpath(path.substr(0, slash + 1).c_str(), parent))
        return path;
    return std::string(parent) + "/" + path.substr(slash + 1);
}

bool IsRecorded(int descriptor)
{
    ErrnoKeeper const keeper;
    return Log::Get().Covers(PathOf(descriptor));
}

std::uint64_t InodeOf(int descriptor)
{
    struct stat found = {};
    fstat(descriptor, &found);
    return found.st_ino;
}

void Note(DiskCall call, int descriptor, std::int64_t offset = 0, std::string_view data = {})
{
    ErrnoKeeper const keeper;
    DiskRecordHead head{};
    head.call = call;
    head.file = InodeOf(descriptor);
    head.offset = offset;
    Log::Get().Append(head, {}, {}, data);
}

void NotePath(DiskCall call, std::string_view path, std::string_view other = {}, std::uint64_t file = 0)
{
    ErrnoKeeper const keeper;
    DiskRecordHead head{};
    head.call = call;
    head.file = file;
    Log::Get().Append(head, path, other);
}

void NoteUnknown(char const* call, std::string_view path)
{
    Log::Step const step;
    NotePath(DiskCall::Unknown, std::string(call) + " of " + std::string(path));
}

int Open(int folder, char const* name, int flags, mode_t mode)
{
    auto const open = [&] { return static_cast<int>(syscall(SYS_openat, folder, name, flags, mode)); };
    std::string const path = flags & (O_CREAT | O_TRUNC) ? PathOf(folder, name) : std::string();
    if (!Log::Get().Covers(path))
        return open();
    Log::Step const step;
    struct stat before = {};
    bool const wasThere = lstat(path.c_str(), &before) == 0;
    int const descriptor = open();
    if (descriptor >= 0 && !wasThere)
        NotePath(DiskCall::MakeFile, path, {}, InodeOf(descriptor));
    else if (descriptor >= 0 && (flags & O_TRUNC))
        Note(DiskCall::Resize, descriptor);
    return descriptor;
}

mode_t ModeOf(int flags, va_list arguments)
{
    return flags & O_CREAT ? static_cast<mode_t>(va_arg(arguments, unsigned)) : 0;
}

// Where a write without a position goes.
std::int64_t PositionOf(int descriptor)
{
    bool const appends = (fcntl(descriptor, F_GETFL) & O_APPEND) != 0;
    return lseek(descriptor, 0, appends ? SEEK_END : SEEK_CUR);
}

ssize_t Write(int descriptor, void const* data, std::size_t size)
{
    auto const write = [&] { return syscall(SYS_write, descriptor, data, size); };
    if (!IsRecorded(descriptor))
        return write();
    Log::Step const step;
    std::int64_t const offset = PositionOf(descriptor);
    ssize_t const count = write();
    if (count > 0)
        Note(DiskCall::Write, descriptor, offset,
             {static_cast<char const*>(data), static_cast<std::size_t>(count)});
    return count;
}

ssize_t WriteAt(int descriptor, void const* data, std::size_t size, off_t offset)
{
    auto const write = [&] { return syscall(SYS_pwrite64, descriptor, data, size, offset); };
    if (!IsRecorded(descriptor))
        return write();
    Log::Step const step;
    ssize_t const count = write();
    if (count > 0)
        Note(DiskCall::Write, descriptor, offset,
             {static_cast<char const*>(data), static_cast<std::size_t>(count)});
    return count;
}

std::string Joined(iovec const* parts, int count)
{
    std::string data;
    for (int i = 0; i < count; ++i)
        data.append(static_cast<char const*>(parts[i].iov_base), parts[i].iov_len);
    return data;
}

int Resize(int descriptor, off_t size)
{
    auto const resize = [&] { return static_cast<int>(syscall(SYS_ftruncate, descriptor, size)); };
    if (!IsRecorded(descriptor))
        return resize();
    Log::Step const step;
    int const result = resize();
    if (result == 0)
        Note(DiskCall::Resize, descriptor, size);
    return result;
}

int Allocate(int descriptor, int mode, off_t offset, off_t size)
{
    auto const allocate = [&]
    { return static_cast<int>(syscall(SYS_fallocate, descriptor, mode, offset, size)); };
    if (!IsRecorded(descriptor))
        return allocate();
    if (mode != 0)
        NoteUnknown("fallocate with a mode", PathOf(descriptor));
    Log::Step const step;
    int const result = allocate();
    if (result == 0)
        Note(DiskCall::Grow, descriptor, offset + size);
    return result;
}

// The bytes of the source are taken by a read of their own: the target may not be open for reading.
ssize_t CopyRange(int from, off_t* fromOffset, int to, off_t* toOffset, std::size_t size, unsigned flags)
{
    auto const copy = [&]
    { return syscall(SYS_copy_file_range, from, fromOffset, to, toOffset, size, flags); };
    if (!IsRecorded(to))
        return copy();
    Log::Step const step;
    off_t const begin = fromOffset ? *fromOffset : lseek(from, 0, SEEK_CUR);
    off_t const target = toOffset ? *toOffset : lseek(to, 0, SEEK_CUR);
    ssize_t const count = copy();
    if (count > 0)
    {
        std::string data(static_cast<std::size_t>(count), '\0');
        if (syscall(SYS_pread64, from, data.data(), data.size(), begin) != count)
            GiveUp("what was copied cannot be read");
        Note(DiskCall::Write, to, target, data);
    }
    return count;
}

int Rename(int fromFolder, char const* from, int toFolder, char const* to, unsigned flags)
{
    auto const rename = [&]
    { return static_cast<int>(syscall(SYS_renameat2, fromFolder, from, toFolder, to, flags)); };
    std::string const path = PathOf(fromFolder, from);
    std::string const other = PathOf(toFolder, to);
    bool const isInside = Log::Get().Covers(path);
    if (!isInside && !Log::Get().Covers(other))
        return rename();
    if ((flags & ~static_cast<unsigned>(RENAME_NOREPLACE)) != 0 || isInside != Log::Get().Covers(other))
        NoteUnknown("an exchange, or a rename into or out of the folder,", path);
    Log::Step const step;
    int const result = rename();
    if (result == 0)
        NotePath(DiskCall::Rename, path, other);
    return result;
}

int Remove(int folder, char const* name, int flags)
{
    auto const remove = [&] { return static_cast<int>(syscall(SYS_unlinkat, folder, name, flags)); };
    std::string const path = PathOf(folder, name);
    if (!Log::Get().Covers(path))
        return remove();
    Log::Step const step;
    int const result = remove();
    if (result == 0)
        NotePath(DiskCall::Remove, path);
    return result;
}

int MakeFolder(int folder, char const* name, mode_t mode)
{
    auto const make = [&] { return static_cast<int>(syscall(SYS_mkdirat, folder, name, mode)); };
    std::string const path = PathOf(folder, name);
    if (!Log::Get().Covers(path))
        return make();
    Log::Step const step;
    int const result = make();
    struct stat made = {};
    if (result == 0 && lstat(path.c_str(), &made) == 0)
        NotePath(DiskCall::MakeFolder, path, {}, made.st_ino);
    return result;
}

std::int64_t NewFlush()
{
    static std::atomic<std::int64_t> counter{0};
    return (static_cast<std::int64_t>(getpid()) << 32) + ++counter;
}

void TakeTime()
{
    static char const* const text = std::getenv("COMGUI_DISK_FLUSH_US");
    if (text)
        usleep(static_cast<useconds_t>(std::strtoul(text, nullptr, 10)));
}

int Flush(int descriptor, long call)
{
    if (!IsRecorded(descriptor))
        return static_cast<int>(syscall(call, descriptor));
    std::int64_t const number = NewFlush();
    {
        Log::Step const step;
        Note(DiskCall::BeginFlush, descriptor, number);
    }
    TakeTime();
    Log::Step const step;
    int const result = static_cast<int>(syscall(call, descriptor));
    if (result == 0)
        Note(DiskCall::Flush, descriptor, number);
    return result;
}

bool EndsIn(std::string_view text, std::string_view end)
{
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

void* Map(void* address, std::size_t size, int protection, int flags, int descriptor, off_t offset)
{
    bool const isWritten = descriptor >= 0 && (flags & MAP_SHARED) != 0 && (protection & PROT_WRITE) != 0;
    if (isWritten && IsRecorded(descriptor))
    {
        std::string const path = PathOf(descriptor);
        if (!EndsIn(path, "-shm") && !EndsIn(path, "/site.lock"))
            NoteUnknown("a mapping for writing", path);
    }
    return reinterpret_cast<void*>(syscall(SYS_mmap, address, size, protection, flags, descriptor, offset));
}

// With a path of the recorded folder nothing that the program writes would be seen.
FILE* OpenStream(char const* path, char const* mode)
{
    bool const writes = std::string_view(mode).find_first_of("wa+") != std::string_view::npos;
    if (writes && Log::Get().Covers(PathOf(AT_FDCWD, path)))
        NoteUnknown("fopen", path);
    bool const creates = mode[0] != 'r';
    int const direction = std::string_view(mode).find('+') != std::string_view::npos ? O_RDWR
                          : mode[0] == 'r'                                           ? O_RDONLY
                                                                                     : O_WRONLY;
    int const extra = mode[0] == 'a' ? O_APPEND : mode[0] == 'w' ? O_TRUNC : 0;
    int const descriptor = static_cast<int>(
        syscall(SYS_openat, AT_FDCWD, path, direction | (creates ? O_CREAT : 0) | extra | O_CLOEXEC, 0666));
    return descriptor < 0 ? nullptr : fdopen(descriptor, mode);
}
}  // namespace

// For the programs that are recorded: a text of theirs in the log.
RECORDED void comgui_disk_mark(char const* text)
{
    Log::Step const step;
    NotePath(DiskCall::Mark, text);
}

#define COMGUI_RECORD_OPEN(name)                                                                             \
    RECORDED int name(char const* path, int flags, ...)                                                      \
    {                                                                                                        \
        va_list arguments;                                                                                   \
        va_start(arguments, flags);                                                                          \
        mode_t const mode = ModeOf(flags, arguments);                                                        \
        va_end(arguments);                                                                                   \
        return Open(AT_FDCWD, path, flags, mode);                                                            \
    }
COMGUI_RECORD_OPEN(open)
COMGUI_RECORD_OPEN(open64)

#define COMGUI_RECORD_OPENAT(name)                                                                           \
    RECORDED int name(int folder, char const* path, int flags, ...)                                          \
    {                                                                                                        \
        va_list arguments;                                                                                   \
        va_start(arguments, flags);                                                                          \
        mode_t const mode = ModeOf(flags, arguments);                                                        \
        va_end(arguments);                                                                                   \
        return Open(folder, path, flags, mode);                                                              \
    }
COMGUI_RECORD_OPENAT(openat)
COMGUI_RECORD_OPENAT(openat64)

// The headers of the C library name some of these functions twice, for files of any size.
#define COMGUI_RECORD_TWICE(result, name, parameters, call)                                                  \
    RECORDED result name parameters { return call; }                                                         \
    RECORDED result name##64 parameters { return call; }
COMGUI_RECORD_TWICE(int, creat, (char const* path, mode_t mode),
                    Open(AT_FDCWD, path, O_WRONLY | O_CREAT | O_TRUNC, mode))
COMGUI_RECORD_TWICE(ssize_t, pwrite, (int file, void const* data, size_t size, off_t offset),
                    WriteAt(file, data, size, offset))
COMGUI_RECORD_TWICE(ssize_t, pwritev, (int file, iovec const* parts, int count, off_t offset),
                    WriteAt(file, Joined(parts, count).data(), Joined(parts, count).size(), offset))
COMGUI_RECORD_TWICE(int, ftruncate, (int file, off_t size) noexcept, Resize(file, size))
COMGUI_RECORD_TWICE(int, fallocate, (int file, int mode, off_t offset, off_t size),
                    Allocate(file, mode, offset, size))
COMGUI_RECORD_TWICE(int, posix_fallocate, (int file, off_t offset, off_t size),
                    Allocate(file, 0, offset, size) == 0 ? 0 : errno)
COMGUI_RECORD_TWICE(void*, mmap,
                    (void* address, size_t size, int protection, int flags, int file, off_t offset) noexcept,
                    Map(address, size, protection, flags, file, offset))
COMGUI_RECORD_TWICE(FILE*, fopen, (char const* path, char const* mode), OpenStream(path, mode))

RECORDED ssize_t write(int file, void const* data, size_t size) { return Write(file, data, size); }
RECORDED ssize_t writev(int file, iovec const* parts, int count)
{
    std::string const data = IsRecorded(file) ? Joined(parts, count) : std::string();
    return data.empty() ? syscall(SYS_writev, file, parts, count) : Write(file, data.data(), data.size());
}
RECORDED ssize_t copy_file_range(int from, off_t* fromOffset, int to, off_t* toOffset, size_t size,
                                 unsigned flags)
{
    return CopyRange(from, fromOffset, to, toOffset, size, flags);
}
RECORDED ssize_t sendfile(int to, int from, off_t* offset, size_t size) noexcept
{
    if (IsRecorded(to))
        NoteUnknown("sendfile", PathOf(to));
    return syscall(SYS_sendfile, to, from, offset, size);
}
RECORDED ssize_t sendfile64(int to, int from, off_t* offset, size_t size) noexcept
{
    return sendfile(to, from, offset, size);
}
RECORDED int rename(char const* from, char const* to) noexcept
{
    return Rename(AT_FDCWD, from, AT_FDCWD, to, 0);
}
RECORDED int renameat(int fromFolder, char const* from, int toFolder, char const* to) noexcept
{
    return Rename(fromFolder, from, toFolder, to, 0);
}
RECORDED int renameat2(int fromFolder, char const* from, int toFolder, char const* to,
                       unsigned flags) noexcept
{
    return Rename(fromFolder, from, toFolder, to, flags);
}
RECORDED int unlink(char const* path) noexcept { return Remove(AT_FDCWD, path, 0); }
RECORDED int unlinkat(int folder, char const* path, int flags) noexcept
{
    return Remove(folder, path, flags);
}
RECORDED int rmdir(char const* path) noexcept { return Remove(AT_FDCWD, path, AT_REMOVEDIR); }
RECORDED int remove(char const* path) noexcept
{
    int const result = Remove(AT_FDCWD, path, 0);
    return result != 0 && errno == EISDIR ? Remove(AT_FDCWD, path, AT_REMOVEDIR) : result;
}
RECORDED int mkdir(char const* path, mode_t mode) noexcept { return MakeFolder(AT_FDCWD, path, mode); }
RECORDED int mkdirat(int folder, char const* path, mode_t mode) noexcept
{
    return MakeFolder(folder, path, mode);
}
RECORDED int fsync(int file) { return Flush(file, SYS_fsync); }
RECORDED int fdatasync(int file) { return Flush(file, SYS_fdatasync); }

// It leaves the size of the file and the cache of the drive out, so nothing is certain after it.
RECORDED int sync_file_range(int file, off64_t offset, off64_t size, unsigned flags)
{
    return static_cast<int>(syscall(SYS_sync_file_range, file, offset, size, flags));
}
RECORDED int truncate(char const* path, off_t size) noexcept
{
    if (Log::Get().Covers(PathOf(AT_FDCWD, path)))
        NoteUnknown("truncate", path);
    return static_cast<int>(syscall(SYS_truncate, path, size));
}
RECORDED int linkat(int fromFolder, char const* from, int toFolder, char const* to, int flags) noexcept
{
    if (Log::Get().Covers(PathOf(toFolder, to)))
        NoteUnknown("link", to);
    return static_cast<int>(syscall(SYS_linkat, fromFolder, from, toFolder, to, flags));
}
RECORDED int link(char const* from, char const* to) noexcept
{
    return linkat(AT_FDCWD, from, AT_FDCWD, to, 0);
}
RECORDED int symlinkat(char const* target, int folder, char const* path) noexcept
{
    if (Log::Get().Covers(PathOf(folder, path)))
        NoteUnknown("symlink", path);
    return static_cast<int>(syscall(SYS_symlinkat, target, folder, path));
}
RECORDED int symlink(char const* target, char const* path) noexcept
{
    return symlinkat(target, AT_FDCWD, path);
}
