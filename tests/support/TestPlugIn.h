// What the factories of comgui_test_plugin make: a record of how the factory was called. It lies in the
// module itself, so that its address also tells which copy of the module was called.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

struct FACTORY_CALL
{
    int calls;
    CFAllocatorRef allocator;
    CFUUIDBytes type;
};
