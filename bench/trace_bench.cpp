// What the trace costs a scalar read, switched off and on, above the plug-in's own slot.
#include "bench/ratio_report.h"
#include "standin/trace/Trace.h"
#include "standin/trace/TracedTables.h"
#include <benchmark/benchmark.h>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <thread>
#include <unistd.h>

namespace
{
[[gnu::noinline]] int Get(void* instance, int, int, char const* key, PARAM_TYPE type, void* value, int)
{
    if (!instance || !key || type != PARAM_INT)
        return 0;
    *static_cast<int*>(value) = 25;
    return 1;
}

MTICKET_ACCESS const& Plain()
{
    static MTICKET_ACCESS const table = []
    {
        static int place = 0;
        MTICKET_ACCESS made{};
        made.Instance = &place;
        made.MGETPARAMETER = Get;
        return made;
    }();
    return table;
}

void Read(benchmark::State& state, MTICKET_ACCESS const* container)
{
    for (auto _ : state)
    {
        int value = 0;
        benchmark::DoNotOptimize(container);
        benchmark::DoNotOptimize(
            container->MGETPARAMETER(container->Instance, 3, 1, "Job/Copies", PARAM_INT, &value, -1));
        benchmark::DoNotOptimize(value);
    }
}

void PlainRead(benchmark::State& state) { Read(state, &Plain()); }

void ReadSwitchedOff(benchmark::State& state)
{
    trace::Trace::Get().Switch(false);
    Read(state, trace::CopyOf(&Plain(), nullptr));
}

void ReadTraced(benchmark::State& state)
{
    std::this_thread::sleep_for(std::chrono::milliseconds(50));  // until the ring is empty
    trace::Trace::Get().Switch(true);
    Read(state, trace::CopyOf(&Plain(), nullptr));
    trace::Trace::Get().Switch(false);
}

// Two records a call: the ring does not come to be full, which would be cheaper.
constexpr int WithoutLoss = trace::TraceRing::Slots / 2 - 100;

BENCHMARK(PlainRead);
BENCHMARK(ReadSwitchedOff);
BENCHMARK(ReadTraced)->Iterations(WithoutLoss)->Repetitions(20);
}  // namespace

int main(int argc, char** argv)
{
    char folder[] = "/tmp/trace_bench-XXXXXX";
    if (!mkdtemp(folder))
        return 1;
    setenv("COMGUI_TRACE_FILE", (std::string(folder) + "/bench.trace").c_str(), 1);
    int const status = RunAndReport(
        argc, argv,
        {{"a read, switched off", "ReadSwitchedOff", "PlainRead", 5, GOAL::ADDED_TIME},
         {"a read, traced", "ReadTraced/iterations:" + std::to_string(WithoutLoss) + "/repeats:20",
          "PlainRead", 150, GOAL::ADDED_TIME}});
    std::filesystem::remove_all(folder);
    return status;
}
