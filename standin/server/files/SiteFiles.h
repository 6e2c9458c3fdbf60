// The small deeds on files and folders by which a site is kept in order.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace standin
{
// One line on stderr, for the person who runs the program.
void Report(std::string const& line) noexcept;

// Makes the folder with those above it if it is missing; nobody but this user may look into it. Throws
// StorageError.
void MakePrivateFolder(std::filesystem::path const& folder);

// Renames the file and those that belong to it, each its name and one of the suffixes, in the given order,
// to names that are free: NAME.damaged-YYYYmmdd-HHMMSS[-n] and the suffix. Reports the new name. Throws
// StorageError.
void SetAside(std::filesystem::path const& file, std::vector<std::string> const& suffixes);
}  // namespace standin
