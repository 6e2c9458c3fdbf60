// The loop of a filter of bytes, in a form for every machine and in one for those that can look up, and move
// together, 64 bytes at a time.
#pragma once

#include <cstddef>

namespace comgui::detail
{
// Puts the entry of each byte of from to where to points, but for entries that are 0. How many there were.
// to: room for size bytes, none of them among those of from. table: 256 entries.
using FILTER_BYTES = std::size_t(char const* table, char const* from, std::size_t size, char* to);

FILTER_BYTES FilterBytesOneByOne;

// The quickest form that this machine has.
FILTER_BYTES* QuickestFilterBytes();
}  // namespace comgui::detail
