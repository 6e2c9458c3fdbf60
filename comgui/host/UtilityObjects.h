// Where the host keeps its plug-ins. Declared here, supplied by the host: by its own libraries, or by
// libcomgui_host for a host that brings none.
#pragma once

#include "comgui/foundation/export.h"
#include <wx/string.h>

namespace UtilityObjects
{
// Puts the full path of the bundle of that name into path. The bundle need not exist.
COMGUI_EXPORT void GetPlugInsPath(wxString& path, wchar_t const* bundleName);

// Only in libcomgui_host: the folder in which GetPlugInsPath places every bundle from now on. The empty
// text takes that back; then it is "PlugIns" beside the running program if the bundle is there, else the
// folder of libcomgui_host itself. To be called before the first ComGUIManager::GetInstance(), which looks
// for the plug-in once. For any thread.
COMGUI_EXPORT void SetPlugInsFolder(wxString const& folder);
}  // namespace UtilityObjects
