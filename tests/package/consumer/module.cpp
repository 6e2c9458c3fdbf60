// The beginning of a communication module: its table and CoreFoundation's types come from the package.
#include <CoreFoundation/CoreFoundation.h>
#include <comgui/comgui.h>

extern "C" COMGUI_EXPORT void* Factory(CFAllocatorRef, CFUUIDRef)
{
    static ComGUIModuleInterface const table{};
    static ComGUIModuleInterface const* interface = &table;
    return CFUUIDCreateFromString(kCFAllocatorDefault, nullptr) == nullptr ? &interface : nullptr;
}
