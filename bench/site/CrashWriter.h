// One of the programs that crash_series starts, to be killed. It has a lane, in which no other program
// writes: a counter, a table, numbers that it appends to a list of all lanes, and tickets that it creates and
// deletes, the oldest as soon as there are MostTickets. It reports a change when the call has returned, by a
// line:
//     found COUNTER TABLE APPENDED [ID...]    first of all: what it finds of its lane, with its tickets' ids
//     counter N | table N | append N BLOCK | create ID | delete ID    what was done
//     torn WHAT | misheard WHAT | refused WHAT                        what must not be
// It dies between any two instructions; so of its last change, and of no other, the report may be missing.
#pragma once

#include <cstddef>

inline constexpr std::size_t MostTickets = 3;

struct CrashTask
{
    int lane;   // from 0 up
    int lanes;  // of all writers
    int block;  // of the list: where the lane's last number is, or before
    unsigned seed;
};

// Returns only if the login fails: the exit code.
int WriteUntilKilled(CrashTask const& task);

// For a program that comes when all writers are dead: a line for each lane, which begins with "found" as that
// of its next writer would, then one that begins with "disordered" for each number that is out of its order
// in the list, where those of each lane are 1, 2, 3 and so on; and "done".
int CheckLanes(int lanes);
