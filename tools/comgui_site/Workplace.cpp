#include "tools/comgui_site/Workplace.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/RemoveTree.h"
#include "tools/comgui_site/Trouble.h"
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace comgui_site
{
namespace
{
using standin::Descriptor;
using std::filesystem::path;

constexpr int Attempts = 100;

Descriptor Opened(path const& folder)
{
    return Descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
}

void RemoveLeftovers(path const& file)
{
    std::error_code error;
    for (auto const& entry : std::filesystem::directory_iterator(file.parent_path(), error))
    {
        if (!standin::IsTemporary(entry.path().filename().string(), file.filename().string()))
            continue;
        Descriptor const folder = Opened(entry.path());
        if (folder.Number() >= 0 && standin::LockTemporary(folder.Number()) &&
            standin::RemoveContent(folder.Number()))
            rmdir(entry.path().c_str());
    }
}
}  // namespace

// A link fails where a file is by now, a renaming would replace it. Some file systems have no links.
void GiveName(path const& made, path const& file, bool mayReplace)
{
    standin::FlushFile(made);
    bool const isLinked = !mayReplace && link(made.c_str(), file.c_str()) == 0;
    if (!isLinked && !mayReplace && errno == EEXIST)
        throw Trouble(file.string() + ": is there already; choose another name, or say --force");
    if (!isLinked && rename(made.c_str(), file.c_str()) != 0)
        throw standin::FileError(standin::FileFault(file, "cannot be written", errno));
    standin::FlushFolder(file.parent_path());
}

Workplace::Workplace(path const& file)
{
    RemoveLeftovers(file);
    int attempt = 1;
    while (!Make(file))
        if (++attempt > Attempts)
            throw standin::FileError(standin::FileFault(file, "cannot be written", errno));
}

Workplace::~Workplace()
{
    if (standin::RemoveContent(m_lock.Number()))
        rmdir(m_folder.c_str());
}

// False if somebody took it for a leftover before it was locked.
bool Workplace::Make(path const& file)
{
    m_folder = standin::TemporaryFor(file);
    if (mkdir(m_folder.c_str(), 0700) != 0)
        throw standin::FileError(standin::FileFault(file, "cannot be written", errno));
    m_lock = Opened(m_folder);
    bool const isOthers =
        m_lock.Number() < 0 || (!standin::LockTemporary(m_lock.Number()) && errno == EWOULDBLOCK);
    return !isOthers && mkdir(Folder().c_str(), 0700) == 0;
}
}  // namespace comgui_site
