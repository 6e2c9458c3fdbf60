// The small deeds on files and folders by which a site is kept in order.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace standin
{
// Makes those of the folders that are missing, with those above them; nobody but this user may look into
// them. When this returns the names of those that it made are on the disk, so that no power cut takes what is
// in them away. With flushesAll, so are the names of those that were there: a process that was killed may
// have made them and got no further. Throws FileError.
void MakePrivateFolders(std::vector<std::filesystem::path> const& folders, bool flushesAll = false);

// Flushes the names of a folder and of those that it is in, as far as this user may. Throws FileError.
void FlushFoldersAbove(std::filesystem::path const& folder);

// NAME.WORD-YYYYmmdd-HHMMSS, with a number behind it as long as that with one of the suffixes is taken.
std::filesystem::path FreeName(std::filesystem::path const& file, std::string const& word,
                               std::vector<std::string> const& suffixes);

// Renames the file and those that belong to it, each its name and one of the suffixes, in the given order,
// to names that are free: NAME.damaged-YYYYmmdd-HHMMSS[-n] and the suffix. Reports the new name. Throws
// FileError.
void SetAside(std::filesystem::path const& file, std::vector<std::string> const& suffixes);
}  // namespace standin
