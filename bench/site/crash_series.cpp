// crash_series: lets several programs write to one site, kills one of them after the other at random instants
// and starts new ones in their place, and checks that every acknowledged change is there. Starts
// itself anew for each of them.
#include "bench/site/CrashWriter.h"
#include "bench/site/Lane.h"
#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/Program.h"
#include "tests/support/SiteClient.h"
#include <CLI/CLI.hpp>
#include <iostream>
#include <memory>
#include <poll.h>
#include <random>

using comgui::test::TemporaryFolder;

namespace
{
using Clock = Program::Clock;

enum Status
{
    Good = 0,
    Negative = 1,  // something was lost, torn, misheard or refused, or a writer has paused for too long
    Failed = 2,
};

constexpr char WriterOption[] = "--as-writer";
constexpr char CheckerOption[] = "--as-checker";
constexpr auto Patience = std::chrono::seconds(60);  // with a program that lives: one that is silent hangs

struct Trouble : std::runtime_error
{
    using runtime_error::runtime_error;
};

struct Options
{
    int kills = 1000;
    int writers = 4;
    double interval = 60;       // ms between two kills, on average
    double longestPause = 100;  // ms of a living writer; 0: not judged
    unsigned seed = std::random_device()();
    std::string site;
};

// A lane with the program that writes it at the moment.
struct Runner
{
    Lane lane;
    std::unique_ptr<Program> program{};
    Clock::time_point lastLine{};
    bool isAtWork = false;  // it has reported a change
};

class Series
{
public:
    explicit Series(Options const& options) : m_options(options), m_random(options.seed)
    {
        for (int i = 0; i < options.writers; ++i)
            m_runners.push_back({Lane(i, m_wrongs)});
    }

    int Run()
    {
        auto const began = Clock::now();
        for (std::size_t i = 0; i < m_runners.size(); ++i)
            Start(i);
        std::exponential_distribution<> wait(1 / m_options.interval);
        for (int kill = 1; kill <= m_options.kills; ++kill)
        {
            ReadUntil(Clock::now() + std::chrono::microseconds(static_cast<int>(1000 * wait(m_random))));
            std::size_t const victim = m_random() % m_runners.size();
            End(victim);
            Start(victim);
            if (kill % 100 == 0 || kill == m_options.kills)
                Tell(kill, began);
        }
        // The last kills are checked too.
        for (std::size_t i = 0; i < m_runners.size(); ++i)
            End(i);
        CheckAll();
        return Summary();
    }

private:
    void Start(std::size_t number)
    {
        Runner& runner = m_runners[number];
        runner.program = std::make_unique<Program>(std::vector<std::string>{
            Program::OwnFile(), WriterOption, std::to_string(number), std::to_string(m_options.writers),
            std::to_string(runner.lane.Block()), std::to_string(m_random())});
        runner.lastLine = Clock::now();
        runner.isAtWork = false;
    }

    // Kills a writer and reads what it still reported.
    void End(std::size_t number)
    {
        Runner& runner = m_runners[number];
        runner.program->Kill();
        m_killedAtWork += runner.isAtWork ? 1 : 0;
        while (auto const line = runner.program->Line(Clock::now() + Patience))
            runner.lane.Take(*line);
        runner.program.reset();
    }

    void ReadUntil(Clock::time_point end)
    {
        do
        {
            std::vector<pollfd> outputs;
            for (Runner const& runner : m_runners)
                outputs.push_back({runner.program->Output(), POLLIN, 0});
            auto const left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now());
            poll(outputs.data(), outputs.size(), static_cast<int>(std::max<std::int64_t>(left.count(), 0)));
            for (Runner& runner : m_runners)
                Read(runner);
        } while (Clock::now() < end);
    }

    void Read(Runner& runner)
    {
        auto const now = Clock::now();
        while (auto const line = runner.program->Line(now))
        {
            if (runner.isAtWork)
                m_longestPause = std::max(m_longestPause, now - runner.lastLine);
            runner.isAtWork = runner.isAtWork || !line->starts_with("found");
            runner.lastLine = now;
            runner.lane.Take(*line);
        }
        if (runner.program->HasEnded())
            throw Trouble("a writer has ended by itself; its own message is above");
        if (now - runner.lastLine > Patience)
            throw Trouble("a writer hangs");
    }

    void CheckAll()
    {
        Program checker({Program::OwnFile(), CheckerOption, std::to_string(m_runners.size())});
        std::size_t lane = 0;
        for (;;)
        {
            auto const line = checker.Line(Clock::now() + std::chrono::minutes(10));
            if (!line)
                throw Trouble("the checker does not finish");
            if (*line == "done")
                break;
            if (line->starts_with("found"))
                m_runners.at(lane++).lane.Take(*line);
            else
                m_wrongs.Take("all lanes", "lost", *line);
        }
        if (lane != m_runners.size())
            throw Trouble("the checker has not seen all lanes");
    }

    std::int64_t Sum(std::int64_t (Lane::*what)() const) const
    {
        std::int64_t sum = 0;
        for (Runner const& runner : m_runners)
            sum += (runner.lane.*what)();
        return sum;
    }

    void Tell(int kills, Clock::time_point began) const
    {
        std::cout << kills << " kills, " << Sum(&Lane::Changes) << " changes acknowledged, "
                  << std::chrono::duration_cast<std::chrono::seconds>(Clock::now() - began).count() << " s"
                  << std::endl;
    }

    int Summary() const
    {
        std::cout << m_killedAtWork
                  << " of the writers were killed while writing, the others during start-up; "
                  << Sum(&Lane::Finds) << " comparisons of a lane\n"
                  << "longest pause of a living writer between two changes: "
                  << std::chrono::duration_cast<std::chrono::milliseconds>(m_longestPause).count() << " ms\n";
        int const misheard = m_wrongs.Count("misheard");
        int const refused = m_wrongs.Count("refused");
        if (misheard + refused > 0)
            std::cout << misheard << " notifications misheard, " << refused << " changes refused\n";
        std::cout << m_options.kills << " kills: " << m_wrongs.Count("lost") << " lost, "
                  << m_wrongs.Count("torn") << " torn\n";
        if (Sum(&Lane::Changes) == 0)
            throw Trouble("no writer came to write anything: --interval is too short for this machine");
        double const pause = std::chrono::duration<double, std::milli>(m_longestPause).count();
        bool const isTooLong = m_options.longestPause > 0 && pause > m_options.longestPause;
        if (isTooLong)
            std::cerr << "a living writer has paused for more than " << m_options.longestPause << " ms\n";
        return m_wrongs.IsGood() && !isTooLong ? Good : Negative;
    }

    Options const& m_options;
    std::mt19937 m_random;
    Wrongs m_wrongs;
    std::vector<Runner> m_runners;
    Clock::duration m_longestPause{};
    int m_killedAtWork = 0;
};

int RunSeries(Options const& options)
{
    std::unique_ptr<TemporaryFolder> temporary;
    if (options.site.empty())
        temporary = std::make_unique<TemporaryFolder>();
    std::filesystem::path const site =
        temporary ? temporary->Path() / "site" : std::filesystem::absolute(options.site);
    if (std::filesystem::exists(site / "site.db"))
        throw Trouble(site.string() + ": is a site already; name a folder that is new");
    SiteClient::MakeSite(site);
    setenv("COMGUI_SITE", site.c_str(), 1);
    std::cout << "seed " << options.seed << ", " << options.writers << " writers" << std::endl;
    return Series(options).Run();
}

int Run(int argc, char** argv)
{
    Options options;
    CLI::App app{
        "Kills programs that write to one site, one after the other, and checks that every acknowledged "
        "change is there.",
        "crash_series"};
    app.footer("Exit status: 0 all is well; 1 something was lost, torn, misheard or refused, or a writer has "
               "paused for too long; 2 trouble.");
    app.add_option("KILLS", options.kills, "How many to kill (1000)")->check(CLI::Range(1, 10000000));
    app.add_option("--writers", options.writers, "How many write at a time (4)")->check(CLI::Range(1, 32));
    app.add_option("--interval", options.interval, "Time from one kill to the next, in ms on average (60)")
        ->check(CLI::Range(1.0, 60000.0));
    app.add_option(
           "--longest-pause", options.longestPause,
           "Between two changes of a writer that lives, in ms (100); 0: not judged. It counts what the "
           "machine itself holds up, so give a busy one, or a slow disk, a second or more")
        ->check(CLI::Range(0.0, 600000.0));
    app.add_option("--seed", options.seed, "For the instants of the kills, and what is written");
    app.add_option("--site", options.site,
                   "A new folder for the site, which stays; otherwise a temporary one");
    try
    {
        app.parse(argc, argv);
    }
    catch (CLI::ParseError const& error)
    {
        if (error.get_exit_code() == 0)
            return app.exit(error);
        throw Trouble(std::string(error.what()) + "; see crash_series --help");
    }
    return RunSeries(options);
}
}  // namespace

int main(int argc, char** argv)
try
{
    std::vector<std::string> const arguments(argv + 1, argv + argc);
    if (arguments.size() == 5 && arguments[0] == WriterOption)
        return WriteUntilKilled({std::stoi(arguments[1]), std::stoi(arguments[2]), std::stoi(arguments[3]),
                                 static_cast<unsigned>(std::stoul(arguments[4]))});
    if (arguments.size() == 2 && arguments[0] == CheckerOption)
        return CheckLanes(std::stoi(arguments[1]));
    return Run(argc, argv);
}
catch (std::exception const& error)
{
    std::cerr << "crash_series: " << error.what() << '\n';
    return Failed;
}
