// Between the kit's texts, UTF-8 in std::string, and wxWidgets'. A wxString that is made from a std::string
// without these takes the bytes for the locale's.
#pragma once

#include "comgui/foundation/export.h"
#include <string>
#include <string_view>
#include <wx/string.h>

namespace comgui
{
// Bytes that are no UTF-8 become U+FFFD each, so nothing disappears. A zero byte is a character like others.
COMGUI_EXPORT wxString ToWx(std::string_view utf8);

COMGUI_EXPORT std::string ToUtf8(wxString const& text);
}  // namespace comgui
