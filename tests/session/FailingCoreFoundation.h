// Makes calls of CoreFoundation fail that do not fail by themselves.
#pragma once

struct CORE_FOUNDATION_FAILURES
{
    int strings = 0;  // so many of the next CFStringCreateWithCString
    int urls = 0;     // so many of the next CFURLCreateWithFileSystemPath
};

extern CORE_FOUNDATION_FAILURES coreFoundationFailures;
