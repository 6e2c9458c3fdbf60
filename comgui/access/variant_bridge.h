// Between the variants of a host and the values of a ticket, over either family of tickets. The comments at
// the views' operations say what crosses.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include <wx/variant.h>

namespace comgui::detail
{
// GetWxVariantParameterChk.
template <typename Slots>
bool ReadVariant(Slots const& ticket, char const* key, wxVariant& value, int pos);

// GetWxVariantParameterDef.
template <typename Slots>
wxVariant ReadVariantLike(Slots const& ticket, wxVariant const& def, int pos);

// SetWxVariantParameter.
template <typename Slots>
bool WriteVariant(Slots const& ticket, char const* key, wxVariant const& value, int pos);
}  // namespace comgui::detail
