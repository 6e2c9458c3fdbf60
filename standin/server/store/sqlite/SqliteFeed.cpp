// How a SqliteStore tells of changes: its journal, its bell, and the pruning of the journal.
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/sqlite/SqliteConnections.h"
#include <algorithm>

namespace standin
{
namespace
{
using namespace std::chrono_literals;

// What one call hands out of the journal is held in memory.
constexpr std::size_t LargestFeedBytes = 16ul << 20;

// So many records go in one transaction, and so many transactions in one call of Maintain, lest others wait.
constexpr Sequence PrunedAtOnce = 1000;
constexpr int PruningsAtOnce = 100;

[[noreturn]] void FailAsBrokenJournal(Database const& database, std::string const& reason)
{
    try
    {
        database.FailAsDamaged(reason);
    }
    catch (StoreError const& error)
    {
        throw BrokenJournal(error.what());
    }
}
}  // namespace

bool SqliteStore::ChangesSince(Sequence after, std::function<void(CommittedChange&&)> const& take)
{
    std::vector<CommittedChange> changes;
    {
        auto const lock = Lock(m_reading);
        Database& database = m_reader->database;
        Reading const reading(*this);
        Database::Run pruned(database, m_reader->pruned);
        if (pruned.Step() && after < pruned.Number(0))
            return false;
        std::size_t bytes = 0;
        Sequence last = after;
        Database::Run run(database, m_reader->journal);
        run << after << m_options.limits.feedLargest;
        while (bytes < LargestFeedBytes && run.Step())
        {
            if (run.Number(0) != ++last)
                FailAsBrokenJournal(database, "the journal has no record " + std::to_string(last));
            try
            {
                bytes += run.Bytes(6).size();
                changes.push_back({last, run.Integer(1), run.Number(2),
                                   ReadChangeRecord(run.Int(3), {run.Int(4), run.Int(5)}, run.Bytes(6))});
            }
            catch (StoreError const& error)
            {
                FailAsBrokenJournal(database, error.what());
            }
            TicketChange& change = changes.back().change;
            if (change.kind == TicketChange::Create)
                change.incarnation = change.revision = last;
        }
    }
    for (CommittedChange& change : changes)
        take(std::move(change));
    return true;
}

void SqliteStore::WaitForChanges(Sequence heard, std::chrono::milliseconds time)
{
    CheckUsable();
    auto const end = std::chrono::steady_clock::now() + std::min<std::chrono::milliseconds>(time, 1h);
    for (;;)
    {
        std::uint32_t const bell = m_page->Bell();  // first: a ring behind it is not slept through
        if (m_isInterrupted.exchange(false) || Committed() > heard)
            return;
        auto const left = end - std::chrono::steady_clock::now();
        if (left <= 0s)
            break;
        m_page->Wait(bell, left);
    }
    Sequence last = 0;
    {
        auto const lock = Lock(m_reading);
        last = LastSequence(m_reader->database, m_reader->lastSequence);
    }
    if (last > Committed())
    {
        m_page->RaiseCommitted(last);
        m_page->Ring(SharedPage::For::All);
    }
}

void SqliteStore::Interrupt() noexcept
{
    m_isInterrupted = true;
    if (!m_lock->IsForeign())
        m_page->Ring(SharedPage::For::All);
}

void SqliteStore::Maintain(Sequence heard)
{
    CheckInPlace();
    std::lock_guard const maintenance(m_maintenance);
    if (heard != m_heard)
    {
        auto const lock = Lock(m_writing);
        Database& database = m_writer->database;
        Database::Statement const note = database.Prepare("UPDATE program SET heard = ? WHERE id = ?");
        Writing writing(*this);
        (Database::Run(database, note) << heard << static_cast<long long>(m_self)).Do();
        writing.Commit();
        m_heard = heard;
    }
    Sequence pruned = 0;
    Sequence const upTo = PrunableUpTo(pruned);
    for (int i = 0; i < PruningsAtOnce && pruned < upTo; ++i)
    {
        pruned = std::min(pruned + PrunedAtOnce, upTo);
        auto const lock = Lock(m_writing);
        Database& database = m_writer->database;
        Database::Statement const drop = database.Prepare("DELETE FROM journal WHERE sequence <= ?");
        Database::Statement const note =
            database.Prepare("UPDATE site SET value = max(value, ?) WHERE name = 'pruned'");
        Writing writing(*this);
        (Database::Run(database, drop) << pruned).Do();
        (Database::Run(database, note) << pruned).Do();
        writing.Commit();
    }
}

// pruned: up to where the journal is pruned already.
Sequence SqliteStore::PrunableUpTo(Sequence& pruned)
{
    Sequence last = 0;
    std::vector<std::pair<ProgramId, Sequence>> programs;
    {
        auto const lock = Lock(m_reading);
        Database& database = m_reader->database;
        Reading const reading(*this);
        last = LastSequence(database, m_reader->lastSequence);
        Database::Run prunedRun(database, m_reader->pruned);
        pruned = prunedRun.Step() ? prunedRun.Number(0) : 0;
        Database::Statement const list = database.Prepare("SELECT id, heard FROM program");
        Database::Run run(database, list);
        while (run.Step())
            programs.emplace_back(run.Integer(0), run.Number(1));
    }
    StoreLimits const& limits = m_options.limits;
    Sequence upTo = last - std::min(last, limits.journalKept);
    for (auto const& [program, heard] : programs)
        if (heard < upTo && IsAlive(program))
            upTo = heard;
    return std::max(upTo, last - std::min(last, limits.journalLargest));
}
}  // namespace standin
