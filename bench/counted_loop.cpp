#include "bench/counted_loop.h"

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#if __has_include(<valgrind/callgrind.h>)
#    include <valgrind/callgrind.h>
#else
#    define RUNNING_ON_VALGRIND 0
#    define CALLGRIND_ZERO_STATS
#    define CALLGRIND_DUMP_STATS
#endif

namespace
{
double lastCost = 0;

char const* CostsPath()
{
    static char const* const path = RUNNING_ON_VALGRIND ? std::getenv("COMGUI_BENCH_COSTS") : nullptr;
    return path;
}

// The lines of a file of callgrind that begin with "events:" and "totals:" name the events and count them.
std::map<std::string, double> EventsIn(std::string const& path)
{
    std::map<std::string, double> counts;
    std::ifstream file(path);
    std::string names;
    for (std::string line; std::getline(file, line);)
        if (line.rfind("events: ", 0) == 0)
            names = line.substr(8);
        else if (line.rfind("totals: ", 0) == 0)
        {
            std::istringstream event(names);
            std::istringstream count(line.substr(8));
            double value = 0;
            for (std::string name; event >> name && count >> value;)
                counts[name] = value;
        }
    return counts;
}

double CyclesOf(std::map<std::string, double> const& counts)
{
    double cycles = 0;
    for (auto const& [event, count] : counts)
        if (event == "Ir")
            cycles += count;
        else if (event == "Bcm" || event == "Bim" || event == "I1mr" || event == "D1mr" || event == "D1mw")
            cycles += 10 * count;
        else if (event == "ILmr" || event == "DLmr" || event == "DLmw")
            cycles += 100 * count;
    return cycles;
}
}  // namespace

bool COUNTED_LOOP::Counts() { return CostsPath() != nullptr; }

double COUNTED_LOOP::LastCost() { return lastCost; }

void COUNTED_LOOP::StartCounting() { CALLGRIND_ZERO_STATS; }

void COUNTED_LOOP::StopCounting()
{
    static int dumps = 0;  // callgrind numbers its files
    CALLGRIND_DUMP_STATS;
    std::string const path = CostsPath() + ("." + std::to_string(++dumps));
    lastCost = CyclesOf(EventsIn(path)) / Counted;
    std::remove(path.c_str());
}
