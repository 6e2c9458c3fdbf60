// UTF-8 as the host's texts: what wxString::FromUTF8 gives, in a third of its time where it is ASCII, as keys
// and most values are.
#pragma once

#include <wx/string.h>

namespace comgui::detail
{
// Empty for null, and for what is no UTF-8.
wxString FromUtf8(char const* text);
}  // namespace comgui::detail
