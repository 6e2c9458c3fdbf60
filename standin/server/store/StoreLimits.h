// The bounds within which a store works. Tests make them smaller, since a journal of a million records or a
// type with sixteen million tickets takes minutes to fill.
#pragma once

#include "standin/server/tickets/TicketAddress.h"
#include <cstdint>

namespace standin
{
struct StoreLimits
{
    std::uint64_t journalKept = 1000;  // so many records are never pruned
    std::uint64_t journalLargest =
        1'000'000;                     // beyond so many, records go that a living program has not heard
    std::uint64_t feedLargest = 4096;  // records that one call of ChangesSince hands out
    int largestId = LargestId;
};
}  // namespace standin
