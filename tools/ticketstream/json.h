// Streams as JSON; docs/stream-formats.md tells its shape.
#pragma once

#include "tools/shared/Output.h"
#include <string_view>

namespace ticketstream
{
// Prints the stream, a line a record. Throws BrokenStream before anything is printed.
void PrintJson(std::string_view stream, tools::Output& out);
}  // namespace ticketstream
