#include "tools/comgui_site/check.h"

#include "standin/server/jobs/JobFolder.h"
#include "standin/server/sessions/TicketService.h"
#include "standin/server/site/SiteFolders.h"
#include "tools/comgui_site/TicketCommits.h"
#include "tools/comgui_site/users.h"
#include "tools/comgui_site/words.h"
#include <algorithm>

namespace comgui_site
{
using standin::JobTicketType;
using standin::Store;
using standin::StoredValue;
using standin::SystemTicket;
using standin::TicketAddress;
using standin::UserTicketType;

namespace
{
constexpr int Arrived = 1;  // of "Job/State"

// What of a job's ticket speaks of its file.
struct JobFile
{
    long long state = -1;
    long long size = -1;     // -1: the ticket does not tell
    std::string path;        // with its variable; empty: the ticket names none
    bool hasFolder = false;  // that the server made, as it does for every job that somebody sends

    void Take(std::string_view key, int pos, StoredValue const& value)
    {
        if (pos != 0)
            return;
        if (key == "Job/State" && value.type == PARAM_INT)
            state = value.integer;
        else if (key == "Job/Size" && value.type == PARAM_INT64)
            size = value.integer;
        else if (key == "Job/File" && value.type == PARAM_STRING)
            path = value.bytes;
        else if (key == standin::JobMarkKey)
            hasFolder = true;
    }
};

class Inspection
{
public:
    Inspection(Store& store, std::filesystem::path const& folder)
        : m_store(store), m_folders(FoldersOf(store, folder))
    {
    }

    std::vector<std::string> Problems(std::function<void(long long, long long)> const& progress)
    {
        std::vector<TicketAddress> tickets;
        m_store.Tickets([&](TicketAddress address, auto const&) { tickets.push_back(address); });
        if (!std::binary_search(tickets.begin(), tickets.end(), SystemTicket))
            Add("ticket 0/0: is missing; import one, or restore a backup");
        long long done = 0;
        for (TicketAddress const address : tickets)
        {
            progress(done++, static_cast<long long>(tickets.size()));
            LookAtTicket(address);
        }
        LookAtUsers();
        return std::move(m_problems);
    }

private:
    // Of the folders that the system ticket names, as they are once the site is open: the server sets that of
    // the site itself.
    static standin::FolderTable FoldersOf(Store& store, std::filesystem::path const& folder)
    {
        standin::FolderSettings settings;
        store.Load(SystemTicket,
                   [&](std::string_view key, int pos, StoredValue const& value)
                   {
                       if (standin::FolderSettings::Concern(key, pos))
                           settings.Put(key, value);
                   });
        std::string const site = folder.string();
        StoredValue install;
        install.type = PARAM_STRING;
        install.bytes = site;
        settings.Put("System/InstallFolder", install);
        return standin::FolderTable(settings.values);
    }

    void Add(std::string problem) { m_problems.push_back(std::move(problem)); }
    void Add(TicketAddress address, std::string const& problem)
    {
        Add("ticket " + TextOf(address) + ": " + problem);
    }

    void LookAtTicket(TicketAddress address)
    {
        JobFile job;
        standin::FolderSettings settings;
        try
        {
            auto const take = [&](std::string_view key, int pos, StoredValue const& value)
            {
                if (key.empty())
                    Add(address, "a value without a key");
                job.Take(key, pos, value);
                if (address == SystemTicket && standin::FolderSettings::Concern(key, pos))
                    settings.Put(key, value);
            };
            if (!m_store.Load(address, take))
                return;  // deleted meanwhile
        }
        catch (standin::StoreError const& error)
        {
            Add(address, std::string("cannot be read: ") + error.what());
            return;
        }
        if (address == SystemTicket)
            for (auto const& fault : standin::FaultsOf(settings))
                Add(address, "clients cannot read the folders: " + std::string(fault.key));
        if (address.type == JobTicketType && job.state == Arrived)
            LookAtJob(address, job);
    }

    void LookAtJob(TicketAddress address, JobFile const& job)
    {
        std::string const problem = ProblemOf(job);
        // Whoever deletes a job deletes its ticket first.
        if (!problem.empty() && Load(m_store, address))
            Add(address, problem);
    }

    std::string ProblemOf(JobFile const& job) const
    {
        if (job.path.empty())
            return job.hasFolder ? "the job has arrived, but its ticket names no file" : "";
        std::string const name = "the job's file " + Cleaned(job.path);
        auto const end = job.path.find(")/");
        auto const folder = job.path.starts_with("$(") && end != std::string::npos
                                ? m_folders.FolderOf(std::string_view(job.path).substr(2, end - 2))
                                : std::nullopt;
        if (!folder)
            return name + " is in no folder that the system ticket names";
        std::filesystem::path const file = std::filesystem::path(*folder) / job.path.substr(end + 2);
        std::error_code error;
        if (!is_regular_file(std::filesystem::symlink_status(file, error)))
            return name + " is missing: " + Cleaned(file.string());
        auto const size = static_cast<long long>(std::filesystem::file_size(file, error));
        if (!error && job.size >= 0 && size != job.size)
            return name + " has " + std::to_string(size) + " bytes instead of " + std::to_string(job.size);
        return "";
    }

    void LookAtUsers()
    {
        bool hasAdministrator = false;
        for (standin::User const& user : m_store.Users())
        {
            std::string const name = "user \"" + Cleaned(user.name) + "\": ";
            TicketAddress const ticket{UserTicketType, user.ticketId};
            hasAdministrator |= user.role == Administrator;
            if (user.name.empty() || !IsPlain(user.name))
                Add(name + "the name is empty, has control characters, or is not UTF-8");
            if (!user.passwordHash.starts_with('$'))
                Add(name + "no password fits; set one with passwd");
            if (!Load(m_store, ticket) && m_store.FindUser(user.name))
                Add(name + "the ticket " + TextOf(ticket) + " is missing; import one, or remove the user");
        }
        if (!hasAdministrator)
            Add("no user is an administrator; make one: users role NAME 16");
    }

    Store& m_store;
    standin::FolderTable const m_folders;
    std::vector<std::string> m_problems;
};
}  // namespace

std::vector<std::string> ProblemsOf(Store& store, std::filesystem::path const& folder,
                                    std::function<void(long long, long long)> const& progress)
{
    return Inspection(store, folder).Problems(progress);
}
}  // namespace comgui_site
