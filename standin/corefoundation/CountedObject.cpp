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

namespace comgui::detail
{
void CountedObject::Release() const
{
    if (m_owners.fetch_sub(1, std::memory_order_acq_rel) == 1)
        delete this;
}

bool CountedObject::RetainUnlessGone() const
{
    long owners = m_owners.load(std::memory_order_relaxed);
    while (owners > 0)
    {
        if (m_owners.compare_exchange_weak(owners, owners + 1, std::memory_order_relaxed))
            return true;
    }
    return false;
}

void ProgramError(char const* what)
{
    std::fprintf(stderr, "CoreFoundation: %s: a mistake of the calling program, which ends here\n", what);
    std::abort();
}
}  // namespace comgui::detail
