#include "tools/comgui_validate/Loader.h"

#include <cstring>
#include <filesystem>
#include <system_error>
#include <type_traits>

namespace validate
{
namespace
{
struct RELEASE
{
    void operator()(CFTypeRef object) const { CFRelease(object); }
};
template <typename Ref>
using Owner = std::unique_ptr<std::remove_pointer_t<Ref>, RELEASE>;

Owner<CFStringRef> NewString(char const* text)
{
    return Owner<CFStringRef>(CFStringCreateWithCString(kCFAllocatorDefault, text, kCFStringEncodingUTF8));
}

Owner<CFUUIDRef> NewUuid(char const* text)
{
    return Owner<CFUUIDRef>(CFUUIDCreateFromString(kCFAllocatorDefault, NewString(text).get()));
}

Owner<CFArrayRef> FactoriesOf(CFPlugInRef plugIn)
{
    auto const type = NewUuid(COMGUI_PLUGIN_TYPE_UUID);
    return Owner<CFArrayRef>(CFPlugInFindFactoriesForPlugInTypeInPlugIn(type.get(), plugIn));
}

ComGUIModuleInterface const& TableOf(void* object) { return **static_cast<ComGUIModuleInterface**>(object); }
}  // namespace

Loader::Loader(std::string const& folder)
{
    auto const text = NewString(folder.c_str());
    Owner<CFURLRef> const url(
        text ? CFURLCreateWithFileSystemPath(kCFAllocatorDefault, text.get(), kCFURLPOSIXPathStyle, true)
             : nullptr);
    if (url)
        m_plugIn = CFPlugInCreate(kCFAllocatorDefault, url.get());
    // Any folder can be opened, but only one with a property list is a bundle.
    std::error_code error;
    m_hasInfo = std::filesystem::is_regular_file(folder + "/Contents/Info.plist", error);
}

bool Loader::HasFactory() const
{
    auto const factories = FactoriesOf(m_plugIn);
    return factories && CFArrayGetCount(factories.get()) > 0;
}

bool Loader::MakeInstance()
{
    auto const factories = FactoriesOf(m_plugIn);
    auto const first = static_cast<CFUUIDRef>(CFArrayGetValueAtIndex(factories.get(), 0));
    m_instance = CFPlugInInstanceCreate(nullptr, first, NewUuid(COMGUI_PLUGIN_TYPE_UUID).get());
    return m_instance;
}

bool Loader::HasTable() const { return *static_cast<void**>(m_instance); }

bool Loader::AskForInterface(char const* uuid)
{
    CFUUIDBytes const source = CFUUIDGetUUIDBytes(NewUuid(uuid).get());
    COMGUI_UUID bytes;
    static_assert(sizeof bytes == sizeof source);
    std::memcpy(&bytes, &source, sizeof bytes);
    m_found = nullptr;
    TableOf(m_instance).QueryInterface(m_instance, bytes, &m_found);
    return m_found;
}

void Loader::ReleaseInstance() { TableOf(m_instance).Release(m_instance); }

std::unique_ptr<Module> Loader::Take() const
{
    auto module = std::make_unique<Module>();
    module->pointer = static_cast<ComGUIModuleInterface**>(m_found);
    module->table = module->Live();
    return module;
}

bool Loader::Open(Module& module) const { return module.table.Open(&module.instance) == 0; }

std::unique_ptr<Module> Load(std::string const& folder)
{
    Loader loader(folder);
    if (!loader.HasInfo() || !loader.HasFactory() || !loader.MakeInstance() || !loader.HasTable())
        return nullptr;
    bool const hasInterface = loader.AskForInterface(COMGUI_INTERFACE_UUID);
    loader.ReleaseInstance();
    if (!hasInterface)
        return nullptr;
    auto module = loader.Take();
    return module->table.Open && loader.Open(*module) ? std::move(module) : nullptr;
}
}  // namespace validate
