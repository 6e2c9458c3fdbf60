// A new, empty folder for one test; gone with everything in it when the object goes, but not with its copy in
// a process made by fork. Failures throw, so that a test never runs on half a fixture.
#pragma once

#include <filesystem>
#include <string_view>

namespace comgui::test
{
class TemporaryFolder
{
public:
    // place: the folder to make it in.
    explicit TemporaryFolder(std::filesystem::path const& place = std::filesystem::temp_directory_path());
    ~TemporaryFolder();
    TemporaryFolder(TemporaryFolder const&) = delete;
    TemporaryFolder& operator=(TemporaryFolder const&) = delete;

    // Absolute, and free of symbolic links.
    std::filesystem::path const& Path() const { return m_path; }
    std::filesystem::path operator/(std::filesystem::path const& name) const { return m_path / name; }

    // Writes a file, over an older one of that name, and gives its path. name: relative to the folder; the
    // folders in it are made.
    std::filesystem::path Write(std::filesystem::path const& name, std::string_view text) const;

private:
    std::filesystem::path m_path;
    int m_process;  // that made it
};
}  // namespace comgui::test
