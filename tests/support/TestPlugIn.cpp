#include "tests/support/TestPlugIn.h"

// These functions are found by the names that a test writes into an Info.plist.
#define TEST_FACTORY extern "C" __attribute__((visibility("default"))) void*

namespace
{
FACTORY_CALL record{};
}  // namespace

TEST_FACTORY RecordingFactory(CFAllocatorRef allocator, CFUUIDRef type)
{
    ++record.calls;
    record.allocator = allocator;
    record.type = CFUUIDGetUUIDBytes(type);
    return &record;
}

TEST_FACTORY StatelessFactory(CFAllocatorRef, CFUUIDRef) { return &record; }

TEST_FACTORY RefusingFactory(CFAllocatorRef, CFUUIDRef) { return nullptr; }
