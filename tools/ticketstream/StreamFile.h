// Files by name, where - is standard input or output. Failures are Trouble.
#pragma once

#include <string>
#include <string_view>

namespace ticketstream
{
// The file's bytes, or as many of the first ones as wanted. Pipes are read to their end.
std::string ReadFile(std::string const& name, unsigned long limit = std::string::npos);

// A file is there as a whole or not at all: on failure what stood there stays.
void WriteFile(std::string const& name, std::string_view bytes);
}  // namespace ticketstream
