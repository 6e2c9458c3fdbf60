#include "standin/corefoundation/CFArray.h"

using comgui::detail::ProgramError;

CFIndex CFArrayGetCount(CFArrayRef array)
{
    if (array == nullptr)
        ProgramError("CFArrayGetCount of a null reference");
    return static_cast<CFIndex>(array->elements.size());
}

void const* CFArrayGetValueAtIndex(CFArrayRef array, CFIndex index)
{
    if (index < 0 || index >= CFArrayGetCount(array))
        ProgramError("CFArrayGetValueAtIndex outside the array");
    return array->elements[static_cast<std::size_t>(index)].get();
}
