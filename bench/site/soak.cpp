// soak: lets programs of all kinds work on one site, kills, stops and starves them at random moments, and
// checks all along that the site keeps what it promises. Starts itself anew for each of them.
#include "bench/site/Soak.h"
#include "bench/site/SoakClient.h"
#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/SiteClient.h"
#include <CLI/CLI.hpp>
#include <csignal>
#include <iostream>
#include <sys/prctl.h>

using comgui::test::TemporaryFolder;

namespace fs = std::filesystem;

namespace
{
enum Status
{
    Good = 0,
    Negative = 1,  // a promise was broken
    Failed = 2,
};

struct Trouble : std::runtime_error
{
    using runtime_error::runtime_error;
};

struct Options : SoakOptions
{
    double minutes = 10;
    std::string site;
};

// Keeps what is in a temporary folder.
fs::path Kept(TemporaryFolder const& temporary, unsigned seed)
{
    fs::path const kept = temporary.Path().parent_path() / ("soak-" + std::to_string(seed));
    std::error_code error;
    fs::rename(temporary.Path(), kept, error);
    return error ? temporary.Path() : kept;
}

Status RunOn(SmallDisk& disk, fs::path const& site, fs::path const& folder, Options const& options)
{
    SiteClient::MakeSite(site);
    setenv("COMGUI_SITE", site.c_str(), 1);
    std::cout << "seed " << options.seed << ", " << options.seconds << " s, site " << site.string()
              << (disk.IsThere() ? ", on a small disk that becomes full"
                                 : ", whose disk does not become full: that takes root, and no --site")
              << std::endl;
    Status status = Failed;
    try
    {
        status = Soak(options, site, disk, folder).Run() ? Good : Negative;
    }
    catch (std::exception const& error)
    {
        std::cerr << "soak: " << error.what() << '\n';
    }
    if (status != Good)
        disk.Unload();
    return status;
}

int RunSoak(Options const& options)
{
    TemporaryFolder const temporary;
    fs::path const site = options.site.empty() ? temporary / "disk" / "site" : fs::absolute(options.site);
    if (fs::exists(site / "site.db"))
        throw Trouble(site.string() + ": is a site already; name a folder that is new");
    SmallDisk disk(temporary / "disk", options.site.empty());
    Status const status = RunOn(disk, site, temporary.Path(), options);
    if (status != Good)
        std::cerr << "seed " << options.seed << "; the site and what the programs wrote to stderr are in "
                  << Kept(temporary, options.seed).string() << ' ' << options.site << '\n';
    return status;
}

int Run(int argc, char** argv)
{
    Options options;
    CLI::App app{
        "Lets programs of all kinds work on one site, disturbs them, and checks that every promise is kept.",
        "soak"};
    app.footer("Exit status: 0 every promise was kept; 1 one was broken; 2 trouble.");
    app.add_option("MINUTES", options.minutes, "How long (10)")->check(CLI::Range(0.1, 100000.0));
    auto* const seconds = app.add_option("--seconds", options.seconds, "How long, instead of MINUTES")
                              ->check(CLI::Range(4.0, 6e6));
    app.add_option("--writers", options.writers, "How many write at a time (3)")->check(CLI::Range(1, 32));
    app.add_option("--rate", options.rate, "Changes a second of each writer, at most (200)")
        ->check(CLI::Range(1.0, 100000.0));
    app.add_option("--interval", options.interval,
                   "Time from one disturbance to the next, in ms on average (300)")
        ->check(CLI::Range(1.0, 60000.0));
    app.add_option("--longest-pause", options.longestPause,
                   "Of a program that is not disturbed, in ms (5000); 0: not judged")
        ->check(CLI::Range(0.0, 600000.0));
    app.add_option("--buried-within", options.buriedWithin,
                   "Within so many ms nothing is left of a dead program (3000); a busy machine needs more")
        ->check(CLI::Range(2000.0, 600000.0));
    app.add_option("--seed", options.seed, "For the disturbances, and what is written");
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
        throw Trouble(std::string(error.what()) + "; see soak --help");
    }
    if (seconds->count() == 0)
        options.seconds = 60 * options.minutes;
    return RunSoak(options);
}

std::optional<int> RunAsOther(std::vector<std::string> const& arguments)
{
    if (arguments.empty() || !arguments[0].starts_with("--as-"))
        return std::nullopt;
    std::signal(SIGXFSZ, SIG_IGN);     // a full disk is an error of a write
    prctl(PR_SET_PDEATHSIG, SIGKILL);  // also of one that is stopped
    auto const number = [&](std::size_t i) { return std::stoi(arguments.at(i)); };
    auto const seed = [&](std::size_t i) { return static_cast<unsigned>(std::stoul(arguments.at(i))); };
    if (arguments[0] == "--as-writer")
        return WriteUntilKilled(
            {number(1), number(2), number(3), seed(4), std::chrono::microseconds(number(5))});
    if (arguments[0] == "--as-checker")
        return CheckLanes(number(1));
    if (arguments[0] == "--as-client")
        return RunSoakClient(
            {arguments.at(1), number(2), number(3), seed(4), number(5) != 0, arguments.at(6)});
    return std::nullopt;
}
}  // namespace

int main(int argc, char** argv)
try
{
    auto const code = RunAsOther({argv + 1, argv + argc});
    return code ? *code : Run(argc, argv);
}
catch (std::exception const& error)
{
    std::cerr << "soak: " << error.what() << '\n';
    return Failed;
}
