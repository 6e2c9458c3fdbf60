#include "standin/server/jobs/JobIntake.h"

#include "standin/server/files/Report.h"
#include "standin/server/jobs/JobFolder.h"
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
constexpr int Announced = 0;
constexpr int Arrived = 1;
constexpr std::chrono::milliseconds ProgressPause(100);
constexpr std::chrono::seconds ShortestPause(1);  // between two attempts to delete what has failed
constexpr std::chrono::seconds LongestPause(60);

TicketWrite Put(char const* key, std::string const& text) { return {key, -1, TicketValue::String(text)}; }
TicketWrite Put(char const* key, int number) { return {key, -1, TicketValue::Int(number)}; }

// A list of writes that cannot be copied, as an initialiser would do.
template <typename... Writes>
std::vector<TicketWrite> ListOf(Writes... writes)
{
    std::vector<TicketWrite> list;
    list.reserve(sizeof...(writes));
    (list.push_back(std::move(writes)), ...);
    return list;
}

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

// Says every now and then how far a job is.
class ProgressReport
{
public:
    using Write = std::function<void(int percent)>;
    ProgressReport(off_t size, Write write) : m_size(size), m_write(std::move(write)) {}

    void operator()(off_t done)
    {
        auto const now = std::chrono::steady_clock::now();
        int const percent = static_cast<int>(100.0 * static_cast<double>(done) / static_cast<double>(m_size));
        if (now - m_last < ProgressPause || percent == m_percent)
            return;
        m_last = now;
        m_percent = percent;
        m_write(percent);
    }

private:
    off_t m_size;
    Write m_write;
    std::chrono::steady_clock::time_point m_last = std::chrono::steady_clock::now();
    int m_percent = 0;
};
}  // namespace

bool JobIntake::IsGone(TicketWriter::Ticket const& ticket) const
{
    return m_tickets.IncarnationOf(ticket.address) != ticket.incarnation;
}

// Of a ticket that is there and cannot be written the store has reported why.
void JobIntake::WriteOrFail(TicketWriter::Ticket const& ticket, std::vector<TicketWrite> writes,
                            TicketWriter::Conditions const& conditions)
{
    bool const isDone = m_writer.Write(ticket, writes, conditions) &&
                        std::all_of(writes.begin(), writes.end(), [](auto const& write) { return write.ok; });
    if (isDone)
        return;
    if (IsGone(ticket))
        FailAsGone();
    throw TransferError(TargetUnwritable, "");
}

// What somebody left in $(JOB) blocks only the id whose name it has. The id above the largest in use, or if
// the ids have come to their end the smallest free one, as far as its folder's name is free, too. -1: none.
int JobIntake::FreeId() const
{
    FolderTable const folders = Folders();
    int const newest = m_tickets.LargestId(JobTicketType);
    for (int id = newest + 1; id <= LargestId; ++id)
        if (IsJobFolderFree(folders, id))
            return id;
    for (int id = 0; id < newest; ++id)
        if (m_tickets.IncarnationOf({JobTicketType, id}) == 0 && IsJobFolderFree(folders, id))
            return id;
    return -1;
}

// Another thread or program may be faster; then the next id is due.
std::optional<TicketWriter::Ticket> JobIntake::MakeTicket(std::vector<TicketWrite>& writes)
{
    for (;;)
    {
        TicketAddress const address{JobTicketType, FreeId()};
        if (address.id < 0)
            return std::nullopt;
        auto const made = m_writer.Create({address, 0, TicketChange::Owner::ThisProgram}, writes);
        if (made || m_tickets.IncarnationOf(address) == 0)
            return made;
    }
}

JobIntake::Job JobIntake::Make(Session const& session, Announcement const& announcement)
{
    std::string const mark = NewJobMark();
    auto writes =
        ListOf(Put(JobPreparedKey, 1), Put(StateKey, Announced), Put(NameKey, announcement.name),
               Put(UserKey, session.Who().name), Put(EndPointKey, session.EndPoint()), Put(JobMarkKey, mark));
    if (m_tickets.IncarnationOf({QueueTicketType, announcement.queue}) != 0)
        writes.push_back(Put("Job/Queue", announcement.queue));
    if (announcement.copies > 0)
        writes.push_back(Put("Job/Copies", announcement.copies));
    auto const ticket = MakeTicket(writes);
    if (!ticket)
        throw TransferError(TargetUnwritable, "no ticket can be made for a job; try again");
    return {*ticket, mark};
}

TransferResult JobIntake::Prepare(Session const& session, Announcement const& announcement, int& id)
{
    return m_transfers.Run(session,
                           [&](RunningTransfer const&)
                           {
                               CheckName(announcement.name);
                               Job const job = Make(session, announcement);
                               id = job.ticket.address.id;
                               std::lock_guard const lock(m_lock);
                               m_prepared.push_back({session.Number(), announcement, job});
                           });
}

// The look at a ticket may wait for the disk, so it is taken without the lock.
void JobIntake::ForgetGone()
{
    std::vector<TicketWriter::Ticket> gone;
    {
        std::lock_guard const lock(m_lock);
        for (Prepared const& prepared : m_prepared)
            gone.push_back(prepared.job.ticket);
    }
    std::erase_if(gone, [this](TicketWriter::Ticket const& ticket) { return !IsGone(ticket); });
    std::lock_guard const lock(m_lock);
    std::erase_if(m_prepared,
                  [&](Prepared const& prepared)
                  {
                      auto const isSame = [&](TicketWriter::Ticket const& ticket)
                      {
                          return ticket.address == prepared.job.ticket.address &&
                                 ticket.incarnation == prepared.job.ticket.incarnation;
                      };
                      return std::any_of(gone.begin(), gone.end(), isSame);
                  });
}

std::optional<JobIntake::Job> JobIntake::Claim(Session const& session, std::string const& name)
{
    ForgetGone();
    std::lock_guard const lock(m_lock);
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
    return m_transfers.Run(session,
                           [&](RunningTransfer& running)
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
                                       Drop(std::move(*job));
                                   throw;
                               }
                           });
}

// Of a ticket that cannot be read nobody knows.
bool JobIntake::MayTellOfFile(TicketWriter::Ticket const& ticket)
{
    bool tells = false;
    bool const isRead = m_tickets.LookAt(ticket.address, ticket.incarnation,
                                         [&](TicketSnapshot const& job)
                                         {
                                             tells = job.Find(std::string_view(JobFileKey)) != nullptr;
                                             return true;
                                         });
    return isRead ? tells : !IsGone(ticket);
}

// A ticket must not speak of a file that is gone; then the folder goes behind the ticket. Else it goes first:
// the file may be what fills the disk, and on a full one no ticket can be deleted.
void JobIntake::Drop(Job job)
{
    if (job.folders && !MayTellOfFile(job.ticket))  // where $(JOB) was then: it may have been moved
        RemoveJobFolder(*job.folders, job.ticket.address.id, job.mark);
    if (m_writer.Delete(job.ticket) || IsGone(job.ticket))
        return;
    std::lock_guard const lock(m_lock);
    m_failed.push_back(std::move(job));
}

void JobIntake::DropAgain()
{
    std::vector<Job> failed;
    {
        std::lock_guard const lock(m_lock);
        if (m_failed.empty() || std::chrono::steady_clock::now() < m_nextAttempt)
            return;
        failed.swap(m_failed);
    }
    for (Job& job : failed)
        Drop(std::move(job));
    std::lock_guard const lock(m_lock);
    m_pause =
        m_failed.empty() ? std::chrono::seconds(0) : std::clamp(2 * m_pause, ShortestPause, LongestPause);
    m_nextAttempt = std::chrono::steady_clock::now() + m_pause;
}

void JobIntake::Receive(Session const& session, Job& job, SourceFile const& source, std::string const& name,
                        RunningTransfer& running)
{
    job.folders = Folders();
    Descriptor const folder = MakeJobFolder(*job.folders, job.ticket.address.id, job.mark);
    // Whoever deletes the ticket takes the folder away with it, but not one that comes only then. Of a folder
    // that comes before, this look tells; of one that goes later, the write at the end.
    if (IsGone(job.ticket))
        FailAsGone();
    try
    {
        m_transfers.CheckRoom();
        PartFile file(m_store, folder.Number(), name);
        auto const write = [&](int percent) { WriteOrFail(job.ticket, ListOf(Put(ProgressKey, percent))); };
        m_transfers.Copy(file, source, running, ProgressReport(source.Size(), write));
        file.Finish(PartFile::Survives::PowerCut);
        FlushFolderForJobs(*job.folders);
    }
    catch (TransferError const& error)
    {
        if (error.Result() != TransferCut && IsGone(job.ticket))
            FailAsGone();  // in a folder that was removed nothing gets a name
        throw;
    }
    Arrive(session, job, name, source.Size());
    m_store.Sync();
}

void JobIntake::Arrive(Session const& session, Job const& job, std::string const& name, long long size)
{
    auto const whereTheFolderIs = [&]
    {
        TicketSnapshot::Version version;
        FolderTable const folders(m_tickets.Folders(&version).values);
        if (folders.FolderOf("JOB") != job.folders->FolderOf("JOB"))
            throw TransferError(TargetUnwritable, "$(JOB) was moved while a job came in; send the job anew");
        return std::vector{TicketChange::Basis{SystemTicket, version.incarnation, version.revision}};
    };
    std::string const folder = "$(JOB)/" + std::to_string(job.ticket.address.id);
    WriteOrFail(job.ticket,
                ListOf(Put(NameKey, name), Put(UserKey, session.Who().name),
                       Put(EndPointKey, session.EndPoint()), Put(JobFileKey, folder + "/" + name),
                       Put("Job/Folder", folder), TicketWrite{"Job/Size", -1, TicketValue::Int64(size)},
                       Put(StateKey, Arrived), Put(ProgressKey, 100),
                       TicketWrite{JobPreparedKey, -1, TicketValue()}),
                {nullptr, TicketChange::Owner::Nobody, whereTheFolderIs});
}

void JobIntake::End(Session const& session)
{
    std::vector<Prepared> ended;
    {
        std::lock_guard const lock(m_lock);
        auto const isOthers = [&](Prepared const& prepared) { return prepared.session != session.Number(); };
        auto const first = std::stable_partition(m_prepared.begin(), m_prepared.end(), isOthers);
        ended.assign(std::move_iterator(first), std::move_iterator(m_prepared.end()));
        m_prepared.erase(first, m_prepared.end());
    }
    for (Prepared& prepared : ended)
        Drop(std::move(prepared.job));
}
}  // namespace standin
