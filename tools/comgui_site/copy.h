// A site as a whole at another place: from a folder to a database, the other way, or to another of its kind.
#pragma once

#include "standin/server/site/SiteName.h"

namespace comgui_site
{
struct Copied
{
    std::size_t tickets = 0;
    std::size_t users = 0;
    std::size_t files = 0;
    unsigned long long bytes = 0;  // of the files
};

// Makes the second site from the first: tickets, users, and the files and folders of its folder. The second
// is there only when all of it is, compared with the first, and on the disk; the first stays as it is. Throws
// Trouble: if programs have the first open, if there is a second already, or if its folder is not empty; and
// StoreError or FileError. Nothing of the second is left then, unless a server was lost over the last step
// for good: it may be there, and its files are.
Copied CopySite(standin::SiteName const& from, standin::SiteName const& to);
}  // namespace comgui_site
