#include "comgui/access/FilenameToTicket.h"

wxString FilenameToTicket(wxString const& name)
{
    wxString ticketName = name;
    ticketName.Replace("\\", "/");
    return ticketName;
}
