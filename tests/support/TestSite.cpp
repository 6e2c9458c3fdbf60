#include "tests/support/TestSite.h"

#include <cstdlib>
#include <string_view>
#if COMGUI_HAS_POSTGRESQL_SERVER
#    include "tests/support/PostgresCluster.h"
#    include <map>
#    include <unistd.h>
#else
#    include <stdexcept>
#endif

namespace
{
#if COMGUI_HAS_POSTGRESQL_SERVER
std::string DatabaseFor(std::filesystem::path const& folder)
{
    static std::map<std::filesystem::path, std::string> databases;
    auto const [known, isNew] = databases.try_emplace(folder, "site_" + std::to_string(getpid()) + "_" +
                                                                  std::to_string(databases.size()));
    if (isNew)
        PostgresCluster::Instance().Run("CREATE DATABASE " + known->second);
    return PostgresCluster::Instance().Uri("postgres", known->second);
}
#else
std::string DatabaseFor(std::filesystem::path const&)
{
    throw std::runtime_error("COMGUI_TEST_ENGINE: PostgreSQL was not there when this was built");
}
#endif
}  // namespace

bool AreSitesInDatabases()
{
    char const* const engine = std::getenv("COMGUI_TEST_ENGINE");
    return engine != nullptr && std::string_view(engine) == "postgresql";
}

void UseSiteIn(std::filesystem::path const& folder)
{
    setenv("COMGUI_SITE", AreSitesInDatabases() ? DatabaseFor(folder).c_str() : folder.c_str(), 1);
    setenv("COMGUI_SITE_FOLDER", folder.c_str(), 1);
}
