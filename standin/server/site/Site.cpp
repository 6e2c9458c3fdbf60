#include "standin/server/site/Site.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/site/Seed.h"
#include "standin/server/site/SiteFolders.h"
#include "standin/server/tickets/TicketXml.h"
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
        ReplaceFile(file, text);
        return seed;
    }
    catch (XmlError const& error)
    {
        throw StorageError(std::string(error.what()) +
                           "; install the program again, or put a sound seed.xml into " + folder.string());
    }
}

SqliteStorage OpenStorage(std::filesystem::path const& folder, std::filesystem::path const& shippedSeed)
{
    std::filesystem::path const file = folder / "site.db";
    Seed seed;  // lives until the database is filled
    auto const first = [&seed, &folder, &shippedSeed]
    {
        seed = SeedOfSite(folder, shippedSeed);
        SetJobFoldersAside(folder / "job");  // the jobs that they belong to are gone
        return seed.Content();
    };
    try
    {
        return SqliteStorage(file, first);
    }
    catch (DamagedStorage const& error)
    {
        Report(error.what());
    }
    SetAside(file, {"-wal", "-shm", "-journal", ""});
    return SqliteStorage(file, first);
}

std::filesystem::path Prepared(std::filesystem::path const& folder)
{
    std::filesystem::path absolute = MadeAbsolute(folder);
    MakePrivateFolder(absolute);
    return absolute;
}
}  // namespace

std::filesystem::path Site::Folder()
{
    if (std::filesystem::path const site = FromEnvironment("COMGUI_SITE"); !site.empty())
        return MadeAbsolute(site);
    if (std::filesystem::path const data = FromEnvironment("XDG_DATA_HOME"); data.is_absolute())
        return MadeAbsolute(data / "comgui" / "site");
    if (std::filesystem::path const home = FromEnvironment("HOME"); !home.empty())
        return MadeAbsolute(home / ".local" / "share" / "comgui" / "site");
    throw StorageError(
        "no folder for the site: neither COMGUI_SITE nor HOME is set; set COMGUI_SITE to a folder");
}

Site Site::Open(std::filesystem::path const& folder, std::filesystem::path const& seedFile)
{
    return {folder, seedFile};
}

Site::Site(std::filesystem::path const& folder, std::filesystem::path const& seedFile)
    : m_folder(Prepared(folder)), m_lock(m_folder), m_storage(OpenStorage(m_folder, seedFile))
{
    for (char const* const file : {SeedFile, SystemTicketFile})
        RemoveLeftovers(m_folder / file);
    KeepInstallFolder();
    KeepFoldersReadable();
    MakeFolders();
    SweepTransfers(m_storage, m_folder);
    MirrorSystemTicket();
}

// The site may have been moved, or copied from another machine.
void Site::KeepInstallFolder()
{
    std::string const folder = m_folder.string();
    bool isTold = false;
    m_storage.Load(SystemTicket,
                   [&](std::string_view key, int pos, StoredValue const& value)
                   {
                       if (key == InstallFolderKey)
                           isTold = pos == 0 && value.type == PARAM_STRING && value.bytes == folder;
                   });
    if (isTold)
        return;
    StoredValue value;
    value.type = PARAM_STRING;
    value.bytes = folder;
    m_storage.Apply({{Change::CreateTicket, SystemTicket},
                     {Change::DeleteKey, SystemTicket, InstallFolderKey},
                     {Change::PutValue, SystemTicket, InstallFolderKey, 0, value}});
}

void Site::KeepFoldersReadable()
{
    FolderSettings const settings = FoldersIn(m_storage);
    for (FolderFault const& fault : FaultsOf(settings))
    {
        Report(m_folder.string() + ": " + fault.line);
        m_storage.Apply({{Change::DeleteKey, SystemTicket, fault.key},
                         {Change::PutValue, SystemTicket, fault.key, 0, fault.value}});
    }
}

// The server's own folders, and those that the system ticket places below the site. Folders elsewhere are
// the owner's to make.
void Site::MakeFolders()
{
    for (std::string_view const name : OwnFolders)
        MakePrivateFolder(m_folder / name);
    std::vector<std::filesystem::path> folders;
    m_storage.Load(SystemTicket,
                   [&folders](std::string_view key, int, StoredValue const& value)
                   {
                       constexpr std::string_view Below = "$(INSTALL)/";
                       bool const isFolder =
                           key.starts_with("System/Folders/") || key == "System/Linearisation/LAB";
                       if (isFolder && value.type == PARAM_STRING && value.bytes.starts_with(Below))
                           folders.emplace_back(value.bytes.substr(Below.size()));
                   });
    for (std::filesystem::path const& folder : folders)
    {
        std::filesystem::path const below = folder.lexically_normal();
        if (below.is_relative() && !below.empty() && *below.begin() != "..")
            MakePrivateFolder(m_folder / below);
    }
}

void Site::MirrorSystemTicket() noexcept
{
    try
    {
        TicketXml ticket;
        ticket.address = SystemTicket;
        m_storage.Load(SystemTicket, [&ticket](std::string_view key, int pos, StoredValue const& value)
                       { ticket.Put(key, pos, value); });
        ticket.Write(m_folder / SystemTicketFile);
    }
    catch (std::exception const& error)
    {
        Report(error.what());
    }
}
}  // namespace standin
