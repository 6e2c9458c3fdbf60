// Looks at a site and at the programs that have it open from outside: what lies in the folder, and what the
// system says of a process.
#pragma once

#include <cstddef>
#include <filesystem>
#include <optional>
#include <string>
#include <sys/types.h>
#include <vector>

// Files on their way and folders of jobs that are being removed, in all folders of the site.
std::vector<std::string> UnfinishedIn(std::filesystem::path const& site);

// These, and new files that were to replace old ones, which go when the site is opened by the first of its
// programs.
std::vector<std::string> TemporaryIn(std::filesystem::path const& site);

std::size_t JobFoldersIn(std::filesystem::path const& site);

std::uintmax_t DatabaseSizeOf(std::filesystem::path const& site);  // with the journal of the engine

struct Footprint
{
    long kilobytes = 0;  // of memory, resident
    long files = 0;      // open
};
std::optional<Footprint> FootprintOf(pid_t process);  // nothing once it has ended

// Has no file of the process grow any more, as if the disk were full, or takes that back. A program that
// lives through it ignores SIGXFSZ. False if the process has ended.
bool SetDiskFull(pid_t process, bool isFull);
