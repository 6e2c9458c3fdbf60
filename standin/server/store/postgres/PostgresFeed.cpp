// How a PostgresStore reports changes: its journal, the wait for the bell, and the pruning of the journal.
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/postgres/PostgresTurn.h"
#include <algorithm>
#include <utility>

namespace standin
{
using postgres::Clock;
using postgres::Parameters;
using postgres::Result;

namespace
{
using namespace std::chrono_literals;

// What one call hands out of the journal is held in memory.
constexpr long long LargestFeedBytes = 16LL << 20;

// So many records go in one transaction, and so many transactions in one call of Maintain, lest others wait.
constexpr long long PrunedAtOnce = 1000;
constexpr int PruningsAtOnce = 100;

constexpr char const* JournalRemedy = "; bring a backup back";

CommittedChange ChangeOf(Result const& rows, int row, Sequence expected, std::string const& name)
{
    if (rows.Number(row, 1) != expected)
        throw BrokenJournal(name + ": the journal has no record " + std::to_string(expected) + JournalRemedy);
    CommittedChange committed{expected, rows.Integer(row, 2), rows.Number(row, 3), {}};
    TicketChange& change = committed.change;
    try
    {
        change = ReadChangeRecord(rows.Int(row, 4), {rows.Int(row, 5), rows.Int(row, 6)}, rows.Bytes(row, 7));
    }
    catch (StoreError const& error)
    {
        throw BrokenJournal(name + ": " + error.what() + JournalRemedy);
    }
    if (change.kind == TicketChange::Create)
        change.incarnation = change.revision = expected;
    return committed;
}
}  // namespace

bool PostgresStore::ChangesSince(Sequence after, std::function<void(CommittedChange&&)> const& take)
{
    // The sizes are known without the records, which lie elsewhere if they are large.
    Result const rows = Turn(*this).Run(
        "SELECT s.pruned, j.sequence, j.program, j.number, j.kind, j.type, j.id, j.record FROM site s LEFT "
        "JOIN ("
        "SELECT b.*, sum(octet_length(b.record)) OVER (ORDER BY b.sequence) - octet_length(b.record) AS "
        "before "
        "FROM (SELECT * FROM journal WHERE sequence > $1 ORDER BY sequence LIMIT $2) b) j ON j.before < $3 "
        "ORDER BY j.sequence",
        Parameters() << after << m_options.limits.feedLargest << LargestFeedBytes);
    if (after < rows.Number(0, 0))
        return false;
    std::vector<CommittedChange> changes;
    for (int row = 0; row < rows.Rows() && !rows.IsNull(row, 1); ++row)
        changes.push_back(ChangeOf(rows, row, after + static_cast<Sequence>(row) + 1, m_name));
    if (!changes.empty())
        RaiseCommitted(changes.back().sequence);
    for (CommittedChange& change : changes)
        take(std::move(change));
    return true;
}

void PostgresStore::RaiseCommitted(Sequence newest)
{
    Sequence known = m_committed;
    while (known < newest && !m_committed.compare_exchange_weak(known, newest))
        ;
    if (known >= newest)
        return;
    std::lock_guard const lock(m_hearing);  // lest a waiter has looked and does not wait yet
    m_heard.notify_all();
}

void PostgresStore::WaitForChanges(Sequence heard, std::chrono::milliseconds time)
{
    CheckUsable();
    {
        std::unique_lock lock(m_hearing);
        auto const end = Clock::now() + std::min<std::chrono::milliseconds>(time, 1h);
        if (m_heard.wait_until(lock, end,
                               [&] { return m_isInterrupted || m_committed > heard || m_reach.IsOver(); }))
        {
            m_isInterrupted = false;
            if (!m_reach.IsOver())
                return;
        }
    }
    RaiseCommitted(Turn(*this).Run("SELECT sequence FROM newest").Number(0, 0));
}

void PostgresStore::Interrupt() noexcept
{
    std::lock_guard const lock(m_hearing);
    m_isInterrupted = true;
    m_heard.notify_all();
}

// What it does not know of its own changes it may still ask the journal for.
Sequence PostgresStore::Needed(Sequence heard)
{
    auto const now = Clock::now();
    std::lock_guard const lock(m_unknowns);
    for (auto& [number, unknown] : m_unknown)
    {
        unknown.isKept = unknown.isKept && now - unknown.askedAt <= m_options.askingPause;
        if (unknown.isKept)
            heard = std::min(heard, unknown.known);
    }
    return heard;
}

// Who is missing, and has been for the settling time, which is what all have to come back after a break: as
// far as this program has seen over the connection that it has.
std::vector<long long> PostgresStore::Gone()
{
    Turn turn(*this);
    Result const rows = turn.Run("SELECT id FROM program WHERE id NOT IN (SELECT program FROM living)");
    auto const now = Clock::now();
    if (std::exchange(m_goneOver, m_connected) != m_connected)
        m_missing.clear();
    std::map<ProgramId, Clock::time_point> missing;
    std::vector<long long> gone;
    for (int row = 0; row < rows.Rows(); ++row)
    {
        ProgramId const program = rows.Integer(row, 0);
        auto const known = m_missing.find(program);
        auto const since = known == m_missing.end() ? now : known->second;
        missing.emplace(program, since);
        if (now - since >= m_options.settling)
            gone.push_back(program);
    }
    m_missing = std::move(missing);
    return gone;
}

void PostgresStore::Maintain(Sequence heard)
{
    m_settled = heard;
    {
        Turn turn(*this);  // no change of its own is on its way meanwhile
        // A sound connection finds by its name what somebody has restored in the place of a schema that he
        // dropped, of which this program knows nothing.
        bool const isOurs = turn.Run("SELECT note_heard($1, $2) FROM site WHERE lock_class() = $3",
                                     Parameters() << m_self << Needed(heard) << m_lockClass)
                                .Rows() == 1;
        if (!isOurs)
            End(m_name +
                ": another site has taken the place of the one that this program has open; start the "
                "program anew");
        if (m_hasLeftovers)
        {
            m_hasLeftovers = false;  // before: what fails meanwhile is left over anew
            try
            {
                PutBelongingsBack(turn.Deadline());
            }
            catch (...)
            {
                m_hasLeftovers = true;
                throw;
            }
        }
    }
    StoreLimits const& limits = m_options.limits;
    auto const gone = Gone();
    for (int i = 0; i < PruningsAtOnce; ++i)
    {
        Result const pruned = Turn(*this).Run("SELECT prune_journal($1, $2, $3, $4)",
                                              Parameters() << limits.journalKept << limits.journalLargest
                                                           << PrunedAtOnce << gone);
        if (pruned.Integer(0, 0) < PrunedAtOnce)
            return;
    }
}
}  // namespace standin
