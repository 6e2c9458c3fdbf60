// The sites of this process: one for each site folder, opened at first need and kept to the end of the
// process, since containers that clients hold lead there. For any thread.
#pragma once

#include "standin/server/site/Server.h"
#include "standin/server/site/Site.h"

namespace standin
{
struct OpenSite
{
    explicit OpenSite(std::filesystem::path const& folder);

    Site site;
    Server server;
};

// The site that Site::Folder() names at this moment. Null if it cannot be opened; one line on stderr says
// why, and the next call tries again.
OpenSite* SiteOfThisProcess() noexcept;
}  // namespace standin
