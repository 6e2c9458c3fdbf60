// Shows at the end of a run how the library stands beside what it is measured against, and beside the goals.
#pragma once

#include <string>
#include <vector>

struct GOAL
{
    enum KIND
    {
        CPU_TIME,        // of one iteration; both sides work on the same records
        ELAPSED_TIME,    // the same by the clock, or as the benchmark itself has taken it
        BYTES_A_RECORD,  // the counter of that name
        ADDED_TIME,      // CPU_TIME, of which ours may take that many nanoseconds more
    };

    char const* measure;  // in words
    std::string ours;     // names of benchmarks
    std::string peer;
    double most;  // ours by peer must not be above it; for ADDED_TIME, ours less peer
    KIND kind = CPU_TIME;
};

// The name of the counter that BYTES_A_RECORD stands for.
inline constexpr char BytesARecord[] = "bytes_a_record";

// Runs the registered benchmarks as the command line says and prints the ratios as a table in Markdown: of
// the medians, if --benchmark_repetitions asks for several runs, and then with their spread: how far the
// ratios of single runs lie apart, without the upper and the lower quarter of them. Goals of which a side did
// not run are left out. COMGUI_BENCH_FIGURES in the environment: a file that gets a line for each goal, its
// fields separated by tabs: the program, the measure, the last part of the peer's name (no argument), the
// ratio, its spread, the goal. To be returned from main: 0, or 1 if the command line is wrong or a benchmark
// ended with an error; a goal that is not met is no error, since the machine may be busy.
int RunAndReport(int argc, char** argv, std::vector<GOAL> const& goals);
