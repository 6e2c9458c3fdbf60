// Between the variants of a host and the values of a ticket, over either family of tickets. The comments at
// the views' operations say what crosses.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include <wx/variant.h>

namespace comgui::detail
{
// GetWxVariantParameterChk: the ticket decides the type.
template <typename Slots>
bool ReadVariant(Slots const& slots, char const* key, wxVariant& value, int pos);

// GetWxVariantParameterDef: def decides the type, names the key and is the default.
template <typename Slots>
wxVariant ReadVariantLike(Slots const& slots, wxVariant const& def, int pos);

// SetWxVariantParameter.
template <typename Slots>
bool WriteVariant(Slots const& slots, char const* key, wxVariant const& value, int pos);
}  // namespace comgui::detail
