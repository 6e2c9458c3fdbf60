#include "tools/comgui_site/backup.h"

#include "standin/server/files/AtomicFile.h"
#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/Workplace.h"
#include <cerrno>
#include <cstring>
#include <sys/stat.h>
#include <unistd.h>

namespace comgui_site
{
namespace
{
using std::filesystem::path;

// A link fails where a file is by now, a renaming would replace it. Some file systems have no links.
void Name(path const& made, path const& file, bool mayReplace)
{
    bool const isLinked = !mayReplace && link(made.c_str(), file.c_str()) == 0;
    if (!isLinked && !mayReplace && errno == EEXIST)
        throw Trouble(file.string() + ": is there already; choose another name, or say --force");
    if (!isLinked && rename(made.c_str(), file.c_str()) != 0)
        throw standin::FileError(standin::FileFault(file, "cannot be written", errno));
    standin::FlushFolder(file.parent_path());
}

// What new files may be for others: nothing.
class PrivateFiles
{
public:
    PrivateFiles() : m_before(umask(077)) {}
    ~PrivateFiles() { umask(m_before); }
    PrivateFiles(PrivateFiles const&) = delete;
    PrivateFiles& operator=(PrivateFiles const&) = delete;

private:
    mode_t const m_before;
};

void CheckTarget(path const& site, path const& file, bool mayReplace)
{
    if (!file.has_filename())
        throw Trouble(file.string() + ": is no name of a file; name one");
    auto const status = std::filesystem::symlink_status(file);
    CheckIsNotOfSite(file, site);
    if (!exists(status))
        return;
    if (!is_regular_file(status))
        throw Trouble(file.string() + ": is no regular file; choose another name");
    if (!mayReplace)
        throw Trouble(file.string() + ": is there already; choose another name, or say --force");
}
}  // namespace

void BackUp(OpenedSite& site, path const& file, bool mayReplace)
{
    path const target = TargetOf(file);
    CheckTarget(site.Folder(), target, mayReplace);
    Workplace const workplace(target);
    {
        PrivateFiles const privately;
        Progress progress("copying the database");
        auto const tell = [&](long long done, long long total)
        { progress(static_cast<unsigned long long>(done), static_cast<unsigned long long>(total)); };
        site.Store().BackupTo(workplace.Database(), tell);
    }
    standin::FlushFile(workplace.Database());
    Name(workplace.Database(), target, mayReplace);
}
}  // namespace comgui_site
