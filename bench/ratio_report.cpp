#include "bench/ratio_report.h"

#include "bench/counted_loop.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <memory>

namespace
{
double Median(std::vector<double> values)
{
    std::sort(values.begin(), values.end());
    std::size_t const half = values.size() / 2;
    return values.size() % 2 ? values[half] : (values[half - 1] + values[half]) / 2;
}

// Of the runs of both sides, one by one.
double Spread(std::vector<double> const& ours, std::vector<double> const& peer)
{
    std::vector<double> ratios;
    for (std::size_t i = 0; i < std::min(ours.size(), peer.size()); ++i)
        ratios.push_back(ours[i] / peer[i]);
    std::sort(ratios.begin(), ratios.end());
    std::size_t const quarter = ratios.size() / 4;
    return ratios[ratios.size() - 1 - quarter] - ratios[quarter];
}

struct CLOSE
{
    void operator()(std::FILE* file) const { std::fclose(file); }
};

class REPORTER : public benchmark::ConsoleReporter
{
public:
    REPORTER() : ConsoleReporter(OO_Tabular) {}  // no colours: the output is often kept in a file

    void ReportRuns(std::vector<Run> const& runs) override
    {
        ConsoleReporter::ReportRuns(runs);
        for (Run const& run : runs)
            if (run.error_occurred)
                failed = true;
            else if (run.run_type == Run::RT_Iteration)
                Take(run);
    }

    // file: for the figures, or null.
    void Print(std::vector<GOAL> const& goals, char const* program, std::FILE* file) const
    {
#ifndef NDEBUG
        std::puts("\nNot an optimised build: these ratios say nothing about the goals.");
#endif
        std::puts("\n| measure | ours | peer | ratio | spread | goal | met |\n|---|---|---|---|---|---|---|");
        for (GOAL const& goal : goals)
            Print(goal, program, file);
    }

    bool Failed() const { return failed; }

private:
    struct FIGURES
    {
        std::vector<double> nanoseconds;
        std::vector<double> elapsed;
        std::vector<double> bytes;
    };

    void Take(Run const& run)
    {
        FIGURES& taken = figures[run.run_name.str()];
        taken.nanoseconds.push_back(COUNTED_LOOP::Counts() ? COUNTED_LOOP::LastCost()
                                                           : run.cpu_accumulated_time * 1e9 /
                                                                 static_cast<double>(run.iterations));
        taken.elapsed.push_back(run.real_accumulated_time * 1e9 / static_cast<double>(run.iterations));
        auto const bytes = run.counters.find(BytesARecord);
        if (bytes != run.counters.end())
            taken.bytes.push_back(bytes->second);
    }

    std::vector<double> const* Values(std::string const& name, GOAL::KIND kind) const
    {
        auto const found = figures.find(name);
        if (found == figures.end())
            return nullptr;
        std::vector<double> const& values = kind == GOAL::ELAPSED_TIME     ? found->second.elapsed
                                            : kind == GOAL::BYTES_A_RECORD ? found->second.bytes
                                                                           : found->second.nanoseconds;
        return values.empty() ? nullptr : &values;
    }

    void Print(GOAL const& goal, char const* program, std::FILE* file) const
    {
        std::vector<double> const* const ours = Values(goal.ours, goal.kind);
        std::vector<double> const* const peer = Values(goal.peer, goal.kind);
        if (!ours || !peer)
            return;
        bool const isAdded = goal.kind == GOAL::ADDED_TIME;
        double const result = isAdded ? Median(*ours) - Median(*peer) : Median(*ours) / Median(*peer);
        double const spread = isAdded ? 0 : Spread(*ours, *peer);
        char const* const form = isAdded
                                     ? "| %s | %s %.4g %s | %s %.4g %s | +%.2f ns | %.0f | +%.2f ns | %s |\n"
                                     : "| %s | %s %.4g %s | %s %.4g %s | %.3f | %.3f | %.2f | %s |\n";
        std::printf(form, goal.measure, goal.ours.c_str(), Median(*ours), Unit(goal), goal.peer.c_str(),
                    Median(*peer), Unit(goal), result, spread, goal.most, result <= goal.most ? "yes" : "NO");
        if (file && !isAdded)
            std::fprintf(file, "%s\t%s\t%s\t%.4f\t%.4f\t%.3f\n", program, goal.measure,
                         LastName(goal.peer).c_str(), result, spread, goal.most);
    }

    // Without the benchmark's argument.
    static std::string LastName(std::string const& path)
    {
        std::size_t const end = path.find_last_not_of("/0123456789") + 1;
        return path.substr(0, end).substr(path.rfind('/', end - 1) + 1);
    }

    static char const* Unit(GOAL const& goal)
    {
        return goal.kind == GOAL::BYTES_A_RECORD ? "bytes" : COUNTED_LOOP::Counts() ? "cycles" : "ns";
    }

    std::map<std::string, FIGURES> figures;
    bool failed = false;
};
}  // namespace

int RunAndReport(int argc, char** argv, std::vector<GOAL> const& goals)
{
    std::string const program = std::string(argv[0]).substr(std::string(argv[0]).rfind('/') + 1);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    REPORTER reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    char const* const path = std::getenv("COMGUI_BENCH_FIGURES");
    std::unique_ptr<std::FILE, CLOSE> const file(path ? std::fopen(path, "a") : nullptr);
    if (path && !file)
        std::fprintf(stderr, "%s: cannot be written\n", path);
    reporter.Print(goals, program.c_str(), file.get());
    return reporter.Failed() || (path && !file) ? 1 : 0;
}
