// What the commands do with a site, from what the command line says to what they print. Each gives the exit
// status: 0, or 1 for problems that it has found. Whatever fails is thrown.
#pragma once

#include "tools/comgui_site/TicketCommits.h"
#include "tools/comgui_site/users.h"
#include "tools/comgui_site/words.h"
#include <optional>
#include <string>
#include <vector>

namespace comgui_site
{
// The words of a command line, those that the command has.
struct Request
{
    std::string site;  // empty: that of this user
    bool isJson = false;
    bool force = false;
    bool keepTicket = false;
    TicketCommits::Mode mode = TicketCommits::Mode::Merge;
    NewUser user;                       // add, remove, role and passwd
    std::string file;                   // backup and restore
    std::string from, to;               // copy
    std::string output = "-";           // export
    std::vector<std::string> files;     // import
    std::vector<std::string> rule;      // trouble add, by words
    std::size_t number = 0;             // trouble remove
    std::vector<TicketChoice> tickets;  // export
    std::optional<standin::Sequence> since{};
};

int RunInfo(Request const& request);
int RunCheck(Request const& request);
int RunUsers(Request const& request);
int RunUsersAdd(Request const& request);
int RunUsersRemove(Request const& request);
int RunUsersRole(Request const& request);
int RunPasswd(Request const& request);
int RunBackup(Request const& request);
int RunRestore(Request const& request);
int RunCopy(Request const& request);
int RunExport(Request const& request);
int RunImport(Request const& request);
int RunFollow(Request const& request);
int RunTrouble(Request const& request);
int RunTroubleAdd(Request const& request);
int RunTroubleRemove(Request const& request);
int RunTroubleClear(Request const& request);
}  // namespace comgui_site
