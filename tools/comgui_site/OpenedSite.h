// A site that this program has open, as one of any number of programs, from the beginning of a command to its
// end. It is never made here: a folder without a site is an error.
#pragma once

#include "standin/server/store/sqlite/SqliteStore.h"
#include <filesystem>
#include <memory>

namespace comgui_site
{
// The folder of the command line, absolute, or else that of this user. Throws StoreError, as Site::Folder
// does.
std::filesystem::path FolderOfSite(std::string const& given);

// With a name by which it may be replaced: absolute, and of the file behind a link.
std::filesystem::path TargetOf(std::filesystem::path const& file);

// Throws Trouble if a file that is to be written, or what it is a link to, is one of the site's own.
void CheckIsNotOfSite(std::filesystem::path const& file, std::filesystem::path const& site);

class OpenedSite
{
public:
    // Throws Trouble if there is no site in the folder, StoreError if it cannot be opened; a damaged database
    // stays as it is.
    explicit OpenedSite(std::filesystem::path folder);
    ~OpenedSite();  // leaves, and reports a failure on stderr
    OpenedSite(OpenedSite const&) = delete;
    OpenedSite& operator=(OpenedSite const&) = delete;

    // For a command that has changed something: it is on the disk when this returns. Throws StoreError.
    void Leave();

    std::filesystem::path const& Folder() const { return m_folder; }
    standin::SqliteStore& Store() { return *m_store; }

private:
    std::filesystem::path const m_folder;
    std::unique_ptr<standin::SqliteStore> m_store;
};
}  // namespace comgui_site
