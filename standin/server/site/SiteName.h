// What names a site: a folder of one machine, or a database and the folder of files that goes with it.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>
#include <tuple>

namespace standin
{
struct SiteName
{
    std::filesystem::path folder;  // absolute, without a slash at the end
    std::string database{};  // as libpq takes it, perhaps with a password; empty: the folder has its own

    // The site of this user: $COMGUI_SITE, or else comgui/site in the folder for data of programs. Throws
    // StoreError if the environment names none.
    static SiteName OfThisUser();

    // The site of that name: a folder, or a URI that begins with postgresql:// or postgres://; its files are
    // in $COMGUI_SITE_FOLDER. Throws StoreError if that names no folder.
    static SiteName Of(std::string const& name);

    bool IsDatabase() const { return !database.empty(); }

    friend bool operator<(SiteName const& left, SiteName const& right)
    {
        return std::tie(left.folder, left.database) < std::tie(right.folder, right.database);
    }
};

// Whether a name of a site is that of a database.
bool NamesDatabase(std::string_view name);
}  // namespace standin
