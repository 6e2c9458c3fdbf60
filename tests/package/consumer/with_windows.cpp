// Compiled with the property COMGUI_GUI.
#include <comgui/comgui.h>

static_assert(wxUSE_GUI == 1, "the package must leave wxWidgets' GUI to those who have windows");
