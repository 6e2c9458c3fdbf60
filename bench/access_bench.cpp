// What a typed read costs above the slot that it calls: a test of the result, and nothing allocated. The
// slot only stores a number, so that the difference shows.
#include <comgui/comgui.h>

#include <atomic>
#include <benchmark/benchmark.h>
#include <cstdlib>
#include <new>

namespace
{
std::atomic<long> allocations{0};

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
    long const before = allocations;
    for (auto _ : state)
        benchmark::DoNotOptimize(read(access));
    state.counters["allocations"] = static_cast<double>(allocations - before);
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

// Not inlined, or the compiler takes malloc and delete, or new and free, for a mismatched pair.
[[gnu::noinline]] void* operator new(std::size_t size)
{
    allocations.fetch_add(1, std::memory_order_relaxed);
    if (void* const memory = std::malloc(size ? size : 1))
        return memory;
    throw std::bad_alloc();
}

[[gnu::noinline]] void operator delete(void* memory) noexcept { std::free(memory); }

[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept { std::free(memory); }

BENCHMARK(SlotDirectly);
BENCHMARK(GetIntParameter);

BENCHMARK_MAIN();
