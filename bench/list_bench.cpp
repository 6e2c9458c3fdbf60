// What it costs to gather records in a list and lay them out as a table, beside building a protobuf message
// of the same records; and to ask a key filter about each key of a ticket, beside its rule in the plainest
// form.
#include "bench/counted_loop.h"
#include "bench/peers/peer.h"
#include "bench/ratio_report.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <iterator>
#include <set>
#include <string>
#include <utility>
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
    for (auto _ : COUNTED_LOOP(state))
        benchmark::DoNotOptimize(builder->Build(records.Table()));
    state.counters["time_a_record"] =
        benchmark::Counter(static_cast<double>(records.Size()),
                           benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

struct FILTER_CASE
{
    std::vector<std::string> keys;      // of the system ticket
    std::vector<std::string> patterns;  // 200
    long selected;                      // how many of the keys
};

std::vector<std::string> SystemKeys()
{
    std::vector<std::string> keys;
    for (SETMULTIPAR const* record = SystemTicket().Table(); record->key; ++record)
        keys.emplace_back(record->key);
    return keys;
}

std::string SectionOf(std::string const& key) { return key.substr(0, key.rfind('/') + 1); }

// Most keys are selected: 160 sections of 15 keys as a whole, and 40 single keys of the others.
FILTER_CASE const& Sections()
{
    static FILTER_CASE const made = []
    {
        FILTER_CASE sections{SystemKeys(), {}, 160 * 15 + 40};
        std::size_t key = 0;
        while (sections.patterns.size() < 160)
        {
            std::string const section = SectionOf(sections.keys[key]);
            sections.patterns.push_back(section + "*");
            while (sections.keys[key].starts_with(section))
                ++key;
        }
        for (std::size_t i = 0; i < 40; ++i)
            sections.patterns.push_back(sections.keys[key + i * 11]);
        return sections;
    }();
    return made;
}

// Most keys are not: 120 single keys, 40 that no ticket has, and 40 sections.
FILTER_CASE const& SingleKeys()
{
    static FILTER_CASE const made = []
    {
        FILTER_CASE singles{SystemKeys(), {}, 0};
        std::size_t const step = singles.keys.size() / 200;
        for (std::size_t i = 0; i < 200; ++i)
        {
            std::string const& key = singles.keys[i * step];
            singles.patterns.push_back(i % 5 < 3 ? key : i % 5 < 4 ? key + "Extra" : SectionOf(key) + "*");
        }
        singles.selected = 40 * 15 + 120;  // each stands in a section of its own
        return singles;
    }();
    return made;
}

// A set of keys, and one of prefixes that takes a text and its beginning for one.
class PLAIN_FILTER
{
public:
    explicit PLAIN_FILTER(std::vector<std::string> const& patterns)
    {
        for (std::string const& pattern : patterns)
            if (pattern.ends_with('*'))
                prefixes.insert(pattern.substr(0, pattern.size() - 1));
            else
                keys.insert(pattern);
    }

    bool multi_contains(std::string const& key) const
    {
        if (keys.find(key) != keys.end())
            return true;
        auto const prefix = prefixes.find(key);
        return prefix != prefixes.end() && prefix->size() <= key.size();
    }

private:
    std::set<std::string> keys;
    std::set<std::string, STRINGPREFIXSET::LESS> prefixes;
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
void Contains(benchmark::State& state, FILTER_CASE const& (*filterCase)(),
              FILTER (*make)(std::vector<std::string> const&))
{
    auto const& [keys, patterns, selected] = filterCase();
    FILTER filter = make(patterns);
    std::vector<bool> const answers = Answers(filter, keys);
    if (std::count(answers.begin(), answers.end(), true) != selected ||
        answers != Answers(PLAIN_FILTER(patterns), keys))
        return state.SkipWithError("the filter does not select what it should");
    for (auto _ : COUNTED_LOOP(state))
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
    for (auto const& [name, filterCase] : {std::pair("sections", &Sections), std::pair("keys", &SingleKeys)})
    {
        std::string const contains = std::string("Contains/") + name;
        benchmark::RegisterBenchmark((contains + "/comgui").c_str(), Contains<PARTIAL_MODE>, filterCase,
                                     MakePartialMode);
        benchmark::RegisterBenchmark((contains + "/plain").c_str(), Contains<PLAIN_FILTER>, filterCase,
                                     [](std::vector<std::string> const& patterns)
                                     { return PLAIN_FILTER(patterns); });
    }
    return RunAndReport(
        argc, argv,
        {{"build, job ticket", "Build/job/comgui", "Build/job/protobuf_heap", 0.35},
         {"build, job ticket", "Build/job/comgui", "Build/job/protobuf", 0.35},
         {"build, system ticket", "Build/system/comgui", "Build/system/protobuf_heap", 0.40},
         {"build, system ticket", "Build/system/comgui", "Build/system/protobuf", 0.40},
         {"key filter, most selected", "Contains/sections/comgui", "Contains/sections/plain", 0.35},
         {"key filter, few selected", "Contains/keys/comgui", "Contains/keys/plain", 0.35}});
}
