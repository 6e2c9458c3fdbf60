// The one function that the bundle exports.
#include "comgui/module/PlugIn.h"
#include "standin/module/StandInModule.h"

COMGUI_PLUGIN(ComGUIModuleFactory, standin::StandInModule)
