#include "tools/comgui_site/backup.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/Workplace.h"
#include "tools/comgui_site/content.h"
#include <cerrno>
#include <cstring>
#include <sys/stat.h>
#include <unistd.h>

namespace comgui_site
{
namespace
{
using std::filesystem::path;

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
// One in a folder is copied page by page, with the journal's numbers; another one ticket by ticket.
void Copy(standin::SiteStore& store, Workplace const& workplace)
{
    if (auto* const inFolder = dynamic_cast<standin::SqliteStore*>(&store))
    {
        Progress progress("copying the database");
        auto const tell = [&](long long done, long long total)
        { progress(static_cast<unsigned long long>(done), static_cast<unsigned long long>(total)); };
        return inFolder->BackupTo(workplace.Database(), tell);
    }
    standin::SqliteStore copy(workplace.Folder(), [] { return standin::StoreContent(); });
    CopyContent(store, copy);
    copy.Leave();
}
}  // namespace

void BackUp(OpenedSite& site, path const& file, bool mayReplace)
{
    path const target = TargetOf(file);
    CheckTarget(site.Folder(), target, mayReplace);
    Workplace const workplace(target);
    PrivateFiles const privately;
    Copy(site.Store(), workplace);
    GiveName(workplace.Database(), target, mayReplace);
}
}  // namespace comgui_site
