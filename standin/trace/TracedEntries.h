// The traced entries over those of the real plug-in.
#pragma once

#include "comgui/session/ComGUIModuleInterface.h"

namespace trace
{
// Puts them into a copy of the real table. Entries that are null there stay so.
void TraceEntries(ComGUIModuleInterface& table);
}  // namespace trace
