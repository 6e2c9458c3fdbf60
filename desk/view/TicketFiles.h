// Tickets to files and back: asks for the file, does the work on the worker's thread, tells what was lost.
#pragma once

#include "desk/model/ExportFile.h"
#include <comgui/client.h>
#include <functional>
#include <optional>
#include <string>
#include <wx/string.h>

class wxWindow;

namespace desk
{
// How the user is asked for a file; nothing: he does not want to after all.
struct FileQuestions
{
    std::function<std::optional<ExportFile>(wxWindow* parent, wxString const& proposed)> askForTarget;
    std::function<std::optional<std::string>(wxWindow* parent)> askForSource;
};

// With the dialogs of the system.
FileQuestions FileDialogs();

// said: called once at the end, with what to tell the user, unless he has changed his mind.
using Said = std::function<void(wxString const&)>;

// As XML, or as a stream if the user chooses that, or names a file in .stream.
void ExportTicket(wxWindow* parent, FileQuestions const& questions, comgui::Tickets const& tickets,
                  comgui::Worker const& worker, comgui::TicketAddress ticket, Said said);

// A new ticket with what the file holds. made: called with it.
void ImportTicket(wxWindow* parent, FileQuestions const& questions, comgui::Tickets const& tickets,
                  comgui::Worker const& worker, int type, std::function<void(comgui::TicketAddress)> made,
                  Said said);
}  // namespace desk
