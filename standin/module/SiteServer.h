// The sites of this process: one for each name, opened at first need and kept to the end of the process,
// since containers that clients hold lead there. For any thread.
#pragma once

#include "standin/server/site/Server.h"
#include "standin/server/site/Site.h"

namespace standin
{
struct OpenSite
{
    explicit OpenSite(SiteName const& name);

    Site site;
    Server server;
};

// The site that SiteName::OfThisUser() names at this moment. Null if it cannot be opened; one line on stderr
// says why, and the next call tries again.
OpenSite* SiteOfThisProcess() noexcept;
}  // namespace standin
