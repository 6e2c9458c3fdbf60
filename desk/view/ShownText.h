// A text of a server or of a file's name as a control can show it, harmless and short.
#pragma once

#include "desk/model/DisplayText.h"
#include <comgui/client/Text.h>
#include <string_view>
#include <wx/string.h>

namespace desk
{
inline wxString ShownText(std::string_view text, std::size_t characters = CellCharacters)
{
    return comgui::ToWx(DisplayText(text, characters));
}
}  // namespace desk
