#include "tests/support/BundleOnDisk.h"

#include <fstream>
#include <sstream>

namespace fs = std::filesystem;

BundleOnDisk::BundleOnDisk(fs::path const& parent, std::string const& name) : m_path(parent / name)
{
    fs::create_directories(Executable().parent_path());
    WriteInfo(Info());
}

fs::path BundleOnDisk::Executable() const
{
#ifdef __APPLE__
    return m_path / "Contents" / "MacOS" / m_executable;
#else
    return m_path / "Contents" / "Linux" / m_executable;
#endif
}

void BundleOnDisk::SetExecutableName(std::string const& name)
{
    m_executable = name;
    WriteInfo(Info());
}

void BundleOnDisk::CopyExecutable(fs::path const& sharedObject) const
{
    fs::copy_file(sharedObject, Executable(), fs::copy_options::overwrite_existing);
}

void BundleOnDisk::LinkExecutable(fs::path const& sharedObject) const
{
    fs::create_symlink(fs::absolute(sharedObject), Executable());
}

void BundleOnDisk::AddFactory(std::string const& type, std::string const& factory,
                              std::string const& function)
{
    m_functions[factory] = function;
    ListFactory(type, factory);
}

void BundleOnDisk::ListFactory(std::string const& type, std::string const& factory)
{
    m_factories[type].push_back(factory);
    WriteInfo(Info());
}

void BundleOnDisk::WriteInfo(std::string_view content) const
{
    fs::remove(InfoFile());  // a file written over is flushed to disk by some file systems: slow
    std::ofstream stream;
    stream.exceptions(std::ios::failbit | std::ios::badbit);
    stream.open(InfoFile(), std::ios::binary);
    stream.write(content.data(), static_cast<std::streamsize>(content.size()));
    stream.close();
}

std::string BundleOnDisk::Info() const
{
    std::ostringstream text;
    text << "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">\n<dict>\n"
         << "<key>CFBundleExecutable</key><string>" << m_executable << "</string>\n"
         << "<key>CFPlugInFactories</key>\n<dict>\n";
    for (auto const& [factory, function] : m_functions)
        text << "<key>" << factory << "</key><string>" << function << "</string>\n";
    text << "</dict>\n<key>CFPlugInTypes</key>\n<dict>\n";
    for (auto const& [type, factories] : m_factories)
    {
        text << "<key>" << type << "</key>\n<array>\n";
        for (auto const& factory : factories)
            text << "<string>" << factory << "</string>\n";
        text << "</array>\n";
    }
    text << "</dict>\n</dict>\n</plist>\n";
    return text.str();
}
