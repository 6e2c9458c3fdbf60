#include "tools/comgui_site/commands.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/store/sqlite/Database.h"
#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Password.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/backup.h"
#include "tools/comgui_site/check.h"
#include "tools/comgui_site/copy.h"
#include "tools/comgui_site/export.h"
#include "tools/comgui_site/follow.h"
#include "tools/comgui_site/import.h"
#include "tools/comgui_site/info.h"
#include "tools/comgui_site/rules.h"
#include "tools/shared/Output.h"
#include <algorithm>

namespace comgui_site
{
using tools::Output;

namespace
{
// What was done is done, so that it is said on stdout even if nobody reads that: a failure is one all the
// same.
void Print(std::string const& text)
{
    Output out(stdout);
    out.Add(text);
    out.Flush();
}

void WriteNewFile(std::filesystem::path const& file, std::string const& text, bool mayReplace)
{
    auto const status = std::filesystem::status(file);
    if (exists(status) && !is_regular_file(status))
        throw Trouble(file.string() + ": is no regular file; choose another name");
    if (exists(status) && !mayReplace)
        throw Trouble(file.string() + ": is there already; choose another name, or say --force");
    standin::ReplaceFile(file, text);
}

bool IsFolder(std::string const& output)
{
    return output.ends_with('/') || std::filesystem::is_directory(output);
}

std::string SessionsText(OpenedSite& site, std::string const& name)
{
    auto const sessions = site.Store().Sessions();
    auto const count = std::count_if(sessions.begin(), sessions.end(),
                                     [&](auto const& session) { return session.user == name; });
    if (count == 0)
        return "";
    return "; " + Counted(static_cast<std::size_t>(count), "session") +
           (count == 1 ? " that is open goes on until it logs out"
                       : " that are open go on until they log out");
}

std::vector<std::string> AllProblemsOf(OpenedSite& site)
{
    std::vector<std::string> problems;
    {
        Progress progress("checking the database");
        problems = site.Store().Check(
            [&](long long done, long long total)
            { progress(static_cast<unsigned long long>(done), static_cast<unsigned long long>(total)); });
    }
    Progress progress("checking the tickets");
    auto const more = ProblemsOf(
        site.Store(), site.Folder(),
        [&](long long done, long long total)
        { progress(static_cast<unsigned long long>(done), static_cast<unsigned long long>(total)); });
    problems.insert(problems.end(), more.begin(), more.end());
    return problems;
}

// A database that is too damaged to be opened has a problem, too.
std::vector<std::string> ProblemsOfSite(standin::SiteName const& name)
try
{
    OpenedSite site(name);
    return AllProblemsOf(site);
}
catch (standin::DamagedStore const& damage)
{
    return {damage.what()};
}

std::string LinesOf(std::vector<std::string> const& lines, char const* before)
{
    std::string text;
    for (std::string const& line : lines)
        text += before + Cleaned(line) + '\n';
    return text;
}

char const* NameOf(TicketCommits::Done::Kind kind)
{
    switch (kind)
    {
    case TicketCommits::Done::Created:
        return "created";
    case TicketCommits::Done::Changed:
        return "changed";
    default:
        return "unchanged";
    }
}

std::string ResultOf(bool isJson, standin::TicketAddress address, TicketCommits::Done const& done)
{
    if (isJson)
        return LineOf(Json{{"type", address.type},
                           {"id", address.id},
                           {"result", NameOf(done.kind)},
                           {"values", done.values}});
    return TextOf(address) + "  " + NameOf(done.kind) +
           (done.values > 0 ? ", " + Counted(done.values, "value") : "") + '\n';
}
}  // namespace

int RunInfo(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    SiteInfo info = InfoOf(site.Store(), site.Folder());
    if (site.IsDatabase())
    {
        info.database = site.Store().Name();
        info.databaseSize = static_cast<unsigned long long>(site.Store().Measure().databaseBytes);
    }
    Print(request.isJson ? LinesOf(JsonOf(info)) : TextOf(info));
    return 0;
}

int RunCheck(Request const& request)
{
    auto const name = NameOfSite(request.site);
    auto const problems = ProblemsOfSite(name);
    if (request.isJson)
    {
        Json json{{"site", JsonOf(name.folder.string())}, {"problems", Json::array()}};
        for (std::string const& problem : problems)
            json["problems"].push_back(JsonOf(problem));
        Print(LinesOf(json));
    }
    else
        Print(problems.empty() ? "no problems\n" : LinesOf(problems, ""));
    return problems.empty() ? 0 : 1;
}

int RunUsers(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    std::string text;
    Json json = Json::array();
    for (standin::User const& user : site.Store().Users())
    {
        text += Cleaned(user.name) + "  role " + std::to_string(user.role) +
                (user.role == Administrator ? " (administrator)" : "") + "  ticket 17/" +
                std::to_string(user.ticketId) + '\n';
        json.push_back({{"name", JsonOf(user.name)}, {"role", user.role}, {"ticket", user.ticketId}});
    }
    Print(request.isJson ? LinesOf(json) : text);
    return 0;
}

int RunUsersAdd(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    CheckNewUser(site.Store(), request.user);
    std::string const hash = HashOfNewPassword(request.user.name);
    standin::User made;
    {
        UsersTurn const turn(site.Store());
        made = AddUser(site.Store(), request.user, hash);
    }
    site.Leave();
    Print("added " + Cleaned(made.name) + ", role " + std::to_string(made.role) + ", ticket 17/" +
          std::to_string(made.ticketId) + '\n');
    return 0;
}

int RunUsersRemove(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    std::string const& name = request.user.name;
    std::string text = "removed " + Cleaned(name);
    {
        UsersTurn const turn(site.Store());
        int const ticket = MustBeUser(site.Store(), name).ticketId;
        text += RemoveUser(site.Store(), name, request.keepTicket) ? " with the ticket 17/"
                                                                   : "; there still is the ticket 17/";
        text += std::to_string(ticket);
    }
    text += SessionsText(site, name) + '\n';
    site.Leave();
    Print(text);
    return 0;
}

int RunUsersRole(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    {
        UsersTurn const turn(site.Store());
        SetRole(site.Store(), request.user.name, request.user.role);
    }
    std::string const sessions = SessionsText(site, request.user.name);
    site.Leave();
    Print(Cleaned(request.user.name) + " has role " + std::to_string(request.user.role) +
          (sessions.empty() ? "" : sessions + " with the role that they began with") + '\n');
    return 0;
}

int RunPasswd(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    MustBeUser(site.Store(), request.user.name);
    std::string const hash = HashOfNewPassword(request.user.name);
    {
        UsersTurn const turn(site.Store());
        SetPasswordHash(site.Store(), request.user.name, hash);
    }
    site.Leave();
    Print("the password of " + Cleaned(request.user.name) + " is changed\n");
    return 0;
}

int RunBackup(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    BackUp(site, request.file, request.force);
    std::error_code error;
    Print("backed up to " + Cleaned(request.file) + ", " +
          SizeText(std::filesystem::file_size(request.file, error)) +
          "\nnot in it: the folders of files (job/ and the others), seed.xml\n");
    return 0;
}

int RunRestore(Request const& request)
{
    auto const name = NameOfSite(request.site);
    Restored const restored = Restore(name, request.file);
    std::string text = "restored " + Cleaned(name.folder.string()) + " from " + Cleaned(request.file) + '\n';
    if (!restored.setAside.empty())
        text += "the database before is " + Cleaned(restored.setAside) + '\n';
    text += "the folders of files are as they were; a backup has none of them\n";
    if (!restored.jobFolders.empty())
        text += "folders of jobs that are not in the backup are now:\n" + LinesOf(restored.jobFolders, "  ");
    if (!restored.problems.empty())
        text += "problems of the site as it is now:\n" + LinesOf(restored.problems, "  ");
    Print(text);
    return 0;
}

int RunCopy(Request const& request)
{
    Copied const copied = CopySite(NameOfSite(request.from), NameOfSite(request.to));
    Print("copied " + Counted(copied.tickets, "ticket") + ", " + Counted(copied.users, "user") + ", " +
          Counted(copied.files, "file") + " (" + SizeText(copied.bytes) +
          "); compared, and all of it is the same\n");
    return 0;
}

int RunExport(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    auto const tickets = Chosen(site.Store(), request.tickets);
    if (request.output != "-" && IsFolder(request.output))
    {
        std::size_t const written = ExportToFolder(site.Store(), tickets, request.output, request.force);
        Print(Counted(written, "ticket") + " in " + Cleaned(request.output) + '\n');
        return 0;
    }
    bool const isOne = request.tickets.size() == 1 && request.tickets[0].id;
    Document const document =
        isOne ? ExportOne(site.Store(), tickets.at(0)) : ExportToDocument(site.Store(), tickets);
    if (request.output == "-")
    {
        Print(document.text);
        return 0;
    }
    CheckIsNotOfSite(request.output, site.Folder());
    WriteNewFile(request.output, document.text, request.force);
    Print(Counted(document.tickets, "ticket") + " in " + Cleaned(request.output) + '\n');
    return 0;
}

int RunImport(Request const& request)
{
    auto const tickets = ReadTickets(request.files);
    OpenedSite site(NameOfSite(request.site));
    std::string results;  // printed at the end: a pipe that is closed keeps no ticket from being written
    bool isMirrorDue = false;
    auto const tell = [&](standin::TicketAddress address, TicketCommits::Done const& done)
    {
        isMirrorDue |= address == standin::SystemTicket && done.kind != TicketCommits::Done::Unchanged;
        results += ResultOf(request.isJson, address, done);
    };
    std::exception_ptr failure;
    try
    {
        Import(site.Store(), tickets, request.mode, tell);
    }
    catch (...)
    {
        failure = std::current_exception();
    }
    if (isMirrorDue)
        WriteMirror(site.Store(), site.Folder());
    if (!failure)
        site.Leave();
    Print(results);
    if (failure)
        std::rethrow_exception(failure);
    return 0;
}

int RunFollow(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    Output out(stdout);
    Follow(site.Store(), request.since, request.isJson, out);
    return 0;
}

int RunTrouble(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    auto const rules = standin::RulesOf(site.Store());
    std::string text = rules.empty() ? "no rules\n" : "";
    Json json = Json::array();
    for (std::size_t i = 0; i < rules.size(); ++i)
    {
        ShownRule const shown = ShownRuleOf(rules[i]);
        text += std::to_string(i + 1) + "  " + shown.text + '\n';
        json.push_back(Json{{"rule", JsonOf(rules[i])}, {"state", shown.state}});
    }
    Print(request.isJson ? LinesOf(json) : text);
    return 0;
}

int RunTroubleAdd(Request const& request)
{
    standin::TroubleRule const rule = RuleOf(request.rule);
    OpenedSite site(NameOfSite(request.site));
    ChangeRulesOf(site,
                  [&](std::vector<std::string>& rules)
                  {
                      std::erase_if(rules, HasEnded);
                      rules.push_back(rule.Text());
                  });
    site.Leave();
    Print("from now on: " + ShownRuleOf(rule.Text()).text + '\n');
    return 0;
}

int RunTroubleRemove(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    std::string removed;
    ChangeRulesOf(site,
                  [&](std::vector<std::string>& rules)
                  {
                      if (request.number == 0 || request.number > rules.size())
                          throw Trouble("there is no rule " + std::to_string(request.number) +
                                        "; trouble lists those there are");
                      auto const rule = rules.begin() + static_cast<std::ptrdiff_t>(request.number - 1);
                      removed = *rule;
                      rules.erase(rule);
                  });
    site.Leave();
    Print("no longer: " + ShownRuleOf(removed).text + '\n');
    return 0;
}

int RunTroubleClear(Request const& request)
{
    OpenedSite site(NameOfSite(request.site));
    ChangeRulesOf(site, [](std::vector<std::string>& rules) { rules.clear(); });
    site.Leave();
    Print("the servers of the site behave again\n");
    return 0;
}
}  // namespace comgui_site
