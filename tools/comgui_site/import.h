// Tickets from XML: ticket files with type and id, and the documents that export writes.
#pragma once

#include "tools/comgui_site/TicketCommits.h"
#include <functional>
#include <string>
#include <vector>

namespace comgui_site
{
// Every ticket of the files, each with its address, in ascending order; so the system ticket, which may be
// refused for what it holds, comes first. Throws XmlError or Trouble, which name the file, for whatever is no
// such file, a ticket without an address, an address that comes twice, and users, which only a seed may have.
std::vector<standin::TicketXml> ReadTickets(std::vector<std::string> const& files);

// One after another, each as a whole or not at all. tell: called for each when it is done. Throws what
// TicketCommits throws; the tickets before are done then.
void Import(standin::Store& store, std::vector<standin::TicketXml> const& tickets, TicketCommits::Mode mode,
            std::function<void(standin::TicketAddress, TicketCommits::Done const&)> const& tell);

// Writes tickets/SYS_0000.xml anew, which is due after a change of the system ticket. A failure is reported
// on stderr, since the file is only a copy.
void WriteMirror(standin::Store& store, std::filesystem::path const& site);
}  // namespace comgui_site
