// A plug-in bundle built up in a folder, step by step. From the first moment on it is a bundle that can be
// opened, with no factory and no executable; each verb leaves a complete Info.plist behind.
#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <string_view>
#include <vector>

class BundleOnDisk
{
public:
    // Makes the folder of that name inside parent, which must outlive the bundle's use.
    explicit BundleOnDisk(std::filesystem::path const& parent, std::string const& name = "ComGUI.Bundle");

    std::filesystem::path const& Path() const { return m_path; }
    std::filesystem::path InfoFile() const { return m_path / "Contents" / "Info.plist"; }

    // Where the executable belongs, whether it is there or not.
    std::filesystem::path Executable() const;

    // CFBundleExecutable, "Module" at first. What was installed before keeps its old name.
    void SetExecutableName(std::string const& name);

    // Makes that shared object the bundle's executable. A copy is loaded apart from all others, with data
    // of its own; a link shares them with whoever else loads the same file.
    void CopyExecutable(std::filesystem::path const& sharedObject) const;
    void LinkExecutable(std::filesystem::path const& sharedObject) const;

    // Adds a factory, served by that function, at the end of the type's list. UUIDs are written as given.
    void AddFactory(std::string const& type, std::string const& factory, std::string const& function);

    // Adds a factory to the type's list that no function serves.
    void ListFactory(std::string const& type, std::string const& factory);

    // Puts any bytes in the place of the Info.plist.
    void WriteInfo(std::string_view content) const;

    // The Info.plist as the verbs above make it.
    std::string Info() const;

private:
    std::filesystem::path m_path;
    std::string m_executable = "Module";
    std::map<std::string, std::string> m_functions;               // by factory
    std::map<std::string, std::vector<std::string>> m_factories;  // by type
};
