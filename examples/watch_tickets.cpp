// Watches a server: prints what changes in its tickets as it comes, and leaves in good order on Ctrl-C. With
// --busy a second client changes tickets meanwhile, so that there is something to see.
#include "CommandLine.h"
#include "EndSignals.h"
#include "Output.h"
#include "Shown.h"

#include <chrono>
#include <climits>
#include <comgui/client.h>
#include <csignal>
#include <cstdio>
#include <exception>
#include <optional>
#include <string>
#include <thread>
#include <wx/datetime.h>

char const ProgramName[] = "watch_tickets";

namespace
{
using namespace comgui;

struct OPTIONS
{
    LOGIN login;
    int events = 0;  // leave after so many; 0: on Ctrl-C only
    bool busy = false;
};

// Nothing, or the status with which to end at once: after --help, or after a message on a wrong command line.
std::optional<int> Parse(int argc, char** argv, OPTIONS& options)
{
    wxCmdLineParser parser;
    parser.SetLogo("Prints what changes in the tickets of a server, until Ctrl-C.\n"
                   "Exit status: 0 all is well; 2 a wrong command line, no server, no login, or the output "
                   "cannot be written.");
    parser.AddSwitch("h", "help", "show this text", wxCMD_LINE_OPTION_HELP);
    parser.AddSwitch("b", "busy", "change tickets meanwhile, in a second session (as operator)");
    LOGIN::AddOptions(parser);
    parser.AddOption("n", "events", "leave after so many events (0: no limit)");
    if (auto const status = ParseCommandLine(parser, argc, argv))
        return status;
    if (!options.login.TakeOptions(parser) || !TakeNumber(parser, "events", options.events, 0, INT_MAX))
        return Trouble;
    options.busy = parser.Found("busy");
    return std::nullopt;
}

std::string TextOf(std::optional<Value> const& value)
{
    if (!value)
        return "(changed)";
    if (value->IsNone())
        return "(deleted)";
    return value->Type() == PARAM_STRING ? "\"" + ToText(*value) + "\"" : ToText(*value);
}

// Prints events, each on a line, or on one for each key.
class Printer
{
public:
    explicit Printer(int limit) : m_limit(limit) {}

    void Print(Event const& event)
    {
        std::visit([this](auto const& what) { Take(what); }, event);
    }

private:
    void Take(TicketCreated const& created) { Print(created.ticket, "(created)"); }
    void Take(TicketDeleted const& deleted) { Print(deleted.ticket, "(deleted)"); }
    void Take(TicketChanged const& changed)
    {
        if (changed.isWhole)
            Print(changed.ticket, "(many keys)");
        for (auto const& [key, value] : changed.keys)
            Print(changed.ticket, key + " " + TextOf(value));
    }
    void Take(ManyTicketsChanged many) { Print("many tickets of type " + std::to_string(many.type)); }
    void Take(TransferProgressed const&) {}
    void Take(TransferEnded const&) {}
    void Take(ServerLost const& lost) { Print(lost.error.Text()); }
    void Take(ServerBack) { Print("the server is back"); }

    void Print(TicketAddress ticket, std::string const& what)
    {
        Print("ticket " + std::to_string(ticket.type) + "/" + std::to_string(ticket.id) + "  " + what);
    }
    void Print(std::string const& what)
    {
        if (m_isOver)
            return;  // what still comes while the program is leaving
        std::printf("%s  %s\n", ToUtf8(wxDateTime::UNow().Format("%H:%M:%S.%l")).c_str(),
                    Shown(what).c_str());
        bool const isWritten = FlushOutput();
        m_isOver = ++m_printed == m_limit || !isWritten;
        if (m_isOver)
            EndSignals::Raise();
    }

    int const m_limit;
    int m_printed = 0;
    bool m_isOver = false;
};

// Another client, which has one job after another.
class BusyClient
{
public:
    BusyClient() = default;
    BusyClient(BusyClient const&) = delete;
    BusyClient& operator=(BusyClient const&) = delete;
    ~BusyClient() { DeleteJob(); }

    bool Enter(Server const& server) { return LOGIN{server, {"operator", "operator"}}.Enter(m_connection); }

    void Work()
    {
        DeleteJob();
        auto const job = m_tickets.Create(JobTickets);
        if (!job)
            return;
        m_job = *job;
        ++m_round;
        (void)m_tickets.WriteAll(*job, {{"Job/Identification/Name", "Brochure " + std::to_string(m_round)},
                                        {"Job/Copies", 100 * m_round},
                                        {"Job/Progress", 12.5}});
    }

private:
    void DeleteJob()
    {
        if (m_job)
            (void)m_tickets.Delete(*m_job);
        m_job.reset();
    }

    Connection m_connection;
    Tickets const m_tickets = m_connection.GetTickets();
    std::optional<TicketAddress> m_job;
    int m_round = 0;
};

// Until the user, the limit or the output ends it.
void Watch(Connection& connection, OPTIONS const& options, BusyClient& busy, EndSignals const& end)
{
    Printer printer(options.events);
    TaskQueue events;
    Subscription const subscription =
        connection.Subscribe(Interest::InAllTypes(), events.GetExecutor(),
                             [&printer](Event const& event) { printer.Print(event); });
    std::printf("Watching %s as %s; Ctrl-C ends it.\n", Shown(options.login.server.host).c_str(),
                Shown(options.login.account.user).c_str());
    if (!FlushOutput())
        return;
    std::thread printing([&events] { events.Run(); });
    while (!end.WaitFor(std::chrono::milliseconds(500)))
        if (options.busy)
            busy.Work();
    events.Stop();
    printing.join();
    std::puts("\nLeaving.");
}
}  // namespace

int main(int argc, char** argv)
try
{
    std::signal(SIGPIPE, SIG_IGN);
    EndSignals const end;
    OPTIONS options;
    if (auto const status = Parse(argc, argv, options))
        return *status;
    Connection connection;
    BusyClient busy;
    if (!options.login.Enter(connection) || (options.busy && !busy.Enter(options.login.server)))
        return Trouble;
    Watch(connection, options, busy, end);
    return FlushOutput() ? Good : Trouble;
}
catch (std::exception const& e)  // such as no thread to be had
{
    Fail(e.what());
    return Trouble;
}
