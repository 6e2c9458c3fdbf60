// How a text that was read from a ticket becomes what the host sees: a path in variable form is resolved,
// anything else stays as it is.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include <wx/string.h>

namespace comgui::detail
{
// UTF-8 as the host sees it; null is the empty text. The ticket is asked for its translator only when the
// text needs one, and then every time anew; without a translator $(...) stays.
template <typename Slots>
wxString Decode(Slots const& ticket, char const* value);

// Reads a text and decodes it. A failed read empties value and gives false.
template <typename Slots>
bool ReadText(Slots const& ticket, char const* key, wxString& value, int pos);
}  // namespace comgui::detail
