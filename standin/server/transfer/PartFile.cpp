#include "standin/server/transfer/PartFile.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/DatabaseFiles.h"
#include "standin/server/files/Report.h"
#include "standin/server/transfer/TransferError.h"
#include <algorithm>
#include <cerrno>
#include <climits>
#include <fcntl.h>
#include <sys/stat.h>

namespace standin
{
namespace
{
constexpr std::string_view PartNameBeginning = ".transfer";

std::string NewPartName() { return std::string(PartNameBeginning) + "." + RandomName() + ".tmp"; }

// The absolute path of an open folder.
std::string PathOf(int folder)
{
#ifdef __APPLE__
    char path[PATH_MAX];
    return fcntl(folder, F_GETPATH, path) == 0 ? path : "";
#else
    std::error_code error;
    return std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(folder), error).string();
#endif
}

// A terminal that is opened must not become the process's own, and a pipe not keep it waiting for a writer.
constexpr int ToRead = O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

template <typename Work>
auto RefusingDatabases(Work const& work)
{
    try
    {
        return work();
    }
    catch (FileError const& error)
    {
        throw TransferError(PathRefused, ForMessages(error.what()));
    }
}

Descriptor Opened(int folder, std::string const& name, int flags)
{
    return RefusingDatabases([&] { return OpenToRead(folder, name, flags); });
}
}  // namespace

bool IsPartFileName(std::string_view name) { return IsTemporary(name, PartNameBeginning); }

void RemovePartFile(std::filesystem::path const& file)
{
    if (IsPartFileName(file.filename().string()))
        unlink(file.c_str());
}

SourceFile::SourceFile(int folder, std::string const& name)
    : m_file(Opened(folder, name, ToRead | O_NOFOLLOW))
{
    int const reason = errno;
    if (m_file.Number() < 0 && reason == ELOOP)
        throw TransferError(PathRefused, name + ": a symbolic link; name the file that it points at");
    Check(name, reason);
}

SourceFile::SourceFile(std::filesystem::path const& file) : m_file(Opened(AT_FDCWD, file.string(), ToRead))
{
    int const reason = errno;
    Check(file.string(), reason);
}

void SourceFile::Check(std::string const& shown, int reason)
{
    std::string const name = ForMessages(shown);
    if (m_file.Number() < 0)
        throw TransferError(reason == ENAMETOOLONG ? PathRefused
                            : reason == ENXIO      ? NotAFile
                                                   : SourceUnreadable,
                            FileFault(name, "cannot be read", reason));
    struct stat found = {};
    if (fstat(m_file.Number(), &found) != 0)
        throw TransferError(SourceUnreadable, FileFault(name, "cannot be read", errno));
    if (!S_ISREG(found.st_mode))
        throw TransferError(NotAFile, name + ": no regular file; name a file");
    m_size = found.st_size;
}

PartFile::PartFile(Store& store, int folder, std::string name)
    : m_store(store), m_folder(folder), m_name(std::move(name))
{
    struct stat old = {};
    bool const isThere = fstatat(folder, m_name.c_str(), &old, AT_SYMLINK_NOFOLLOW) == 0;
    if (!isThere && errno == ENAMETOOLONG)
        Fail(errno);
    if (isThere && S_ISLNK(old.st_mode))
        throw TransferError(PathRefused, Shown() + ": a symbolic link; name the file that it points at");
    if (isThere)
        RefusingDatabases([&] { DatabaseFiles::RefuseIfOpen(old, m_name); });
    if (isThere && !S_ISREG(old.st_mode))
        throw TransferError(NotAFile, Shown() + ": something else than a file has that name; choose another");
    MakeFile(isThere ? 0600 : 0666);
    if (isThere)
        TakeRightsOf(old, m_file.Number());
}

// One that is taken stays, whoever's it is.
void PartFile::MakeFile(mode_t mode)
{
    for (;;)
    {
        std::string name = NewPartName();
        m_partPath = PathOf(m_folder) + "/" + name;
        if (!m_store.AddPartFile(m_partPath))
            continue;
        m_file = Descriptor(
            openat(m_folder, name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, mode));
        int const reason = errno;
        if (m_file.Number() >= 0)
        {
            m_partName = std::move(name);
            return;
        }
        Forget();
        if (reason != EEXIST)
            Fail(reason);
    }
}

// A note too many stays until the program has ended, and whoever buries it then finds no such file.
void PartFile::Forget() noexcept
{
    try
    {
        m_store.RemovePartFile(m_partPath);
    }
    catch (std::exception const& error)
    {
        Report(error.what());
    }
}

PartFile::~PartFile()
{
    if (m_partName.empty())
        return;
    unlinkat(m_folder, m_partName.c_str(), 0);
    Forget();
}

void PartFile::Fail(int reason) const
{
    throw TransferError(reason == ENAMETOOLONG ? PathRefused : TargetUnwritable,
                        FileFault(Shown(), "cannot be written", reason));
}

void PartFile::FailAsCut() const
{
    throw TransferError(SourceUnreadable, Shown() + ": the source was cut while it was read; try again");
}

void PartFile::CopyFrom(SourceFile const& source, std::size_t piece,
                        std::function<void(off_t done)> const& after)
{
    off_t const size = source.Size();
    for (off_t at = 0; at < size;)
    {
        off_t begin = lseek(source.Number(), at, SEEK_DATA);
        if (begin < 0)
            begin = errno == ENXIO ? size : at;  // nothing but a hole is left, or nobody knows of holes
        off_t const hole = begin < size ? lseek(source.Number(), begin, SEEK_HOLE) : size;
        off_t const end = hole < 0 ? size : std::min(hole, size);
        CopyRange(source, std::min(begin, size), end, piece, after);
        at = end;
    }
    if (ftruncate(m_file.Number(), size) != 0)  // for a hole at the end
        Fail(errno);
    struct stat now = {};
    if (fstat(source.Number(), &now) != 0 || now.st_size < size)
        FailAsCut();
    after(size);
}

void PartFile::CopyRange(SourceFile const& source, off_t begin, off_t end, std::size_t piece,
                         std::function<void(off_t done)> const& after)
{
    while (begin < end)
    {
        ssize_t const count =
            CopyPiece(source, begin, std::min(piece, static_cast<std::size_t>(end - begin)));
        if (count == 0)
            FailAsCut();  // now: by the end it may be as long as it was, with something else in it
        begin += count;
        after(begin);
    }
}

ssize_t PartFile::CopyPiece(SourceFile const& source, off_t at, std::size_t size)
{
#ifdef __linux__
    if (m_copiesDirectly)
    {
        off_t from = at;
        off_t to = at;
        ssize_t const count = copy_file_range(source.Number(), &from, m_file.Number(), &to, size, 0);
        if (count > 0)
            return count;
        m_copiesDirectly = false;  // reading and writing tells which of the two fails, if any
    }
#endif
    m_buffer.resize(std::max(m_buffer.size(), size));
    ssize_t count = -1;
    do
        count = pread(source.Number(), m_buffer.data(), size, at);
    while (count < 0 && errno == EINTR);
    int const reason = errno;
    if (count < 0)
        throw TransferError(SourceUnreadable, FileFault(Shown(), "the source cannot be read", reason));
    for (ssize_t done = 0; done < count;)
    {
        ssize_t const written = pwrite(m_file.Number(), m_buffer.data() + done,
                                       static_cast<std::size_t>(count - done), at + done);
        if (written < 0 && errno != EINTR)
            Fail(errno);
        done += std::max<ssize_t>(written, 0);
    }
    return count;
}

void PartFile::Finish(Survives what)
{
    // Always: else a power cut could leave the name with half of the file, and the old one gone.
    if (fsync(m_file.Number()) != 0)
        Fail(errno);
    if (!m_file.Close())
        Fail(errno);
    if (renameat(m_folder, m_partName.c_str(), m_folder, m_name.c_str()) != 0)
        Fail(errno);
    m_partName.clear();
    Forget();
    if (what == Survives::PowerCut && !FlushFolder(m_folder))
        Fail(errno);
}
}  // namespace standin
