#include "standin/server/site/Caretaker.h"

#include "standin/server/files/Report.h"
#include "standin/server/site/SiteFolders.h"
#include "standin/server/transfer/PartFile.h"
#include <utility>

namespace standin
{
namespace
{
constexpr std::chrono::milliseconds Pause(700);  // what a dead program has left goes within two seconds
}

Caretaker::Caretaker(Store& store, Feed& feed, TicketService& tickets, TicketWriter& writer, JobIntake& jobs,
                     SystemTicketMirror& mirror, std::filesystem::path site)
    : m_store(store), m_feed(feed), m_tickets(tickets), m_writer(writer), m_jobs(jobs), m_mirror(mirror),
      m_site(std::move(site))
{
}

void Caretaker::Start()
{
    std::lock_guard const lock(m_lock);
    if (!m_thread.joinable() && !m_isStopped)
        m_thread = std::thread([this] { Run(); });
}

void Caretaker::Stop()
{
    {
        std::lock_guard const lock(m_lock);
        m_isStopped = true;
    }
    m_end.notify_all();
    if (m_thread.joinable())
        m_thread.join();
}

void Caretaker::Run()
{
    for (std::unique_lock lock(m_lock); !m_isStopped;)
    {
        lock.unlock();
        Tidy();
        lock.lock();
        m_end.wait_for(lock, Pause, [this] { return m_isStopped; });
    }
}

// Each duty by itself: what makes one fail may be what another one clears away, such as a file that fills the
// disk.
void Caretaker::Tidy() noexcept
{
    std::lock_guard const round(m_round);
    bool const hadReported = std::exchange(m_hasReported, false);
    auto const attempt = [&](auto const& duty)
    {
        try
        {
            duty();
        }
        catch (std::exception const& error)
        {
            if (!hadReported && !m_hasReported)
                Report(error.what());
            m_hasReported = true;
        }
    };
    attempt([this] { m_store.Maintain(m_feed.Settled()); });
    attempt([this] { m_store.Bury([this](Estate const& estate) { Clear(estate); }); });
    attempt([this] { m_jobs.DropAgain(); });
    m_mirror.CatchUp();
    if (!m_hasBuried)
        return;
    attempt(
        [this]
        {
            SweepJobFolders(m_store, m_tickets, m_site);
            m_mirror.Write();  // it may have died between a change and the copy of it
            m_hasBuried = false;
        });
}

// The right to bury the program may be lost in the middle of it, and the program may come back then and send
// its jobs: so nothing goes that has changed since the estate was listed, and the next burial looks again.
void Caretaker::Clear(Estate const& estate)
{
    m_hasBuried = true;
    for (std::string const& file : estate.partFiles)
        RemovePartFile(file);
    for (Estate::Ticket const& ticket : estate.tickets)
    {
        if (!m_writer.DeleteOrThrow({ticket.address, ticket.incarnation}, ticket.revision) &&
            IsStored(ticket))
            throw StoreError("a job of a program that has died cannot be deleted yet; it is tried again by "
                             "itself");
    }
}

// What the cache does not know it may not have heard of yet.
bool Caretaker::IsStored(Estate::Ticket const& ticket)
{
    auto const found = m_store.Load(ticket.address, [](auto, int, auto const&) {});
    return found && found->state.incarnation == ticket.incarnation;
}
}  // namespace standin
