// What a translation of a path costs beside the least that it can cost, a copy of its result; and the filter
// of bytes beside the loop that anyone would write.
#include "bench/ratio_report.h"

#include <comgui/comgui.h>

#include <algorithm>
#include <atomic>
#include <benchmark/benchmark.h>
#include <cstdint>
#include <cstdlib>
#include <iterator>
#include <memory>
#include <new>
#include <random>
#include <string>

namespace
{
std::atomic<long> allocations{0};

// As a server has them: 28 folders, most of them side by side in one.
std::unique_ptr<clFOLDER_VARIABLES> Translator()
{
    static char const* const variables[] = {
        "INSTALL",      "TEMP",         "THUMBNAIL",  "PRINT",        "REMOTE_IN", "REMOTE_WCC",
        "REMOTE_OUT",   "LOG",          "EMBEDDED",   "EXPORT",       "PREVIEW",   "JOB",
        "PAPER",        "REFERENCE",    "LIN_VISUAL", "LIN_MEASURED", "LIN_PLATE", "LIN_SPOTCOLOR",
        "SPOTCOLORTAB", "CONTROLSTRIP", "UPDATES",    "BACKUP",       "SPT",       "LABCORRECTION",
        "ENVIRONMENTS", "LOGO",         "HOT",        "ANALYTICS"};
    static_assert(std::size(variables) == 28);
    std::unique_ptr<clFOLDER_VARIABLES> folders(CreateFolderVariables(nullptr));
    for (char const* variable : variables)
        folders->SetFolderVariable(variable, (std::string("/srv/print/folders/") + variable).c_str());
    folders->SetFolderVariable("INSTALL", "/srv/print");
    return folders;
}

std::string const Path = "/srv/print/folders/ANALYTICS/2026/jobs/0123456789/report.csv";  // 60 bytes
std::string const Form = "$(ANALYTICS)/2026/jobs/0123456789/report.csv";

template <typename TRANSLATE>
void Measure(benchmark::State& state, TRANSLATE translate, std::string const& expected)
{
    if (Path.size() != 60 || translate() != expected)
        return state.SkipWithError("the translation is not what it should be");
    long const before = allocations;
    for (auto _ : state)
        benchmark::DoNotOptimize(translate());
    state.counters["allocations"] =
        benchmark::Counter(static_cast<double>(allocations - before), benchmark::Counter::kAvgIterations);
}

void Encode(benchmark::State& state)
{
    auto const folders = Translator();
    Measure(
        state, [&] { return folders->Encode(Path); }, Form);
}

void EncodeBackslashes(benchmark::State& state)
{
    auto const folders = Translator();
    std::string path = Path;
    CharSets::DBCS::ReplaceAll(path, '/', '\\');
    Measure(
        state, [&] { return folders->Encode(path); }, Form);
}

void Decode(benchmark::State& state)
{
    auto const folders = Translator();
    Measure(
        state, [&] { return folders->Decode(Form, false); }, Path);
}

void Copy(benchmark::State& state, std::string const& text)
{
    std::string const* source = &text;
    benchmark::DoNotOptimize(source);
    Measure(
        state, [&] { return std::string(*source); }, text);
}

constexpr std::size_t TextSize = 4096;

// In which that many of 100 bytes, anywhere, are to be removed.
std::string Text(unsigned removed)
{
    std::mt19937 random(1);
    std::string text(TextSize, 'x');
    for (char& c : text)
        c = random() % 100 < removed ? '#' : static_cast<char>('a' + random() % 26);
    return text;
}

template <typename FILTER>
void Filter(benchmark::State& state, FILTER filter)
{
    std::string const text = Text(static_cast<unsigned>(state.range(0)));
    std::string expected = text;
    expected.erase(std::remove(expected.begin(), expected.end(), '#'), expected.end());
    if (filter(text) != expected)
        return state.SkipWithError("the filter does not give what it should");
    for (auto _ : state)
        benchmark::DoNotOptimize(filter(text));
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(text.size()));
}

void FilterString(benchmark::State& state)
{
    CharSets::FilterString filter(true);
    filter.setRemove("#");
    Filter(state, filter);
}

// The same table, byte by byte: what is not 0 is appended.
void FilterByAppending(benchmark::State& state)
{
    CharSets::FilterString table(true);
    table.setRemove("#");
    Filter(state,
           [&](std::string const& text)
           {
               std::string result;
               result.reserve(text.size());
               for (char const c : text)
                   if (char const entry = table(c))
                       result += entry;
               return result;
           });
}

// An addition that waits for the one before takes one cycle: as many of them as there are bytes.
void OneCycleAByte(benchmark::State& state)
{
    for (auto _ : state)
        for (std::size_t i = 0; i < TextSize; ++i)
            asm volatile("" : "+r"(i));
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

int main(int argc, char** argv)
{
    benchmark::RegisterBenchmark("Encode/28", Encode);
    benchmark::RegisterBenchmark("Encode/28/backslashes", EncodeBackslashes);
    benchmark::RegisterBenchmark("Encode/copy", Copy, Form);
    benchmark::RegisterBenchmark("Decode/28", Decode);
    benchmark::RegisterBenchmark("Decode/copy", Copy, Path);
    benchmark::RegisterBenchmark("Filter/FilterString", FilterString)->Arg(0)->Arg(1)->Arg(20);
    benchmark::RegisterBenchmark("Filter/appending", FilterByAppending)->Arg(0)->Arg(1)->Arg(20);
    benchmark::RegisterBenchmark("Filter/one_cycle_a_byte", OneCycleAByte);
    return RunAndReport(argc, argv,
                        {{"encode, 28 folders", "Encode/28", "Encode/copy", 15},
                         {"encode, 28 folders, backslashes", "Encode/28/backslashes", "Encode/copy", 15},
                         {"decode, 28 folders", "Decode/28", "Decode/copy", 8},
                         {"filter, all pass", "Filter/FilterString/0", "Filter/one_cycle_a_byte", 1},
                         {"filter, 1 % removed", "Filter/FilterString/1", "Filter/one_cycle_a_byte", 1},
                         {"filter, 20 % removed", "Filter/FilterString/20", "Filter/one_cycle_a_byte", 1},
                         {"filter, 20 % removed", "Filter/FilterString/20", "Filter/appending/20", 0.5}});
}
