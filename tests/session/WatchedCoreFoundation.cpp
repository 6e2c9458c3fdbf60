#include "tests/session/WatchedCoreFoundation.h"

#include <dlfcn.h>

CORE_FOUNDATION_FAILURES coreFoundationFailures;
CORE_FOUNDATION_URL coreFoundationURL;

namespace
{
struct TEXT
{
    CFStringRef string = nullptr;
    std::string bytes;
    CFStringEncoding encoding = 0;
};

TEXT lastText;
}  // namespace

static bool FailsNow(int& failures) { return failures > 0 && failures-- > 0; }

// The program's own definitions come before those of any shared library, and pass on what shall not fail.
template <typename Function>
static Function* Next(char const* name)
{
    return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

// Seen by the libraries whatever the header and the compiler's options say about visibility.
#define WATCHED extern "C" __attribute__((visibility("default")))

WATCHED CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, char const* text,
                                              CFStringEncoding encoding)
{
    if (FailsNow(coreFoundationFailures.strings))
        return nullptr;
    CFStringRef const string =
        Next<decltype(CFStringCreateWithCString)>("CFStringCreateWithCString")(allocator, text, encoding);
    lastText = {string, text, encoding};
    return string;
}

WATCHED CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path,
                                               CFURLPathStyle style, Boolean isDirectory)
{
    if (FailsNow(coreFoundationFailures.urls))
        return nullptr;
    if (path == lastText.string)
        coreFoundationURL = {lastText.bytes, lastText.encoding, style, isDirectory != 0};
    return Next<decltype(CFURLCreateWithFileSystemPath)>("CFURLCreateWithFileSystemPath")(allocator, path,
                                                                                          style, isDirectory);
}
