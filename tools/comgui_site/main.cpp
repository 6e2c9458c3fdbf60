// comgui_site: looks after a site of the stand-in server. The command line; what the commands do stands in
// commands.cpp.
#include "standin/server/store/Store.h"
#include "tools/comgui_site/Interrupts.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/commands.h"
#include "tools/shared/Output.h"
#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <climits>
#include <iostream>
#include <sstream>

namespace
{
using namespace comgui_site;

enum Status
{
    Good = 0,
    Failed = 1,  // what was asked for was not done, or problems were found
    Wrong = 2,   // the command line is wrong
};

constexpr std::string_view Commands[] = {"info", "check",  "users",  "passwd", "backup", "restore",
                                         "copy", "export", "import", "follow", "trouble"};

void Complain(std::string text)
{
    std::replace(text.begin(), text.end(), '\n', ' ');
    std::cerr << "comgui_site: " << Cleaned(text) << '\n';
}

bool IsCommand(std::string_view word)
{
    return std::find(std::begin(Commands), std::end(Commands), word) != std::end(Commands);
}

// Sets up the parser; each command sets m_run to what it does.
class CommandLine
{
public:
    CommandLine()
    {
        m_app.require_subcommand(0, 1);  // none is noted below, once unknown words were
        m_app.set_version_flag("--version", "comgui_site " COMGUI_SITE_VERSION);
        m_app.add_option("--site", m_request.site, "The folder of the site, or its database")
            ->type_name("SITE")
            ->expected(1);
        m_app.footer(
            "SITE is the folder of the site: the word before the command, unless that is the name of a "
            "command "
            "itself (then\nwrite ./info, or --site info). Without it: $COMGUI_SITE, or else comgui/site in "
            "$XDG_DATA_HOME (~/.local/share).\nA site in a database is named "
            "postgresql://USER@HOST/DATABASE, "
            "and $COMGUI_SITE_FOLDER is the folder of its files.\nOther programs may have the site open, but "
            "for restore and copy. comgui_site COMMAND --help describes a command.\n"
            "Exit status: 0 done; 1 failed, or problems were found; 2 the command line is wrong.");
        AddLooks();
        AddUsers();
        AddDatabase();
        AddTickets();
        AddTrouble();
    }

    int Run(int argc, char** argv)
    {
        try
        {
            m_app.parse(Arguments(argc, argv));
            if (std::string const missing = Missing(); !missing.empty())
                throw WrongUse(missing + " is missing");
            ReadChoices();
        }
        catch (CLI::ParseError const& e)
        {
            if (e.get_exit_code() != 0)
                throw WrongUse(e.what());
            return Show(e);
        }
        return m_run(m_request);
    }

private:
    using Command = int (*)(Request const&);

    CLI::App* Add(CLI::App& parent, char const* name, char const* description, char const* footer,
                  Command run)
    {
        CLI::App* const command = parent.add_subcommand(name, description);
        command->footer(footer);
        command->callback(
            [this, command, run]
            {
                if (command->get_subcommands().empty())
                    m_run = run;
            });
        return command;
    }

    void AddJson(CLI::App* command) { command->add_flag("--json", m_request.isJson, "Print JSON"); }
    void AddForce(CLI::App* command)
    {
        command->add_flag("--force", m_request.force, "Replace files that are there already");
    }
    void AddName(CLI::App* command) { command->add_option("NAME", m_request.user.name, "A user"); }

    void AddLooks()
    {
        AddJson(
            Add(m_app, "info", "Show what the site holds and which programs have it open",
                "This program itself is not listed. In JSON, sizes are in bytes and times in seconds since "
                "1970.",
                RunInfo));
        AddJson(Add(m_app, "check", "Look for damage and contradictions in the whole site",
                    "Prints a line for each problem. Exit status: 1 if there is any.", RunCheck));
        CLI::App* const follow = Add(
            m_app, "follow", "Print the changes of tickets as they are made",
            "A line a change: its number, the program that made it, write, create or delete, the ticket, and "
            "the values. KEY=VALUE\nis a whole key anew, KEY[POS]=VALUE one of its values. In JSON, an "
            "object a "
            "line; one with \"lost\" stands for changes\nthat are no longer in the journal. Ends by Ctrl-C, "
            "or "
            "when nobody reads the output any more.",
            RunFollow);
        follow->add_option("--since", m_since, "Begin behind the change with this number; 0: with the oldest")
            ->type_name("N");
        AddJson(follow);
    }

    void AddUsers()
    {
        CLI::App* const users =
            Add(m_app, "users", "List users, or add, remove and change them",
                "users alone lists the users. Role 16 is an administrator, 1 an operator.", RunUsers);
        users->require_subcommand(0, 1);
        AddJson(users);
        CLI::App* const add = Add(*users, "add", "Add a user",
                                  "Asks for the password twice, or reads one line from a pipe. Makes the "
                                  "user's own ticket 17/ID if "
                                  "it is missing.",
                                  RunUsersAdd);
        AddName(add);
        add->add_option("--role", m_request.user.role, "16: administrator, 1: operator (default)")
            ->check(CLI::Range(0, INT_MAX))
            ->type_name("N");
        add->add_option("--ticket", m_request.user.ticket,
                        "The id of the user's own ticket; default: the next")
            ->check(CLI::Range(0, standin::LargestId))
            ->type_name("ID");
        CLI::App* const remove =
            Add(*users, "remove", "Remove a user, with the user's own ticket",
                "The last administrator cannot be removed. Sessions that are open go on.", RunUsersRemove);
        AddName(remove);
        remove->add_flag("--keep-ticket", m_request.keepTicket, "Do not delete the user's own ticket");
        CLI::App* const role = Add(*users, "role", "Give a user another role",
                                   "The last administrator keeps that role.", RunUsersRole);
        AddName(role);
        role->add_option("N", m_request.user.role, "16: administrator, 1: operator")
            ->check(CLI::Range(0, INT_MAX));
        AddName(
            Add(m_app, "passwd", "Set the password of a user",
                "Asks for the password twice, or reads one line from a pipe: comgui_site passwd NAME <file",
                RunPasswd));
    }

    void AddDatabase()
    {
        CLI::App* const backup = Add(m_app, "backup", "Copy the database to one file, while programs work",
                                     "Tickets, users and, of a site in a folder, the journal, as of one "
                                     "moment. The file is readable by "
                                     "you alone, and has\nits name only when it is whole. The folders of "
                                     "files, job/ among them, are not "
                                     "in it.",
                                     RunBackup);
        backup->add_option("FILE", m_request.file, "The new file");
        AddForce(backup);
        Add(m_app, "restore", "Make a backup the database of the site",
            "No program may have the site open. The file is checked first. The old database is not deleted: "
            "it "
            "gets the name\nsite.db.replaced-DATE-TIME, or in a database its schema "
            "comgui_replaced_DATE_TIME. A "
            "missing site is made. The\nfolders of files stay, but those of jobs that are not in the backup "
            "move to job.replaced-DATE-TIME/.",
            RunRestore)
            ->add_option("FILE", m_request.file, "A file that backup has written");
        CLI::App* const copy = Add(
            m_app, "copy", "Make the same site at another place",
            "FROM and TO are named as SITE is; one of them may be a database, so this moves a site from a "
            "folder to a database\nor back. No program may have FROM open, and TO must be new: its folder "
            "is empty or missing. Tickets, users and files\nare copied and then compared; only then TO is "
            "there. FROM stays as it is: delete it when you no longer need it.",
            RunCopy);
        copy->add_option("FROM", m_request.from, "The site that is there");
        copy->add_option("TO", m_request.to, "The new one");
    }

    void AddTickets()
    {
        CLI::App* const export_ = Add(
            m_app, "export", "Write tickets as XML",
            "Nothing chosen: all. A single TYPE/ID gives a ticket file. Otherwise, without -o and to a file, "
            "one "
            "<site> holds\nevery ticket; to a folder, each gets a file TYPE_ID.xml. A folder is what is one "
            "already, or what ends with a slash.\nimport reads all of these. Users are not in them.",
            RunExport);
        export_->add_option("TYPE[/ID]", m_choices, "Tickets, or all of a type");
        export_->add_option("-o,--output", m_request.output, "A file, or a folder with a slash at the end")
            ->type_name("WHERE");
        AddForce(export_);
        CLI::App* const import_ = Add(
            m_app, "import", "Bring tickets from XML into the site",
            "Ticket files with type and id, and what export has written. All files are read first; a mistake "
            "in "
            "one of them stops\nthe import before anything is written. Then each ticket is written as a "
            "whole "
            "or not at all. A key of the file gets\nexactly the values that it has there; other keys of the "
            "ticket stay, or go with --replace. System/InstallFolder\nstays as it is.",
            RunImport);
        import_->add_option("FILE", m_request.files, "XML files");
        import_->add_flag_callback(
            "--replace", [this] { m_request.mode = TicketCommits::Mode::Replace; },
            "Delete the keys that the file does not have");
        AddJson(import_);
    }

    void AddTrouble()
    {
        CLI::App* const trouble = Add(
            m_app, "trouble", "Let the servers of the site misbehave, to test clients",
            "trouble alone lists the rules. They are for every program that has the site open, until they "
            "are removed or end.",
            RunTrouble);
        trouble->require_subcommand(0, 1);
        AddJson(trouble);
        Add(*trouble, "add", "Add a rule",
            "RULE begins with what is to happen:\n"
            "  fail [code=N]             calls fail; entries answer 112, or N\n"
            "  delay by=250ms            calls take longer\n"
            "  away [sessions=lost]      as if there were no server; with its sessions lost when it is back\n"
            "  late by=2s, twice, lost, swapped\n"
            "                            so notifications come\n"
            "  stall by=1m [at=50%]      transfers stand still\n"
            "  full                      the server's disk is full\n"
            "and says of which: call=NAME (of an entry, a slot or a command, with * and ?), ticket=TYPE/ID, "
            "ticket=TYPE/*, user=NAME,\nnth=N, share=10%, seed=N, times=N; each program counts for itself. "
            "for=30s ends the rule.\n"
            "Examples: trouble add fail call=MSETPARAMETER share=5%; trouble add away for=10s sessions=lost",
            RunTroubleAdd)
            ->add_option("RULE", m_request.rule, "A rule, in words");
        Add(*trouble, "remove", "Remove a rule", "trouble lists the rules with their numbers.",
            RunTroubleRemove)
            ->add_option("N", m_request.number, "The number of the rule");
        Add(*trouble, "clear", "Remove all rules", "", RunTroubleClear);
    }

    // In the order in which the parser takes them, which is from the last. The site before the command
    // becomes an option. A name in brackets would be taken for a list of names, but for its folder.
    static std::vector<std::string> Arguments(int argc, char** argv)
    {
        std::vector<std::string> arguments(argv + 1, argv + argc);
        if (arguments.size() > 1 && !IsCommand(arguments[0]) && !arguments[0].starts_with('-') &&
            (IsCommand(arguments[1]) || arguments[1].starts_with('-')))
            arguments.insert(arguments.begin(), "--site");
        for (std::string& argument : arguments)
            if (!argument.empty() && argument.front() == '[' && argument.back() == ']')
                argument.insert(0, "./");
        std::reverse(arguments.begin(), arguments.end());
        return arguments;
    }

    // Looked for here and not by the parser, which would speak of what is missing before it spoke of an
    // option that it does not know.
    std::string Missing() const
    {
        CLI::App const* command = &m_app;
        while (!command->get_subcommands().empty())
            command = command->get_subcommands().front();
        if (command == &m_app)
            return "the command (info, check, users, passwd, backup, restore, copy, export, import, "
                   "follow or trouble)";
        for (CLI::Option const* option : command->get_options())
            if (option->get_positional() && option->count() == 0 && option->get_name(true) != "TYPE[/ID]")
                return option->get_name(true);
        return "";
    }

    void ReadChoices()
    {
        for (std::string const& text : m_choices)
        {
            auto const choice = ChoiceOf(text);
            if (!choice)
                throw WrongUse(text + " names no ticket; write TYPE or TYPE/ID, as in 3 or 3/12");
            m_request.tickets.push_back(*choice);
        }
        if (!m_since)
            return;
        std::uint64_t since = 0;
        std::string const& text = *m_since;
        auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), since);
        if (error != std::errc() || end != text.data() + text.size())
            throw WrongUse("--since: \"" + text + "\" is no number of a change");
        m_request.since = since;
    }

    // Help or version.
    int Show(CLI::ParseError const& asked)
    {
        std::ostringstream text;
        m_app.exit(asked, text, text);
        tools::Output out(stdout);
        out.Add(text.str());
        out.Flush();
        return Good;
    }

    CLI::App m_app{"Looks after a site of the stand-in server.", "comgui_site"};
    Request m_request;
    std::vector<std::string> m_choices;
    std::optional<std::string> m_since;
    Command m_run = nullptr;
};

int Run(int argc, char** argv)
try
{
    return CommandLine().Run(argc, argv);
}
catch (WrongUse const& wrong)
{
    Complain(std::string(wrong.what()) + "; comgui_site --help describes the commands");
    return Wrong;
}
catch (ClosedPipe const&)
{
    return Failed;  // whoever closed it knows
}
catch (std::bad_alloc const&)
{
    Complain("not enough memory");
    return Failed;
}
catch (Interrupted const&)
{
    return Failed;
}
catch (std::exception const& error)
{
    Complain(error.what());
    return Failed;
}
}  // namespace

int main(int argc, char** argv)
{
    Interrupts::Watch();
    int const status = Run(argc, argv);
    if (status != Good && Interrupts::HaveCome())
        Interrupts::End();
    return status;
}
