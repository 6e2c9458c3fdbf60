// CF references that go with their scope, and the short way to make them.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <cstring>
#include <filesystem>
#include <memory>
#include <string>
#include <type_traits>

struct CFReleaser
{
    void operator()(CFTypeRef object) const { CFRelease(object); }
};
template <class REF>
using Held = std::unique_ptr<std::remove_pointer_t<REF>, CFReleaser>;

inline Held<CFStringRef> MakeString(std::string const& text)
{
    return Held<CFStringRef>(
        CFStringCreateWithCString(kCFAllocatorDefault, text.c_str(), kCFStringEncodingUTF8));
}

inline Held<CFURLRef> MakeURL(std::filesystem::path const& path)
{
    return Held<CFURLRef>(CFURLCreateWithFileSystemPath(kCFAllocatorDefault, MakeString(path.string()).get(),
                                                        kCFURLPOSIXPathStyle, true));
}

inline Held<CFUUIDRef> MakeUUID(std::string const& text)
{
    return Held<CFUUIDRef>(CFUUIDCreateFromString(kCFAllocatorDefault, MakeString(text).get()));
}

inline bool IsUUID(void const* element, std::string const& text)
{
    CFUUIDBytes const bytes = CFUUIDGetUUIDBytes(static_cast<CFUUIDRef>(element));
    CFUUIDBytes const expected = CFUUIDGetUUIDBytes(MakeUUID(text).get());
    return std::memcmp(&bytes, &expected, sizeof bytes) == 0;
}

inline Held<CFPlugInRef> OpenPlugIn(std::filesystem::path const& bundle)
{
    return Held<CFPlugInRef>(CFPlugInCreate(kCFAllocatorDefault, MakeURL(bundle).get()));
}

inline Held<CFArrayRef> FactoriesOf(Held<CFPlugInRef> const& plugIn, std::string const& type)
{
    return Held<CFArrayRef>(CFPlugInFindFactoriesForPlugInTypeInPlugIn(MakeUUID(type).get(), plugIn.get()));
}

inline void* MakeInstance(std::string const& factory, std::string const& type)
{
    return CFPlugInInstanceCreate(kCFAllocatorDefault, MakeUUID(factory).get(), MakeUUID(type).get());
}
