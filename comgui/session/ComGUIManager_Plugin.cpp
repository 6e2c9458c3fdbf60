// Opening the communication plug-in through CoreFoundation's plug-in services.
#include "comgui/session/ComGUIManager.h"

#include "comgui/host/UtilityObjects.h"
#include <CoreFoundation/CoreFoundation.h>
#include <cstdio>
#include <cstring>
#include <memory>
#include <type_traits>

namespace
{
struct RELEASE
{
    void operator()(CFTypeRef object) const { CFRelease(object); }
};

// Owns one reference to a CoreFoundation object.
template <typename Ref>
using CF_OWNER = std::unique_ptr<std::remove_pointer_t<Ref>, RELEASE>;

CF_OWNER<CFStringRef> NewString(char const* utf8)
{
    return CF_OWNER<CFStringRef>(CFStringCreateWithCString(kCFAllocatorDefault, utf8, kCFStringEncodingUTF8));
}

CF_OWNER<CFUUIDRef> NewUUID(char const* text)
{
    return CF_OWNER<CFUUIDRef>(CFUUIDCreateFromString(kCFAllocatorDefault, NewString(text).get()));
}

COMGUI_UUID BytesOf(CFUUIDRef uuid)
{
    CFUUIDBytes const source = CFUUIDGetUUIDBytes(uuid);
    COMGUI_UUID bytes;
    static_assert(sizeof bytes == sizeof source);
    std::memcpy(&bytes, &source, sizeof bytes);
    return bytes;
}

// An instance of the plug-in's first factory for that type; null without one. Further factories are ignored.
void* NewInstance(CFPlugInRef plugIn, CFUUIDRef type)
{
    CF_OWNER<CFArrayRef> const factories(CFPlugInFindFactoriesForPlugInTypeInPlugIn(type, plugIn));
    if (!factories || CFArrayGetCount(factories.get()) < 1)
        return nullptr;
    auto const first = static_cast<CFUUIDRef>(CFArrayGetValueAtIndex(factories.get(), 0));
    return CFPlugInInstanceCreate(nullptr, first, type);
}
}  // namespace

int ComGUIManager::RegisterPlugIn(__CFBundle** plugIn)
{
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"" COMGUI_BUNDLE_NAME);

    CF_OWNER<CFStringRef> const text = NewString(path.utf8_str());
    if (!text)
    {
        std::fputs("CFStringCreateWithCString failed\n", stderr);
        return -1;
    }
    CF_OWNER<CFURLRef> const url(
        CFURLCreateWithFileSystemPath(kCFAllocatorDefault, text.get(), kCFURLPOSIXPathStyle, true));
    if (!url)
    {
        std::fputs("RegisterPlugIn: CFURLCreateWithFileSystemPath() failed\n", stderr);
        return -1;
    }
    *plugIn = CFPlugInCreate(kCFAllocatorDefault, url.get());
    if (!*plugIn)
        std::fputs("RegisterPlugIn: CFPlugInCreate() failed\n", stderr);
    return *plugIn ? 0 : -1;
}

int ComGUIManager::CreateComGUIModuleInterface(__CFBundle* plugIn, ComGUIModuleInterface*** module)
{
    void* const instance = NewInstance(plugIn, NewUUID(COMGUI_PLUGIN_TYPE_UUID).get());
    if (!instance)
        return -1;
    // COM style: the instance's first word points at its table. What QueryInterface hands out holds a
    // reference of its own, so the factory's one goes back in every case.
    ComGUIModuleInterface const* const table = *static_cast<ComGUIModuleInterface**>(instance);
    table->QueryInterface(instance, BytesOf(NewUUID(COMGUI_INTERFACE_UUID).get()),
                          reinterpret_cast<void**>(module));
    table->Release(instance);
    return *module ? 0 : -1;
}
