// The folder in which the embedded server keeps all that lasts:
//
//   site.db        tickets, users and the journal of changes; with site.db-wal, site.db-shm while it is open
//   site.lock      which programs have the site open, and the word by which they wake one another
//   site.number    instead of those, if tickets, users and journal are in a database: which one's files these
//                  are
//   seed.xml       what a new site.db is filled with. The owner may edit it; after that, deleting site.db
//                  while no program has the site open starts the site anew
//   tickets/       SYS_0000.xml, the system ticket for programs that read a local ticket file
//   temp/ job/ upload/ preview/ log/ ...   the folders that the system ticket names
//
// What turns out damaged is reported on stderr and set aside under NAME.damaged-DATE-TIME, never deleted.
#pragma once

#include "standin/server/site/Server.h"
#include "standin/server/site/SiteName.h"
#include "standin/server/store/SiteStore.h"

namespace standin
{
class Site
{
public:
    // Makes the folder, for this user alone, and what is missing in the database; seedFile is the seed that
    // comes with the program. Throws StoreError or FileError, with nothing lost, if the site cannot be
    // written, if its database is of a newer version, if the folder is not that of the database's site, or if
    // a seed is needed and the program's own is missing or damaged.
    Site(SiteName name, std::filesystem::path const& seedFile);
    Site(Site const&) = delete;
    Site& operator=(Site const&) = delete;

    // Once the server is there: notes where the site is, switches off a folder of the system ticket that
    // would hold up its readers for good, makes missing folders, clears up after programs that died, and
    // writes tickets/SYS_0000.xml. Others who open the site wait until then. Throws StoreError: also if other
    // programs have the folder in another place, since the system ticket can name one only.
    void PutInOrder(Server& server);

    // An orderly end; nothing of the site may be used any more. A failure is reported on stderr.
    void Leave() noexcept;

    std::filesystem::path const& folder() const { return m_name.folder; }
    SiteStore& store() { return *m_store; }

private:
    SiteName const m_name;
    std::unique_ptr<SiteStore> m_store;
};
}  // namespace standin
