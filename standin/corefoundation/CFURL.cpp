#include "standin/corefoundation/CFURL.h"

#include "standin/corefoundation/CFString.h"
#include <system_error>

CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef, CFStringRef path, CFURLPathStyle style, Boolean)
{
    if (path == nullptr)
        comgui::detail::ProgramError("CFURLCreateWithFileSystemPath of a null path");
    if (path->text.empty() || style != kCFURLPOSIXPathStyle)
        return nullptr;
    // Made full now: the URL keeps its meaning when the current folder changes.
    std::error_code error;
    std::filesystem::path full = std::filesystem::absolute(path->text, error);
    return error ? nullptr : new __CFURL(std::move(full));
}
