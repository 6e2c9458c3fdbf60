#include "standin/server/transfer/ServerPath.h"

#include "standin/server/files/FileError.h"
#include "standin/server/transfer/PartFile.h"
#include "standin/server/transfer/TransferError.h"
#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>

namespace standin
{
namespace
{
[[noreturn]] void Refuse(std::string const& text, std::string const& reason)
{
    throw TransferError(PathRefused, ForMessages(text) + ": " + reason);
}

struct Identity
{
    dev_t device = 0;
    ino_t number = 0;

    friend bool operator==(Identity const&, Identity const&) = default;
};

std::optional<Identity> IdentityOf(std::optional<std::string> const& folder)
{
    struct stat found = {};
    if (!folder || stat(folder->c_str(), &found) != 0)
        return std::nullopt;
    return Identity{found.st_dev, found.st_ino};
}

// Goes down folder by folder. Each is opened by its name in the one above, which nobody can exchange for
// another meanwhile.
class Way
{
public:
    Way(FolderTable const& table, Purpose purpose, std::string const& site, std::string shown)
        : m_purpose(purpose), m_site(IdentityOf(site)), m_install(IdentityOf(table.FolderOf("INSTALL"))),
          m_job(IdentityOf(table.FolderOf("JOB"))), m_shown(std::move(shown))
    {
    }

    void Begin(std::string const& folder)
    {
        m_folder = Descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        int const reason = errno;
        if (m_folder.Number() < 0 && (reason == ENOENT || reason == ENOTDIR))
            Refuse(m_shown, FileFault(folder, "the folder of the variable is not there", reason));
        if (m_folder.Number() < 0)
            FailAtFolder(folder, reason);
        Check();
    }

    void Enter(std::string const& name)
    {
        Descriptor below(
            openat(m_folder.Number(), name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
        int const reason = errno;
        if (below.Number() < 0 && IsLink(name))
            Refuse(m_shown, "there is a symbolic link on the way; name the folder that it points at");
        if (below.Number() < 0)
            FailAtFolder(name, reason);
        m_folder = std::move(below);
        Check();
    }

    Descriptor Taken() { return std::move(m_folder); }

private:
    [[noreturn]] void FailAtFolder(std::string const& folder, int reason) const
    {
        throw TransferError(m_purpose == Purpose::Read ? SourceUnreadable : TargetUnwritable,
                            FileFault(m_shown, "the folder " + folder + " cannot be opened", reason));
    }

    bool IsLink(std::string const& name) const
    {
        struct stat found = {};
        return fstatat(m_folder.Number(), name.c_str(), &found, AT_SYMLINK_NOFOLLOW) == 0 &&
               S_ISLNK(found.st_mode);
    }

    // Whatever variable leads there.
    void Check() const
    {
        struct stat found = {};
        if (fstat(m_folder.Number(), &found) != 0)
            Refuse(m_shown, FileFault("a folder on the way", "cannot be looked at", errno));
        Identity const identity{found.st_dev, found.st_ino};
        if (m_site == identity || m_install == identity)
            Refuse(m_shown, "the server keeps its own files there; choose another folder");
        if (m_purpose == Purpose::Write && m_job == identity)
            Refuse(m_shown, "jobs are sent, not put; choose another folder");
    }

    Purpose m_purpose;
    std::optional<Identity> m_site;
    std::optional<Identity> m_install;
    std::optional<Identity> m_job;
    std::string m_shown;
    Descriptor m_folder;
};
}  // namespace

bool IsFileName(std::string_view name)
{
    auto const isForbidden = [](unsigned char byte)
    { return byte < 0x20 || byte == 0x7F || byte == '/' || byte == '\\'; };
    return !name.empty() && name.size() <= 255 && name != "." && name != ".." && !IsPartFileName(name) &&
           std::none_of(name.begin(), name.end(), isForbidden);
}

ServerPath ServerPath::Parse(std::string text, std::string_view leaf)
{
    std::string const shown = text;
    std::replace(text.begin(), text.end(), '\\', '/');
    auto const end = text.find(')');
    bool const hasVariable = NeedsDecode(text) && end != std::string::npos && end > 2;
    if (!hasVariable || (end + 1 < text.size() && text[end + 1] != '/'))
        Refuse(shown, "no place on the server; write $(VARIABLE)/name");

    ServerPath path;
    path.variable = text.substr(2, end - 2);
    text.erase(0, end + 1);
    while (!text.empty())
    {
        text.erase(0, 1);  // the slash
        auto const length = std::min(text.find('/'), text.size());
        path.folders.push_back(text.substr(0, length));
        text.erase(0, length);
    }
    if (path.folders.empty() || path.folders.back().empty())
    {
        if (!path.folders.empty())
            path.folders.pop_back();
        path.folders.emplace_back(leaf);
    }
    for (std::string const& name : path.folders)
        if (!IsFileName(name))
            Refuse(shown,
                   "not a name that a file here can have: \"" + ForMessages(name.substr(0, 60)) + "\"");
    path.name = std::move(path.folders.back());
    path.folders.pop_back();
    return path;
}

Descriptor OpenFolderOf(ServerPath const& path, FolderTable const& table, Purpose purpose,
                        std::string const& site)
{
    std::string const shown = "$(" + path.variable + ")";
    auto const root = table.FolderOf(path.variable);
    if (!root)
        Refuse(shown, "no such folder variable, or one without a folder; see the system ticket");
    if (!root->starts_with('/'))
        Refuse(shown, "its folder is no absolute path; correct it in the system ticket");
    Way way(table, purpose, site, shown + "/" + path.name);
    way.Begin(*root);
    for (std::string const& folder : path.folders)
        way.Enter(folder);
    return way.Taken();
}
}  // namespace standin
