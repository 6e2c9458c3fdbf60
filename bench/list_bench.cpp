// What it costs to gather records in a list and lay them out as a table, beside building a protobuf message
// of the same records; and to ask a key filter about each key of a ticket, beside looking at each of its
// patterns.
#include "bench/peers/peer.h"
#include "bench/ratio_report.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <iterator>
#include <string>
#include <vector>

namespace
{
void Build(benchmark::State& state, WORKLOAD& (*workload)(), std::unique_ptr<BUILDER> (*make)())
{
    WORKLOAD& records = workload();
    std::unique_ptr<BUILDER> const builder = make();
    COMPARISON comparison(records.Table());
    builder->TellBuilt(records.Table(), comparison);
    if (!comparison.Equal())
        return state.SkipWithError("what was built does not hold the records");
    for (auto _ : state)
        benchmark::DoNotOptimize(builder->Build(records.Table()));
    state.counters["time_a_record"] =
        benchmark::Counter(static_cast<double>(records.Size()),
                           benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

// The keys of the system ticket, and 200 patterns: 160 sections as a whole, and 40 single keys of the others.
struct FILTER_CASE
{
    std::vector<std::string> keys;
    std::vector<std::string> patterns;
};

FILTER_CASE MakeFilterCase()
{
    constexpr std::size_t Sections = 160;
    constexpr std::size_t SingleKeys = 40;
    FILTER_CASE made;
    for (SETMULTIPAR const* record = SystemTicket().Table(); record->key; ++record)
        made.keys.emplace_back(record->key);
    std::size_t key = 0;
    while (made.patterns.size() < Sections)
    {
        std::string const section = made.keys[key].substr(0, made.keys[key].rfind('/') + 1);
        made.patterns.push_back(section + "*");
        while (made.keys[key].starts_with(section))
            ++key;
    }
    for (std::size_t i = 0; i < SingleKeys; ++i)
        made.patterns.push_back(made.keys[key + i * 11]);
    return made;
}

FILTER_CASE const& FilterCase()
{
    static FILTER_CASE const made = MakeFilterCase();
    return made;
}

// The rule of the filter, with nothing but a look at one pattern after the other.
class LINEAR_FILTER
{
public:
    explicit LINEAR_FILTER(std::vector<std::string> const& patterns)
    {
        for (std::string const& pattern : patterns)
            if (pattern.ends_with('*'))
                prefixes.push_back(pattern.substr(0, pattern.size() - 1));
            else
                keys.push_back(pattern);
    }

    bool multi_contains(std::string const& key) const
    {
        return std::find(keys.begin(), keys.end(), key) != keys.end() ||
               std::any_of(prefixes.begin(), prefixes.end(),
                           [&](std::string const& prefix) { return key.starts_with(prefix); });
    }

private:
    std::vector<std::string> keys;
    std::vector<std::string> prefixes;
};

PARTIAL_MODE MakePartialMode(std::vector<std::string> const& patterns)
{
    std::vector<char const*> table;
    table.reserve(patterns.size() + 1);
    for (std::string const& pattern : patterns)
        table.push_back(pattern.c_str());
    table.push_back(nullptr);
    return PARTIAL_MODE(table.data());
}

template <typename FILTER>
std::vector<bool> Answers(FILTER const& filter, std::vector<std::string> const& keys)
{
    std::vector<bool> answers;
    std::transform(keys.begin(), keys.end(), std::back_inserter(answers),
                   [&](std::string const& key) { return filter.multi_contains(key); });
    return answers;
}

template <typename FILTER>
void Contains(benchmark::State& state, FILTER (*make)(std::vector<std::string> const&))
{
    FILTER_CASE const& filterCase = FilterCase();
    std::vector<std::string> const& keys = filterCase.keys;
    FILTER filter = make(filterCase.patterns);
    // 160 sections of 15 keys, and 40 keys more.
    std::vector<bool> const answers = Answers(filter, keys);
    if (std::count(answers.begin(), answers.end(), true) != 160 * 15 + 40 ||
        answers != Answers(LINEAR_FILTER(filterCase.patterns), keys))
        return state.SkipWithError("the filter does not select what it should");
    for (auto _ : state)
        for (std::string const& key : keys)
            benchmark::DoNotOptimize(filter.multi_contains(key));
    state.counters["time_a_key"] =
        benchmark::Counter(static_cast<double>(keys.size()),
                           benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}
}  // namespace

int main(int argc, char** argv)
{
    benchmark::RegisterBenchmark("Build/job/comgui", Build, JobTicket, MakeComguiBuilder);
    benchmark::RegisterBenchmark("Build/job/protobuf", Build, JobTicket, MakeProtobufBuilder);
    benchmark::RegisterBenchmark("Build/job/protobuf_heap", Build, JobTicket, MakeProtobufHeapBuilder);
    benchmark::RegisterBenchmark("Build/system/comgui", Build, SystemTicket, MakeComguiBuilder);
    benchmark::RegisterBenchmark("Build/system/protobuf", Build, SystemTicket, MakeProtobufBuilder);
    benchmark::RegisterBenchmark("Build/system/protobuf_heap", Build, SystemTicket, MakeProtobufHeapBuilder);
    benchmark::RegisterBenchmark("Contains/prefix200/comgui", Contains<PARTIAL_MODE>, MakePartialMode);
    benchmark::RegisterBenchmark("Contains/prefix200/linear", Contains<LINEAR_FILTER>,
                                 [](std::vector<std::string> const& patterns)
                                 { return LINEAR_FILTER(patterns); });
    return RunAndReport(
        argc, argv,
        {{"build, job ticket", "Build/job/comgui", "Build/job/protobuf", 0.35},
         {"build, system ticket", "Build/system/comgui", "Build/system/protobuf", 0.40},
         {"key filter, 200 patterns", "Contains/prefix200/comgui", "Contains/prefix200/linear", 0.65}});
}
