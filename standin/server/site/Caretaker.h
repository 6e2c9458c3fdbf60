// Keeps a site in order while it is open: notes how far this program has heard, lets the journal be pruned,
// and clears up after programs that died. On a thread of its own.
#pragma once

#include "standin/server/feed/TicketWriter.h"
#include "standin/server/jobs/JobIntake.h"
#include "standin/server/sessions/TicketService.h"
#include "standin/server/site/SystemTicketMirror.h"
#include <condition_variable>
#include <filesystem>
#include <mutex>
#include <thread>

namespace standin
{
class Caretaker
{
public:
    // Everything outlives it. site: the folder.
    Caretaker(Store& store, Feed& feed, TicketService& tickets, TicketWriter& writer, JobIntake& jobs,
              SystemTicketMirror& mirror, std::filesystem::path site);
    ~Caretaker() { Stop(); }
    Caretaker(Caretaker const&) = delete;
    Caretaker& operator=(Caretaker const&) = delete;

    void Start();
    void Stop();

    // One round, as the thread makes it every now and then; waits for one that it makes. Failures are
    // reported on stderr, once.
    void Tidy() noexcept;

private:
    void Clear(Estate const& estate);
    bool IsStored(Estate::Ticket const& ticket);
    void Run();

    Store& m_store;
    Feed& m_feed;
    TicketService& m_tickets;
    TicketWriter& m_writer;
    JobIntake& m_jobs;
    SystemTicketMirror& m_mirror;
    std::filesystem::path const m_site;

    std::mutex m_round;
    bool m_hasReported = false;  // for who has the round
    bool m_hasBuried = false;    // and has yet to look after the folders; the same

    std::mutex m_lock;  // the members below
    std::condition_variable m_end;
    bool m_isStopped = false;
    std::thread m_thread;
};
}  // namespace standin
