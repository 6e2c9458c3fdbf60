#include "standin/server/site/Site.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/site/OpenStore.h"
#include "standin/server/site/Seed.h"
#include "standin/server/site/SiteFolders.h"
#include <algorithm>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

namespace standin
{
namespace
{
constexpr std::string_view InstallFolderKey = "System/InstallFolder";
constexpr char SeedFile[] = "seed.xml";
constexpr char SystemTicketFile[] = "tickets/SYS_0000.xml";
constexpr std::string_view OwnFolders[] = {"tickets", "temp", "job", "upload", "preview", "log"};

// The seed of the site. A missing one is copied from the program's, and so is a damaged one, but only after
// the program's own has proved to be sound.
Seed SeedOfSite(std::filesystem::path const& folder, std::filesystem::path const& shipped)
{
    std::filesystem::path const file = folder / SeedFile;
    if (std::filesystem::exists(file))
    {
        try
        {
            return Seed::Read(file);
        }
        catch (XmlError const& error)
        {
            Report(error.what());
        }
    }
    try
    {
        std::string const text = ReadFile(shipped, TicketXml::SizeLimit + 1);
        Seed seed = Seed::Parse(text, shipped.string());
        if (std::filesystem::exists(file))
            SetAside(file, {""});
        ReplaceFile(file, text, 0600);  // the hashes of passwords are in it
        return seed;
    }
    catch (XmlError const& error)
    {
        throw StoreError(std::string(error.what()) +
                         "; install the program again, or put a sound seed.xml into " + folder.string());
    }
}

// COMGUI_DURABILITY=full: every write survives a power cut.
Durability DurabilityFromEnvironment()
{
    char const* const value = std::getenv("COMGUI_DURABILITY");
    std::string const wanted = value == nullptr ? "" : value;
    if (wanted == "full")
        return Durability::Full;
    if (wanted.empty() || wanted == "normal")
        return Durability::Process;
    throw StoreError("COMGUI_DURABILITY is \"" + ForMessages(wanted) +
                     "\"; it can be normal, which is the default, or full");
}

std::unique_ptr<SiteStore> StoreOf(SiteName const& name, std::filesystem::path const& shippedSeed)
{
    auto const first = [&folder = name.folder, &shippedSeed]
    {
        MakePrivateFolders({folder});
        Seed const seed = SeedOfSite(folder, shippedSeed);
        SetJobFoldersAside(folder / "job");  // the jobs that they belong to are gone
        return seed.Content();
    };
    SqliteOptions options;
    options.durability = DurabilityFromEnvironment();
    options.keepOpening = true;
    options.setAside = [&folder = name.folder](DamagedStore const& damage)
    {
        Report(damage.what());
        SetAside(folder / "site.db", {"-wal", "-shm", "-journal", ""});
    };
    if (!name.IsDatabase())
        MakePrivateFolders({name.folder});
    return OpenStore(name, first, std::move(options));
}

// What cannot be put in order keeps the site from being opened: in a copy of another site $(JOB) would be
// that one's.
void Put(Server& server, std::string_view key, TicketValue value)
{
    TicketWrite write{key, -1, std::move(value)};
    if (!server.Write(SystemTicket, {&write, 1}) || !write.ok)
        throw StoreError("the site cannot be opened: " + std::string(key) +
                         " cannot be corrected; see the line before, and try again");
}

bool IsOpenElsewhere(SiteStore& store)
{
    auto const programs = store.Programs();
    return std::any_of(programs.begin(), programs.end(),
                       [&](ProgramInfo const& program)
                       { return program.isAlive && program.id != store.Self(); });
}

// The site may have been moved, or copied from another machine. Machines that share it must agree.
void KeepInstallFolder(Server& server, SiteStore& store, SiteName const& name)
{
    std::string const folder = name.folder.string();
    std::string known;
    bool const isThere = server.Tickets().LookAt(SystemTicket, 0,
                                                 [&](TicketSnapshot const& ticket)
                                                 {
                                                     known = TextOf(ticket, InstallFolderKey);
                                                     return true;
                                                 });
    if (!isThere && !server.Create(SystemTicket))
        throw StoreError(
            "the site cannot be opened: its system ticket is missing and cannot be made; see the "
            "line before, and try again");
    if (known == folder)
        return;
    if (name.IsDatabase() && !known.empty() && IsOpenElsewhere(store))
        throw StoreError(folder + ": programs that have the site open have its files in " +
                         ForMessages(known) +
                         "; mount them there on this machine too, or end those programs first");
    Put(server, InstallFolderKey, TicketValue::String(folder));
}

void KeepFoldersReadable(Server& server, std::filesystem::path const& site)
{
    for (FolderFault& fault : FaultsOf(server.Tickets().Folders()))
    {
        Report(site.string() + ": " + fault.line);
        Put(server, fault.key, std::move(fault.value));
    }
}

// The folders that the system ticket places below the site. Those elsewhere are the owner's to make.
std::vector<std::filesystem::path> FoldersOf(Server& server, std::filesystem::path const& site)
{
    constexpr std::string_view Below = "$(INSTALL)/";
    std::vector<std::filesystem::path> folders;
    for (std::string const& folder : server.Tickets().Folders().values)
    {
        if (!folder.starts_with(Below))
            continue;
        std::filesystem::path const below =
            std::filesystem::path(folder.substr(Below.size())).lexically_normal();
        if (below.is_relative() && !below.empty() && *below.begin() != "..")
            folders.push_back((site / below / "").parent_path());
    }
    return folders;
}

// Whether a program that is gone may have made folders whose names a power cut takes away.
bool MayBeUnflushed(SiteStore const& store) { return !store.IsTidy(); }
}  // namespace

Site::Site(SiteName name, std::filesystem::path const& seedFile)
    : m_name(std::move(name)), m_store(StoreOf(m_name, seedFile))
{
    if (MayBeUnflushed(*m_store))
        FlushFoldersAbove(folder());
    std::vector<std::filesystem::path> own;
    for (std::string_view const each : OwnFolders)
        own.push_back(folder() / each);
    MakePrivateFolders(own, MayBeUnflushed(*m_store));
}

void Site::PutInOrder(Server& server)
{
    if (DurabilityFromEnvironment() == Durability::Full)
        server.Transfers().Set(PartFile::Survives::PowerCut);
    for (char const* const file : {SeedFile, SystemTicketFile})
        RemoveLeftovers(folder() / file);
    KeepInstallFolder(server, *m_store, m_name);
    KeepFoldersReadable(server, folder());
    MakePrivateFolders(FoldersOf(server, folder()), MayBeUnflushed(*m_store));
    server.Tidy();
    if (!m_store->IsTidy())
    {
        SweepJobFolders(*m_store, server.Tickets(),
                        folder());  // the rounds before may have had another install folder
        m_store->NoteTidy();
    }
    server.Mirror().Write();
    server.FollowRules();
    m_store->EndOpening();
    server.StartCare();
}

void Site::Leave() noexcept
{
    try
    {
        m_store->Leave();
    }
    catch (StoreError const& error)
    {
        Report(error.what());
    }
}
}  // namespace standin
