#include "standin/corefoundation/BundleInfo.h"
#include "standin/corefoundation/CFArray.h"
#include "standin/corefoundation/CFURL.h"
#include "standin/corefoundation/CFUUID.h"
#include "standin/corefoundation/CountedObject.h"
#include <CoreFoundation/CoreFoundation.h>
#include <algorithm>
#include <cstdio>
#include <dlfcn.h>
#include <iterator>
#include <mutex>
#include <system_error>
#include <utility>

using comgui::detail::BundleInfo;
using comgui::detail::CountedObject;
using comgui::detail::Owned;
using comgui::detail::ProgramError;
using comgui::detail::Uuid;

namespace
{
namespace fs = std::filesystem;

using FACTORY = void* (*)(CFAllocatorRef, CFUUIDRef);

constexpr char howToInstall[] =
    "put the shared object that CFBundleExecutable in Info.plist names into Contents/Linux";

void Complain(fs::path const& bundle, std::string const& reason, char const* remedy)
{
    std::fprintf(stderr, "CoreFoundation: %s: %s; %s\n", bundle.c_str(), reason.c_str(), remedy);
}
}  // namespace

// An open bundle. Its executable is not loaded before a factory is called.
struct __CFBundle final : CountedObject
{
    __CFBundle(fs::path place, BundleInfo content) : path(std::move(place)), info(std::move(content)) {}
    ~__CFBundle() override;

    std::vector<Uuid> FactoriesOf(Uuid const& type) const;
    bool HasFactory(Uuid const& factory) const { return info.functions.count(factory) != 0; }

    // The factory's function, null if it cannot be had; stderr then tells why.
    FACTORY Load(Uuid const& factory);

private:
    void* Executable();

    fs::path const path;
    BundleInfo const info;
    std::atomic<void*> executable{nullptr};
};

namespace
{
// All open bundles, in the order of their opening. It does not own them; but it keeps a bundle that its
// opener never closes from looking lost.
class OpenBundles
{
public:
    // Never destroyed: a bundle may be closed, and a factory asked for, while the process comes to its end.
    static OpenBundles& Get()
    {
        static auto& bundles = *new OpenBundles;
        return bundles;
    }

    void Add(__CFBundle* bundle)
    {
        std::lock_guard const lock(m_mutex);
        m_bundles.push_back(bundle);
    }

    void Remove(__CFBundle const* bundle)
    {
        std::lock_guard const lock(m_mutex);
        std::erase(m_bundles, bundle);
    }

    // The bundle opened last that has this factory.
    Owned<__CFBundle> WithFactory(Uuid const& factory)
    {
        std::lock_guard const lock(m_mutex);
        auto const found = std::find_if(
            m_bundles.rbegin(), m_bundles.rend(),
            [&](__CFBundle* bundle) { return bundle->HasFactory(factory) && bundle->RetainUnlessGone(); });
        return Owned<__CFBundle>(found == m_bundles.rend() ? nullptr : *found);
    }

private:
    std::mutex m_mutex;
    std::vector<__CFBundle*> m_bundles;
};
}  // namespace

__CFBundle::~__CFBundle() { OpenBundles::Get().Remove(this); }

std::vector<Uuid> __CFBundle::FactoriesOf(Uuid const& type) const
{
    auto const found = info.factories.find(type);
    return found == info.factories.end() ? std::vector<Uuid>() : found->second;
}

FACTORY __CFBundle::Load(Uuid const& factory)
{
    void* const image = Executable();
    if (image == nullptr)
        return nullptr;
    std::string const& function = info.functions.at(factory);
    void* const symbol = dlsym(image, function.c_str());
    if (symbol == nullptr)
    {
        char const* const reason = dlerror();
        Complain(path,
                 "has no factory function " + function + " (" + (reason ? reason : "its address is null") +
                     ")",
                 "export it with C linkage, or correct CFPlugInFactories in Info.plist");
    }
    return reinterpret_cast<FACTORY>(symbol);
}

// Without a lock, since the executable's own start-up code may open plug-ins too. Two threads that come
// here at once are given one and the same image, which is never unloaded.
void* __CFBundle::Executable()
{
    void* image = executable.load(std::memory_order_acquire);
    if (image != nullptr)
        return image;
    if (info.executable.empty())
    {
        Complain(path, "cannot load its executable (CFBundleExecutable is a path, not a name)", howToInstall);
        return nullptr;
    }
    fs::path const file = path / "Contents" / "Linux" / info.executable;
    image = dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (image == nullptr)
        Complain(path, std::string("cannot load its executable (") + dlerror() + ")", howToInstall);
    executable.store(image, std::memory_order_release);
    return image;
}

CFPlugInRef CFPlugInCreate(CFAllocatorRef, CFURLRef bundleURL)
{
    if (bundleURL == nullptr)
        ProgramError("CFPlugInCreate of a null URL");
    fs::path const& path = bundleURL->path;
    std::error_code error;
    if (!fs::is_directory(path, error))
        return nullptr;
    auto info = comgui::detail::ReadBundleInfo(path);
    if (!info)
    {
        Complain(path, "cannot read its Info.plist, so it has no factories",
                 "put a property list, XML or binary, into Contents/Info.plist");
    }
    Owned<__CFBundle> bundle(new __CFBundle(path, std::move(info).value_or(BundleInfo())));
    OpenBundles::Get().Add(bundle.get());
    return bundle.release();
}

CFArrayRef CFPlugInFindFactoriesForPlugInTypeInPlugIn(CFUUIDRef typeUUID, CFPlugInRef plugIn)
{
    if (typeUUID == nullptr)
        ProgramError("CFPlugInFindFactoriesForPlugInTypeInPlugIn of a null type");
    if (plugIn == nullptr)
        return nullptr;
    auto const factories = plugIn->FactoriesOf(typeUUID->bytes);
    if (factories.empty())
        return nullptr;
    __CFArray::ELEMENTS elements;
    std::transform(factories.begin(), factories.end(), std::back_inserter(elements),
                   [](Uuid const& factory) { return Owned<CountedObject const>(new __CFUUID(factory)); });
    return new __CFArray(std::move(elements));
}

void* CFPlugInInstanceCreate(CFAllocatorRef allocator, CFUUIDRef factoryUUID, CFUUIDRef typeUUID)
{
    if (factoryUUID == nullptr)
        ProgramError("CFPlugInInstanceCreate of a null factory");
    if (typeUUID == nullptr)
        ProgramError("CFPlugInInstanceCreate of a null type");
    auto const bundle = OpenBundles::Get().WithFactory(factoryUUID->bytes);
    if (!bundle)
        return nullptr;
    auto const served = bundle->FactoriesOf(typeUUID->bytes);
    if (std::find(served.begin(), served.end(), factoryUUID->bytes) == served.end())
        return nullptr;
    FACTORY const factory = bundle->Load(factoryUUID->bytes);
    return factory ? factory(allocator, typeUUID) : nullptr;
}
