// What a read through the manager costs above the slot that answers it. The bare slot does nothing but
// store a number, so that the difference shows; the stand-in's slot is what a session really asks.
#include <comgui/comgui.h>

#include <benchmark/benchmark.h>
#include <cstdio>
#include <cstdlib>
#include <filesystem>

namespace
{
constexpr int JobType = 3;
constexpr int JobId = 1;
constexpr char Key[] = "Job/Copies";

int BareSlot(void*, int, int, char const*, PARAM_TYPE, void* value, int)
{
    *static_cast<int*>(value) = 25;
    return 1;
}

MTICKET_ACCESS BareContainer()
{
    MTICKET_ACCESS access = {};
    access.MGETPARAMETER = BareSlot;
    return access;
}

// A site of this run alone, and a manager that is logged in there; ends the program if that fails.
ComGUIManager& LoggedIn()
{
    static ComGUIManager& manager = []() -> ComGUIManager&
    {
        ComGUIManager& made = *ComGUIManager::GetInstance();
        if (!hSTicketInstance || made.Initialize("admin", "admin", "localhost", 50000) != 0 ||
            made.Login("admin", "admin", "localhost", 50000) != 0)
        {
            std::fputs("session_bench: cannot log in to the stand-in server\n", stderr);
            std::exit(1);
        }
        return made;
    }();
    return manager;
}

template <typename Read>
void Measure(benchmark::State& state, Read read)
{
    int value = 0;
    if (read(value) != 1 || value != 25)
        return state.SkipWithError("the read does not give what it should");
    for (auto _ : state)
    {
        benchmark::DoNotOptimize(read(value));
        benchmark::DoNotOptimize(value);
    }
}

void MeasureSlot(benchmark::State& state, MTICKET_ACCESS const* container)
{
    benchmark::DoNotOptimize(container);  // the slot is not known at compile time
    Measure(state,
            [=](int& value) {
                return container->MGETPARAMETER(container->Instance, JobType, JobId, Key, PARAM_INT, &value,
                                                -1);
            });
}

void BareSlotDirectly(benchmark::State& state)
{
    MTICKET_ACCESS const container = BareContainer();
    MeasureSlot(state, &container);
}

void BareSlotThroughTheManager(benchmark::State& state)
{
    MTICKET_ACCESS const container = BareContainer();
    ComGUIManager& manager = LoggedIn();
    Measure(state, [&](int& value)
            { return manager.GetParameter(&container, JobType, JobId, Key, PARAM_INT, &value, -1); });
}

void PrepareStandInValue(ComGUIManager& manager)
{
    int const copies = 25;
    manager.SetParameter(JobType, JobId, Key, PARAM_INT, &copies, -1);
}

void StandInSlotDirectly(benchmark::State& state)
{
    PrepareStandInValue(LoggedIn());
    MeasureSlot(state, LoggedIn().GetClientContainer());
}

void StandInSlotThroughTheManager(benchmark::State& state)
{
    ComGUIManager& manager = LoggedIn();
    PrepareStandInValue(manager);
    Measure(state,
            [&](int& value) { return manager.GetParameter(JobType, JobId, Key, PARAM_INT, &value, -1); });
}
}  // namespace

BENCHMARK(BareSlotDirectly);
BENCHMARK(BareSlotThroughTheManager);
BENCHMARK(StandInSlotDirectly);
BENCHMARK(StandInSlotThroughTheManager);

int main(int argc, char** argv)
{
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    char folder[] = "/tmp/comgui-bench-XXXXXX";
    if (!mkdtemp(folder) || setenv("COMGUI_SITE", folder, 1) != 0)
    {
        std::perror("session_bench: cannot make a folder for the site");
        return 1;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    std::filesystem::remove_all(folder);
}
