#include "comgui/testing/TemporaryFolder.h"

#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <string>
#include <system_error>
#include <unistd.h>

namespace fs = std::filesystem;

namespace comgui::test
{
TemporaryFolder::TemporaryFolder(fs::path const& place) : m_process(getpid())
{
    std::string name = (fs::canonical(place) / "comgui-test-XXXXXX").string();
    if (mkdtemp(name.data()) == nullptr)
        throw std::system_error(errno, std::generic_category(), name);
    m_path = name;
}

TemporaryFolder::~TemporaryFolder()
{
    if (getpid() != m_process)
        return;
    std::error_code ignored;
    fs::remove_all(m_path, ignored);
}

fs::path TemporaryFolder::Write(fs::path const& name, std::string_view text) const
{
    fs::path file = m_path / name;
    fs::create_directories(file.parent_path());
    std::ofstream stream;
    stream.exceptions(std::ios::failbit | std::ios::badbit);
    stream.open(file, std::ios::binary);
    stream.write(text.data(), static_cast<std::streamsize>(text.size()));
    stream.close();
    return file;
}
}  // namespace comgui::test
