#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Descriptor.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/sessions/TicketService.h"
#include "standin/server/store/sqlite/LockFile.h"
#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/backup.h"
#include "tools/comgui_site/check.h"
#include "tools/comgui_site/words.h"
#include <cerrno>
#include <ctime>
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
using std::filesystem::path;

constexpr char Prefix[] = ".restore.";

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
        OpenedSite site(folder);
        std::string names;
        for (auto const& program : site.Store().Programs())
            if (program.isAlive && program.id != site.Store().Self())
                names += (names.empty() ? " by " : ", ") + program.name + " (process " +
                         std::to_string(program.process) + " on " + program.machine + ")";
        return names;
    }
    catch (std::exception const&)
    {
        return "";
    }

    LockFile m_lock;
};

// A folder in the site's for the copy, until that is in its place. It goes with everything in it.
class Workplace
{
public:
    explicit Workplace(path const& site) : m_folder(site / (Prefix + std::to_string(getpid())))
    {
        RemoveLeftovers(site);
        std::filesystem::remove_all(m_folder);  // of a process of the same number that was killed
        standin::MakePrivateFolders({m_folder});
    }
    ~Workplace()
    {
        std::error_code ignored;
        std::filesystem::remove_all(m_folder, ignored);
    }
    Workplace(Workplace const&) = delete;
    Workplace& operator=(Workplace const&) = delete;

    path const& Folder() const { return m_folder; }
    path Database() const { return m_folder / "site.db"; }

private:
    static void RemoveLeftovers(path const& site)
    {
        for (auto const& entry : std::filesystem::directory_iterator(site))
        {
            std::string const name = entry.path().filename().string();
            std::string const process = name.starts_with(Prefix) ? name.substr(sizeof Prefix - 1) : "";
            bool const isNumber = !process.empty() && process.size() < 10 &&
                                  process.find_first_not_of("0123456789") == process.npos;
            std::error_code ignored;
            if (isNumber && !standin::IsAlive(std::stoi(process)))
                std::filesystem::remove_all(entry.path(), ignored);
        }
    }

    path const m_folder;
};

void WriteAll(int file, path const& name, std::string_view bytes)
{
    while (!bytes.empty())
    {
        ssize_t const count = write(file, bytes.data(), bytes.size());
        if (count < 0 && errno != EINTR)
            throw standin::FileError(standin::FileFault(name, "cannot be written", errno));
        bytes.remove_prefix(count < 0 ? 0 : static_cast<std::size_t>(count));
    }
}

void Copy(path const& from, path const& to)
{
    std::error_code error;
    auto const total = std::filesystem::file_size(from, error);
    standin::Descriptor const source(open(from.c_str(), O_RDONLY | O_CLOEXEC));
    if (error || source.Number() < 0)
        throw standin::FileError(standin::FileFault(from, "cannot be read", error ? error.value() : errno));
    standin::Descriptor target(open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (target.Number() < 0)
        throw standin::FileError(standin::FileFault(to, "cannot be written", errno));
    Progress progress("copying the backup");
    std::string block(1 << 20, '\0');
    for (unsigned long long done = 0;;)
    {
        ssize_t const count = read(source.Number(), block.data(), block.size());
        if (count < 0 && errno != EINTR)
            throw standin::FileError(standin::FileFault(from, "cannot be read", errno));
        if (count == 0)
            break;
        std::size_t const got = count < 0 ? 0 : static_cast<std::size_t>(count);
        WriteAll(target.Number(), to, std::string_view(block).substr(0, got));
        progress(done += got, total);
    }
    if (!target.Close())
        throw standin::FileError(standin::FileFault(to, "cannot be written", errno));
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
                       if (key == "Job/File")
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

std::string Now()
{
    std::time_t const seconds = std::time(nullptr);
    std::tm local = {};
    localtime_r(&seconds, &local);
    char text[32];
    return {text, std::strftime(text, sizeof text, "%Y%m%d-%H%M%S", &local)};
}

// NAME.replaced-DATE-TIME, with a number behind it if that is taken.
path FreeName(path const& file)
{
    std::string const stamped = file.string() + ".replaced-" + Now();
    path name = stamped;
    auto const isTaken = [](path const& taken)
    { return std::filesystem::exists(std::filesystem::symlink_status(taken)); };
    for (int n = 2; isTaken(name) || isTaken(name.string() + "-wal"); ++n)
        name = stamped + "-" + std::to_string(n);
    return name;
}

// Gives the file a second name; where the file system has none, another one.
void LinkOrRename(path const& from, path const& to)
{
    if (link(from.c_str(), to.c_str()) == 0 || errno == ENOENT)
        return;
    if (rename(from.c_str(), to.c_str()) != 0)
        throw standin::FileError(standin::FileFault(from, "cannot be set aside", errno));
}

// At every instant there is a database under the name, since a program that finds none begins the site anew.
// The old one's journal has to be out of the way before the new one comes, which it does not belong to.
std::string Exchange(path const& folder, Workplace const& workplace)
{
    path const database = folder / "site.db";
    std::string const wal = database.string() + "-wal";
    bool const isThere = std::filesystem::exists(std::filesystem::symlink_status(database));
    path const aside = FreeName(database);
    if (isThere)
    {
        if (struct stat old = {}; stat(database.c_str(), &old) == 0)
            chmod(workplace.Database().c_str(), old.st_mode & 07777);
        LinkOrRename(database, aside);
        LinkOrRename(wal, aside.string() + "-wal");
    }
    unlink(wal.c_str());
    unlink((database.string() + "-shm").c_str());
    if (rename(workplace.Database().c_str(), database.c_str()) != 0)
        throw standin::FileError(standin::FileFault(database, "cannot be replaced", errno));
    standin::Descriptor const opened(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (opened.Number() >= 0)
        standin::FlushFolder(opened.Number());
    return isThere ? aside.filename().string() : "";
}

void Flush(path const& file)
{
    standin::Descriptor const opened(open(file.c_str(), O_RDONLY | O_CLOEXEC));
    if (opened.Number() < 0 || fsync(opened.Number()) != 0)
        throw standin::FileError(standin::FileFault(file, "cannot be flushed to the disk", errno));
}

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

// The server would take them for what dead jobs have left.
std::vector<std::string> SetJobFoldersAside(path const& folder, std::set<std::string> const& jobs)
{
    std::vector<std::string> moved;
    path const place = FreeName(folder / "job");
    for (std::string const& name : OtherJobFolders(folder, jobs))
    {
        standin::MakePrivateFolders({place});
        path const from = folder / "job" / name;
        if (rename(from.c_str(), (place / name).c_str()) != 0)
            throw standin::FileError(standin::FileFault(from, "cannot be set aside", errno));
        moved.push_back(place.filename().string() + "/" + name);
    }
    return moved;
}

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
}  // namespace

Restored Restore(path const& folder, path const& file)
{
    CheckFile(file);
    standin::MakePrivateFolders({folder});
    {
        Alone const beforeTheLongWork(folder);
    }
    Workplace const workplace(folder);
    Copy(file, workplace.Database());
    auto const jobs = CheckCopy(file, workplace);
    Flush(workplace.Database());
    Restored restored;
    {
        Alone const alone(folder);
        restored.jobFolders = SetJobFoldersAside(folder, jobs);
        restored.setAside = Exchange(folder, workplace);
    }
    OpenedSite site(folder);
    restored.problems = ProblemsOf(site.Store(), folder, [](long long, long long) {});
    site.Leave();
    return restored;
}
}  // namespace comgui_site
