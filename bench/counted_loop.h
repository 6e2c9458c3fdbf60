// A measured loop whose cost can be counted instead of timed: under callgrind, the work of its iterations is
// a number that neither other programs nor the processor's pace change.
#pragma once

#include <benchmark/benchmark.h>
#include <cstddef>

// Used as `for (auto _ : COUNTED_LOOP(state))`. Outside of callgrind it is the loop of benchmark::State and
// nothing else.
class COUNTED_LOOP
{
public:
    explicit COUNTED_LOOP(benchmark::State& ofLoop) : state(ofLoop) {}
    COUNTED_LOOP(COUNTED_LOOP const&) = delete;
    COUNTED_LOOP& operator=(COUNTED_LOOP const&) = delete;
    ~COUNTED_LOOP();

    auto begin()
    {
        Start();
        return state.begin();
    }

    auto end() { return state.end(); }

    // Whether this program runs under callgrind and COMGUI_BENCH_COSTS names the file of its
    // --callgrind-out-file.
    static bool Counts();

    // Of the loop that ended last, divided by its iterations: what callgrind's authors take for the cycles of
    // a processor. Instructions count 1, mispredicted branches and misses of the first cache 10, of the last
    // one 100.
    static double LastCost();

private:
    static void Start();

    benchmark::State& state;
};
