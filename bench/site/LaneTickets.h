// Where the lanes of CrashWriter are in a site, and the lines by which programs report.
#pragma once

#include "tests/support/SiteClient.h"
#include <cstdint>
#include <string>

inline constexpr int JobType = 3;
inline constexpr int CounterType = 60;  // ticket LANE + 1
inline constexpr int TableType = 61;    // the same, and one that all lanes write
inline constexpr int CreatedType = 62;
inline constexpr int ListType = 63;
inline constexpr TicketName SharedTable{TableType, 100};
inline constexpr char CounterKey[] = "Counter";

// A number in the list consists of the lane and the lane's own count.
inline constexpr int LaneShift = 40;
inline constexpr int LaneOf(std::int64_t value) { return static_cast<int>(value >> LaneShift); }
inline constexpr std::int64_t CountOf(std::int64_t value)
{
    return value & ((std::int64_t{1} << LaneShift) - 1);
}

// Writes a line to stdout, at once and whole, so that it is there even if the program dies behind it.
void PrintLine(std::string line);
