// A new, empty folder for one test; gone with everything in it when the object goes. Failures throw, so
// that a test never runs on half a fixture.
#pragma once

#include <filesystem>
#include <string_view>

class TemporaryFolder
{
public:
    TemporaryFolder();
    ~TemporaryFolder();
    TemporaryFolder(TemporaryFolder const&) = delete;
    TemporaryFolder& operator=(TemporaryFolder const&) = delete;

    // Absolute, and free of symbolic links.
    std::filesystem::path const& Path() const { return m_path; }

    // Writes a file, over an older one of that name, and gives its path. name: relative to the folder; the
    // folders in it are made.
    std::filesystem::path Write(std::filesystem::path const& name, std::string_view text) const;

private:
    std::filesystem::path m_path;
};
