#include "standin/corefoundation/CountedObject.h"

#include <CoreFoundation/CoreFoundation.h>
#include <cstdio>
#include <cstdlib>

using comgui::detail::CountedObject;
using comgui::detail::ProgramError;

CFAllocatorRef const kCFAllocatorDefault = nullptr;

CFTypeRef CFRetain(CFTypeRef object)
{
    if (object == nullptr)
        ProgramError("CFRetain of a null reference");
    static_cast<CountedObject const*>(object)->Retain();
    return object;
}

void CFRelease(CFTypeRef object)
{
    if (object == nullptr)
        ProgramError("CFRelease of a null reference");
    static_cast<CountedObject const*>(object)->Release();
}

void comgui::detail::ProgramError(char const* what)
{
    std::fprintf(stderr, "CoreFoundation: %s: a mistake of the calling program, which ends here\n", what);
    std::abort();
}
