// Streams from JSON: the way back from json.h.
#pragma once

#include <string>
#include <string_view>

namespace ticketstream
{
// The stream that the JSON tells. What json printed gives a stream that reads the same, and the same bytes
// if it was printed of what the library had written. Throws WrongJson.
std::string MakeStream(std::string_view json);
}  // namespace ticketstream
