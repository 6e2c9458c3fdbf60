// Makes a Module the plug-in of a bundle: in one source of it
//
//     COMGUI_PLUGIN(MyFactory, MyModule)
//
// defines the exported function MyFactory, to be named in the bundle's Info.plist. comgui_add_module, which
// comes with the package, writes that file and builds the bundle.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/module/Entries.h"

struct __CFAllocator;  // of CoreFoundation, which an author need not include
struct __CFUUID;

namespace comgui::plugin
{
template <typename AuthorsModule>
class PlugIn
{
public:
    // The one object, which stays to the end of the process.
    static AuthorsModule& GetModule()
    {
        static auto& module = *new AuthorsModule;
        static detail::StopAtExit const atExit(module);
        return module;
    }

    // The table, also for a host that needs no bundle.
    static ComGUIModuleInterface& Table()
    {
        static ComGUIModuleInterface table = MakeTable();
        return table;
    }

private:
    static Module& Get() { return GetModule(); }

    static ComGUIModuleInterface MakeTable()
    {
        static ::STicketFactory factory{
            {},
            [](char const* path) { return detail::CreateTicket(Get, path); },
            [](STICKET_ACCESS const** ticket) { detail::DestroyTicket(Get, ticket); },
        };
        ComGUIModuleInterface table{};
        detail::FillEntries(table);
        table.Open = [](void** hInstance) { return detail::Open(Get, hInstance); };
        table.STicketFactory = &factory;
        return table;
    }
};
}  // namespace comgui::plugin

#define COMGUI_PLUGIN(FACTORY, MODULE)                                                                       \
    extern "C" COMGUI_EXPORT void* FACTORY(__CFAllocator const*, __CFUUID const* type)                       \
    {                                                                                                        \
        return comgui::plugin::detail::MakeObject(comgui::plugin::PlugIn<MODULE>::Table(), type);            \
    }
