// The entries of the module's table; what each does stands in comgui/session/ComGUIModuleInterface.h, what
// they answer in ModuleCodes.h.
#pragma once

#include "comgui/session/ComGUIModuleInterface.h"

namespace standin
{
// Fills all entries but the plug-in's header words.
void FillEntries(ComGUIModuleInterface& table);
}  // namespace standin
