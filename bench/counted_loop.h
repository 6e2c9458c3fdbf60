// A measured loop whose cost can be counted instead of timed: under callgrind, the work of its iterations is
// a number that neither other programs nor the processor's pace change.
#pragma once

#include <benchmark/benchmark.h>
#include <cstddef>

// Used as `for (auto _ : COUNTED_LOOP(state))`. Outside of callgrind it is the loop of benchmark::State and
// nothing else. Under callgrind it runs a fixed number of times, the first ones uncounted, so that caches and
// heap are as they are later on; start such a program with --benchmark_min_time=0.
class COUNTED_LOOP
{
public:
    // Counts first, then goes on as the benchmark's own.
    class ITERATOR
    {
    public:
        ITERATOR(benchmark::State::StateIterator ofState, int timesToCount)
            : timed(ofState), toCount(timesToCount)
        {
        }

        auto operator*() const { return *timed; }

        ITERATOR& operator++()
        {
            if (toCount == 0)
                ++timed;
            else if (--toCount == Counted)
                StartCounting();
            else if (toCount == 0)
                StopCounting();
            return *this;
        }

        bool operator!=(ITERATOR const& end) const { return toCount != 0 || timed != end.timed; }

    private:
        benchmark::State::StateIterator timed;
        int toCount;
    };

    explicit COUNTED_LOOP(benchmark::State& ofLoop) : state(ofLoop) {}

    ITERATOR begin() { return {state.begin(), Counts() ? Uncounted + Counted : 0}; }
    ITERATOR end() { return {state.end(), 0}; }

    // Whether this program runs under callgrind and COMGUI_BENCH_COSTS names the file of its
    // --callgrind-out-file.
    static bool Counts();

    // Of one time through the loop that ended last: what callgrind's authors take for the cycles of a
    // processor. Instructions count 1, mispredicted branches and misses of the first cache 10, of the last
    // one 100.
    static double LastCost();

private:
    static constexpr int Uncounted = 2;
    static constexpr int Counted = 1;

    static void StartCounting();
    static void StopCounting();

    benchmark::State& state;
};
