// Files that are read and replaced as a whole. Whoever opens a file that ReplaceFile writes finds the old
// content or the new one, also after a kill or a power cut. Safe from any thread; of two that replace one
// file at the same time the later one wins.
#pragma once

#include "standin/server/files/FileError.h"
#include <cstddef>
#include <filesystem>
#include <string>
#include <string_view>
#include <sys/stat.h>

namespace standin
{
// The content, or its first limit bytes if it is larger.
std::string ReadFile(std::filesystem::path const& file, std::size_t limit);

// Flushes the entries of an open folder to the disk: without this a power cut may bring an old name back.
// True also where the file system cannot flush a folder; false, with errno, for a failure.
bool FlushFolder(int folder);

// The same by the folder's path; one that this user may write to but not read cannot be flushed by him.
// Throws FileError.
void FlushFolder(std::filesystem::path const& folder);

// Flushes a file's content. Throws FileError.
void FlushFile(std::filesystem::path const& file);

// Writes all of it to an open file, whose name is for messages. Throws FileError.
void WriteAll(int descriptor, std::string_view content, std::filesystem::path const& file);

// Writes a new file beside the old one, flushes it to the disk and puts it in the old one's place, whose
// permissions it takes over. A link stays, and what it points at is replaced. On failure the old content is
// there as it was and nothing else is left, unless the folder cannot be flushed, which comes last. A process
// killed in between leaves NAME.RANDOM.tmp behind, where RANDOM is a RandomName and a NAME that would be too
// long is cut. mode: of a file that is new, less what the process's mask takes away.
void ReplaceFile(std::filesystem::path const& file, std::string_view content, mode_t mode = 0666);

// Gives an open file owner, group and permissions of another as far as this user may. Nobody who may not read
// that may then read this.
void TakeRightsOf(struct stat const& other, int file);

// So many digits of a hexadecimal number that nobody can foresee, so that none comes twice and nobody lays a
// link in the way of a file that is about to be made.
inline constexpr std::size_t RandomNameSize = 16;
std::string RandomName();

// A name in the same folder, BEGINNING.RANDOM.tmp, for what is not to have the file's own name yet.
std::filesystem::path TemporaryFor(std::filesystem::path const& file);

// Whether TemporaryFor may have given that name for a file of that one.
bool IsTemporary(std::string_view name, std::string_view file);

// Locks what is open for its maker, as long as it is open, so that it is not taken for a leftover. False if
// somebody else has it, with EWOULDBLOCK, or if the file system has no locks.
bool LockTemporary(int file);

// Removes what ReplaceFile has left beside the file in processes that were killed. What belongs to a process
// that lives stays, as far as the file system's locks reach, and so does what cannot be removed.
void RemoveLeftovers(std::filesystem::path const& file);
}  // namespace standin
