#include "tools/comgui_trace/Start.h"

#include "standin/trace/TraceFormat.h"
#include "standin/trace/TraceRing.h"
#include "tools/comgui_trace/TraceFile.h"
#include "tools/shared/Trouble.h"
#include "tools/shared/text.h"
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <system_error>
#include <unistd.h>

namespace tracing
{
namespace
{
namespace fs = std::filesystem;
using tools::Trouble;

// In the build tree as after installation the libraries lie beside this program's folder.
fs::path LibraryFolder()
{
    fs::path const own = fs::read_symlink("/proc/self/exe").parent_path();
    for (fs::path const& folder : {own.parent_path() / COMGUI_LIBRARY_FOLDER, own.parent_path() / "lib"})
        if (fs::is_directory(folder / "ComGUI-Trace.Bundle"))
            return fs::canonical(folder);
    throw Trouble("ComGUI-Trace.Bundle is not installed beside comgui_trace");
}

void Set(char const* name, std::string const& value) { setenv(name, value.c_str(), 1); }
}  // namespace

void Start(StartOptions const& options)
{
    fs::path const bundle = LibraryFolder() / "ComGUI-Trace.Bundle";
    Set("COMGUI_TRACE_PLUGIN", bundle);
    Set("COMGUI_TRACE_FILE", fs::absolute(options.file.empty() ? "comgui-%p.trace" : options.file));
    Set("COMGUI_TRACE", options.isOff ? "off" : "on");
    if (!options.bundle.empty())
        Set("COMGUI_TRACE_BUNDLE", fs::absolute(options.bundle));
    char const* const others = std::getenv("LD_PRELOAD");
    std::string const start = bundle / "Contents/Linux/libcomgui_trace_start.so";
    Set("LD_PRELOAD", others && *others ? start + ":" + others : start);
    std::vector<char*> arguments;
    for (std::string const& argument : options.program)
        arguments.push_back(const_cast<char*>(argument.c_str()));
    arguments.push_back(nullptr);
    execvp(arguments[0], arguments.data());
    throw Trouble(tools::ShownName(options.program[0]) +
                  " cannot be started: " + std::generic_category().message(errno));
}

void Switch(std::string const& file, bool on)
{
    TraceFile const trace(file);
    bool const runs = kill(static_cast<pid_t>(trace.Head().process), 0) == 0;
    auto const ring = runs ? trace::TraceRing::Open(file + trace::RingSuffix) : nullptr;
    if (!ring)
        throw Trouble("no program writes " + tools::ShownName(file) + " now");
    ring->Switch(on);
}
}  // namespace tracing
