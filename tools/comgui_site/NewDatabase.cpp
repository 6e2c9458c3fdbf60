#include "tools/comgui_site/NewDatabase.h"

#include "standin/server/store/sqlite/SqliteStore.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/Workplace.h"
#if COMGUI_HAS_POSTGRESQL
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
    InSchema(std::string const& uri, Old old)
        : m_replacement(uri, old == Old::SetAside ? standin::PostgresReplacement::Old::SetAside
                                                  : standin::PostgresReplacement::Old::Forbidden)
    {
    }

    standin::SiteStore& Store() override { return m_replacement.Store(); }

    std::string Finish() override
    {
        std::string const aside = m_replacement.Finish();
        return aside.empty() ? "" : "the schema " + aside;
    }

private:
    standin::PostgresReplacement m_replacement;
};
#endif
}  // namespace

std::unique_ptr<NewDatabase> NewDatabase::Begin(standin::SiteName const& name, path const& workplace, Old old)
{
#if COMGUI_HAS_POSTGRESQL
    if (name.IsDatabase())
        return std::make_unique<InSchema>(name.database, old);
#endif
    if (name.IsDatabase() || old == Old::SetAside)
        throw Trouble("this program was built without PostgreSQL; build it with COMGUI_POSTGRESQL=ON");
    return std::make_unique<InFolder>(name.folder, workplace);
}
}  // namespace comgui_site
