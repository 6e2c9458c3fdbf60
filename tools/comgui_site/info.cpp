#include "tools/comgui_site/info.h"

#include "tools/comgui_site/users.h"
#include <algorithm>

namespace comgui_site
{
using standin::ProgramInfo;
using standin::Sequence;
using standin::Store;
using standin::User;

namespace
{
void AddSizes(SiteInfo& info)
{
    using Options = std::filesystem::directory_options;
    std::error_code error;
    std::filesystem::recursive_directory_iterator entry(info.folder, Options::skip_permission_denied, error);
    for (; !error && entry != std::filesystem::recursive_directory_iterator(); entry.increment(error))
    {
        std::error_code gone;  // files come and go
        if (!is_regular_file(entry->symlink_status(gone)))
            continue;
        auto const size = entry->file_size(gone);
        std::string const name = entry->path().filename().string();
        bool const isOfSite = entry.depth() == 0 && name.starts_with("site.");
        if (isOfSite && (name == "site.lock" || name == "site.db-shm"))
            continue;  // worth nothing when the site is closed
        bool const isDatabase = isOfSite && (name == "site.db" || name == "site.db-wal");
        if (!gone)
            (isDatabase ? info.databaseSize : info.filesSize) += size;
    }
}

std::size_t SessionsOf(SiteInfo const& info, ProgramInfo const& program)
{
    return static_cast<std::size_t>(std::count_if(info.sessions.begin(), info.sessions.end(),
                                                  [&](auto const& session)
                                                  { return session.program == program.id; }));
}

std::string LineOf(SiteInfo const& info, ProgramInfo const& program)
{
    return "  " + Cleaned(program.name) + "  process " + std::to_string(program.process) + " on " +
           Cleaned(program.machine) + "  since " + TimeText(program.since) + "  " +
           Counted(SessionsOf(info, program), "session") + "  " +
           (program.isAlive ? "alive"
                            : "dead, to be cleared up by the next program that looks after the site") +
           '\n';
}

std::string JournalText(SiteInfo const& info)
{
    if (info.oldest == 0)
        return "empty; the next change is " + std::to_string(info.newest + 1);
    return "from " + std::to_string(info.oldest) + " to " + std::to_string(info.newest);
}
}  // namespace

Sequence BeginningOfJournal(Store& store)
{
    Sequence low = 0;
    Sequence high = store.Committed();
    while (low < high)
    {
        Sequence const middle = low + (high - low) / 2;
        if (store.ChangesSince(middle, [](auto&&) {}))
            high = middle;
        else
            low = middle + 1;
    }
    return low + 1;
}

SiteInfo InfoOf(Store& store, std::filesystem::path const& folder)
{
    SiteInfo info;
    info.folder = folder;
    AddSizes(info);
    info.newest = store.Tickets([&](auto address, auto const&) { ++info.tickets[address.type]; });
    info.users = store.Users();
    info.programs = store.Programs();
    std::erase_if(info.programs, [&](ProgramInfo const& program) { return program.id == store.Self(); });
    info.sessions = store.Sessions();
    Sequence const beginning = BeginningOfJournal(store);
    info.oldest = beginning <= info.newest ? beginning : 0;
    return info;
}

std::string TextOf(SiteInfo const& info)
{
    std::string text = "site      " + Cleaned(info.folder.string()) + "\ndatabase  " +
                       SizeText(info.databaseSize) +
                       (info.database.empty() ? "" : ", " + Cleaned(info.database)) + "\nfiles     " +
                       SizeText(info.filesSize) + "\nchanges   " + std::to_string(info.newest) +
                       "\njournal   " + JournalText(info);
    std::size_t count = 0;
    for (auto const& [type, number] : info.tickets)
        count += number;
    text += "\ntickets   " + std::to_string(count) + '\n';
    for (auto const& [type, number] : info.tickets)
    {
        std::string const name = NameOfType(type);
        text += "  type " + std::to_string(type) + (name.empty() ? "" : " (" + name + ")") + ": " +
                std::to_string(number) + '\n';
    }
    text += "users     " + std::to_string(info.users.size()) + '\n';
    for (User const& user : info.users)
        text += "  " + Cleaned(user.name) + "  role " + std::to_string(user.role) + "  ticket 17/" +
                std::to_string(user.ticketId) + '\n';
    text += "programs  " + std::to_string(info.programs.size()) + '\n';
    for (ProgramInfo const& program : info.programs)
        text += LineOf(info, program);
    return text;
}

Json JsonOf(SiteInfo const& info)
{
    Json json{{"site", JsonOf(info.folder.string())},
              {"database", info.database.empty() ? Json(nullptr) : JsonOf(info.database)},
              {"databaseBytes", info.databaseSize},
              {"fileBytes", info.filesSize},
              {"newestChange", info.newest},
              {"oldestChangeInJournal", info.oldest == 0 ? Json(nullptr) : Json(info.oldest)}};
    json["tickets"] = Json::object();
    for (auto const& [type, number] : info.tickets)
        json["tickets"][std::to_string(type)] = number;
    json["users"] = Json::array();
    for (User const& user : info.users)
        json["users"].push_back(
            {{"name", JsonOf(user.name)}, {"role", user.role}, {"ticket", user.ticketId}});
    json["programs"] = Json::array();
    for (ProgramInfo const& program : info.programs)
        json["programs"].push_back({{"id", program.id},
                                    {"name", JsonOf(program.name)},
                                    {"process", program.process},
                                    {"machine", JsonOf(program.machine)},
                                    {"since", program.since},
                                    {"alive", program.isAlive},
                                    {"sessions", SessionsOf(info, program)}});
    return json;
}
}  // namespace comgui_site
