#include "standin/corefoundation/CFUUID.h"

#include "standin/corefoundation/CFString.h"
#include <bit>

using comgui::detail::ParseUuid;
using comgui::detail::ProgramError;

CFUUIDRef CFUUIDCreateFromString(CFAllocatorRef, CFStringRef text)
{
    if (text == nullptr)
        return nullptr;
    auto const uuid = ParseUuid(text->text);
    return uuid ? new __CFUUID(*uuid) : nullptr;
}

CFUUIDBytes CFUUIDGetUUIDBytes(CFUUIDRef uuid)
{
    if (uuid == nullptr)
        ProgramError("CFUUIDGetUUIDBytes of a null reference");
    return std::bit_cast<CFUUIDBytes>(uuid->bytes);
}
