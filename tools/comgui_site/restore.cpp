#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Descriptor.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/jobs/JobIntake.h"
#include "standin/server/site/OpenStore.h"
#include "standin/server/store/sqlite/Database.h"
#include "standin/server/store/sqlite/LockFile.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include "tools/comgui_site/NewDatabase.h"
#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/Workplace.h"
#include "tools/comgui_site/backup.h"
#include "tools/comgui_site/check.h"
#include "tools/comgui_site/content.h"
#include "tools/comgui_site/words.h"
#include <cerrno>
#include <fcntl.h>
#include <set>
#include <sys/stat.h>
#include <unistd.h>

namespace comgui_site
{
namespace
{
using namespace std::chrono_literals;
using standin::LockFile;
using standin::SiteName;
using std::filesystem::path;

// The site for this program alone: nobody has it open, and who wants to open it waits.
class Alone
{
public:
    explicit Alone(path const& folder) : m_lock(folder)
    {
        bool const isOurs = m_lock.LockWithin(LockFile::Opening, LockFile::Hold::Exclusive, 5s) &&
                            m_lock.TryLock(LockFile::Site, LockFile::Hold::Exclusive) &&
                            !m_lock.IsFolderHeldElsewhere();
        if (isOurs)
            return;
        m_lock.Close();
        throw Trouble(folder.string() + ": in use" + WhoHas(folder) +
                      "; end what has it open, then try again");
    }
    ~Alone() { m_lock.Close(); }
    Alone(Alone const&) = delete;
    Alone& operator=(Alone const&) = delete;

private:
    // By whom, as far as they can be asked.
    static std::string WhoHas(path const& folder)
    try
    {
        OpenedSite site({folder});
        return OtherPrograms(site.Store());
    }
    catch (std::exception const&)
    {
        return "";
    }

    LockFile m_lock;
};

void Copy(path const& from, path const& to, char const* what)
{
    std::error_code error;
    auto const total = std::filesystem::file_size(from, error);
    standin::Descriptor const source(open(from.c_str(), O_RDONLY | O_CLOEXEC));
    if (error || source.Number() < 0)
        throw standin::FileError(standin::FileFault(from, "cannot be read", error ? error.value() : errno));
    standin::Descriptor target(open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (target.Number() < 0)
        throw standin::FileError(standin::FileFault(to, "cannot be written", errno));
    Progress progress(what);
    std::string block(1 << 20, '\0');
    for (unsigned long long done = 0;;)
    {
        ssize_t const count = read(source.Number(), block.data(), block.size());
        if (count < 0 && errno != EINTR)
            throw standin::FileError(standin::FileFault(from, "cannot be read", errno));
        if (count == 0)
            break;
        std::size_t const got = count < 0 ? 0 : static_cast<std::size_t>(count);
        standin::WriteAll(target.Number(), std::string_view(block).substr(0, got), to);
        progress(done += got, total);
    }
    if (!target.Close())
        throw standin::FileError(standin::FileFault(to, "cannot be written", errno));
    standin::FlushFile(to);
}

// The jobs that have arrived, by the names of their folders.
std::set<std::string> ArrivedJobs(standin::Store& store)
{
    std::vector<standin::TicketAddress> jobs;
    store.Tickets(
        [&](standin::TicketAddress address, auto const&)
        {
            if (address.type == standin::JobTicketType)
                jobs.push_back(address);
        });
    std::set<std::string> arrived;
    for (auto const address : jobs)
        store.Load(address,
                   [&](std::string_view key, int, auto const&)
                   {
                       if (key == standin::JobFileKey)
                           arrived.insert(std::to_string(address.id));
                   });
    return arrived;
}

// What is wrong with the copy, said of the file that it was made of.
std::string WithNameOf(path const& file, Workplace const& workplace, std::string text)
{
    std::string const copy = workplace.Database().string();
    if (auto const at = text.find(copy); at != std::string::npos)
        text.replace(at, copy.size(), file.string());
    return text;
}

// Opens the copy as a site, which looks at every page and brings an older schema up to date, and looks at
// every row. The result: the jobs that have arrived.
std::set<std::string> CheckCopy(path const& file, Workplace const& workplace)
try
{
    auto const first = [&]() -> standin::StoreContent
    { throw Trouble(file.string() + ": is a database without a site; name a file that backup has written"); };
    standin::SqliteStore copy(workplace.Folder(), first);
    Progress progress("checking the backup");
    auto const problems = copy.Check(
        [&](long long done, long long total)
        { progress(static_cast<unsigned long long>(done), static_cast<unsigned long long>(total)); });
    if (!problems.empty())
        throw Trouble(file.string() + ": the backup is damaged: " + problems[0] + "; restore another one");
    auto jobs = ArrivedJobs(copy);
    copy.Leave();
    return jobs;
}
catch (standin::DamagedStore const& damage)
{
    throw Trouble(WithNameOf(file, workplace, damage.Damage()) + "; restore another file");
}
catch (standin::StoreError const& error)
{
    throw Trouble(WithNameOf(file, workplace, error.what()));
}

void Rename(path const& from, path const& to)
{
    if (rename(from.c_str(), to.c_str()) != 0)
        throw standin::FileError(standin::FileFault(from, "cannot be renamed", errno));
}

// The exchange of the database. At every instant there is a database under the name, since a program that
// finds none begins the site anew, and it is the old one with all its changes or the new one. So what is
// still in the old one's journal is worked in first: the journal has to be gone before the new one comes. And
// the old one is copied: of two names for one file, a program that comes behind our death would write to
// both.
class Exchange
{
public:
    // Does what takes time, and what may be done in vain. Throws, with nothing lost.
    Exchange(path const& folder, Workplace const& workplace)
        : m_database(folder / "site.db"), m_new(workplace.Database()), m_copy(workplace.Folder() / "old.db")
    {
        struct stat old = {};
        m_isThere = stat(m_database.c_str(), &old) == 0;
        if (!m_isThere)
            return;
        m_aside = standin::FreeName(m_database, "replaced", {"", "-wal"});
        m_isSound = old.st_size > 0 && WorkJournalIn();
        if (m_isSound)
            Copy(m_database, m_copy, "setting the old database aside");
        for (path const& file : {m_new, m_copy})
            chmod(file.c_str(), old.st_mode & 07777);
    }

    // The old one's new name; empty if there was none.
    std::string Do()
    {
        if (m_isSound)
            Rename(m_copy, m_aside);
        else if (m_isThere)
            SetDamagedAside();
        try
        {
            standin::FlushFolder(m_database.parent_path());  // a power cut must not take the name back
            unlink(WithSuffix(m_database, "-wal").c_str());
            unlink(WithSuffix(m_database, "-shm").c_str());
            Rename(m_new, m_database);
        }
        catch (standin::FileError const&)
        {
            if (m_isSound)
                unlink(m_aside.c_str());
            throw;
        }
        standin::FlushFolder(m_database.parent_path());
        return m_aside.filename().string();
    }

private:
    static path WithSuffix(path const& file, char const* suffix) { return file.string() + suffix; }

    // False for a damaged one, which stays as it is.
    bool WorkJournalIn() const
    try
    {
        standin::Database old(m_database, false);
        if (old.Number("PRAGMA wal_checkpoint(TRUNCATE)") != 0)
            throw Trouble(m_database.string() + ": in use by another program; end it, then try again");
        return true;
    }
    catch (standin::DamagedStore const&)
    {
        return false;
    }

    // Its journal is part of what can still be saved. Nobody writes to a damaged database, so it may well
    // have two names for a moment.
    void SetDamagedAside() const
    {
        LinkOrRename(m_database, m_aside);
        LinkOrRename(WithSuffix(m_database, "-wal"), WithSuffix(m_aside, "-wal"));
    }

    // Where the file system has no links, only a renaming is left.
    static void LinkOrRename(path const& from, path const& to)
    {
        if (link(from.c_str(), to.c_str()) != 0 && errno != ENOENT)
            Rename(from, to);
    }

    path const m_database;
    path const m_new;
    path const m_copy;  // of the old one
    path m_aside;
    bool m_isThere = false;
    bool m_isSound = false;
};

// The folders in job/ that have a number for a name and are not those of the jobs.
std::set<std::string> OtherJobFolders(path const& folder, std::set<std::string> const& jobs)
{
    std::set<std::string> others;
    std::error_code error;
    std::filesystem::directory_iterator entry(folder / "job", error);
    for (; !error && entry != std::filesystem::directory_iterator(); entry.increment(error))
    {
        std::string const name = entry->path().filename().string();
        if (name.find_first_not_of("0123456789") == name.npos && !jobs.contains(name))
            others.insert(name);
    }
    return others;
}

// Moves aside the folders of jobs that the backup does not know, since the server would take them for what
// dead jobs have left; and back, unless they are to stay there.
class StrayJobFolders
{
public:
    StrayJobFolders(path const& folder, std::set<std::string> const& jobs)
        : m_jobs(folder / "job"), m_place(standin::FreeName(m_jobs, "replaced", {""}))
    {
        try
        {
            for (std::string const& name : OtherJobFolders(folder, jobs))
            {
                standin::MakePrivateFolders({m_place});
                Rename(m_jobs / name, m_place / name);
                m_moved.push_back(name);
            }
            if (!m_moved.empty())
                for (path const& changed : {m_place, m_jobs})
                    standin::FlushFolder(changed);
        }
        catch (...)
        {
            MoveBack();
            throw;
        }
    }
    ~StrayJobFolders()
    {
        if (!m_stay)
            MoveBack();
    }
    StrayJobFolders(StrayJobFolders const&) = delete;
    StrayJobFolders& operator=(StrayJobFolders const&) = delete;

    // Their names from now on.
    std::vector<std::string> Keep()
    {
        m_stay = true;
        std::vector<std::string> names;
        for (std::string const& name : m_moved)
            names.push_back(m_place.filename().string() + "/" + name);
        return names;
    }

private:
    void MoveBack() noexcept
    {
        for (std::string const& name : m_moved)
            rename((m_place / name).c_str(), (m_jobs / name).c_str());
        rmdir(m_place.c_str());
    }

    path const m_jobs;
    path const m_place;
    std::vector<std::string> m_moved;
    bool m_stay = false;
};

void CheckFile(path const& file)
{
    std::error_code error;
    auto const status = std::filesystem::status(file, error);
    if (!exists(status))
        throw Trouble(file.string() + ": is not there; name a file that backup has written");
    if (!is_regular_file(status))
        throw Trouble(file.string() + ": is no regular file; name one that backup has written");
    if (std::filesystem::file_size(file, error) == 0)
        throw Trouble(file.string() + ": is empty; name a file that backup has written");
    auto const journal = std::filesystem::file_size(file.string() + "-wal", error);
    if (!error && journal > 0)
        throw Trouble(file.string() +
                      ": is the database of a site that was not left in order, and not all of it; "
                      "let a program open that site, or use backup");
}

// The database of a folder is exchanged as a file.
void Exchanged(path const& folder, Workplace const& workplace, std::set<std::string> const& jobs,
               Restored& restored)
{
    standin::FlushFile(workplace.Database());
    Alone const alone(folder);
    Exchange exchange(folder, workplace);
    StrayJobFolders strays(folder, jobs);
    restored.setAside = exchange.Do();
    restored.jobFolders = strays.Keep();
}

// Another one is filled anew beside the old one.
void Refilled(SiteName const& name, Workplace const& workplace, std::set<std::string> const& jobs,
              Restored& restored)
{
    auto const database = NewDatabase::Begin(name, workplace.Folder(), NewDatabase::Old::SetAside);
    standin::SqliteStore backup(workplace.Folder(), [] { return standin::StoreContent(); });
    CopyContent(backup, database->Store());
    backup.Leave();
    StrayJobFolders strays(name.folder, jobs);
    try
    {
        restored.setAside = database->Finish();
    }
    catch (UnknownEnd const& unknown)
    {
        auto const kept = strays.Keep();
        throw Trouble(
            std::string(unknown.what()) +
            (kept.empty() ? "" : "; folders of other jobs are in " + path(kept[0]).parent_path().string()));
    }
    restored.jobFolders = strays.Keep();
}

// Before the long work: that nobody has it open, and that the folder is the database's.
void CheckIsFree(SiteName const& name)
try
{
    if (!name.IsDatabase())
    {
        standin::CheckIsNoDatabases(name.folder);
        Alone const alone(name.folder);
        return;
    }
    OpenedSite site(name);
    CheckIsAlone(site);
}
catch (MissingSite const&)
{
}
}  // namespace

Restored Restore(SiteName const& name, path const& file)
{
    CheckFile(file);
    standin::MakePrivateFolders({name.folder});
    CheckIsFree(name);
    Workplace const workplace(name.folder / ".restore");
    Copy(file, workplace.Database(), "copying the backup");
    auto const jobs = CheckCopy(file, workplace);
    Restored restored;
    if (name.IsDatabase())
        Refilled(name, workplace, jobs, restored);
    else
        Exchanged(name.folder, workplace, jobs, restored);
    OpenedSite site(name);
    restored.problems = ProblemsOf(site.Store(), name.folder, [](long long, long long) {});
    site.Leave();
    return restored;
}
}  // namespace comgui_site
