// site_load: puts a site under the load of several programs at once, each a process of its own that reads,
// writes or listens, and reports how fast they are, and whether anything was lost on the way. Starts itself
// anew for each of them.
#include "bench/site/LatencyHistogram.h"
#include "bench/site/LoadClient.h"
#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/Program.h"
#include "tests/support/SiteClient.h"
#include <CLI/CLI.hpp>
#include <cstdio>
#include <iostream>
#include <memory>
#include <random>

using comgui::test::TemporaryFolder;

namespace
{
using nlohmann::json;

enum Status
{
    Good = 0,
    Negative = 1,  // something was lost, torn, missed, doubled or out of order
    Failed = 2,    // there are no figures
};

constexpr auto Patience = std::chrono::seconds(60);  // with a client that should answer at once
constexpr char Worker[] = "--as-client";             // how this program starts itself anew

struct Trouble : std::runtime_error
{
    using runtime_error::runtime_error;
};

struct Options
{
    int clients = 4;
    std::vector<std::string> mix;
    double seconds = 5;
    double changes = 0;
    double reads = 0;
    std::string site;
    std::string user = "admin";
    std::string password = "admin";
    bool isJson = false;
};

std::vector<std::string> DefaultMix(int clients)
{
    if (clients == 1)
        return {"write+read+watch"};
    if (clients == 2)
        return {"write", "read+watch"};
    return {"write", "watch", "read", "write"};
}

bool Has(std::string const& kinds, std::string const& kind)
{
    return ('+' + kinds + '+').find('+' + kind + '+') != std::string::npos;
}

// The tasks of all clients; the kinds of the mix are dealt out in turn.
std::vector<LoadTask> Tasks(Options const& options)
{
    std::vector<LoadTask> tasks(static_cast<std::size_t>(options.clients));
    std::vector<int> writers;
    int readers = 0;
    std::int64_t const run = std::random_device()() & 0xFFFFF;
    for (std::size_t i = 0; i < tasks.size(); ++i)
    {
        std::string const& kinds = options.mix[i % options.mix.size()];
        LoadTask& task = tasks[i];
        task.reads = Has(kinds, "read");
        task.writes = Has(kinds, "write");
        task.watches = Has(kinds, "watch");
        task.number = static_cast<int>(i);
        task.run = run;
        task.user = options.user;
        task.password = options.password;
        readers += task.reads ? 1 : 0;
        if (task.writes)
            writers.push_back(task.number);
    }
    for (LoadTask& task : tasks)
    {
        task.writers = writers;
        task.changesPerSecond = task.writes ? options.changes / static_cast<double>(writers.size()) : 0;
        task.readsPerSecond = task.reads ? options.reads / readers : 0;
    }
    return tasks;
}

class Client
{
public:
    explicit Client(LoadTask const& task)
        : m_number(task.number), m_program({Program::OwnFile(), Worker, json(task).dump()})
    {
    }

    void Say(std::string const& line)
    {
        if (!m_program.Say(line))
            Fail("has ended");
    }

    std::string Line(std::chrono::nanoseconds patience = Patience)
    {
        auto const line = m_program.Line(Program::Clock::now() + patience);
        if (!line)
            Fail(m_program.HasEnded() ? "has died" : "does not answer");
        if (line->starts_with("refused"))
            Fail("got no session, or no callback: " + *line + "; its own message is above");
        return *line;
    }

private:
    [[noreturn]] void Fail(std::string const& what) const
    {
        throw Trouble("client " + std::to_string(m_number) + " " + what);
    }

    int const m_number;
    Program m_program;
};

// What all the clients together have measured and found wrong.
struct Figures
{
    double seconds = 0;
    LatencyHistogram reads;
    LatencyHistogram writes;
    LatencyHistogram heard;
    std::int64_t refused = 0;
    std::int64_t lost = 0;
    std::int64_t torn = 0;
    std::int64_t missed = 0;
    std::int64_t doubled = 0;
    std::int64_t disordered = 0;

    bool IsGood() const { return refused + lost + torn + missed + doubled + disordered == 0; }
};

void Add(Figures& all, json const& one)
{
    all.reads.Add(LatencyHistogram(one.at("reads")));
    all.writes.Add(LatencyHistogram(one.at("writes")));
    all.refused += one.at("refused").get<std::int64_t>();
    all.torn += one.at("torn").get<std::int64_t>();
    if (!one.contains("heard"))
        return;
    json const& heard = one.at("heard");
    all.heard.Add(LatencyHistogram(heard.at("latency")));
    all.missed += heard.at("missed").get<std::int64_t>();
    all.doubled += heard.at("doubled").get<std::int64_t>();
    all.disordered += heard.at("disordered").get<std::int64_t>();
}

// Counts the watchers that heard all changes, but in another order than the first watcher.
std::int64_t OtherOrders(std::vector<json> const& figures)
{
    std::vector<std::uint64_t> orders;
    for (json const& one : figures)
        if (one.contains("heard") && one.at("heard").at("missed") == 0)
            orders.push_back(one.at("heard").at("order"));
    return std::count_if(orders.begin(), orders.end(), [&](auto order) { return order != orders.front(); });
}

// The changes that were acknowledged to the writers and that a new program does not find.
std::int64_t Lost(std::vector<json> const& figures, LoadTask task)
{
    task.verifies = true;
    Client verifier(task);
    verifier.Line();
    json const found = json::parse(verifier.Line(std::chrono::minutes(10)));
    std::int64_t lost = found.at("disordered");
    for (json const& one : figures)
    {
        std::size_t const number = one.at("number");
        lost += std::abs(one.at("appended").get<std::int64_t>() -
                         found.at("appended").at(number).get<std::int64_t>());
        if (auto const last = found.at("last").find(std::to_string(number)); last != found.at("last").end())
            lost += *last == one.at("last") ? 0 : 1;
    }
    return lost;
}

std::vector<json> RunClients(std::vector<LoadTask> const& tasks, double seconds)
{
    std::vector<std::unique_ptr<Client>> clients;
    for (LoadTask const& task : tasks)
        clients.push_back(std::make_unique<Client>(task));
    for (auto const& client : clients)
        client->Line();

    auto const length =
        std::chrono::duration_cast<std::chrono::nanoseconds>(std::chrono::duration<double>(seconds));
    auto const end = Program::Clock::now() + length;
    for (auto const& client : clients)
        client->Say("go " + std::to_string(std::chrono::nanoseconds(end.time_since_epoch()).count()));
    std::int64_t written = 0;
    for (auto const& client : clients)
        written += std::stoll(client->Line(length + Patience).substr(std::strlen("written ")));
    for (auto const& client : clients)
        client->Say("expect " + std::to_string(written));
    std::vector<json> figures;
    for (auto const& client : clients)
        figures.push_back(json::parse(client->Line(std::chrono::minutes(10))));
    return figures;
}

std::filesystem::path FolderOfDatabase()
{
    char const* const folder = std::getenv("COMGUI_SITE_FOLDER");
    if (folder == nullptr || *folder == '\0')
        throw Trouble("COMGUI_SITE_FOLDER is not set; set it to the folder of the site's files");
    return folder;
}

Figures Measure(Options const& options)
{
    std::unique_ptr<TemporaryFolder> temporary;
    bool const isDatabase = options.site.starts_with("postgresql://");
    if (options.site.empty())
    {
        temporary = std::make_unique<TemporaryFolder>();
        SiteClient::MakeSite(temporary->Path() / "site");
    }
    else if (isDatabase)
        SiteClient::MakeSite(FolderOfDatabase());
    std::string const folder =
        temporary ? temporary->Path() / "site" : std::filesystem::absolute(options.site);
    setenv("COMGUI_SITE", isDatabase ? options.site.c_str() : folder.c_str(), 1);

    std::vector<LoadTask> const tasks = Tasks(options);
    std::vector<json> const figures = RunClients(tasks, options.seconds);
    Figures all;
    all.seconds = options.seconds;
    for (json const& one : figures)
        Add(all, one);
    all.disordered += OtherOrders(figures);
    all.lost = Lost(figures, tasks.front());
    return all;
}

json FormOf(LatencyHistogram const& times, double seconds)
{
    return {{"count", times.Count()},
            {"per_second", static_cast<double>(times.Count()) / seconds},
            {"p50_us", static_cast<double>(times.Percentile(50)) / 1e3},
            {"p90_us", static_cast<double>(times.Percentile(90)) / 1e3},
            {"p99_us", static_cast<double>(times.Percentile(99)) / 1e3},
            {"max_us", static_cast<double>(times.Max()) / 1e3}};
}

void PrintJson(Options const& options, Figures const& all)
{
    json const form{{"clients", options.clients},
                    {"mix", options.mix},
                    {"seconds", all.seconds},
                    {"reads", FormOf(all.reads, all.seconds)},
                    {"writes", FormOf(all.writes, all.seconds)},
                    {"heard", FormOf(all.heard, all.seconds)},
                    {"refused", all.refused},
                    {"lost", all.lost},
                    {"torn", all.torn},
                    {"missed", all.missed},
                    {"doubled", all.doubled},
                    {"out_of_order", all.disordered}};
    std::cout << form.dump(2) << '\n';
}

void PrintLine(char const* name, LatencyHistogram const& times, double seconds)
{
    if (times.Count() == 0)
        return;
    json const form = FormOf(times, seconds);
    std::printf("%-8s %12.0f /s %11.1f %11.1f %11.1f %11.1f\n", name, form["per_second"].get<double>(),
                form["p50_us"].get<double>(), form["p90_us"].get<double>(), form["p99_us"].get<double>(),
                form["max_us"].get<double>());
}

void PrintText(Options const& options, Figures const& all)
{
    std::printf("%d client%s, %g s\n", options.clients, options.clients == 1 ? "" : "s", all.seconds);
    std::printf("%-8s %15s %11s %11s %11s %11s\n", "", "", "p50 us", "p90 us", "p99 us", "max us");
    PrintLine("reads", all.reads, all.seconds);
    PrintLine("writes", all.writes, all.seconds);
    PrintLine("heard", all.heard, all.seconds);
    std::printf("%lld lost, %lld torn, %lld missed, %lld doubled, %lld out of order, %lld refused\n",
                static_cast<long long>(all.lost), static_cast<long long>(all.torn),
                static_cast<long long>(all.missed), static_cast<long long>(all.doubled),
                static_cast<long long>(all.disordered), static_cast<long long>(all.refused));
}

constexpr char Footer[] = "KINDS is read, write or watch, or several with + between, as in read+watch. A "
                          "writer sets a value of its\n"
                          "own most of the time; each 8th change appends to a list that all share, each 16th "
                          "writes a table of theirs.\n"
                          "A reader reads those values, and the table as a whole. A watcher hears of the "
                          "values: \"heard\" is the time\n"
                          "from before the write in one program to the callback in another.\n"
                          "Without --site the site is a temporary folder. In a given site, the tickets "
                          "of the types 90, 91 and 93\n"
                          "are used, and stay.\n"
                          "Exit status: 0 all is well; 1 something was lost, torn, missed, doubled, out of "
                          "order or refused; 2 trouble.";

void AddOptions(CLI::App& app, Options& options)
{
    app.footer(Footer);
    app.add_option("--clients", options.clients, "How many programs (4)")->check(CLI::Range(1, 32));
    app.add_option("--mix", options.mix,
                   "KINDS,KINDS,... of the programs in turn (write,watch,read,write; with fewer than three "
                   "programs some do several)")
        ->delimiter(',')
        ->check(
            [](std::string const& kinds) -> std::string
            {
                std::istringstream parts(kinds + "+");
                for (std::string kind; std::getline(parts, kind, '+');)
                    if (kind != "read" && kind != "write" && kind != "watch")
                        return "\"" + kind + "\" is none of read, write and watch";
                return "";
            });
    app.add_option("--seconds", options.seconds, "How long (5)")->check(CLI::Range(0.01, 86400.0));
    app.add_option("--rate", options.changes, "Changes per second in total (0: as many as can be)")
        ->check(CLI::NonNegativeNumber);
    app.add_option("--read-rate", options.reads, "Reads per second in total (0: as many as can be)")
        ->check(CLI::NonNegativeNumber);
    app.add_option("--site", options.site, "The site's folder");
    app.add_option("--user", options.user, "Log in as this user (admin)");
    app.add_option("--password", options.password, "With this password (admin)");
    app.add_flag("--json", options.isJson, "Print the figures as JSON");
}

int Run(int argc, char** argv)
{
    Options options;
    CLI::App app{"Puts a site under the load of several programs at once, and measures them.", "site_load"};
    AddOptions(app, options);
    try
    {
        app.parse(argc, argv);
    }
    catch (CLI::ParseError const& error)
    {
        if (error.get_exit_code() == 0)
            return app.exit(error);
        throw Trouble(std::string(error.what()) + "; see site_load --help");
    }
    if (options.mix.empty())
        options.mix = DefaultMix(options.clients);
    Figures const all = Measure(options);
    options.isJson ? PrintJson(options, all) : PrintText(options, all);
    return all.IsGood() ? Good : Negative;
}
}  // namespace

int main(int argc, char** argv)
try
{
    if (argc == 3 && std::string_view(argv[1]) == Worker)
        return RunLoadClient(json::parse(argv[2]).get<LoadTask>());
    return Run(argc, argv);
}
catch (std::exception const& error)
{
    std::cerr << "site_load: " << error.what() << '\n';
    return Failed;
}
