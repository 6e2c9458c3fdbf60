// The plug-in behind this one. COMGUI_TRACE_BUNDLE names its bundle; else comgui_trace has noted which one
// the program was about to open; else it lies beside this bundle, as ComGUI-Real.Bundle or, where this one
// has another name than that, as ComGUI.Bundle.
#pragma once

#include "comgui/session/ComGUIModuleInterface.h"
#include <string>

namespace trace
{
class RealModule
{
public:
    // The one of this process, loaded at the first call; null if there is none, and stderr tells why.
    static RealModule* Get();

    ComGUIModuleInterface const& Table() const { return m_table; }

    static bool IsItsInterface(COMGUI_UUID interfaceId);
    static bool IsItsType(void const* type);  // a CFUUIDRef

    // Of the object that the plug-in's factory has made.
    int QueryInterface(COMGUI_UUID interfaceId, void** out) const;

private:
    RealModule(void* object, ComGUIModuleInterface const& table) : m_object(object), m_table(table) {}
    static RealModule* Load();
    static RealModule* Load(std::string const& bundle);

    void* const m_object;  // kept for good
    ComGUIModuleInterface const m_table;
};
}  // namespace trace
