// How jobs come to the server. A job is a ticket of type 3 and a file in a folder of its own, $(JOB)/ID. It
// may be announced first, which makes the ticket with "Job/State" 0; the file turns it into 1, in the very
// transaction that says where the file is. So a job in state 1 has its whole file, whenever the process ends,
// and when Send has returned also when the power does. Until then the ticket belongs to this program: it
// goes when its session ends, or with the program. For any thread.
#pragma once

#include "standin/server/transfer/TransferError.h"
#include "standin/server/transfer/TransferService.h"

namespace standin
{
inline constexpr char JobPreparedKey[] = "Job/Prepared";
inline constexpr char JobFileKey[] = "Job/File";  // once it is there

class JobIntake
{
public:
    JobIntake(Store& store, TicketService& tickets, TicketWriter& writer, TransferService& transfers)
        : m_store(store), m_tickets(tickets), m_writer(writer), m_transfers(transfers)
    {
    }
    JobIntake(JobIntake const&) = delete;
    JobIntake& operator=(JobIntake const&) = delete;

    struct Announcement
    {
        std::string name;    // of the file that will come
        bool isCut = false;  // the name had no room: the file's begins with it
        int queue = 0;       // the id of a ticket of type 7; none if there is no such ticket
        int copies = 0;      // none below 1
    };

    // Makes the job's ticket; id gets its id.
    TransferResult Prepare(Session const& session, Announcement const& announcement, int& id);

    // Copies a file of the client's into the newest job of the session that was announced with that name and
    // has not come yet, or into one made now. On failure the job's ticket is gone, and its folder too.
    TransferResult Send(Session const& session, std::string const& clientPath, std::string const& name);

    void End(Session const& session);  // an ended one: what it has announced and not sent goes

    // Deletes what has failed and could not be deleted then. To be called every now and then; what goes on
    // failing is tried ever more rarely.
    void DropAgain();

private:
    struct Job
    {
        TicketWriter::Ticket ticket;
        std::string mark;                      // of its folder
        std::optional<FolderTable> folders{};  // as they were when its folder was made
    };
    struct Prepared
    {
        unsigned long long session;
        Announcement announcement;
        Job job;
    };

    Job Make(Session const& session, Announcement const& announcement);
    int FreeId() const;
    std::optional<TicketWriter::Ticket> MakeTicket(std::vector<TicketWrite>& writes);
    void ForgetGone();
    std::optional<Job> Claim(Session const& session, std::string const& name);
    void Receive(Session const& session, Job& job, SourceFile const& source, std::string const& name,
                 RunningTransfer& running);
    void Arrive(Session const& session, Job const& job, std::string const& name, long long size);
    bool MayTellOfFile(TicketWriter::Ticket const& ticket);
    void Drop(Job job);
    bool IsGone(TicketWriter::Ticket const& ticket) const;
    void WriteOrFail(TicketWriter::Ticket const& ticket, std::vector<TicketWrite> writes,
                     TicketWriter::Conditions const& conditions = {});
    FolderTable Folders() const { return FolderTable(m_tickets.Folders().values); }

    Store& m_store;
    TicketService& m_tickets;
    TicketWriter& m_writer;
    TransferService& m_transfers;
    std::mutex m_lock;
    std::vector<Prepared> m_prepared;  // in the order of their making
    std::vector<Job> m_failed;         // whose tickets are still there
    std::chrono::steady_clock::time_point m_nextAttempt{};
    std::chrono::seconds m_pause{0};  // behind that attempt
};
}  // namespace standin
