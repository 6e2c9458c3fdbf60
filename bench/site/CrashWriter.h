// One of the programs that crash_series and soak start, to be killed. It has a lane, in which no other
// program writes: a counter, a table, numbers that it appends to a list of all lanes, tickets that it creates
// and deletes, the oldest as soon as there are MostTickets, and jobs that it sends and deletes likewise. It
// reports a change when the call has returned, by a line:
//     found COUNTER TABLE APPENDED [ID...] jobs [N...]    first of all: what it finds of its lane
//     counter N | table N | append N BLOCK | create ID | delete ID | send N | drop N    what was done
//     torn WHAT | misheard WHAT | refused WHAT                                        what must not be
// It dies between any two instructions; so of its last change, and of no other, the report may be missing.
// What is refused it tries again: it was not done.
#pragma once

#include <chrono>
#include <cstddef>

inline constexpr std::size_t MostTickets = 3;
inline constexpr std::size_t MostJobs = 2;

struct CrashTask
{
    int lane;   // from 0 up
    int lanes;  // of all writers
    int block;  // of the list: where the lane's last number is, or before
    unsigned seed;
    std::chrono::microseconds pause{};  // between two steps
};

// Returns only if the login fails: the exit code.
int WriteUntilKilled(CrashTask const& task);

// For a program that comes when all writers are dead: a line for each lane, which begins with "found" as that
// of its next writer would, then one that begins with "disordered" for each number that is out of its order
// in the list, where those of each lane are 1, 2, 3 and so on; and "done".
int CheckLanes(int lanes);
