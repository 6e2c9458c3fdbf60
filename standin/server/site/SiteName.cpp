#include "standin/server/site/SiteName.h"

#include "standin/server/files/Report.h"
#include "standin/server/store/Store.h"
#include <cstdlib>

namespace standin
{
namespace
{
std::string FromEnvironment(char const* name)
{
    char const* const value = std::getenv(name);
    return value == nullptr ? "" : value;
}

std::filesystem::path MadeAbsolute(std::filesystem::path const& folder)
{
    std::filesystem::path const absolute = std::filesystem::absolute(folder).lexically_normal();
    return absolute.has_filename() ? absolute : absolute.parent_path();  // no slash at the end
}

// All machines have to see the same files, so that no default would be right.
std::filesystem::path FolderOfFiles()
{
    std::filesystem::path const folder = FromEnvironment("COMGUI_SITE_FOLDER");
    if (folder.empty())
        throw StoreError("the site is a database, and COMGUI_SITE_FOLDER is not set; set it to the folder "
                         "that all machines of the site share for its files");
    if (folder.is_relative())
        throw StoreError("COMGUI_SITE_FOLDER is \"" + ForMessages(folder.string()) +
                         "\"; write it from the root, as on every machine of the site");
    return MadeAbsolute(folder);
}
}  // namespace

bool NamesDatabase(std::string_view name)
{
    return name.starts_with("postgresql://") || name.starts_with("postgres://");
}

SiteName SiteName::Of(std::string const& name)
{
    if (NamesDatabase(name))
        return {FolderOfFiles(), name};
    return {MadeAbsolute(name)};
}

SiteName SiteName::OfThisUser()
{
    if (std::string const site = FromEnvironment("COMGUI_SITE"); !site.empty())
        return Of(site);
    if (std::filesystem::path const data = FromEnvironment("XDG_DATA_HOME"); data.is_absolute())
        return {MadeAbsolute(data / "comgui" / "site")};
    if (std::filesystem::path const home = FromEnvironment("HOME"); !home.empty())
        return {MadeAbsolute(home / ".local" / "share" / "comgui" / "site")};
    throw StoreError(
        "no folder for the site: neither COMGUI_SITE nor HOME is set; set COMGUI_SITE to a folder");
}
}  // namespace standin
