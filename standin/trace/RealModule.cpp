#include "standin/trace/RealModule.h"

#include <CoreFoundation/CoreFoundation.h>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <dlfcn.h>
#include <filesystem>
#include <memory>
#include <type_traits>

namespace trace
{
namespace
{
namespace fs = std::filesystem;

struct Releaser
{
    void operator()(void const* object) const { CFRelease(object); }
};
template <typename Ref>
using Owner = std::unique_ptr<std::remove_pointer_t<Ref>, Releaser>;

Owner<CFStringRef> NewString(char const* text)
{
    return Owner<CFStringRef>(CFStringCreateWithCString(kCFAllocatorDefault, text, kCFStringEncodingUTF8));
}

Owner<CFUUIDRef> NewUuid(char const* text)
{
    return Owner<CFUUIDRef>(CFUUIDCreateFromString(kCFAllocatorDefault, NewString(text).get()));
}

// The folder of this bundle: its executable lies in Contents/Linux.
fs::path OwnBundle()
{
    Dl_info module{};
    if (!dladdr(reinterpret_cast<void const*>(&OwnBundle), &module))
        return {};
    return fs::absolute(module.dli_fname).parent_path().parent_path().parent_path();
}

std::string BundleToLoad()
{
    if (char const* const named = std::getenv("COMGUI_TRACE_BUNDLE"); named && *named)
        return named;
    using Noted = char const* (*)();
    if (auto const noted = reinterpret_cast<Noted>(dlsym(RTLD_DEFAULT, "comgui_trace_noted_bundle")))
        if (char const* const bundle = noted(); *bundle)
            return bundle;
    fs::path const own = OwnBundle();
    fs::path const real = own.parent_path() / "ComGUI-Real.Bundle";
    std::error_code error;
    if (fs::is_directory(real, error) || own.filename() == COMGUI_BUNDLE_NAME)
        return real;
    return own.parent_path() / COMGUI_BUNDLE_NAME;
}

COMGUI_UUID InterfaceId()
{
    CFUUIDBytes const source = CFUUIDGetUUIDBytes(NewUuid(COMGUI_INTERFACE_UUID).get());
    COMGUI_UUID id;
    static_assert(sizeof id == sizeof source);
    std::memcpy(&id, &source, sizeof id);
    return id;
}

CFPlugInRef OpenBundle(std::string const& bundle)
{
    auto const text = NewString(bundle.c_str());
    Owner<CFURLRef> const url(
        text ? CFURLCreateWithFileSystemPath(kCFAllocatorDefault, text.get(), kCFURLPOSIXPathStyle, true)
             : nullptr);
    return url ? CFPlugInCreate(kCFAllocatorDefault, url.get()) : nullptr;
}

void* NewInstance(CFPlugInRef plugIn)
{
    auto const type = NewUuid(COMGUI_PLUGIN_TYPE_UUID);
    Owner<CFArrayRef> const factories(CFPlugInFindFactoriesForPlugInTypeInPlugIn(type.get(), plugIn));
    if (!factories || CFArrayGetCount(factories.get()) == 0)
        return nullptr;
    auto const first = static_cast<CFUUIDRef>(CFArrayGetValueAtIndex(factories.get(), 0));
    return CFPlugInInstanceCreate(nullptr, first, type.get());
}

RealModule* Complain(std::string const& bundle, char const* what)
{
    std::fprintf(stderr, "ComGUI-Trace: %s: %s; name the plug-in's bundle in COMGUI_TRACE_BUNDLE\n",
                 bundle.c_str(), what);
    return nullptr;
}
}  // namespace

RealModule* RealModule::Get()
{
    static RealModule* const module = Load();
    return module;
}

RealModule* RealModule::Load()
{
    std::string const bundle = BundleToLoad();
    std::error_code error;
    if (fs::equivalent(bundle, OwnBundle(), error))
        return Complain(bundle, "is this bundle itself");
    return Load(bundle);
}

RealModule* RealModule::Load(std::string const& bundle)
{
    CFPlugInRef const plugIn = OpenBundle(bundle);
    if (!plugIn)
        return Complain(bundle, "no bundle");
    void* const object = NewInstance(plugIn);
    if (!object)
        return Complain(bundle, "no plug-in in it");
    void* found = nullptr;
    (**static_cast<ComGUIModuleInterface**>(object)).QueryInterface(object, InterfaceId(), &found);
    if (!found)
        return Complain(bundle, "its plug-in has no interface");
    return new RealModule(object, **static_cast<ComGUIModuleInterface**>(found));
}

bool RealModule::IsItsInterface(COMGUI_UUID interfaceId)
{
    COMGUI_UUID const own = InterfaceId();
    return std::memcmp(&own, &interfaceId, sizeof own) == 0;
}

int RealModule::QueryInterface(COMGUI_UUID interfaceId, void** out) const
{
    return (**static_cast<ComGUIModuleInterface**>(m_object)).QueryInterface(m_object, interfaceId, out);
}
}  // namespace trace
