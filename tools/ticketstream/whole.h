// Whether a stream can be read to its end, and if not, where it breaks.
#pragma once

#include <string_view>

namespace ticketstream
{
// A stream that does not begin as a container stream counts as a ticket stream.
bool IsContainer(std::string_view stream);

// Throws BrokenStream at the first thing that cannot be read, that of payloads included. No bytes are whole.
void MustBeWhole(std::string_view stream);
}  // namespace ticketstream
