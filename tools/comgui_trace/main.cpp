// comgui_trace: starts programs under a trace of what passes between the library and its plug-in, and shows
// what was written. The command line.
#include "tools/comgui_trace/CallText.h"
#include "tools/comgui_trace/Difference.h"
#include "tools/comgui_trace/Start.h"
#include "tools/comgui_trace/Summary.h"
#include "tools/shared/Output.h"
#include "tools/shared/Trouble.h"
#include "tools/shared/text.h"
#include <CLI/CLI.hpp>
#include <algorithm>
#include <chrono>
#include <csignal>
#include <fnmatch.h>
#include <iostream>
#include <thread>

namespace
{
using namespace tracing;
using tools::Trouble;

enum Status
{
    Good = 0,
    Differs = 1,
    Failed = 2,
};

struct Request
{
    StartOptions start{};
    std::string file{};
    std::string other{};
    std::vector<std::string> calls{};
    std::vector<std::string> keys{};
    std::vector<unsigned> threads{};
    double slower = 0;  // milliseconds
    std::string onOrOff{};
    bool isFailedOnly = false;
    bool isFollowed = false;
    bool hasDetails = false;
    bool isJson = false;
};

bool FitsOne(std::vector<std::string> const& patterns, std::string const& text)
{
    return std::any_of(patterns.begin(), patterns.end(),
                       [&text](std::string const& pattern)
                       { return fnmatch(pattern.c_str(), text.c_str(), 0) == 0; });
}

// A key among the arguments, or in the details.
bool HasKey(TracedCall const& call, std::vector<std::string> const& patterns)
{
    auto const fits = [&patterns](Field const& field)
    {
        auto const* const text = std::get_if<Text>(&field);
        return text && FitsOne(patterns, text->here);
    };
    auto const names = NamesIn(TextOf(call.began.head.call).arguments);
    for (std::size_t i = 0; i < call.began.fields.size() && i < names.size(); ++i)
        if (names[i] == "key" && fits(call.began.fields[i]))
            return true;
    return std::any_of(call.details.begin(), call.details.end(),
                       [&fits](Record const& detail)
                       { return !detail.fields.empty() && fits(detail.fields[0]); });
}

bool IsWanted(Request const& request, TracedCall const& call)
{
    if (!request.calls.empty() && !FitsOne(request.calls, TextOf(call.began.head.call).name))
        return false;
    if (!request.keys.empty() && !HasKey(call, request.keys))
        return false;
    bool const isOfThread =
        request.threads.empty() || std::find(request.threads.begin(), request.threads.end(),
                                             call.began.head.thread) != request.threads.end();
    if (!isOfThread || (request.isFailedOnly && call.hasEnded && call.isGood))
        return false;
    return !call.hasEnded || static_cast<double>(call.duration) >= request.slower * 1e6;
}

void ShowCall(Request const& request, TracedCall const& call, tools::Output& out)
{
    if (!IsWanted(request, call))
        return;
    out.Add(request.isJson
                ? ToJson(call).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace) + "\n"
                : Line(call, out, request.hasDetails));
}

// Until the program has ended.
void Follow(TraceFile& trace, CallReader& reader, tools::Output& out)
{
    auto const runs = [&trace] { return kill(static_cast<pid_t>(trace.Head().process), 0) == 0; };
    for (bool isLast = false; !isLast;)
    {
        isLast = !runs();  // asked first: what it wrote before its end is read below
        for (Record record; trace.Next(record);)
            reader.Add(record);
        out.Flush();
        if (!isLast)
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
}

void TellOfDropped(unsigned long long dropped)
{
    if (dropped)
        std::cerr << "comgui_trace: " << dropped
                  << " records were dropped: they came faster than they could be written\n";
}

int Show(Request const& request)
{
    tools::Output out(stdout);
    CallReader reader([&](TracedCall const& call) { ShowCall(request, call, out); });
    TraceFile trace(request.file);
    if (request.isFollowed)
        Follow(trace, reader, out);
    for (Record record; trace.Next(record);)
        reader.Add(record);
    for (Record const& record : trace.Rest())
        reader.Add(record);
    reader.Finish();
    out.Flush();
    TellOfDropped(reader.Dropped());
    return Good;
}

int Summarise(Request const& request)
{
    Summary summary;
    CallReader reader([&summary](TracedCall const& call) { summary.Add(call); });
    ForEach(request.file, [&reader](Record const& record) { reader.Add(record); });
    reader.Finish();
    tools::Output out(stdout);
    out.Add(request.isJson ? summary.Json(reader.Dropped()).dump(4) + "\n" : summary.Text(reader.Dropped()));
    out.Flush();
    return Good;
}

std::vector<std::string> EssencesOf(Request const& request, std::string const& file)
{
    std::vector<std::string> lines;
    CallReader reader(
        [&](TracedCall const& call)
        {
            if (IsWanted(request, call))
                lines.push_back(Essence(call));
        });
    ForEach(file, [&reader](Record const& record) { reader.Add(record); });
    reader.Finish();
    TellOfDropped(reader.Dropped());
    return lines;
}

int Compare(Request const& request)
{
    constexpr std::size_t Around = 2;
    auto const before = EssencesOf(request, request.file);
    auto const after = EssencesOf(request, request.other);
    tools::Output out(stdout);
    auto const lines = Difference(before, after, Around);
    for (DifferingLine const& line : lines)
        out.Add(line.kind == DifferingLine::Same ? "  " + *line.line + "\n"
                : line.kind == DifferingLine::Removed
                    ? out.Painted(tools::Colour::Removed, "- " + *line.line) + "\n"
                    : out.Painted(tools::Colour::Added, "+ " + *line.line) + "\n");
    out.Flush();
    return lines.empty() ? Good : Differs;
}

void AddFilters(CLI::App& command, Request& request)
{
    auto const all = CLI::MultiOptionPolicy::TakeAll;
    command.add_option("--call", request.calls, "Calls of this name only, MSET* for instance")
        ->type_name("PATTERN")
        ->expected(1)
        ->multi_option_policy(all);
    command.add_option("--key", request.keys, "Calls that name such a key only")
        ->type_name("PATTERN")
        ->expected(1)
        ->multi_option_policy(all);
    command.add_option("--thread", request.threads, "Calls of this thread only")
        ->type_name("ID")
        ->expected(1)
        ->multi_option_policy(all);
    command.add_option("--slower", request.slower, "Calls that took at least as long only")->type_name("MS");
    command.add_flag("--failed", request.isFailedOnly, "Calls that failed, or never ended, only");
}

CLI::App* AddRun(CLI::App& app, Request& request)
{
    CLI::App* const command =
        app.add_subcommand("run", "Start PROGRAM with a trace between it and its plug-in");
    command
        ->add_option("-o,--output", request.start.file,
                     "The trace; comgui-%p.trace if not given, %p: the process")
        ->type_name("FILE");
    command
        ->add_option("--bundle", request.start.bundle, "The plug-in; the one that PROGRAM opens if not given")
        ->type_name("BUNDLE");
    command->add_flag("--off", request.start.isOff, "Begin switched off");
    command->add_option("PROGRAM", request.start.program, "The program and its arguments, behind --")
        ->required();
    return command;
}

int Run(int argc, char** argv)
{
    Request request;
    CLI::App app("Traces what passes between libcomgui and its plug-in.", "comgui_trace");
    app.set_version_flag("--version", "comgui_trace " COMGUI_TRACE_VERSION);
    app.require_subcommand(1);
    app.footer(
        "Passwords are never written. Exit status: 0; 1 two traces differ; 2 it could not be done. run\n"
        "ends as PROGRAM does.");
    CLI::App* const run = AddRun(app, request);
    CLI::App* const show = app.add_subcommand("show", "Print the calls of a trace");
    CLI::App* const summary = app.add_subcommand("summary", "Count the calls, and tell how long they took");
    CLI::App* const diff =
        app.add_subcommand("diff", "Compare two traces but for times, threads and addresses");
    CLI::App* const turn = app.add_subcommand("switch", "Switch the trace of a running program on or off");
    for (CLI::App* const command : {show, summary, diff, turn})
        command->add_option("FILE", request.file, "The trace")->required();
    for (CLI::App* const command : {show, diff})
        AddFilters(*command, request);
    for (CLI::App* const command : {show, summary})
        command->add_flag("--json", request.isJson, command == show ? "A JSON object a line" : "As JSON");
    show->add_flag("-f,--follow", request.isFollowed, "Go on until the program ends");
    show->add_flag("-d,--details", request.hasDetails, "Print records of tables and walks, too");
    diff->add_option("OTHER", request.other, "The other trace")->required();
    turn->add_option("WHAT", request.onOrOff, "on or off")->required()->check(CLI::IsMember({"on", "off"}));
    try
    {
        app.parse(argc, argv);
    }
    catch (CLI::ParseError const& e)
    {
        if (e.get_exit_code() == 0)
            return app.exit(e);
        throw Trouble(std::string(e.what()) + "; comgui_trace --help shows how");
    }
    if (*run)
        Start(request.start);
    if (*turn)
        return Switch(request.file, request.onOrOff == "on"), Good;
    if (*summary)
        return Summarise(request);
    return *diff ? Compare(request) : Show(request);
}
}  // namespace

int main(int argc, char** argv)
try
{
    return Run(argc, argv);
}
catch (tools::ClosedPipe const&)
{
    return Good;
}
catch (std::exception const& error)
{
    std::string text = error.what();
    std::replace(text.begin(), text.end(), '\n', ' ');
    std::cerr << "comgui_trace: " << text << '\n';
    return Failed;
}
