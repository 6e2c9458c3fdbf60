// Why a ticket file cannot be read or written, as a sentence for the user.
#pragma once

#include "desk/model/FileFault.h"
#include <wx/string.h>

namespace desk
{
wxString TextOf(FileFault const& fault);
}  // namespace desk
