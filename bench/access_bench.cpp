// What a typed read costs above the slot that it calls: a test of the result, and nothing allocated. The
// slot only stores a number, so that the difference shows.
#include "bench/heap_count.h"

#include <benchmark/benchmark.h>
#include <comgui/comgui.h>

namespace
{
int StoreNumber(void*, int, int, char const*, PARAM_TYPE, void* value, int)
{
    *static_cast<int*>(value) = 25;
    return 1;
}

MTICKET_ACCESS Container()
{
    MTICKET_ACCESS access = {};
    access.MGETPARAMETER = StoreNumber;
    return access;
}

template <typename Read>
void Measure(benchmark::State& state, Read read)
{
    MTICKET_ACCESS const container = Container();
    MTICKET_ACCESS const* access = &container;
    benchmark::DoNotOptimize(access);  // the slot is not known at compile time
    if (read(access) != 25)
        return state.SkipWithError("the read does not give what it should");
    long const before = BlocksTaken();
    for (auto _ : state)
        benchmark::DoNotOptimize(read(access));
    state.counters["allocations"] = static_cast<double>(BlocksTaken() - before);
}

void SlotDirectly(benchmark::State& state)
{
    Measure(state,
            [](MTICKET_ACCESS const* access)
            {
                int value = 0;
                return access->MGETPARAMETER(access->Instance, 3, 1, "Job/Copies", PARAM_INT, &value, -1)
                           ? value
                           : -1;
            });
}

void GetIntParameter(benchmark::State& state)
{
    Measure(state, [](MTICKET_ACCESS const* access)
            { return MTICKET_READ::Of(access)->GetIntParameter(3, 1, "Job/Copies", -1); });
}
}  // namespace

BENCHMARK(SlotDirectly);
BENCHMARK(GetIntParameter);

BENCHMARK_MAIN();
