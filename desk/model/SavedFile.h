// Files as a whole, under UTF-8 names. From any thread.
#pragma once

#include "desk/model/FileFault.h"
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace desk
{
// The bytes of a file. Faults: CannotRead, NotAFile, TooLarge above the limit, which is seen before anything
// is read, NoMemory.
FileResult<std::string> LoadFile(std::string const& file, std::size_t limit);

// Writes a new file beside the old one and puts it in its place once all is on the disk; whoever opens the
// file finds the old content or the new one. A link stays, the file that it names is replaced, and so do the
// permissions. After a fault the old content is there and nothing else. Faults: CannotWrite, NotAFile.
std::optional<FileFault> SaveFile(std::string const& file, std::string_view content);
}  // namespace desk
