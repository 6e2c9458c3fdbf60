#include "standin/server/site/Site.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/site/Seed.h"
#include "standin/server/site/SiteFolders.h"
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

std::filesystem::path FromEnvironment(char const* name)
{
    char const* const value = std::getenv(name);
    return value == nullptr ? "" : value;
}

std::filesystem::path MadeAbsolute(std::filesystem::path const& folder)
{
    std::filesystem::path const absolute = std::filesystem::absolute(folder).lexically_normal();
    return absolute.has_filename() ? absolute : absolute.parent_path();  // no slash at the end
}

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
    std::string const wanted = FromEnvironment("COMGUI_DURABILITY").string();
    if (wanted == "full")
        return Durability::Full;
    if (wanted.empty() || wanted == "normal")
        return Durability::Process;
    throw StoreError("COMGUI_DURABILITY is \"" + ForMessages(wanted) +
                     "\"; it can be normal, which is the default, or full");
}

std::unique_ptr<SqliteStore> OpenStore(std::filesystem::path const& folder,
                                       std::filesystem::path const& shippedSeed)
{
    auto const first = [&folder, &shippedSeed]
    {
        Seed const seed = SeedOfSite(folder, shippedSeed);
        SetJobFoldersAside(folder / "job");  // the jobs that they belong to are gone
        return seed.Content();
    };
    SqliteOptions options;
    options.durability = DurabilityFromEnvironment();
    options.keepOpening = true;
    options.setAside = [&folder](DamagedStore const& damage)
    {
        Report(damage.what());
        SetAside(folder / "site.db", {"-wal", "-shm", "-journal", ""});
    };
    return std::make_unique<SqliteStore>(folder, first, std::move(options));
}

std::filesystem::path Prepared(std::filesystem::path const& folder)
{
    std::filesystem::path absolute = MadeAbsolute(folder);
    MakePrivateFolders({absolute});
    return absolute;
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

// The site may have been moved, or copied from another machine.
void KeepInstallFolder(Server& server, std::filesystem::path const& folder)
{
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
    if (known != folder.string())
        Put(server, InstallFolderKey, TicketValue::String(folder.string()));
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
            folders.push_back(MadeAbsolute(site / below));
    }
    return folders;
}

// Whether a program that is gone may have made folders whose names a power cut takes away.
bool MayBeUnflushed(SqliteStore const& store) { return !store.IsTidy(); }
}  // namespace

std::filesystem::path Site::Folder()
{
    if (std::filesystem::path const site = FromEnvironment("COMGUI_SITE"); !site.empty())
        return MadeAbsolute(site);
    if (std::filesystem::path const data = FromEnvironment("XDG_DATA_HOME"); data.is_absolute())
        return MadeAbsolute(data / "comgui" / "site");
    if (std::filesystem::path const home = FromEnvironment("HOME"); !home.empty())
        return MadeAbsolute(home / ".local" / "share" / "comgui" / "site");
    throw StoreError(
        "no folder for the site: neither COMGUI_SITE nor HOME is set; set COMGUI_SITE to a folder");
}

Site::Site(std::filesystem::path const& folder, std::filesystem::path const& seedFile)
    : m_folder(Prepared(folder)), m_store(OpenStore(m_folder, seedFile))
{
    if (MayBeUnflushed(*m_store))
        FlushFoldersAbove(m_folder);
    std::vector<std::filesystem::path> own;
    for (std::string_view const name : OwnFolders)
        own.push_back(m_folder / name);
    MakePrivateFolders(own, MayBeUnflushed(*m_store));
}

void Site::PutInOrder(Server& server)
{
    if (DurabilityFromEnvironment() == Durability::Full)
        server.Transfers().Set(PartFile::Survives::PowerCut);
    for (char const* const file : {SeedFile, SystemTicketFile})
        RemoveLeftovers(m_folder / file);
    KeepInstallFolder(server, m_folder);
    KeepFoldersReadable(server, m_folder);
    MakePrivateFolders(FoldersOf(server, m_folder), MayBeUnflushed(*m_store));
    server.Tidy();
    if (!m_store->IsTidy())
    {
        SweepJobFolders(*m_store, server.Tickets(),
                        m_folder);  // the rounds before may have had another install folder
        m_store->NoteTidy();
    }
    server.Mirror().Write();
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
