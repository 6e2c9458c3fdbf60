// Streams item by item, for people.
#pragma once

#include "tools/shared/Output.h"
#include "tools/ticketstream/Trouble.h"
#include <optional>
#include <string_view>

namespace ticketstream
{
// Prints a line an item: offset, what it is, and for a value its key, type, position and the value. A broken
// stream is printed up to the break, a broken payload up to its break, and the first break is given back.
std::optional<BrokenStream> Dump(std::string_view stream, tools::Output& out);
}  // namespace ticketstream
