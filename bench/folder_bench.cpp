// What a translation of a path costs beside its rule in the plainest form and beside the least that it can
// cost, a copy of its result; and the filter of bytes beside the loop that anyone would write.
#include "bench/counted_loop.h"
#include "bench/heap_count.h"
#include "bench/ratio_report.h"

#include <comgui/comgui.h>

#include <algorithm>
#include <benchmark/benchmark.h>
#include <cstdint>
#include <iterator>
#include <memory>
#include <mutex>
#include <random>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace
{
// As a server has them: 28 folders, most of them side by side in one.
template <typename TRANSLATOR>
void SetFolders(TRANSLATOR& folders)
{
    static char const* const variables[] = {
        "INSTALL",      "TEMP",         "THUMBNAIL",  "PRINT",        "REMOTE_IN", "REMOTE_WCC",
        "REMOTE_OUT",   "LOG",          "EMBEDDED",   "EXPORT",       "PREVIEW",   "JOB",
        "PAPER",        "REFERENCE",    "LIN_VISUAL", "LIN_MEASURED", "LIN_PLATE", "LIN_SPOTCOLOR",
        "SPOTCOLORTAB", "CONTROLSTRIP", "UPDATES",    "BACKUP",       "SPT",       "LABCORRECTION",
        "ENVIRONMENTS", "LOGO",         "HOT",        "ANALYTICS"};
    static_assert(std::size(variables) == 28);
    folders.SetFolderVariable("INSTALL", "/srv/print");
    for (char const* variable : variables)
        if (std::string_view(variable) != "INSTALL")
            folders.SetFolderVariable(variable, (std::string("/srv/print/folders/") + variable).c_str());
}

std::unique_ptr<clFOLDER_VARIABLES> Translator()
{
    std::unique_ptr<clFOLDER_VARIABLES> folders(CreateFolderVariables(nullptr));
    SetFolders(*folders);
    return folders;
}

// The same step by step, one folder after the other, with the lock that threads need.
class PLAIN_TRANSLATOR
{
public:
    PLAIN_TRANSLATOR() { SetFolders(*this); }

    void SetFolderVariable(char const* variable, char const* folder)
    {
        m_mappings.emplace_back(variable, folder);
    }

    std::string Encode(std::string const& path)
    {
        std::lock_guard const lock(m_mutex);
        std::string const slashed = WithSlashes(path);
        std::size_t longest = 0;
        std::string const* best = nullptr;
        for (auto const& [variable, folder] : m_mappings)
            if (folder.size() > longest && slashed.compare(0, folder.size(), folder) == 0 &&
                (folder.size() == slashed.size() || slashed[folder.size()] == '/'))
            {
                longest = folder.size();
                best = &variable;
            }
        return best ? "$(" + *best + ")" + slashed.substr(longest) : path;
    }

    std::string Decode(std::string const& path)
    {
        std::lock_guard const lock(m_mutex);
        if (path.size() < 4 || path[0] != '$' || path[1] != '(')
            return WithSlashes(path);
        std::size_t const end = path.find(')', 2);
        if (end == std::string::npos)
            return path;
        std::string const name = path.substr(2, end - 2);
        for (auto const& [variable, folder] : m_mappings)
            if (variable == name)
                return WithSlashes(folder + path.substr(end + 1));
        return path;
    }

private:
    static std::string WithSlashes(std::string path)
    {
        std::replace(path.begin(), path.end(), '\\', '/');
        return path;
    }

    std::recursive_mutex m_mutex;
    std::vector<std::pair<std::string, std::string>> m_mappings;
};

std::string const Path = "/srv/print/folders/ANALYTICS/2026/jobs/0123456789/report.csv";  // 60 bytes
std::string const Form = "$(ANALYTICS)/2026/jobs/0123456789/report.csv";

template <typename TRANSLATE>
void Measure(benchmark::State& state, TRANSLATE translate, std::string const& expected)
{
    if (Path.size() != 60 || translate() != expected)
        return state.SkipWithError("the translation is not what it should be");
    long const before = BlocksTaken();
    for (auto _ : COUNTED_LOOP(state))
        benchmark::DoNotOptimize(translate());
    state.counters["allocations"] =
        benchmark::Counter(static_cast<double>(BlocksTaken() - before), benchmark::Counter::kAvgIterations);
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

void EncodePlainly(benchmark::State& state)
{
    PLAIN_TRANSLATOR folders;
    Measure(
        state, [&] { return folders.Encode(Path); }, Form);
}

void DecodePlainly(benchmark::State& state)
{
    PLAIN_TRANSLATOR folders;
    Measure(
        state, [&] { return folders.Decode(Form); }, Path);
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
    for (auto _ : COUNTED_LOOP(state))
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
    for (auto _ : COUNTED_LOOP(state))
        for (std::size_t i = 0; i < TextSize; ++i)
            asm volatile("" : "+r"(i));
}
}  // namespace

int main(int argc, char** argv)
{
    benchmark::RegisterBenchmark("Encode/28", Encode);
    benchmark::RegisterBenchmark("Encode/28/backslashes", EncodeBackslashes);
    benchmark::RegisterBenchmark("Encode/plain", EncodePlainly);
    benchmark::RegisterBenchmark("Encode/copy", Copy, Form);
    benchmark::RegisterBenchmark("Decode/28", Decode);
    benchmark::RegisterBenchmark("Decode/plain", DecodePlainly);
    benchmark::RegisterBenchmark("Decode/copy", Copy, Path);
    benchmark::RegisterBenchmark("Filter/FilterString", FilterString)->Arg(0)->Arg(1)->Arg(20);
    benchmark::RegisterBenchmark("Filter/appending", FilterByAppending)->Arg(0)->Arg(1)->Arg(20);
    benchmark::RegisterBenchmark("Filter/one_cycle_a_byte", OneCycleAByte);
    return RunAndReport(
        argc, argv,
        {{"encode, 28 folders", "Encode/28", "Encode/plain", 0.28},
         {"encode, 28 folders, backslashes", "Encode/28/backslashes", "Encode/plain", 0.35},
         {"encode, 28 folders", "Encode/28", "Encode/copy", 5},
         {"decode, 28 folders", "Decode/28", "Decode/plain", 0.55},
         {"decode, 28 folders", "Decode/28", "Decode/copy", 5},
         {"filter, all pass", "Filter/FilterString/0", "Filter/one_cycle_a_byte", 1. / 6},
         {"filter, 1 % removed", "Filter/FilterString/1", "Filter/one_cycle_a_byte", 1. / 6},
         {"filter, 20 % removed", "Filter/FilterString/20", "Filter/one_cycle_a_byte", 1. / 6},
         {"filter, 20 % removed", "Filter/FilterString/20", "Filter/appending/20", 0.1}});
}
