// The ticket servers of this process: one for each site folder, opened at first need and kept to the end of
// the process, since containers that clients hold lead there. For any thread.
#pragma once

#include "standin/server/site/TicketServer.h"

namespace standin
{
// The server of the site that Site::Folder() names at this moment. Null if the site cannot be opened; one
// line on stderr tells why, and the next call tries again.
TicketServer* ServerOfThisSite() noexcept;
}  // namespace standin
