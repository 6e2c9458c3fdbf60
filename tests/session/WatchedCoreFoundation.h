// Watches the calls of CoreFoundation that make the bundle's address, and makes them fail, which they do not
// do by themselves.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <string>

struct CORE_FOUNDATION_FAILURES
{
    int strings = 0;  // so many of the next CFStringCreateWithCString
    int urls = 0;     // so many of the next CFURLCreateWithFileSystemPath
};

extern CORE_FOUNDATION_FAILURES coreFoundationFailures;

// What the last CFURLCreateWithFileSystemPath was made from.
struct CORE_FOUNDATION_URL
{
    std::string path;               // the bytes that its string was made from
    CFStringEncoding encoding = 0;  // that they were said to be in
    CFURLPathStyle style = -1;
    bool isDirectory = false;
};

extern CORE_FOUNDATION_URL coreFoundationURL;
