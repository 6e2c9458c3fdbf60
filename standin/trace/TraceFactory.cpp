// The one function that ComGUI-Trace.Bundle exports: it makes the object whose table a host copies, if the
// real plug-in can be loaded.
#include "comgui/foundation/export.h"
#include "standin/trace/RealModule.h"
#include "standin/trace/Trace.h"
#include "standin/trace/TracedEntries.h"
#include <CoreFoundation/CoreFoundation.h>
#include <atomic>
#include <new>

namespace
{
// COM style: the first word is the table.
struct Object
{
    ComGUIModuleInterface* table;
    std::atomic<unsigned> references{1};
};

unsigned int AddRef(void* object) { return ++static_cast<Object*>(object)->references; }

unsigned int Release(void* object)
{
    auto* const ours = static_cast<Object*>(object);
    unsigned const left = --ours->references;
    if (!left)
        delete ours;
    return left;
}

// What the real plug-in answers, but that its interface is exchanged for the traced one.
int QueryInterface(void* object, COMGUI_UUID interfaceId, void** out)
{
    trace::RealModule const& real = *trace::RealModule::Get();
    if (!out || !real.IsItsInterface(interfaceId))
        return real.QueryInterface(interfaceId, out);
    AddRef(object);
    *out = object;
    return 0;
}

ComGUIModuleInterface* Table()
{
    static ComGUIModuleInterface table = []
    {
        ComGUIModuleInterface copy = trace::RealModule::Get()->Table();
        trace::TraceEntries(copy);
        copy.QueryInterface = QueryInterface;
        copy.AddRef = AddRef;
        copy.Release = Release;
        return copy;
    }();
    return &table;
}
}  // namespace

extern "C" COMGUI_EXPORT void* ComGUITraceFactory(CFAllocatorRef, CFUUIDRef type)
{
    if (!trace::RealModule::IsItsType(type) || !trace::RealModule::Get())
        return nullptr;
    trace::Trace::Get();
    return new (std::nothrow) Object{Table()};
}
