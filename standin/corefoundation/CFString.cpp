#include "standin/corefoundation/CFString.h"

#include "standin/corefoundation/CountedObject.h"
#include "standin/corefoundation/Utf8.h"

CFStringRef CFStringCreateWithCString(CFAllocatorRef, char const* text, CFStringEncoding encoding)
{
    if (text == nullptr)
        comgui::detail::ProgramError("CFStringCreateWithCString of a null text");
    if (encoding != kCFStringEncodingUTF8 || !comgui::detail::IsUtf8(text))
        return nullptr;
    return new __CFString(text);
}
