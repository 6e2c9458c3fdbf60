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

COMGUI_UUID BytesOf(CFUUIDRef uuid)
{
    CFUUIDBytes const source = CFUUIDGetUUIDBytes(uuid);
    COMGUI_UUID id;
    static_assert(sizeof id == sizeof source);
    std::memcpy(&id, &source, sizeof id);
    return id;
}

bool IsSame(COMGUI_UUID const& id, char const* text)
{
    COMGUI_UUID const other = BytesOf(NewUuid(text).get());
    return std::memcmp(&id, &other, sizeof id) == 0;
}

// What comgui_trace has loaded into the program must let the trace itself through.
class Passed
{
public:
    Passed() { Tell(true); }
    ~Passed() { Tell(false); }
    Passed(Passed const&) = delete;
    Passed& operator=(Passed const&) = delete;

private:
    static void Tell(bool isPassed)
    {
        using Pass = void (*)(bool);
        if (auto const pass = reinterpret_cast<Pass>(dlsym(RTLD_DEFAULT, "comgui_trace_pass")))
            pass(isPassed);
    }
};

Owner<CFPlugInRef> OpenBundle(std::string const& bundle)
{
    Passed const here;
    auto const text = NewString(bundle.c_str());
    Owner<CFURLRef> const url(
        text ? CFURLCreateWithFileSystemPath(kCFAllocatorDefault, text.get(), kCFURLPOSIXPathStyle, true)
             : nullptr);
    return Owner<CFPlugInRef>(url ? CFPlugInCreate(kCFAllocatorDefault, url.get()) : nullptr);
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
    auto plugIn = OpenBundle(bundle);
    if (!plugIn)
        return Complain(bundle, "no bundle");
    void* const object = NewInstance(plugIn.get());
    if (!object)
        return Complain(bundle, "no plug-in in it");
    void* found = nullptr;
    (**static_cast<ComGUIModuleInterface**>(object))
        .QueryInterface(object, BytesOf(NewUuid(COMGUI_INTERFACE_UUID).get()), &found);
    if (!found)
        return Complain(bundle, "its plug-in has no interface");
    static_cast<void>(plugIn.release());  // stays, as the library keeps its own
    return new RealModule(object, **static_cast<ComGUIModuleInterface**>(found));
}

bool RealModule::IsItsInterface(COMGUI_UUID interfaceId)
{
    return IsSame(interfaceId, COMGUI_INTERFACE_UUID);
}

bool RealModule::IsItsType(void const* type)
{
    return IsSame(BytesOf(static_cast<CFUUIDRef>(type)), COMGUI_PLUGIN_TYPE_UUID);
}

int RealModule::QueryInterface(COMGUI_UUID interfaceId, void** out) const
{
    return (**static_cast<ComGUIModuleInterface**>(m_object)).QueryInterface(m_object, interfaceId, out);
}
}  // namespace trace
