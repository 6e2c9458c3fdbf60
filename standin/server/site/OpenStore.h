// The store of a site, whichever engine it has.
#pragma once

#include "standin/server/site/SiteName.h"
#include "standin/server/store/SiteStore.h"
#include "standin/server/store/sqlite/SqliteStore.h"

namespace standin
{
// Opens it, or makes it with the content that first gives; with keepOpening in the options others who open it
// wait until EndOpening. The rest of the options is for a folder alone: the server of a database has settings
// of its own.
//
// The folder of a database's files is made with a new site and bears the site's number from then on. Throws
// StoreError for a folder that is another site's, or that has no number and therefore is not the one that was
// made, as where nothing is mounted, and for one of a database's files that is named as a site itself;
// FileError.
std::unique_ptr<SiteStore> OpenStore(SiteName const& name, std::function<StoreContent()> const& first,
                                     SqliteOptions options = {});

// Throws StoreError for a folder that has the files of a site in a database: for who is to make a site there.
void CheckIsNoDatabases(std::filesystem::path const& folder);

#if COMGUI_HAS_POSTGRESQL
class PostgresStore;

// What OpenStore does with the folder of a new site, for who makes one in another way: the folder has the
// site's number, and the site knows that. Throws StoreError if it has another one; FileError.
void MarkFolder(PostgresStore& store, std::filesystem::path const& folder);

// If the site does not come to be.
void UnmarkFolder(PostgresStore const& store, std::filesystem::path const& folder) noexcept;
#endif
}  // namespace standin
