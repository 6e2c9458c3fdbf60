#include "tools/comgui_site/NewDatabase.h"

#include "standin/server/store/sqlite/SqliteStore.h"
#include "tools/comgui_site/Workplace.h"
#if COMGUI_HAS_POSTGRESQL
#    include "standin/server/site/OpenStore.h"
#    include "standin/server/store/postgres/PostgresReplacement.h"
#endif

namespace comgui_site
{
namespace
{
using std::filesystem::path;

class InFolder final : public NewDatabase
{
public:
    InFolder(path const& folder, path const& workplace)
        : m_folder(folder), m_workplace(workplace),
          m_store(std::make_unique<standin::SqliteStore>(workplace, [] { return standin::StoreContent(); }))
    {
    }

    standin::SiteStore& Store() override { return *m_store; }

    std::string Finish() override
    {
        m_store->Leave();
        m_store.reset();
        GiveName(m_workplace / "site.db", m_folder / "site.db", false);
        return "";
    }

private:
    path const m_folder;
    path const m_workplace;
    std::unique_ptr<standin::SqliteStore> m_store;
};

#if COMGUI_HAS_POSTGRESQL
class InSchema final : public NewDatabase
{
public:
    InSchema(standin::SiteName const& name, Old old)
        : m_folder(name.folder),
          m_replacement(name.database, old == Old::SetAside ? standin::PostgresReplacement::Old::SetAside
                                                            : standin::PostgresReplacement::Old::Forbidden)
    {
    }

    standin::SiteStore& Store() override { return m_replacement.Store(); }

    // The folder is marked before anybody can open the site, as it may not be there where the first one does.
    // A site that takes the place of another has the mark of that.
    std::string Finish() override
    try
    {
        if (!m_replacement.HasOld())
            standin::MarkFolder(m_replacement.Store(), m_folder);
        std::string const aside = m_replacement.Finish();
        return aside.empty() ? "" : "the schema " + aside;
    }
    catch (standin::UnknownReplacement const& unknown)
    {
        throw UnknownEnd(unknown.what());
    }
    catch (...)
    {
        if (!m_replacement.HasOld())
            standin::UnmarkFolder(m_replacement.Store(), m_folder);
        throw;
    }

private:
    path const m_folder;
    standin::PostgresReplacement m_replacement;
};
#endif
}  // namespace

std::unique_ptr<NewDatabase> NewDatabase::Begin(standin::SiteName const& name, path const& workplace, Old old)
{
#if COMGUI_HAS_POSTGRESQL
    if (name.IsDatabase())
        return std::make_unique<InSchema>(name, old);
#endif
    if (name.IsDatabase() || old == Old::SetAside)
        throw Trouble("this program was built without PostgreSQL; build it with COMGUI_POSTGRESQL=ON");
    return std::make_unique<InFolder>(name.folder, workplace);
}
}  // namespace comgui_site
