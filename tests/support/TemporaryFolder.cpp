#include "tests/support/TemporaryFolder.h"

#include "tests/support/Files.h"
#include <cerrno>
#include <cstdlib>
#include <string>
#include <system_error>

namespace fs = std::filesystem;

TemporaryFolder::TemporaryFolder(fs::path const& place)
{
    std::string name = (fs::canonical(place) / "comgui-test-XXXXXX").string();
    if (mkdtemp(name.data()) == nullptr)
        throw std::system_error(errno, std::generic_category(), name);
    m_path = name;
}

TemporaryFolder::~TemporaryFolder()
{
    std::error_code ignored;
    fs::remove_all(m_path, ignored);
}

fs::path TemporaryFolder::Write(fs::path const& name, std::string_view text) const
{
    fs::path file = m_path / name;
    fs::create_directories(file.parent_path());
    WriteFile(file, text);
    return file;
}
