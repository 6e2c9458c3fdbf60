#include "standin/server/files/AtomicFile.h"

#include "standin/server/files/DatabaseFiles.h"
#include "standin/server/files/Descriptor.h"
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <random>
#include <sys/file.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace standin
{
namespace
{
constexpr std::string_view Tail = ".tmp";
constexpr std::size_t LongestName = 255;

constexpr int Attempts = 100;

// As much of a file's name as leaves room for what comes behind it, in whole characters.
std::string_view BeginningOf(std::string_view name)
{
    std::size_t size = LongestName - std::strlen(".") - RandomNameSize - Tail.size();
    if (name.size() <= size)
        return name;
    while (size > 0 && (static_cast<unsigned char>(name[size]) & 0xC0) == 0x80)
        --size;
    return name.substr(0, size);
}

// The new file until it has taken the old one's place. It is locked as long as it is somebody's.
class Temporary
{
public:
    // shown: its name for messages. old: the file that is there, or null; nobody who may not read that may
    // read this. mode: of a new one.
    Temporary(std::filesystem::path const& file, std::filesystem::path const& shown, struct stat const* old,
              mode_t mode)
        : m_shown(shown)
    {
        int attempt = 1;
        while (!Make(file, old ? 0600 : mode))
            if (++attempt > Attempts)
                throw FileError(FileFault(m_shown, "cannot be written", errno));
        if (old)
            TakeRightsOf(*old, m_descriptor.Number());
    }
    ~Temporary()
    {
        if (!m_path.empty())
            unlink(m_path.c_str());
    }
    Temporary(Temporary const&) = delete;
    Temporary& operator=(Temporary const&) = delete;

    void Write(std::string_view content)
    {
        WriteAll(m_descriptor.Number(), content, m_shown);
        if (fsync(m_descriptor.Number()) != 0)
            throw FileError(FileFault(m_shown, "cannot be flushed to the disk", errno));
    }

    void TakeThePlaceOf(std::filesystem::path const& file)
    {
        if (rename(m_path.c_str(), file.c_str()) != 0)
            throw FileError(FileFault(m_shown, "cannot be replaced", errno));
        m_path.clear();
    }

private:
    // False if the name is taken, or if somebody took the file for a leftover before it was locked.
    bool Make(std::filesystem::path const& file, mode_t mode)
    {
        std::filesystem::path const path = TemporaryFor(file);
        m_descriptor =
            Descriptor(open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, mode));
        if (m_descriptor.Number() < 0 && errno != EEXIST)
            throw FileError(FileFault(m_shown, "cannot be written", errno));
        if (m_descriptor.Number() < 0)
            return false;
        bool const isOthers = !LockTemporary(m_descriptor.Number()) && errno == EWOULDBLOCK;
        struct stat named = {};
        if (isOthers || lstat(path.c_str(), &named) != 0)
            return false;
        m_path = path;
        return true;
    }

    std::filesystem::path const& m_shown;
    std::filesystem::path m_path;
    Descriptor m_descriptor;
};

std::filesystem::path FolderOf(std::filesystem::path const& file)
{
    return file.has_parent_path() ? file.parent_path() : ".";
}
}  // namespace

bool FlushFolder(int folder) { return fsync(folder) == 0 || errno == EINVAL; }

void FlushFolder(std::filesystem::path const& folder)
{
    Descriptor const opened(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (opened.Number() >= 0 && !FlushFolder(opened.Number()))
        throw FileError(FileFault(folder, "cannot be flushed to the disk", errno));
}

void FlushFile(std::filesystem::path const& file)
{
    Descriptor const opened = OpenToRead(AT_FDCWD, file, O_RDONLY | O_CLOEXEC);
    if (opened.Number() < 0 || fsync(opened.Number()) != 0)
        throw FileError(FileFault(file, "cannot be flushed to the disk", errno));
}

void WriteAll(int descriptor, std::string_view content, std::filesystem::path const& file)
{
    while (!content.empty())
    {
        ssize_t const count = write(descriptor, content.data(), content.size());
        if (count < 0 && errno != EINTR)
            throw FileError(FileFault(file, "cannot be written", errno));
        content.remove_prefix(count < 0 ? 0 : static_cast<std::size_t>(count));
    }
}

std::string ReadFile(std::filesystem::path const& file, std::size_t limit)
{
    Descriptor const descriptor = OpenToRead(AT_FDCWD, file, O_RDONLY | O_CLOEXEC);
    if (descriptor.Number() < 0)
        throw FileError(FileFault(file, "cannot be read", errno));
    std::string content;
    char block[16 * 1024];
    while (content.size() < limit)
    {
        std::size_t const wanted = std::min(sizeof(block), limit - content.size());
        ssize_t const count = read(descriptor.Number(), block, wanted);
        if (count < 0 && errno != EINTR)
            throw FileError(FileFault(file, "cannot be read", errno));
        if (count == 0)
            break;
        content.append(block, count < 0 ? 0 : static_cast<std::size_t>(count));
    }
    return content;
}

void ReplaceFile(std::filesystem::path const& file, std::string_view content, mode_t mode)
{
    std::error_code noLink;
    std::filesystem::path const target = std::filesystem::canonical(file, noLink);
    std::filesystem::path const& name = noLink ? file : target;
    struct stat old = {};
    bool const isThere = stat(name.c_str(), &old) == 0;
    if (isThere)
        DatabaseFiles::RefuseIfOpen(old, file.string());
    Temporary temporary(name, file, isThere ? &old : nullptr, mode);
    temporary.Write(content);
    temporary.TakeThePlaceOf(name);
    FlushFolder(FolderOf(name));
}

void TakeRightsOf(struct stat const& other, int file)
{
    mode_t rights = other.st_mode & 07777;
    struct stat own = {};
    if (fchown(file, other.st_uid, other.st_gid) != 0)
    {
        rights &= 0777;
        if (fchown(file, static_cast<uid_t>(-1), other.st_gid) != 0 &&
            (fstat(file, &own) != 0 || own.st_gid != other.st_gid))
            rights &= ~static_cast<mode_t>(070);
    }
    fchmod(file, rights);
}

std::string RandomName()
{
    std::random_device random;
    std::string name;
    while (name.size() < RandomNameSize)
        name += "0123456789abcdef"[random() % 16];
    return name;
}

std::filesystem::path TemporaryFor(std::filesystem::path const& file)
{
    std::string name = file.filename().string();
    name = std::string(BeginningOf(name)) + "." + RandomName() + std::string(Tail);
    return file.parent_path() / name;
}

bool IsTemporary(std::string_view name, std::string_view file)
{
    std::string_view const beginning = BeginningOf(file);
    bool const isFramed = name.size() == beginning.size() + 1 + RandomNameSize + Tail.size() &&
                          name.starts_with(beginning) && name[beginning.size()] == '.' &&
                          name.ends_with(Tail);
    return isFramed &&
           name.substr(beginning.size() + 1, RandomNameSize).find_first_not_of("0123456789abcdef") ==
               name.npos;
}

bool LockTemporary(int file) { return flock(file, LOCK_EX | LOCK_NB) == 0; }

void RemoveLeftovers(std::filesystem::path const& file)
{
    std::error_code error;
    std::filesystem::directory_iterator entry(FolderOf(file), error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error))
    {
        if (!IsTemporary(entry->path().filename().string(), file.filename().string()))
            continue;
        try
        {
            Descriptor const found = OpenToRead(AT_FDCWD, entry->path(),
                                                O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
            struct stat what = {};
            bool const isFile =
                found.Number() >= 0 && fstat(found.Number(), &what) == 0 && S_ISREG(what.st_mode);
            if (isFile && LockTemporary(found.Number()))
                unlink(entry->path().c_str());
        }
        catch (FileError const&)
        {
            // it stays
        }
    }
}
}  // namespace standin
