#include "standin/server/jobs/JobIntake.h"

#include "standin/server/jobs/JobFolder.h"
#include "standin/server/transfer/TransferService.h"
#include <algorithm>

namespace standin
{
namespace
{
constexpr char NameKey[] = "Job/Identification/Name";
constexpr char UserKey[] = "Job/Identification/User";
constexpr char EndPointKey[] = "Job/Identification/RemoteEndpoint";
constexpr char StateKey[] = "Job/State";
constexpr char ProgressKey[] = "Job/Progress";
constexpr int QueueTicketType = 7;
constexpr std::chrono::milliseconds ProgressPause(100);

// A table of writes. What it is given stays where it is until the table has been used.
class Table
{
public:
    Table& Put(char const* key, std::string const& text) { return Put(key, PARAM_STRING, text.c_str()); }
    Table& Put(char const* key, int const& number) { return Put(key, PARAM_INT, &number); }
    Table& Put(char const* key, PARAM_TYPE type, void const* value)
    {
        SETMULTIPAR& record = m_records.back();
        record.key = key;
        record.type = type;
        record.value = value;
        record.pos = -1;
        m_records.push_back({});
        return *this;
    }
    SETMULTIPAR* Records() { return m_records.data(); }

private:
    std::vector<SETMULTIPAR> m_records{SETMULTIPAR{}};
};

void CheckName(std::string const& name)
{
    if (!IsFileName(name))
        throw TransferError(PathRefused,
                            "\"" + ForMessages(name.substr(0, 60)) + "\": no name for a job's file");
}

SourceFile SourceOf(std::string const& clientPath)
{
    SourceFile source(TransferService::ClientPath(clientPath));
    if (source.Size() == 0)
        throw TransferError(EmptyJob,
                            ForMessages(clientPath) + ": the file is empty; send one with a job in it");
    return source;
}

[[noreturn]] void FailAsGone()
{
    throw TransferError(JobGone,
                        "the job's ticket has been deleted while the job came in; send the job anew");
}

// Of a ticket that is there and cannot be written the storage has told on stderr.
void WriteOrFail(TicketServer& server, TicketServer::MadeTicket const& ticket, Table& table)
{
    if (server.Write(ticket, table.Records()))
        return;
    if (server.BirthOf(ticket.address) == ticket.birth)
        throw TransferError(TargetUnwritable, "");
    FailAsGone();
}

// Writes how far a job is, every now and then.
class ProgressReport
{
public:
    ProgressReport(TicketServer& server, TicketServer::MadeTicket const& ticket, off_t size)
        : m_server(server), m_ticket(ticket), m_size(size)
    {
    }

    void operator()(off_t done)
    {
        auto const now = std::chrono::steady_clock::now();
        int const percent = static_cast<int>(100.0 * static_cast<double>(done) / static_cast<double>(m_size));
        if (now - m_last < ProgressPause || percent == m_percent)
            return;
        m_last = now;
        m_percent = percent;
        WriteOrFail(m_server, m_ticket, Table().Put(ProgressKey, percent));
    }

private:
    TicketServer& m_server;
    TicketServer::MadeTicket const& m_ticket;
    off_t m_size;
    std::chrono::steady_clock::time_point m_last = std::chrono::steady_clock::now();
    int m_percent = 0;
};
}  // namespace

JobIntake::Job JobIntake::Make(Session const& session, Announcement const& announcement)
{
    std::string const endPoint = session.EndPoint();
    std::string const mark = NewJobMark();
    int const yes = 1;
    int const announced = 0;
    Table table;
    table.Put(JobPreparedKey, yes).Put(StateKey, announced).Put(NameKey, announcement.name);
    table.Put(UserKey, session.Who().name).Put(EndPointKey, endPoint);
    table.Put(JobMarkKey, mark);
    if (m_server.Exists({QueueTicketType, announcement.queue}))
        table.Put("Job/Queue", announcement.queue);
    if (announcement.copies > 0)
        table.Put("Job/Copies", announcement.copies);
    auto const ticket = m_server.Make(JobTicketType, table.Records());
    if (!ticket)
        throw TransferError(TargetUnwritable, "no ticket can be made for a job; see the line before");
    return {*ticket, mark};
}

TransferResult JobIntake::Prepare(Session const& session, Announcement const& announcement, int& id)
{
    return m_server.Transfers().Run(session,
                                    [&](RunningTransfer const&)
                                    {
                                        CheckName(announcement.name);
                                        std::lock_guard const lock(m_lock);
                                        m_prepared.reserve(m_prepared.size() + 1);
                                        Job const job = Make(session, announcement);
                                        m_prepared.push_back({session.Number(), announcement, job});
                                        id = job.ticket.address.id;
                                    });
}

std::optional<JobIntake::Job> JobIntake::Claim(Session const& session, std::string const& name)
{
    std::lock_guard const lock(m_lock);
    std::erase_if(m_prepared,
                  [&](Prepared const& prepared)
                  {
                      TicketServer::MadeTicket const& ticket = prepared.job.ticket;
                      return m_server.BirthOf(ticket.address) != ticket.birth;
                  });
    auto const found = std::find_if(m_prepared.rbegin(), m_prepared.rend(),
                                    [&](Prepared const& prepared)
                                    {
                                        Announcement const& told = prepared.announcement;
                                        return prepared.session == session.Number() &&
                                               (told.isCut ? name.starts_with(told.name) : name == told.name);
                                    });
    if (found == m_prepared.rend())
        return std::nullopt;
    Job job = std::move(found->job);
    m_prepared.erase(std::next(found).base());
    return job;
}

TransferResult JobIntake::Send(Session const& session, std::string const& clientPath, std::string const& name)
{
    return m_server.Transfers().Run(session,
                                    [&](RunningTransfer const& running)
                                    {
                                        auto job = Claim(session, name);
                                        try
                                        {
                                            CheckName(name);
                                            SourceFile const source = SourceOf(clientPath);
                                            if (!job)
                                                job = Make(session, {name});
                                            Receive(session, *job, source, name, running);
                                        }
                                        catch (...)
                                        {
                                            if (job)
                                                Drop(*job);
                                            throw;
                                        }
                                    });
}

// The ticket first: it must not tell of a file that is gone.
void JobIntake::Drop(Job const& job)
{
    bool const isGone =
        m_server.Remove(job.ticket) || m_server.BirthOf(job.ticket.address) != job.ticket.birth;
    if (isGone && job.folders)  // where $(JOB) was then: it may have been moved
        RemoveJobFolder(*job.folders, job.ticket.address.id, job.mark);
}

void JobIntake::Receive(Session const& session, Job& job, SourceFile const& source, std::string const& name,
                        RunningTransfer const& running)
{
    TicketServer::MadeTicket const& ticket = job.ticket;
    int const id = ticket.address.id;
    Descriptor folder;
    auto const begin = [&](FolderTable const& folders)
    {
        folder = MakeJobFolder(folders, id, job.mark);
        job.folders = folders;
    };
    // Together, since whoever deletes the ticket takes the folder away with it.
    if (!m_server.WhileItLasts(ticket, begin))
        FailAsGone();
    PartFile file(folder.Number(), name);
    m_server.Transfers().Copy(file, source, running, ProgressReport(m_server, ticket, source.Size()));
    auto const finish = [&](FolderTable const& folders)
    {
        if (folders.FolderOf("JOB") != job.folders->FolderOf("JOB"))
            throw TransferError(TargetUnwritable, "$(JOB) was moved while a job came in; send the job anew");
        file.Finish();
    };
    // Under the lock too: in a folder that was deleted there is nothing to give a name.
    if (!m_server.WhileItLasts(ticket, finish))
        FailAsGone();

    std::string const jobFolder = "$(JOB)/" + std::to_string(id);
    std::string const jobFile = jobFolder + "/" + name;
    std::string const endPoint = session.EndPoint();
    long long const size = source.Size();
    int const arrived = 1;
    int const percent = 100;
    Table table;
    table.Put(NameKey, name).Put(UserKey, session.Who().name).Put(EndPointKey, endPoint);
    table.Put(JobFileKey, jobFile).Put("Job/Folder", jobFolder).Put("Job/Size", PARAM_INT64, &size);
    table.Put(StateKey, arrived).Put(ProgressKey, percent).Put(JobPreparedKey, PARAM_NONE, nullptr);
    WriteOrFail(m_server, ticket, table);
}

void JobIntake::End(Session const& session)
{
    std::lock_guard const lock(m_lock);
    for (Prepared const& prepared : m_prepared)
        if (prepared.session == session.Number())
            m_server.Remove(prepared.job.ticket);
    std::erase_if(m_prepared, [&](Prepared const& prepared) { return prepared.session == session.Number(); });
}
}  // namespace standin
