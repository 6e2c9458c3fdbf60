#include "comgui/host/UtilityObjects.h"

#include <dlfcn.h>
#include <filesystem>
#include <mutex>
#include <system_error>
#ifdef __APPLE__
#    include <mach-o/dyld.h>
#    include <sys/syslimits.h>
#endif

namespace fs = std::filesystem;

namespace
{
// All paths are UTF-8, whatever the locale of the process says.
fs::path PathOf(wxString const& text) { return {static_cast<char const*>(text.utf8_str())}; }

fs::path FullPath(fs::path const& path)
{
    std::error_code error;
    fs::path full = fs::absolute(path, error);
    return error ? path : full;
}

// The folder that was set, empty if none was.
class ChosenFolder
{
public:
    // Made on first use: nothing of this library runs while it is being loaded.
    static ChosenFolder& OfThisProcess()
    {
        static ChosenFolder folder;
        return folder;
    }

    fs::path Get()
    {
        std::lock_guard const lock(m_lock);
        return m_path;
    }
    void Set(fs::path path)
    {
        std::lock_guard const lock(m_lock);
        m_path = std::move(path);
    }

private:
    std::mutex m_lock;
    fs::path m_path;
};

fs::path ProgramFolder()
{
#ifdef __APPLE__
    char program[PATH_MAX] = "";
    uint32_t size = sizeof program;
    return _NSGetExecutablePath(program, &size) == 0 ? FullPath(program).parent_path() : fs::path();
#else
    std::error_code error;
    return fs::read_symlink("/proc/self/exe", error).parent_path();
#endif
}

fs::path LibraryFolder()
{
    // A function that nobody else sees: the address of an exported one can lie in the program.
    Dl_info library{};
    if (dladdr(reinterpret_cast<void const*>(&LibraryFolder), &library) == 0)
        return {};
    return FullPath(library.dli_fname).parent_path();
}

fs::path PlugInsFolder(fs::path const& bundleName)
{
    if (fs::path chosen = ChosenFolder::OfThisProcess().Get(); !chosen.empty())
        return chosen;
    fs::path const besideProgram = ProgramFolder() / "PlugIns";
    std::error_code error;
    return fs::exists(besideProgram / bundleName, error) ? besideProgram : LibraryFolder();
}
}  // namespace

void UtilityObjects::GetPlugInsPath(wxString& path, wchar_t const* bundleName)
{
    fs::path const name = PathOf(bundleName);
    path = wxString::FromUTF8((PlugInsFolder(name) / name).c_str());
}

void UtilityObjects::SetPlugInsFolder(wxString const& folder)
{
    ChosenFolder::OfThisProcess().Set(folder.empty() ? fs::path() : FullPath(PathOf(folder)));
}
