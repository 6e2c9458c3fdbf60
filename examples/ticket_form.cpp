// Shows and edits the tickets of a server in a terminal, as a form of a graphical client would. The command
// line; the commands stand in a file of their own.
#include "FormCommands.h"
#include "FormValue.h"
#include "Output.h"
#include <CLI/CLI.hpp>
#include <algorithm>
#include <climits>
#include <csignal>
#include <functional>
#include <optional>

char const ProgramName[] = "ticket_form";

namespace
{
using namespace comgui;

constexpr int LargestPosition = 0xFFFFFF;
constexpr int LargestId = 0xFFFFFF;

// Decimal as people write it; CLI11 itself takes 010 for eight.
CLI::Validator NumberIn(int least, int largest)
{
    return {[=](std::string& text)
            {
                auto const number = WholeNumber(text, least, largest);
                if (!number)
                    return NumberFrom(least, largest, text);
                text = std::to_string(*number);
                return std::string();
            },
            std::to_string(least) + " to " + std::to_string(largest)};
}

void CheckField(std::string const& text) { SplitField(text); }

void CheckListField(std::string const& text)
{
    auto const [key, values] = SplitField(text);
    ValueOf(key, values, PARAM_COUNT, PARAM_STRING);
}

// What is wrong whatever the server has is found before it is asked.
CLI::Validator Checked(void (*check)(std::string const&))
{
    return {[=](std::string const& text)
            {
                try
                {
                    check(text);
                    return std::string();
                }
                catch (Refusal const& refusal)
                {
                    return std::string(refusal.what());
                }
            },
            ""};
}

class CommandLine
{
public:
    using COMMAND = std::function<void(Connection&)>;

    CommandLine()
    {
        m_app.require_subcommand(0, 1);  // none is told below, once unknown words were
        m_app.fallthrough();
        m_app.add_option("-u,--user", m_options.login.account.user, "Log in as this user")
            ->capture_default_str();
        m_app.add_option("-p,--password", m_options.login.account.password, "With this password")
            ->capture_default_str();
        m_app.add_option("-s,--server", m_options.login.server.host, "At this host")->capture_default_str();
        m_app.add_option("-o,--port", m_options.login.server.port, "And port")
            ->capture_default_str()
            ->transform(NumberIn(LeastPort, LargestPort));
        m_app.add_flag("-j,--json", m_options.json, "Print JSON");
        m_app.footer(
            "A ticket is a TYPE and an ID, as 3 1 for job 1; types are 0 the system, 2 devices, 3 jobs, 7 "
            "queues,\n12 papers, 17 users. ticket_form COMMAND --help tells more of a command.\n\n"
            "  ticket_form keys 3 1\n"
            "  ticket_form set 3 1 Job/Copies=25 'Job/Identification/Name=Spring, second run'\n"
            "  ticket_form set-list 3 1 --type text 'Job/Notes=red,\"blue, then green\"'\n\n"
            "Exit status: 0 all is well; 1 the answer is no: no such ticket or key, or a value that was "
            "refused;\n2 a wrong command line, no server, no login, or the output cannot be written.");
        AddReading();
        AddWriting();
        AddWatch();
    }

    // Nothing, or the status with which to end at once.
    std::optional<int> Parse(int argc, char** argv)
    try
    {
        m_app.parse(argc, argv);
        if (m_run)
            return std::nullopt;
        Fail("the command is missing (list, keys, get, set, set-list, delete or watch); ticket_form --help "
             "tells how");
        return Trouble;
    }
    catch (CLI::ParseError const& e)
    {
        if (e.get_exit_code() == 0)  // help
        {
            m_app.exit(e);
            return FlushOutput() ? Good : Trouble;
        }
        std::string text = e.what();
        std::replace(text.begin(), text.end(), '\n', ' ');
        Fail(text + "; ticket_form --help tells how");
        return Trouble;
    }

    OPTIONS const& Options() const { return m_options; }
    void Run(Connection& connection) const { m_run(connection); }

private:
    CLI::App* AddCommand(char const* name, char const* description, char const* footer,
                         void (*run)(Connection&, OPTIONS const&))
    {
        CLI::App* const command = m_app.add_subcommand(name, description);
        command->footer(footer);
        command->callback([this, run]
                          { m_run = [this, run](Connection& connection) { run(connection, m_options); }; });
        return command;
    }

    CLI::Option* AddType(CLI::App* command)
    {
        return command->add_option("TYPE", m_options.ticket.type, "Type of ticket")
            ->transform(NumberIn(0, TicketTypes - 1));
    }

    CLI::Option* AddId(CLI::App* command)
    {
        return command->add_option("ID", m_options.ticket.id, "Its number")
            ->transform(NumberIn(0, LargestId));
    }

    void AddTicket(CLI::App* command)
    {
        AddType(command)->required();
        AddId(command)->required();
    }

    void AddPosition(CLI::App* command, char const* description)
    {
        command->add_option("--pos", m_options.pos, description)->transform(NumberIn(0, LargestPosition));
    }

    void AddReading()
    {
        AddType(AddCommand("list", "List the tickets of a type, or of all",
                           "A line is type, id and the number of keys.", ListTickets));
        CLI::App* const keys = AddCommand("keys", "Show a ticket: its keys with their types and values",
                                          "Values are shown as JSON; null is a gap in a list.", Keys);
        AddTicket(keys);
        keys->add_option("PREFIX", m_options.key, "Only the keys that begin so");
        CLI::App* const get = AddCommand(
            "get", "Print the value of a key",
            "A text is printed without quotes, a list as one line a value, an empty one for a "
            "gap.\nControl characters become \\n, \\t, \\x1B and so on; from --json a program gets "
            "the text itself.\nFolders come as paths, without $(VARIABLE).",
            Get);
        AddTicket(get);
        get->add_option("KEY", m_options.key, "As keys shows it")->required();
        AddPosition(get, "Only the value at this position of a list, from 0 up");
    }

    void AddFields(CLI::App* command, char const* description, void (*check)(std::string const&))
    {
        AddTicket(command);
        command->add_option("KEY=VALUE", m_options.fields, description)->required()->check(Checked(check));
        command
            ->add_option("-t,--type", m_options.typeName,
                         "int, double, text, int64, unsigned or unsigned64, for new keys or another type")
            ->check(Checked([](std::string const& name) { TypeOf(name); }));
    }

    void AddWriting()
    {
        CLI::App* const set = AddCommand(
            "set", "Write values, each by the type that its key has",
            "All values are checked before one is written. A key that is not there yet needs --type.", Set);
        AddFields(set, "What to write", CheckField);
        AddPosition(set, "Write this position of a list, from 0 up");
        AddFields(
            AddCommand("set-list", "Write whole lists",
                       "KEY=a,b,c puts three values under KEY instead of what was there; KEY= deletes it. "
                       "Quotes keep\ncommas: KEY='a,\"b,c\"' are two values; a quote within quotes is "
                       "written twice.\nNothing between two commas is a gap, \"\" an empty text.",
                       SetList),
            "The key, and its values with commas between them", CheckListField);
        CLI::App* const remove =
            AddCommand("delete", "Delete a key, or one value of a list",
                       "Within a list a gap stays; at its end the list gets shorter.", Delete);
        AddTicket(remove);
        remove->add_option("KEY", m_options.key, "As keys shows it")->required();
        AddPosition(remove, "Only the value at this position, from 0 up");
    }

    void AddWatch()
    {
        CLI::App* const watch = AddCommand(
            "watch", "Print what changes in a ticket, or in all of a type, until Ctrl-C",
            "A line is type, id, key, what happened and the value. With --json each line is an object.",
            nullptr);
        watch->callback(
            [this]
            {
                m_end.emplace();  // here, before any thread; the other commands end by Ctrl-C at once
                m_run = [this](Connection& connection) { Watch(connection, m_options, *m_end); };
            });
        AddType(watch)->required();
        CLI::Option* const id = AddId(watch);
        watch->add_option("-n,--events", m_options.events, "End after so many; 0 is no limit")
            ->transform(NumberIn(0, INT_MAX));
        watch->add_flag("-e,--edit", m_options.edit, "Write lines KEY=VALUE of standard input meanwhile")
            ->needs(id);
    }

    OPTIONS m_options;
    CLI::App m_app{"Shows and edits the tickets of a server, as a form does.", ProgramName};
    COMMAND m_run;
    std::optional<EndSignals> m_end;  // of watch
};

int Run(CommandLine const& commandLine)
try
{
    Connection connection;
    if (!commandLine.Options().login.Enter(connection))
        return Trouble;
    commandLine.Run(connection);
    return Good;
}
catch (Refusal const& refusal)
{
    Fail(refusal.what());
    return Refused;
}
}  // namespace

int main(int argc, char** argv)
try
{
    std::signal(SIGPIPE, SIG_IGN);
    CommandLine commandLine;
    if (auto const status = commandLine.Parse(argc, argv))
        return *status;
    return Run(commandLine);
}
catch (std::exception const& e)
{
    Fail(e.what());
    return Trouble;
}
