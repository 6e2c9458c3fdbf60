// comgui_validate: holds a communication plug-in against its contract. The command line.
#include "tools/comgui_validate/Check.h"
#include "tools/comgui_validate/Contract.h"
#include "tools/comgui_validate/Report.h"
#include "tools/comgui_validate/Run.h"
#include "tools/shared/Output.h"
#include "tools/shared/Trouble.h"
#include "tools/shared/text.h"
#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fnmatch.h>
#include <fstream>
#include <iostream>
#include <unistd.h>

namespace
{
using namespace validate;

enum Status
{
    Good = 0,
    Bad = 1,     // a rule is broken
    Failed = 2,  // nothing can be said
};

void Complain(std::string text)
{
    std::replace(text.begin(), text.end(), '\n', ' ');
    std::cerr << "comgui_validate: " << text << '\n';
}

struct Request
{
    Options options{};
    std::string server{};
    std::string passwordFile{};
    std::vector<std::string> only{};
    std::vector<std::string> more{};
    double limit = 20;
    std::string junit{};
    bool isList = false;
    bool isRules = false;
    bool isJson = false;
};

std::string Footer()
{
    std::string text = "NAME of --option:\n";
    for (auto const& [name, meaning] : OptionNames())
        text += "  " + std::string(name) + std::string(16 - std::string(name).size(), ' ') + meaning + '\n';
    return text + "\nThe password may also stand in $COMGUI_PASSWORD. A PATTERN is the name of a check with "
                  "* and ?.\n"
                  "Each check runs in a process of its own, makes tickets and files of its own, and deletes "
                  "them; those\n"
                  "that need a login are skipped without --user. Use a test server.\n"
                  "Exit status: 0 no rule is broken; 1 one is; 2 the validation could not run.";
}

void AddOptions(CLI::App& app, Request& request)
{
    app.set_version_flag("--version", "comgui_validate " COMGUI_VALIDATE_VERSION);
    app.add_option("BUNDLE", request.options.bundle, "The folder of the plug-in, ComGUI.Bundle");
    app.add_option("--server", request.server, "Where the server is; localhost:50000 if not given")
        ->type_name("HOST:PORT");
    app.add_option("--user", request.options.user, "Who logs in")->type_name("NAME");
    app.add_option("--password", request.options.password, "Others on this machine can read it here")
        ->type_name("TEXT");
    app.add_option("--password-file", request.passwordFile, "A file whose first line is the password")
        ->type_name("FILE");
    app.add_option("--option", request.more, "Something about the server, see below")
        ->type_name("NAME=VALUE")
        ->expected(1)
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll);
    app.add_option("--only", request.only, "Run these checks only; may be given several times")
        ->type_name("PATTERN")
        ->expected(1)
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll);
    app.add_option("--limit", request.limit, "Seconds that a check may take; 20 if not given")
        ->type_name("SECONDS");
    app.add_flag("--list", request.isList, "Print the names of the checks and the rules they test");
    app.add_flag("--rules", request.isRules, "Print the rules and the checks that test them");
    app.add_flag("--json", request.isJson, "Print the results as JSON");
    app.add_option("--junit", request.junit, "Write the results as JUnit's XML, too")->type_name("FILE");
    app.footer(Footer());
}

void TakeServer(Request& request)
{
    if (request.server.empty())
        return;
    auto const colon = request.server.rfind(':');
    std::string const port = colon == std::string::npos ? "50000" : request.server.substr(colon + 1);
    request.options.host = request.server.substr(0, colon);
    bool const isNumber =
        !port.empty() && port.size() <= 5 &&
        std::all_of(port.begin(), port.end(), [](unsigned char c) { return c >= '0' && c <= '9'; });
    request.options.port = isNumber ? std::stoi(port) : 0;
    if (request.options.host.empty() || request.options.port < 1 || request.options.port > 65535)
        throw tools::Trouble("--server is HOST:PORT, not " + tools::Shown(request.server));
}

void TakePassword(Request& request)
{
    if (!request.passwordFile.empty())
    {
        std::ifstream file(request.passwordFile);
        if (!std::getline(file, request.options.password))
            throw tools::Trouble("no password can be read from " + tools::ShownName(request.passwordFile));
    }
    else if (char const* const password = std::getenv("COMGUI_PASSWORD");
             password && request.options.password.empty())
        request.options.password = password;
}

void TakeMore(Request& request)
{
    auto const& known = OptionNames();
    for (std::string const& option : request.more)
    {
        auto const sign = option.find('=');
        std::string const name = option.substr(0, sign);
        bool const isKnown = std::any_of(known.begin(), known.end(),
                                         [&name](OptionName const& each) { return name == each.name; });
        if (sign == std::string::npos || !isKnown)
            throw tools::Trouble("--option " + tools::Shown(option) +
                                 " is none; comgui_validate --help lists them");
        request.options.more[name] = option.substr(sign + 1);
    }
    if (!(request.limit > 0) || request.limit > 3600)
        throw tools::Trouble("--limit is a number of seconds, at most 3600");
    request.options.limit = std::chrono::milliseconds(static_cast<long>(request.limit * 1000));
}

bool Fits(std::string const& check, std::string const& pattern)
{
    return fnmatch(pattern.c_str(), check.c_str(), 0) == 0;
}

std::vector<Check> Chosen(Request const& request)
{
    for (std::string const& pattern : request.only)
        if (std::none_of(Checks().begin(), Checks().end(),
                         [&pattern](Check const& check) { return Fits(check.name, pattern); }))
            throw tools::Trouble("no check is called " + tools::Shown(pattern) +
                                 "; comgui_validate --list names them");
    std::vector<Check> chosen;
    for (Check const& check : Checks())
        if (request.only.empty() ||
            std::any_of(request.only.begin(), request.only.end(),
                        [&check](auto const& each) { return Fits(check.name, each); }))
            chosen.push_back(check);
    return chosen;
}

int List(Request const& request)
{
    tools::Output out(stdout);
    for (Check const& check : Chosen(request))
    {
        std::string rules;
        for (Rule const& rule : Rules())
            if (std::find(rule.checks.begin(), rule.checks.end(), check.name) != rule.checks.end())
                rules += " " + rule.name;
        out.Add(check.name + rules + '\n');
    }
    out.Flush();
    return Good;
}

int PrintRules()
{
    tools::Output out(stdout);
    for (Rule const& rule : Rules())
    {
        std::string checks;
        for (std::string const& check : rule.checks)
            checks += " " + check;
        out.Add(out.Painted(tools::Colour::Item, rule.name) + "  " + rule.text + "\n    " +
                out.Painted(tools::Colour::Quiet, "checked by" + checks) + '\n');
    }
    out.Flush();
    return Good;
}

// On a terminal, one line that changes.
class Progress
{
public:
    explicit Progress(std::size_t count) : m_count(count) {}
    ~Progress() { Wipe(); }
    Progress(Progress const&) = delete;
    Progress& operator=(Progress const&) = delete;

    void Next(char const* check)
    {
        ++m_number;
        if (m_isShown)
            std::cerr << "\r\x1B[K[" << m_number << "/" << m_count << "] " << check << std::flush;
    }
    void Wipe() const
    {
        if (m_isShown)
            std::cerr << "\r\x1B[K" << std::flush;
    }

private:
    bool const m_isShown = isatty(STDERR_FILENO) != 0;
    std::size_t const m_count;
    std::size_t m_number = 0;
};

int Validate(Request const& request)
{
    if (!std::filesystem::is_directory(request.options.bundle))
        throw tools::Trouble(tools::ShownName(request.options.bundle) + " is no folder");
    auto const checks = Chosen(request);
    tools::Output out(stdout);
    std::vector<Result> results;
    {
        Progress progress(checks.size());
        for (Check const& check : checks)
        {
            progress.Next(check.name);
            results.push_back({check.name, Run(check, request.options)});
            if (request.isJson)
                continue;
            progress.Wipe();
            out.Add(Lines(results.back(), out));
            out.Flush();
        }
    }
    out.Add(request.isJson ? ToJson(results, request.options.bundle) : Summary(results));
    out.Flush();
    if (!request.junit.empty() && !(std::ofstream(request.junit) << ToJUnit(results) << std::flush))
        throw tools::Trouble(tools::ShownName(request.junit) + " cannot be written");
    return HasFailure(results) ? Bad : Good;
}

int Run(int argc, char** argv)
{
    Request request;
    CLI::App app("Holds a communication plug-in against the contract that libcomgui has with it.",
                 "comgui_validate");
    AddOptions(app, request);
    try
    {
        app.parse(argc, argv);
    }
    catch (CLI::ParseError const& e)
    {
        if (e.get_exit_code() == 0)
            return app.exit(e);
        throw tools::Trouble(std::string(e.what()) + "; comgui_validate --help shows how");
    }
    TakeServer(request);
    TakePassword(request);
    TakeMore(request);
    if (request.isRules)
        return PrintRules();
    if (request.isList)
        return List(request);
    if (request.options.bundle.empty())
        throw tools::Trouble("BUNDLE is missing; comgui_validate --help shows how");
    return Validate(request);
}
}  // namespace

int main(int argc, char** argv)
try
{
    return Run(argc, argv);
}
catch (tools::ClosedPipe const&)
{
    return Failed;  // whoever closed it knows
}
catch (std::exception const& e)
{
    Complain(e.what());
    return Failed;
}
