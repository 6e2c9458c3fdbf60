// All that a site's database holds as one file, and back. The folders of files are no part of it.
#pragma once

#include "standin/server/site/SiteName.h"
#include <vector>

namespace comgui_site
{
class OpenedSite;

// Writes tickets and users as of one moment to a new file, a database as a folder has it, readable by this
// user alone, under a name of its own until it is whole and on the disk. mayReplace: an older regular file of
// that name, but never one of the site's own. Throws Trouble, FileError or StoreError, with the older file as
// it was.
void BackUp(OpenedSite& site, std::filesystem::path const& file, bool mayReplace);

struct Restored
{
    std::string setAside;                 // the old database's name; empty: there was none
    std::vector<std::string> jobFolders;  // that no job of the backup has, as they are called now
    std::vector<std::string> problems;    // of the site as it is now, see check.h
};

// Makes what is in the file the database of that site, which is made if it is missing. The file is checked
// first, and all of it is copied; only then the site changes, in one step. The old database gets another
// name, and so do the folders of jobs that the backup does not know, since the server would remove them.
// Throws Trouble or StoreError if a program has the site open or the file is no sound database of a site.
Restored Restore(standin::SiteName const& name, std::filesystem::path const& file);
}  // namespace comgui_site
