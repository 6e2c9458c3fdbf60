// The executable of the test bundle: its factories ask the test program for their instance.
#include "comgui/foundation/export.h"
#include <CoreFoundation/CoreFoundation.h>

extern "C"
{
    void* MakeFakeInstance(char const* factory, CFUUIDRef type);  // in the test program

    COMGUI_EXPORT void* FirstFactory(CFAllocatorRef, CFUUIDRef type)
    {
        return MakeFakeInstance("FirstFactory", type);
    }

    COMGUI_EXPORT void* SecondFactory(CFAllocatorRef, CFUUIDRef type)
    {
        return MakeFakeInstance("SecondFactory", type);
    }
}
