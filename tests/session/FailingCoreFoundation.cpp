#include "tests/session/FailingCoreFoundation.h"

#include <CoreFoundation/CoreFoundation.h>
#include <dlfcn.h>

CORE_FOUNDATION_FAILURES coreFoundationFailures;

static bool FailsNow(int& failures) { return failures > 0 && failures-- > 0; }

// The program's own definitions come before those of any shared library, and pass on what shall not fail.
template <typename Function>
static Function* Next(char const* name)
{
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, char const* text, CFStringEncoding encoding)
{
    if (FailsNow(coreFoundationFailures.strings))
        return nullptr;
    return Next<decltype(CFStringCreateWithCString)>("CFStringCreateWithCString")(allocator, text, encoding);
}

CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory)
{
    if (FailsNow(coreFoundationFailures.urls))
        return nullptr;
    return Next<decltype(CFURLCreateWithFileSystemPath)>("CFURLCreateWithFileSystemPath")(allocator, path,
                                                                                          style, isDirectory);
}
