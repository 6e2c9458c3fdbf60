// Tickets as XML: as ticket files, or several in one document,
//
//     <site version="1">
//     <ticket version="1" type="3" id="1"> ... </ticket>
//     ...
//     </site>
//
// which import reads, too, and which has the form of a seed without its users. Each ticket is as of one
// moment of its own.
#pragma once

#include "standin/server/store/Store.h"
#include "tools/comgui_site/words.h"
#include <filesystem>
#include <string>
#include <vector>

namespace comgui_site
{
// The tickets that are chosen, in ascending order, each once; nothing chosen: all. Throws Trouble if there is
// none of a choice.
std::vector<standin::TicketAddress> Chosen(standin::Store& store, std::vector<TicketChoice> const& choices);

// Writes TYPE_ID.xml for each ticket into the folder, which is made if it is missing. mayReplace: older files
// of these names. Throws Trouble, before anything is written, for names that are taken. The result: files
// written; tickets that are deleted meanwhile are left out.
std::size_t ExportToFolder(standin::Store& store, std::vector<standin::TicketAddress> const& tickets,
                           std::filesystem::path const& folder, bool mayReplace);

// Throw Trouble for what is too large to be read again.
struct Document
{
    std::string text;
    std::size_t tickets = 0;
};
Document ExportOne(standin::Store& store,
                   standin::TicketAddress ticket);  // a ticket file; Trouble if it is gone
Document ExportToDocument(standin::Store& store, std::vector<standin::TicketAddress> const& tickets);
}  // namespace comgui_site
