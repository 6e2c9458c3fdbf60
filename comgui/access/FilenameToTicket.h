#pragma once

#include "comgui/foundation/export.h"
#include <wx/string.h>

// A file name as tickets hold it: every backslash a forward slash.
COMGUI_EXPORT wxString FilenameToTicket(wxString const& name);
