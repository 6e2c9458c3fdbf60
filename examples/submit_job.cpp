// Sends files to a server as print jobs, shows how far each one has come, waits until it is there, and prints
// its ticket.
#include "CommandLine.h"
#include "Output.h"
#include "Shown.h"

#include <algorithm>
#include <chrono>
#include <climits>
#include <comgui/client.h>
#include <csignal>
#include <cstdio>
#include <optional>
#include <string>
#include <unistd.h>
#include <vector>

char const ProgramName[] = "submit_job";

namespace
{
using namespace comgui;

struct OPTIONS
{
    LOGIN login;
    JobOptions job;
    std::vector<std::string> files;  // UTF-8
};

// Nothing, or the status with which to end at once: after --help, or after a message on a wrong command line.
std::optional<int> Parse(int argc, char** argv, OPTIONS& options)
{
    wxCmdLineParser parser;
    parser.SetLogo("Sends files to a server as print jobs.\n"
                   "Exit status: 0 all of them are there; 1 one is not, or there is no such queue; 2 a wrong "
                   "command line,\nno server, no login, or the output cannot be written.");
    parser.AddSwitch("h", "help", "show this text", wxCMD_LINE_OPTION_HELP);
    LOGIN::AddOptions(parser);
    parser.AddOption("c", "copies", "print so many copies (0: as the server sees fit)");
    parser.AddOption("q", "queue", "put the jobs into the queue of that number (0: into none)");
    parser.AddParam("FILE", wxCMD_LINE_VAL_STRING, wxCMD_LINE_PARAM_MULTIPLE);
    if (auto const status = ParseCommandLine(parser, argc, argv))
        return status;
    int copies = 0;
    int queue = 0;
    if (!options.login.TakeOptions(parser) || !TakeNumber(parser, "copies", copies, 0, INT_MAX) ||
        !TakeNumber(parser, "queue", queue, 0, INT_MAX))
        return Trouble;
    if (copies != 0)
        options.job.copies = copies;
    if (queue != 0)
        options.job.queue = queue;
    for (std::size_t i = 0; i < parser.GetParamCount(); ++i)
        options.files.push_back(ToUtf8(parser.GetParam(i)));
    return std::nullopt;
}

// The same line over and over.
void Draw(TransferProgress const& progress)
{
    long long const percent = 100 * progress.done / std::max(progress.total.value_or(1), 1LL);
    std::string bar(static_cast<std::size_t>(percent) / 5, '#');
    bar.resize(20, ' ');
    std::printf("\r[%s] %3lld %%", bar.c_str(), percent);
    std::fflush(stdout);
}

// Waits for the end of the transfer; a person sees meanwhile how far it is.
Outcome WaitFor(Transfer const& job)
{
    if (isatty(STDOUT_FILENO) != 1)
        return job.Wait();
    do
        Draw(job.Progress());
    while (!job.WaitFor(std::chrono::milliseconds(100)));
    std::printf("\r%28s\r", "");
    return job.Wait();
}

bool Submit(Connection const& connection, JobOptions const& options, std::string const& file)
{
    Transfer const job = connection.GetTransfers().SendJob(file, options);
    if (Outcome const outcome = WaitFor(job); !outcome)
        return Fail(outcome.GetError().Text());
    TicketAddress const ticket{JobTickets, job.Job().value_or(0)};
    std::printf("%s: job %d, %lld bytes\n", Shown(file).c_str(), ticket.id, job.Progress().done);
    Snapshot const values = connection.GetTickets().ReadAll(ticket).ValueOr({});
    for (auto const& [key, value] : values.Entries())
        std::printf("    %-36s %s\n", Shown(key).c_str(), Shown(ToText(value)).c_str());
    FlushOutput();
    return true;
}
}  // namespace

int main(int argc, char** argv)
{
    std::signal(SIGPIPE, SIG_IGN);
    OPTIONS options;
    if (auto const status = Parse(argc, argv, options))
        return *status;
    Connection connection;
    if (!options.login.Enter(connection))
        return Trouble;
    bool areAllSent = true;
    for (std::string const& file : options.files)  // whatever becomes of one, or of the output
        areAllSent = Submit(connection, options.job, file) && areAllSent;
    if (!FlushOutput())
        return Trouble;
    return areAllSent ? Good : Refused;
}
