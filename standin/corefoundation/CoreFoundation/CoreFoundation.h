// The calls of CoreFoundation that open a plug-in, for systems that have no CoreFoundation: same names,
// types and meaning, and no more than the library uses. What a Create function returns belongs to the
// caller, who gives it back with CFRelease. Failures are null results; where the system's own would crash
// on a null argument or an index outside an array, this one says so in one line and ends the process. All
// calls may come from any thread. The allocator is only handed through to a factory.
//
// Where it is kinder than the system's own, on purpose; a client should rely on none of it:
// - An Info.plist is read each time that its bundle is opened, so that a change is seen without a restart.
// - An executable that cannot be loaded is looked for again with the next factory call.
// - The last release of a plug-in takes its factories away. Its executable stays loaded.
// - Of several open bundles with the same factory, the one opened last serves.
// - What went wrong is said in one line on stderr, with a remedy.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
#    define CF_EXPORT extern "C" __attribute__((visibility("default")))
#else
#    define CF_EXPORT extern __attribute__((visibility("default")))
#endif

typedef unsigned char Boolean;
typedef uint8_t UInt8;
typedef uint32_t UInt32;
typedef long CFIndex;

typedef void const* CFTypeRef;
typedef struct __CFAllocator const* CFAllocatorRef;
typedef struct __CFString const* CFStringRef;
typedef struct __CFURL const* CFURLRef;
typedef struct __CFUUID const* CFUUIDRef;
typedef struct __CFArray const* CFArrayRef;
typedef struct __CFBundle* CFPlugInRef;

CF_EXPORT CFAllocatorRef const kCFAllocatorDefault;

CF_EXPORT CFTypeRef CFRetain(CFTypeRef object);
CF_EXPORT void CFRelease(CFTypeRef object);

typedef UInt32 CFStringEncoding;
enum
{
    kCFStringEncodingUTF8 = 0x08000100
};

// Null for bytes that are no UTF-8, and for any other encoding.
CF_EXPORT CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, char const* text,
                                                CFStringEncoding encoding);

typedef CFIndex CFURLPathStyle;
enum
{
    kCFURLPOSIXPathStyle = 0
};

// Null for an empty path and for any other path style. A relative path is taken from the current folder.
CF_EXPORT CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path,
                                                 CFURLPathStyle style, Boolean isDirectory);

typedef struct
{
    UInt8 byte0, byte1, byte2, byte3, byte4, byte5, byte6, byte7;
    UInt8 byte8, byte9, byte10, byte11, byte12, byte13, byte14, byte15;
} CFUUIDBytes;

// Null for a text that is not of the form 01234567-89AB-CDEF-0123-456789ABCDEF (either letter case).
CF_EXPORT CFUUIDRef CFUUIDCreateFromString(CFAllocatorRef allocator, CFStringRef text);
CF_EXPORT CFUUIDBytes CFUUIDGetUUIDBytes(CFUUIDRef uuid);

CF_EXPORT CFIndex CFArrayGetCount(CFArrayRef array);
CF_EXPORT void const* CFArrayGetValueAtIndex(CFArrayRef array, CFIndex index);

// Opens the bundle at that URL, which may be any folder; null if there is none. Its Contents/Info.plist, XML
// or binary, has the dictionaries CFPlugInFactories and CFPlugInTypes, of arrays of texts or single texts;
// without them the plug-in has no factories. An Info.plist that cannot be read (none, no sound property
// list, XML that is not UTF-8, more than 16 MiB, nested in more than 512 levels) is the same, with a line on
// stderr. The executable is Contents/Linux/<CFBundleExecutable>, or without that text the folder's name less
// its extension. It is loaded when a factory is first called, and then stays loaded to the end of the
// process.
CF_EXPORT CFPlugInRef CFPlugInCreate(CFAllocatorRef allocator, CFURLRef bundleURL);

// The plug-in's factories for that type, as CFUUIDRef in the order of its Info.plist; null if it has none. A
// factory without a function in CFPlugInFactories is skipped, so that the next one of the list may serve.
// The caller releases the array.
CF_EXPORT CFArrayRef CFPlugInFindFactoriesForPlugInTypeInPlugIn(CFUUIDRef typeUUID, CFPlugInRef plugIn);

// Calls the factory, void* Factory(CFAllocatorRef, CFUUIDRef typeUUID), of the bundle opened last that has
// it, and gives what it made. Null without such a factory, if that bundle does not name it for the type, and,
// with a line on stderr, without its executable or its function.
CF_EXPORT void* CFPlugInInstanceCreate(CFAllocatorRef allocator, CFUUIDRef factoryUUID, CFUUIDRef typeUUID);
