// Two streams compared by what they mean.
#pragma once

#include "tools/shared/Output.h"
#include <string_view>

namespace ticketstream
{
// Prints what differs: - for what only left has, + for what only right has. True if they mean the same: the
// same values under each key, in the same order, whatever the order of the keys, as the library's reader
// gives them; of containers, the same operations in the same order. An empty stream is the same as any that
// tells nothing. Throws BrokenStream.
bool Diff(std::string_view left, std::string_view right, tools::Output& out);
}  // namespace ticketstream
