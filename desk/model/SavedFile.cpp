#include "desk/model/SavedFile.h"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <filesystem>
#include <new>
#include <random>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace desk
{
namespace
{
// An open file; closed at its end.
class OpenFile
{
public:
    OpenFile(std::filesystem::path const& file, int flags, mode_t mode = 0)
        : m_number(open(file.c_str(), flags | O_CLOEXEC, mode))
    {
    }
    ~OpenFile()
    {
        if (m_number >= 0)
            close(m_number);
    }
    OpenFile(OpenFile const&) = delete;
    OpenFile& operator=(OpenFile const&) = delete;

    bool IsOpen() const { return m_number >= 0; }
    int Number() const { return m_number; }

private:
    int const m_number;
};

FileFault SystemFault(FileTrouble trouble, std::string const& file)
{
    return {trouble, file, {}, {}, std::generic_category().message(errno)};
}

// Appends until the end, or one byte more than the limit; false with errno.
bool ReadAll(int descriptor, std::size_t limit, std::string& content)
{
    char block[64 * 1024];
    while (content.size() <= limit)
    {
        ssize_t const count = read(descriptor, block, std::min(sizeof block, limit + 1 - content.size()));
        if (count == 0)
            return true;
        if (count < 0 && errno != EINTR)
            return false;
        content.append(block, count < 0 ? 0 : static_cast<std::size_t>(count));
    }
    return true;
}

bool WriteAll(int descriptor, std::string_view content)
{
    while (!content.empty())
    {
        ssize_t const count = write(descriptor, content.data(), content.size());
        if (count < 0 && errno != EINTR)
            return false;
        content.remove_prefix(count < 0 ? 0 : static_cast<std::size_t>(count));
    }
    return true;
}

// Short, since the file's own name may already be as long as names can be.
std::filesystem::path TemporaryBeside(std::filesystem::path const& file)
{
    std::random_device random;
    std::string name = ".ticket-";
    for (int i = 0; i < 16; ++i)
        name += "0123456789abcdef"[random() % 16];
    return file.parent_path() / name;
}

// Writes the temporary file; false with errno. old: whose permissions it gets, if there is one.
bool WriteTemporary(std::filesystem::path const& temporary, struct stat const* old, std::string_view content)
{
    OpenFile const file(temporary, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW, old ? 0600 : 0666);
    if (!file.IsOpen())
        return false;
    if (old)
        fchmod(file.Number(), old->st_mode & 0777);  // a file system may have no permissions
    return WriteAll(file.Number(), content) && fsync(file.Number()) == 0;
}

// That a power cut does not bring the old name back; some file systems cannot promise it.
void FlushFolderOf(std::filesystem::path const& file)
{
    OpenFile const folder(file.has_parent_path() ? file.parent_path() : ".", O_RDONLY | O_DIRECTORY);
    if (folder.IsOpen())
        fsync(folder.Number());
}
}  // namespace

FileResult<std::string> LoadFile(std::string const& file, std::size_t limit)
{
    // Not to wait for the other end of a pipe, which is refused below.
    OpenFile const opened(file, O_RDONLY | O_NONBLOCK | O_NOCTTY);
    struct stat found = {};
    if (!opened.IsOpen() || fstat(opened.Number(), &found) != 0)
        return SystemFault(FileTrouble::CannotRead, file);
    if (!S_ISREG(found.st_mode))
        return FileFault{FileTrouble::NotAFile, file, {}, {}, {}};
    if (static_cast<unsigned long long>(found.st_size) > limit)
        return FileFault{FileTrouble::TooLarge, file, {}, {}, {}};
    try
    {
        std::string content;
        if (!ReadAll(opened.Number(), limit, content))
            return SystemFault(FileTrouble::CannotRead, file);
        if (content.size() > limit)  // it has grown
            return FileFault{FileTrouble::TooLarge, file, {}, {}, {}};
        return content;
    }
    catch (std::bad_alloc const&)
    {
        return FileFault{FileTrouble::NoMemory, file, {}, {}, {}};
    }
}

std::optional<FileFault> SaveFile(std::string const& file, std::string_view content)
{
    std::error_code noLink;
    std::filesystem::path const target = std::filesystem::canonical(file, noLink);
    std::filesystem::path const path = noLink ? std::filesystem::path(file) : target;
    struct stat old = {};
    bool const isThere = stat(path.c_str(), &old) == 0;
    if (isThere && !S_ISREG(old.st_mode))
        return FileFault{FileTrouble::NotAFile, file, {}, {}, {}};
    std::filesystem::path const temporary = TemporaryBeside(path);
    if (!WriteTemporary(temporary, isThere ? &old : nullptr, content) ||
        rename(temporary.c_str(), path.c_str()) != 0)
    {
        FileFault fault = SystemFault(FileTrouble::CannotWrite, file);
        unlink(temporary.c_str());
        return fault;
    }
    FlushFolderOf(path);
    return std::nullopt;
}
}  // namespace desk
