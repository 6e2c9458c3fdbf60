#include "standin/server/site/OpenStore.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include "standin/server/files/SiteFiles.h"
#if COMGUI_HAS_POSTGRESQL
#    include "standin/server/store/postgres/PostgresStore.h"
#endif

namespace standin
{
namespace
{
constexpr char NumberFile[] = "site.number";
#if COMGUI_HAS_POSTGRESQL
constexpr std::size_t LongestNumber = 100;

// The number in the folder; empty if there is none.
std::string NumberIn(std::filesystem::path const& folder)
{
    std::filesystem::path const file = folder / NumberFile;
    if (!std::filesystem::exists(file))
        return "";
    std::string const text = ReadFile(file, LongestNumber);
    return text.substr(0, text.find_first_of("\r\n"));
}

// What is there already belongs to somebody, who must not find it changed.
void CheckIsNobodys(std::filesystem::path const& folder)
{
    for (char const* const file : {"site.db", NumberFile})
        if (std::filesystem::exists(folder / file))
            throw StoreError(folder.string() + ": belongs to another site, as there is " + file +
                             " in it; set COMGUI_SITE_FOLDER to a folder of the new site's own");
}

[[noreturn]] void RefuseFolder(PostgresStore const& store, std::filesystem::path const& folder,
                               std::string const& what)
{
    throw StoreError(folder.string() + ": " + what + "; the site in " + store.Name() + " has the number " +
                     store.SiteNumber() +
                     ": mount its folder there, or set COMGUI_SITE_FOLDER to where it is mounted");
}

void CheckFolder(PostgresStore const& store, std::filesystem::path const& folder, std::string const& number)
{
    if (number.empty())
        RefuseFolder(store, folder,
                     std::string("is not the folder of the site's files, as there is no ") + NumberFile +
                         " in it");
    if (number != store.SiteNumber())
        RefuseFolder(store, folder, "belongs to another site, with the number " + ForMessages(number));
}

// For who did not make the site, while the one who did has not marked its folder and may have died before it
// could: that has put the seed there.
void CheckIsUnmarked(PostgresStore const& store, std::filesystem::path const& folder)
{
    std::error_code error;
    if (std::filesystem::exists(folder / "site.db"))
        RefuseFolder(store, folder, "belongs to another site, as there is site.db in it");
    bool const isEmpty = std::filesystem::is_empty(folder, error);
    if (error || isEmpty)
        RefuseFolder(store, folder,
                     std::string("is not the folder of the site's files, as ") +
                         (error ? "it cannot be looked into" : "nothing is in it"));
}

std::unique_ptr<SiteStore> OpenDatabase(SiteName const& name, std::function<StoreContent()> const& first,
                                        bool keepOpening)
{
    PostgresOptions options;
    options.keepOpening = true;
    bool isNew = false;
    auto const firstInFolder = [&]
    {
        CheckIsNobodys(name.folder);
        isNew = true;
        return first();
    };
    auto store = std::make_unique<PostgresStore>(name.database, firstInFolder, std::move(options));
    try
    {
        if (store->HasFolder())
            CheckFolder(*store, name.folder, NumberIn(name.folder));
        else
        {
            if (!isNew && NumberIn(name.folder).empty())
                CheckIsUnmarked(*store, name.folder);
            MarkFolder(*store, name.folder);
        }
        if (!keepOpening)
            store->EndOpening();
    }
    catch (...)
    {
        store->Leave();  // lest it be taken for dead
        throw;
    }
    return store;
}
#else
std::unique_ptr<SiteStore> OpenDatabase(SiteName const&, std::function<StoreContent()> const&, bool)
{
    throw StoreError("the site is a database, and this program was built without PostgreSQL; build it with "
                     "COMGUI_POSTGRESQL=ON, or name a folder");
}
#endif
}  // namespace

// A new site would take the jobs in the folder for leftovers.
void CheckIsNoDatabases(std::filesystem::path const& folder)
{
    std::error_code ignored;  // who cannot look cannot open the site either, and says why then
    if (std::filesystem::exists(folder / NumberFile, ignored) &&
        std::filesystem::status(folder / "site.db", ignored).type() == std::filesystem::file_type::not_found)
        throw StoreError(folder.string() + ": belongs to a site in a database, as there is " + NumberFile +
                         " and no site.db in it; name the database, and this folder in COMGUI_SITE_FOLDER");
}

#if COMGUI_HAS_POSTGRESQL
void MarkFolder(PostgresStore& store, std::filesystem::path const& folder)
{
    MakePrivateFolders({folder});
    if (NumberIn(folder).empty())
        ReplaceFile(folder / NumberFile, store.SiteNumber() + '\n', 0644);
    CheckFolder(store, folder, NumberIn(folder));
    store.NoteFolder();
}

void UnmarkFolder(PostgresStore const& store, std::filesystem::path const& folder) noexcept
try
{
    if (NumberIn(folder) == store.SiteNumber())
        std::filesystem::remove(folder / NumberFile);
}
catch (std::exception const&)
{
    // It is refused to others, with the file's name.
}
#endif

std::unique_ptr<SiteStore> OpenStore(SiteName const& name, std::function<StoreContent()> const& first,
                                     SqliteOptions options)
{
    if (name.IsDatabase())
        return OpenDatabase(name, first, options.keepOpening);
    CheckIsNoDatabases(name.folder);
    return std::make_unique<SqliteStore>(name.folder, first, std::move(options));
}
}  // namespace standin
