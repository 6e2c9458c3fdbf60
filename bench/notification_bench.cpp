// What a notification costs the plug-in's thread: a table of a thousand changed keys, against the copies that
// it cannot do without, and the append to the queue with four threads at it, against one alone.
#include <comgui/comgui.h>

#include <benchmark/benchmark.h>
#include <list>
#include <memory>
#include <string>
#include <vector>

namespace
{
constexpr std::size_t Keys = 1000;

// What the library queued so far, out of the queue and freed.
void Drain()
{
    std::list<NotifData*> taken;
    {
        wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
        taken.swap(ComGUIManager::m_notificationList);
    }
    for (NotifData* const notification : taken)
        delete notification;
}

struct CHANGES
{
    CHANGES()
    {
        for (std::size_t i = 0; i < Keys; ++i)
            names.push_back("Job/Parameter/" + std::to_string(i));
        for (std::string const& name : names)
            table.push_back({name.c_str(), PARAM_INT, 0, &value, -1, false, {}});
        table.push_back({});
    }

    int value = 5;
    std::vector<std::string> names;
    std::vector<SETMULTIPAR> table;
};

void CopiesAlone(benchmark::State& state)
{
    CHANGES const changes;
    for (auto _ : state)
    {
        std::vector<std::unique_ptr<NotifData>> copies;
        copies.reserve(Keys);
        for (std::size_t i = 0; i < Keys; ++i)
            copies.push_back(
                std::make_unique<NotifData>(nullptr, 1, 0, 0, 3, PARAM_INT, changes.table[i].key));
        benchmark::DoNotOptimize(copies.data());
        state.PauseTiming();
        copies.clear();
        state.ResumeTiming();
    }
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(Keys));
}

void CallbackWithATable(benchmark::State& state)
{
    CHANGES changes;
    for (auto _ : state)
    {
        ComGUIManager::fGUI2NOTIFICATION(nullptr, 1, 0, 0, 3, changes.table.data());
        state.PauseTiming();
        Drain();
        state.ResumeTiming();
    }
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(Keys));
}

void Append(benchmark::State& state)
{
    int sinceDrain = 0;
    for (auto _ : state)
    {
        ComGUIManager::fGUI2NOTIFICATION(nullptr, 4, 0, 0, 3, nullptr);
        if (++sinceDrain == 10000)
        {
            sinceDrain = 0;
            state.PauseTiming();
            Drain();
            state.ResumeTiming();
        }
    }
    state.SetItemsProcessed(state.iterations());
    if (state.thread_index() == 0)
        Drain();
}
}  // namespace

BENCHMARK(CopiesAlone);
BENCHMARK(CallbackWithATable);
BENCHMARK(Append)->ThreadRange(1, 4)->UseRealTime();

BENCHMARK_MAIN();
