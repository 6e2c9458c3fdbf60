// How the cost of the library's operations grows with what they work on. Each operation is measured at sizes
// of powers of ten, and its slope is reported: how the cost of all of it grows with the size, 1 being in
// proportion. COMGUI_GROWTH_FIGURES in the environment: a file that gets a line for each operation and size,
// its fields separated by tabs: operation, size, and the cost of one of the things that it counts, in
// nanoseconds or, for memory, in bytes.
#include <comgui/comgui.h>

#include <algorithm>
#include <benchmark/benchmark.h>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <malloc.h>
#include <map>
#include <memory>
#include <random>
#include <string>
#include <vector>

namespace
{
// A key of so many bytes, of which all but the last ones are the same for every number.
std::string Key(std::size_t number, std::size_t size = 40)
{
    std::string const tail = std::to_string(1000000 + number);
    std::string key = "Job/Parameters/Measurement/";
    key.resize(size > tail.size() ? size - tail.size() : 0, 'k');
    return key + tail;
}

// Records of all different texts and numbers, in the order of their keys.
struct RECORDS
{
    explicit RECORDS(std::size_t count, std::size_t keySize = 40)
    {
        for (std::size_t i = 0; i < count; ++i)
        {
            keys.push_back(Key(i, keySize));
            texts.push_back("text number " + std::to_string(i));
            numbers.push_back(static_cast<double>(i) / 3);
        }
        for (std::size_t i = 0; i < count; ++i)
            table.push_back({keys[i].c_str(),
                             i % 2 ? PARAM_STRING : PARAM_DOUBLE,
                             0,
                             i % 2 ? static_cast<void const*>(texts[i].c_str()) : &numbers[i],
                             -1,
                             false,
                             {}});
        table.push_back({});
    }

    void AddTo(SETMULTIPAR_LIST& list) const
    {
        for (SETMULTIPAR const& record : table)
            if (record.key)
                list.xSetParameter(record.key, record.type, record.value, record.pos);
    }

    std::vector<std::string> keys;
    std::vector<std::string> texts;
    std::vector<double> numbers;
    std::vector<SETMULTIPAR> table;
};

std::size_t Size(benchmark::State const& state) { return static_cast<std::size_t>(state.range(0)); }

void Build(benchmark::State& state)
{
    RECORDS const records(Size(state));
    for (auto _ : state)
    {
        SETMULTIPAR_LIST list(true);
        records.AddTo(list);
        benchmark::DoNotOptimize(list.Table(false));
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

// In an order in which no key is found where the one before was.
void BuildUnsorted(benchmark::State& state)
{
    RECORDS records(Size(state));
    std::shuffle(records.table.begin(), records.table.end() - 1, std::mt19937(1));
    for (auto _ : state)
    {
        SETMULTIPAR_LIST list(true);
        records.AddTo(list);
        benchmark::DoNotOptimize(list.Table(true));
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

void Write(benchmark::State& state)
{
    RECORDS records(Size(state));
    std::string stream;
    for (auto _ : state)
        STICKET_BINSTREAM::Write(stream, records.table.data(), stream.size());
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

void ReadStream(benchmark::State& state, std::size_t count, std::size_t keySize)
{
    std::string stream;
    STICKET_BINSTREAM::Write(stream, RECORDS(count, keySize).table.data(), 0);
    for (auto _ : state)
    {
        SETMULTIPAR_LIST list(true);
        if (!STICKET_BINSTREAM::Read(list, stream.data(), stream.size(), false) || list.Size() != count)
            return state.SkipWithError("the stream is not read");
    }
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(count));
}

void Read(benchmark::State& state) { ReadStream(state, Size(state), 40); }

void ReadByKeySize(benchmark::State& state) { ReadStream(state, 1000, Size(state)); }

constexpr char Bytes[] = "bytes";

// What is kept for each record, rounding of the heap included.
void Memory(benchmark::State& state)
{
    RECORDS const records(Size(state));
    for (auto _ : state)
    {
        std::size_t const before = mallinfo2().uordblks + mallinfo2().hblkhd;
        SETMULTIPAR_LIST list(true);
        records.AddTo(list);
        state.counters[Bytes] = static_cast<double>(mallinfo2().uordblks + mallinfo2().hblkhd - before) /
                                static_cast<double>(Size(state));
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

void Filter(benchmark::State& state, std::vector<std::string> const& patterns, std::size_t keySize)
{
    std::vector<char const*> table;
    for (std::string const& pattern : patterns)
        table.push_back(pattern.c_str());
    table.push_back(nullptr);
    PARTIAL_MODE const mode(table.data());
    std::vector<std::string> asked;  // half of them are selected, some of these by a prefix
    for (std::size_t i = 0; i < 1000; ++i)
    {
        std::size_t const number = i * 7919 % (2 * patterns.size());
        asked.push_back(Key(number, keySize) + (number % 5 == 0 ? "/Below" : ""));
    }
    for (std::size_t i = 0; i <= patterns.size(); ++i)  // an index is made once it pays
        benchmark::DoNotOptimize(mode.multi_contains(asked[0]));
    for (auto _ : state)
        for (std::string const& key : asked)
            benchmark::DoNotOptimize(mode.multi_contains(key));
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(asked.size()));
}

// One of five is a prefix.
void FilterByPatterns(benchmark::State& state)
{
    std::vector<std::string> patterns;
    for (std::size_t i = 0; i < Size(state); ++i)
        patterns.push_back(Key(i) + (i % 5 == 0 ? "/*" : ""));
    Filter(state, patterns, 40);
}

void FilterByKeySize(benchmark::State& state)
{
    std::vector<std::string> patterns;
    for (std::size_t i = 0; i < 200; ++i)
        patterns.push_back(Key(i, Size(state)) + (i % 5 == 0 ? "/*" : ""));
    Filter(state, patterns, Size(state));
}

std::unique_ptr<clFOLDER_VARIABLES> Folders(std::size_t count)
{
    std::unique_ptr<clFOLDER_VARIABLES> folders(CreateFolderVariables(nullptr));
    for (std::size_t i = 0; i < count; ++i)
        folders->SetFolderVariable(("FOLDER_" + std::to_string(i)).c_str(),
                                   ("/srv/print/folders/folder" + std::to_string(i)).c_str());
    return folders;
}

template <typename PATH, typename TRANSLATE>
void Translate(benchmark::State& state, PATH path, TRANSLATE translate)
{
    auto const folders = Folders(Size(state));
    std::vector<std::string> paths;
    for (std::size_t i = 0; i < 1000; ++i)
        paths.push_back(path(std::to_string(i * 7919 % Size(state))) + "/2026/jobs/report.csv");
    for (auto _ : state)
        for (std::string const& each : paths)
            benchmark::DoNotOptimize(translate(*folders, each));
    state.SetItemsProcessed(state.iterations() * static_cast<std::int64_t>(paths.size()));
}

void Encode(benchmark::State& state)
{
    Translate(
        state, [](std::string const& number) { return "/srv/print/folders/folder" + number; },
        [](clFOLDER_VARIABLES const& folders, std::string const& path) { return folders.Encode(path); });
}

void Decode(benchmark::State& state)
{
    Translate(
        state, [](std::string const& number) { return "$(FOLDER_" + number + ")"; },
        [](clFOLDER_VARIABLES const& folders, std::string const& path)
        { return folders.Decode(path, false); });
}

void Notify(benchmark::State& state)
{
    RECORDS records(Size(state));
    for (auto _ : state)
    {
        ComGUIManager::fGUI2NOTIFICATION(nullptr, 1, 0, 0, 3, records.table.data());
        for (NotifData* const notification : ComGUIManager::m_notificationList)
            delete notification;
        ComGUIManager::m_notificationList.clear();
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

struct OPERATION
{
    char const* name;
    void (*run)(benchmark::State&);
    std::int64_t largest;
    double all;   // the things counted in a run grow with the size to this power: 1, or 0 if they are always
                  // 1,000
    double most;  // of the slope: what the rule demands, with room for caches that are too small
};

constexpr OPERATION Operations[] = {
    {"build a list", Build, 1'000'000, 1, 1.25},
    {"build and sort a list, keys in any order", BuildUnsorted, 1'000'000, 1, 1.35},
    {"write a stream", Write, 1'000'000, 1, 1.15},
    {"read a stream", Read, 1'000'000, 1, 1.25},
    {"notify of changes", Notify, 1'000'000, 1, 1.25},
    {"memory of a list", Memory, 1'000'000, 1, 1.25},
    {"filter keys by patterns", FilterByPatterns, 100'000, 0, 0.25},
    {"encode paths of folders", Encode, 10'000, 0, 0.25},
    {"decode paths of folders", Decode, 10'000, 0, 0.25},
    {"read a stream by the size of its keys", ReadByKeySize, 2'000, 0, 1.0},
    {"filter by the size of keys", FilterByKeySize, 2'000, 0, 1.0},
};

class REPORTER : public benchmark::ConsoleReporter
{
public:
    REPORTER() : ConsoleReporter(OO_Tabular) {}

    void ReportRuns(std::vector<Run> const& runs) override
    {
        ConsoleReporter::ReportRuns(runs);
        for (Run const& run : runs)
        {
            failed |= run.error_occurred;
            if (run.error_occurred || run.run_type != Run::RT_Iteration)
                continue;
            double& cost = costs[run.run_name.function_name][std::atol(run.run_name.args.c_str())];
            auto const bytes = run.counters.find(Bytes);
            double const one =
                bytes != run.counters.end() ? bytes->second.value : 1e9 / run.counters.at("items_per_second");
            cost = cost == 0 ? one : std::min(cost, one);
        }
    }

    // file: may be null.
    void Print(std::FILE* file) const
    {
        std::puts(
            "\n| operation | cost of one, smallest size | largest size | largest size | slope | goal | met "
            "|\n|---|---|---|---|---|---|---|");
        for (OPERATION const& operation : Operations)
        {
            auto const found = costs.find(operation.name);
            if (found == costs.end())
                continue;
            SIZES const& sizes = found->second;
            double const slope = operation.all + Slope(sizes);
            std::printf("| %s | %.1f | %.1f | %ld | %.2f | %.2f | %s |\n", operation.name,
                        sizes.begin()->second, sizes.rbegin()->second, sizes.rbegin()->first, slope,
                        operation.most, slope <= operation.most ? "yes" : "NO");
            for (auto const& [size, cost] : sizes)
                if (file)
                    std::fprintf(file, "%s\t%ld\t%.3f\n", operation.name, size, cost);
        }
    }

    bool Failed() const { return failed; }

private:
    using SIZES = std::map<long, double>;  // with the cost of one thing, the least of all runs

    // Of the logarithms, by least squares. Below ten things what a call costs by itself would count.
    static double Slope(SIZES const& sizes)
    {
        double count = 0;
        double sumX = 0;
        double sumY = 0;
        double sumXX = 0;
        double sumXY = 0;
        for (auto const& [size, cost] : sizes)
        {
            if (size < 10)
                continue;
            double const x = std::log(static_cast<double>(size));
            double const y = std::log(cost);
            count += 1;
            sumX += x;
            sumY += y;
            sumXX += x * x;
            sumXY += x * y;
        }
        return count < 2 ? 0 : (count * sumXY - sumX * sumY) / (count * sumXX - sumX * sumX);
    }

    std::map<std::string, SIZES> costs;
    bool failed = false;
};
}  // namespace

int main(int argc, char** argv)
{
    for (OPERATION const& operation : Operations)
        benchmark::RegisterBenchmark(operation.name, operation.run)
            ->RangeMultiplier(10)
            ->Range(operation.largest == 2'000 ? 20 : 1, operation.largest);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    REPORTER reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    char const* const path = std::getenv("COMGUI_GROWTH_FIGURES");
    std::FILE* const file = path ? std::fopen(path, "w") : nullptr;
    if (path && !file)
        std::fprintf(stderr, "%s: cannot be written\n", path);
    reporter.Print(file);
    if (file)
        std::fclose(file);
    return reporter.Failed() || (path && !file) ? 1 : 0;
}
