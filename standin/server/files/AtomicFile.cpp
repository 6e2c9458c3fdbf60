#include "standin/server/files/AtomicFile.h"

#include "standin/server/files/DatabaseFiles.h"
#include "standin/server/files/Descriptor.h"
#include <algorithm>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace standin
{
namespace
{
// The new file until it has taken the old one's place.
class Temporary
{
public:
    explicit Temporary(std::filesystem::path const& file)
        : m_path(NameFor(file)),
          m_descriptor(open(m_path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666))
    {
        if (m_descriptor.Number() < 0)
            throw FileError(FileFault(file, "cannot be written", errno));
        TakePermissionsOf(file);
    }
    ~Temporary()
    {
        if (!m_path.empty())
            unlink(m_path.c_str());
    }
    Temporary(Temporary const&) = delete;
    Temporary& operator=(Temporary const&) = delete;

    void Write(std::string_view content, std::filesystem::path const& file)
    {
        WriteAll(m_descriptor.Number(), content, file);
        if (fsync(m_descriptor.Number()) != 0)
            throw FileError(FileFault(file, "cannot be flushed to the disk", errno));
    }

    void TakeThePlaceOf(std::filesystem::path const& file)
    {
        if (rename(m_path.c_str(), file.c_str()) != 0)
            throw FileError(FileFault(file, "cannot be replaced", errno));
        m_path.clear();
    }

private:
    static std::filesystem::path NameFor(std::filesystem::path const& file)
    {
        static std::atomic<unsigned> counter{0};
        std::filesystem::path name = file;
        name += "." + std::to_string(getpid()) + "-" + std::to_string(counter++) + ".tmp";
        unlink(name.c_str());  // left by a process of the same number that was killed
        return name;
    }

    void TakePermissionsOf(std::filesystem::path const& file) const
    {
        struct stat old = {};
        if (stat(file.c_str(), &old) == 0)
            fchmod(m_descriptor.Number(), old.st_mode & 07777);
    }

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
    Descriptor const opened(open(file.c_str(), O_RDONLY | O_CLOEXEC));
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

void ReplaceFile(std::filesystem::path const& file, std::string_view content)
{
    std::error_code noLink;
    std::filesystem::path const target = std::filesystem::canonical(file, noLink);
    std::filesystem::path const& name = noLink ? file : target;
    struct stat old = {};
    if (stat(name.c_str(), &old) == 0)
        DatabaseFiles::Refuse(old, file.string());
    Temporary temporary(name);
    temporary.Write(content, name);
    temporary.TakeThePlaceOf(name);
    FlushFolder(FolderOf(name));
}

std::optional<pid_t> ProcessOfTemporary(std::string_view ending)
{
    auto const areDigits = [](std::string_view text)
    { return !text.empty() && text.find_first_not_of("0123456789") == text.npos; };
    constexpr std::string_view Tail = ".tmp";
    if (!ending.starts_with('.') || !ending.ends_with(Tail))
        return std::nullopt;
    ending.remove_prefix(1);
    ending.remove_suffix(std::min(Tail.size(), ending.size()));
    auto const dash = ending.find('-');
    if (dash > 9 || !areDigits(ending.substr(0, dash)) || !areDigits(ending.substr(dash + 1)))
        return std::nullopt;
    return std::stoi(std::string(ending.substr(0, dash)));
}

bool IsAlive(pid_t process) { return process <= 0 || kill(process, 0) == 0 || errno != ESRCH; }

void RemoveLeftovers(std::filesystem::path const& file)
{
    std::string const name = file.filename().string();
    std::error_code error;
    std::filesystem::directory_iterator entry(FolderOf(file), error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error))
    {
        std::string const found = entry->path().filename().string();
        if (!found.starts_with(name))
            continue;
        auto const process = ProcessOfTemporary(std::string_view(found).substr(name.size()));
        if (process && !IsAlive(*process))
            unlink(entry->path().c_str());
    }
}
}  // namespace standin
