// Tickets and users as a whole, from one store to another.
#pragma once

#include "standin/server/store/SiteStore.h"

namespace comgui_site
{
// Every ticket that no program owns, and every user, as of one moment, into a store that has none of them.
// Their ids stay; incarnations and revisions are new. Throws StoreError.
void CopyContent(standin::SiteStore& from, standin::Store& to);

// Lines for what differs, but for at most a hundred; nobody may change either meanwhile.
std::vector<std::string> DifferencesBetween(standin::SiteStore& from, standin::SiteStore& to);
}  // namespace comgui_site
