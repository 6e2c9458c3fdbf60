// ticketstream: a look into ticket streams, and streams out of JSON. The command line; the commands stand in
// files of their own.
#include "tools/shared/Output.h"
#include "tools/ticketstream/StreamFile.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/detect.h"
#include "tools/ticketstream/diff.h"
#include "tools/ticketstream/dump.h"
#include "tools/ticketstream/json.h"
#include "tools/ticketstream/make.h"
#include "tools/ticketstream/text.h"
#include "tools/ticketstream/whole.h"
#include <CLI/CLI.hpp>
#include <algorithm>
#include <iostream>

namespace
{
using namespace ticketstream;

enum Status
{
    Good = 0,
    Negative = 1,  // the answer is no: broken, different, no stream
    Failed = 2,    // there is no answer
};

void Complain(std::string const& text) { std::cerr << "ticketstream: " << text << '\n'; }

// What happens to one file must not keep the others from their turn.
template <typename F>
int ForEach(std::vector<std::string> const& files, F command)
{
    int status = Good;
    tools::Output out(stdout);
    for (std::string const& file : files)
        try
        {
            status = std::max(status, command(file, out));
        }
        catch (Trouble const& trouble)
        {
            Complain(trouble.what());
            status = Failed;
        }
    out.Flush();
    return status;
}

int DetectFile(std::string const& file, tools::Output& out)
{
    Kind const kind = Detect(ReadFile(file, BytesToDetect));
    out.Add(ShownName(file) + ": " + kind.name + '\n');
    return kind.isStream ? Good : Negative;
}

int DumpFile(std::string const& file, bool isOneOfMany, tools::Output& out)
{
    std::string const stream = ReadFile(file);
    if (isOneOfMany)
        out.Add("== " + ShownName(file) + '\n');
    auto const broken = Dump(stream, out);
    if (!broken)
        return Good;
    out.Flush();  // the complaint belongs behind
    Complain(ShownName(file) + ": " + broken->what());
    return Negative;
}

int Json(std::string const& file)
try
{
    tools::Output out(stdout);
    PrintJson(ReadFile(file), out);
    out.Flush();
    return Good;
}
catch (BrokenStream const& broken)
{
    Complain(ShownName(file) + ": " + broken.what() + "; dump shows what stands before");
    return Negative;
}

int Make(std::string const& file, std::string const& result)
try
{
    WriteFile(result, MakeStream(ReadFile(file)));
    return Good;
}
catch (WrongJson const& wrong)
{
    Complain(ShownName(file) + ": " + wrong.what());
    return Negative;
}

std::string WholeStream(std::string const& file)
{
    std::string stream = ReadFile(file);
    try
    {
        MustBeWhole(stream);
    }
    catch (BrokenStream const& broken)
    {
        throw Trouble(ShownName(file) + ": " + broken.what() + "; dump shows what stands before");
    }
    return stream;
}

int DiffFiles(std::string const& left, std::string const& right)
{
    if (left == "-" && right == "-")
        throw Trouble("standard input can be read only once; name a file for one of the two");
    tools::Output out(stdout);
    bool const isSame = Diff(WholeStream(left), WholeStream(right), out);
    out.Flush();
    return isSame ? Good : Negative;
}

// Sets up the parser; each command sets run to what it does.
class CommandLine
{
public:
    CommandLine()
    {
        m_app.require_subcommand(0, 1);  // none is told below, once unknown words were
        m_app.set_version_flag("--version", "ticketstream " TICKETSTREAM_VERSION);
        m_app.footer(
            "A FILE named - is standard input. ticketstream COMMAND --help tells more of a command.\n"
            "Exit status: 0 all is well; 1 the answer is no (broken, different, no stream); 2 trouble.");
        AddDetect();
        AddDump();
        AddJson();
        AddMake();
        AddDiff();
    }

    int Run(int argc, char** argv)
    {
        try
        {
            m_app.parse(Arguments(argc, argv));
        }
        catch (CLI::ParseError const& e)
        {
            if (e.get_exit_code() == 0)  // help and version
                return m_app.exit(e);
            Complain(OneLine(e.what()) + "; ticketstream --help tells how");
            return Failed;
        }
        if (std::string const missing = Missing(); !missing.empty())
        {
            Complain(missing + " is missing; ticketstream --help tells how");
            return Failed;
        }
        return m_run();
    }

private:
    CLI::App* AddCommand(char const* name, char const* description, char const* footer,
                         std::function<int()> run)
    {
        CLI::App* const command = m_app.add_subcommand(name, description);
        command->footer(footer);
        command->callback([this, run = std::move(run)] { m_run = run; });
        return command;
    }

    void AddFiles(CLI::App* command) { command->add_option("FILE", m_files, "Streams; - is standard input"); }

    // In the order in which the parser takes them, which is from the last. A name in brackets would be taken
    // for a list of names, but for its folder.
    static std::vector<std::string> Arguments(int argc, char** argv)
    {
        std::vector<std::string> arguments(std::reverse_iterator(argv + argc),
                                           std::reverse_iterator(argv + 1));
        for (std::string& argument : arguments)
            if (!argument.empty() && argument.front() == '[' && argument.back() == ']')
                argument.insert(0, "./");
        return arguments;
    }

    void AddDetect()
    {
        AddFiles(AddCommand("detect", "Tell which kind of stream each file is",
                            "Looks at the first bytes only. Exit status: 1 if a file is neither kind.",
                            [this] { return ForEach(m_files, DetectFile); }));
    }

    void AddDump()
    {
        AddFiles(
            AddCommand("dump", "Print streams item by item, payloads of containers too",
                       "Columns: offset in bytes, item, and of a value key, type, position and the value.\n"
                       "Long values are cut. Exit status: 1 if a stream is broken; it is shown up to there.",
                       [this]
                       {
                           return ForEach(m_files, [this](std::string const& file, tools::Output& out)
                                          { return DumpFile(file, m_files.size() > 1, out); });
                       }));
    }

    void AddJson()
    {
        AddCommand("json", "Print a stream as JSON, which make turns back",
                   "Exit status: 1 if the stream is broken; nothing is printed then.",
                   [this] { return Json(m_file); })
            ->add_option("FILE", m_file, "A stream; - is standard input");
    }

    void AddMake()
    {
        CLI::App* const command =
            AddCommand("make", "Make a stream of JSON, as json prints it",
                       "Exit status: 1 if no stream can be made of the JSON; nothing is written then.",
                       [this] { return Make(m_file, m_result); });
        command->add_option("FILE", m_file, "JSON; - is standard input");
        command->add_option("-o,--output", m_result, "Where the stream goes; standard output unless told");
    }

    void AddDiff()
    {
        CLI::App* const command = AddCommand("diff", "Compare two streams by what they mean",
                                             "The order of keys counts for nothing, that of the values under "
                                             "a key does; operations are compared\n"
                                             "in their order. Lines with - are of A alone, with + of B "
                                             "alone. Exit status: 1 if they differ, 2 also\n"
                                             "if one is broken.",
                                             [this] { return DiffFiles(m_file, m_other); });
        command->add_option("A", m_file, "A stream; - is standard input");
        command->add_option("B", m_other, "Another one");
    }

    // Looked for here and not by the parser, which would speak of what is missing before it spoke of an
    // option that it does not know.
    std::string Missing() const
    {
        if (m_app.get_subcommands().empty())
            return "the command (detect, dump, json, make or diff)";
        for (CLI::Option const* option : m_app.get_subcommands().front()->get_options())
            if (option->get_positional() && option->count() == 0)
                return option->get_name(true);
        return "";
    }

    static std::string OneLine(std::string text)
    {
        std::replace(text.begin(), text.end(), '\n', ' ');
        return text;
    }

    CLI::App m_app{"Looks into ticket streams, and makes them of JSON.", "ticketstream"};
    std::vector<std::string> m_files;
    std::string m_file;
    std::string m_other;
    std::string m_result = "-";
    std::function<int()> m_run;
};
}  // namespace

int main(int argc, char** argv)
try
{
    return CommandLine().Run(argc, argv);
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
catch (std::exception const& e)
{
    Complain(e.what());
    return Failed;
}
