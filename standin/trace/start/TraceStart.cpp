// Loaded into a program by comgui_trace: where the program opens ComGUI.Bundle, ComGUI-Trace.Bundle is opened
// in its place, and told which one was meant. COMGUI_TRACE_PLUGIN names it.
#include <CoreFoundation/CoreFoundation.h>
#include <cstdlib>
#include <cstring>
#include <dlfcn.h>
#include <mutex>
#include <string>
#include <string_view>

#define SEEN extern "C" __attribute__((visibility("default")))

namespace
{
thread_local bool isPassed = false;

std::string& Noted()
{
    static auto& noted = *new std::string;
    return noted;
}

// The first one: the trace opens one plug-in in a process.
void Note(char const* text)
{
    static auto& lock = *new std::mutex;
    std::lock_guard const guard(lock);
    if (Noted().empty())
        Noted() = text;
}

bool IsTheBundle(std::string_view text)
{
    constexpr std::string_view Name = "ComGUI.Bundle";
    while (!text.empty() && text.back() == '/')
        text.remove_suffix(1);
    if (text.size() < Name.size() || text.substr(text.size() - Name.size()) != Name)
        return false;
    return text.size() == Name.size() || text[text.size() - Name.size() - 1] == '/';
}
}  // namespace

SEEN char const* comgui_trace_noted_bundle() { return Noted().c_str(); }

// While the trace opens the bundle that was meant, on this thread, nothing is put in its place.
SEEN void comgui_trace_pass(bool pass) { isPassed = pass; }

// A text that ends in the bundle's name is the path that is about to be opened. Some programs open it twice.
SEEN CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, char const* text,
                                           CFStringEncoding encoding)
{
    auto const next =
        reinterpret_cast<decltype(CFStringCreateWithCString)*>(dlsym(RTLD_NEXT, "CFStringCreateWithCString"));
    char const* const plugIn = std::getenv("COMGUI_TRACE_PLUGIN");
    if (text && plugIn && !isPassed && IsTheBundle(text))
    {
        Note(text);
        return next(allocator, plugIn, encoding);
    }
    return next(allocator, text, encoding);
}
