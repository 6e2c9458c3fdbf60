// The folder in which the embedded server keeps all that lasts, and the right to it:
//
//   site.db        tickets and users
//   seed.xml       what a new site.db is filled with. The owner may edit it; after that, deleting site.db
//                  while no server runs starts the site anew
//   site.lock      who has the site
//   tickets/       SYS_0000.xml, the system ticket for programs that read a local ticket file
//   temp/ job/ upload/ preview/ log/ ...   the folders that the system ticket names
//
// A folder of the system ticket that would hold up its readers for good is switched off, and told too. What
// processes that were killed have left of files and jobs on their way goes when the site is opened.
//
// What turns out damaged is told on stderr and set aside under NAME.damaged-DATE-TIME, never deleted.
// For one thread at a time, as its storage is.
#pragma once

#include "standin/server/site/SiteLock.h"
#include "standin/server/store/SqliteStorage.h"
#include <filesystem>

namespace standin
{
class Site
{
public:
    // The site of this user: $COMGUI_SITE, or else comgui/site in the folder for data of programs. Throws
    // StorageError if the environment names no folder at all.
    static std::filesystem::path Folder();

    // Makes the folder, for this user alone, and what is missing in it; seedFile is the seed that comes with
    // the program. Throws StorageError, with nothing lost, if the site is in use or cannot be written, if its
    // database is of a newer version, or if a seed is needed and the program's own is missing or damaged.
    static Site Open(std::filesystem::path const& folder, std::filesystem::path const& seedFile);
    Site(Site const&) = delete;
    Site& operator=(Site const&) = delete;

    // Writes tickets/SYS_0000.xml from the storage: to be called after every change of the system ticket. The
    // file is a copy, so a failure is told on stderr and stops nobody.
    void MirrorSystemTicket() noexcept;

    std::filesystem::path const& folder() const { return m_folder; }
    Storage& storage() { return m_storage; }

private:
    Site(std::filesystem::path const& folder, std::filesystem::path const& seedFile);
    void KeepInstallFolder();
    void KeepFoldersReadable();
    void MakeFolders();

    std::filesystem::path m_folder;  // absolute
    SiteLock m_lock;                 // taken before and let go after the storage is touched
    SqliteStorage m_storage;
};
}  // namespace standin
