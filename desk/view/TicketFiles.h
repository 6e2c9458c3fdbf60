// Tickets to files and back: asks for the file, does the work on the worker's thread, tells what was lost.
#pragma once

#include <comgui/client.h>
#include <functional>
#include <wx/string.h>

class wxWindow;

namespace desk
{
// said: called once at the end, with what to tell the user, unless he has changed his mind.
using Said = std::function<void(wxString const&)>;

// As XML, or as a stream if the user chooses that, or names a file in .stream.
void ExportTicket(wxWindow* parent, comgui::Tickets const& tickets, comgui::Worker const& worker,
                  comgui::TicketAddress ticket, Said said);

// A new ticket with what the file holds. made: called with it.
void ImportTicket(wxWindow* parent, comgui::Tickets const& tickets, comgui::Worker const& worker, int type,
                  std::function<void(comgui::TicketAddress)> made, Said said);
}  // namespace desk
