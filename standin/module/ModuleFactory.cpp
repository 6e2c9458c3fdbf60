// The one function that the bundle exports: it makes the object whose table a host copies.
#include "standin/module/Entries.h"

#include <CoreFoundation/CoreFoundation.h>
#include <atomic>
#include <new>

namespace
{
// COM style: the first word is the table.
struct ModuleObject
{
    ComGUIModuleInterface* table;
    std::atomic<unsigned> references{1};
};

// The bytes of a UUID's text, either letter case; false for any other text.
constexpr bool SameUuid(unsigned char const* bytes, char const* text)
{
    auto const digit = [](char c) { return c <= '9' ? c - '0' : (c | 32) - 'a' + 10; };
    for (int i = 0; i < 16; ++i, text += 2)
    {
        if (*text == '-')
            ++text;
        if (bytes[i] != digit(text[0]) * 16 + digit(text[1]))
            return false;
    }
    return true;
}

unsigned int AddRef(void* object) { return ++static_cast<ModuleObject*>(object)->references; }

unsigned int Release(void* object)
{
    auto* const module = static_cast<ModuleObject*>(object);
    unsigned const left = --module->references;
    if (!left)
        delete module;
    return left;
}

constexpr int NoInterface = static_cast<int>(0x80000004);  // what COM answers for an interface it lacks

int QueryInterface(void* object, COMGUI_UUID interfaceId, void** out)
{
    if (!out || !SameUuid(interfaceId.bytes, COMGUI_INTERFACE_UUID))
        return NoInterface;
    AddRef(object);
    *out = object;
    return 0;
}

ComGUIModuleInterface* Table()
{
    static ComGUIModuleInterface table = []
    {
        ComGUIModuleInterface entries{};
        entries.QueryInterface = QueryInterface;
        entries.AddRef = AddRef;
        entries.Release = Release;
        standin::FillEntries(entries);
        return entries;
    }();
    return &table;
}
}  // namespace

// The factory's result holds one reference; null for a type that it does not make.
extern "C" __attribute__((visibility("default"))) void* ComGUIModuleFactory(CFAllocatorRef, CFUUIDRef type)
{
    CFUUIDBytes const bytes = CFUUIDGetUUIDBytes(type);
    if (!SameUuid(&bytes.byte0, COMGUI_PLUGIN_TYPE_UUID))
        return nullptr;
    return new (std::nothrow) ModuleObject{Table()};
}
