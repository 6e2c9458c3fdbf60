// Values as the slots of a ticket take and give them: see PARAM_TYPE.h for the value word.
#pragma once

#include "comgui/client/Value.h"
#include "comgui/ticket/BIN_STRING.h"

namespace comgui::detail
{
// A copy of what the value word of a write, of a walk or of a notification says. None for PARAM_NONE and
// PARAM_COUNT, for a null word of a type that needs one, and for an unknown type; a null text is the empty
// one.
Value ValueOf(PARAM_TYPE type, void const* word);

// The value word of a write of a single value. It, and what it points at, lives as long as both arguments.
void const* WordOf(Value const& value, BIN_STRING& bytes);
}  // namespace comgui::detail
