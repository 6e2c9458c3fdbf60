// The entries of a plug-in's table over a Module. For PlugIn.h.
#pragma once

#include "comgui/module/Module.h"
#include "comgui/session/ComGUIModuleInterface.h"

namespace comgui::plugin::detail
{
// A getter of the one Module of a plug-in, which makes it at the first call and may throw.
using GetModule = Module& (*)();

// What the entries without an instance do; the template in PlugIn.h names the module.
int Open(GetModule module, void** hInstance) noexcept;
STICKET_ACCESS const* CreateTicket(GetModule module, char const* path) noexcept;
void DestroyTicket(GetModule module, STICKET_ACCESS const** ticket) noexcept;

// Fills everything but these: the header's three functions, and the entries that get an instance.
void FillEntries(ComGUIModuleInterface& table);

// The object that the bundle's factory answers with, one reference held; null for another type than the
// plug-in's. type: a CFUUIDRef.
void* MakeObject(ComGUIModuleInterface& table, void const* type) noexcept;

// Ends the work of the module's threads at the end of the process, before a client's callback is gone.
class StopAtExit
{
public:
    explicit StopAtExit(Module& module) : m_module(module) {}
    ~StopAtExit();
    StopAtExit(StopAtExit const&) = delete;
    StopAtExit& operator=(StopAtExit const&) = delete;

private:
    Module& m_module;
};
}  // namespace comgui::plugin::detail
