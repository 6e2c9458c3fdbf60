// How a SqliteStore commits changes and brings them to the disk.
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/StoreRows.h"
#include "standin/server/store/sqlite/SqliteConnections.h"
#include <algorithm>

namespace standin
{
CommitOutcome SqliteStore::Commit(TicketChange const& change, std::uint64_t number)
{
    CheckUsable();
    if (m_options.durability == Durability::Full)
        return m_group->Commit(change, number);
    PendingChange pending{change, number};
    PendingChange* const alone[] = {&pending};
    CommitTogether(alone);
    return pending.outcome;
}

// In one transaction, in which each finds what those before it have made.
void SqliteStore::CommitTogether(GroupCommit::Group group)
{
    auto const lock = Lock(m_writing);
    Writing writing(*this);
    Sequence const before = Committed();
    Sequence last = before;
    for (PendingChange* const pending : group)
    {
        RecordOf(pending->change);
        CommitOutcome& outcome = pending->outcome;
        outcome = Make(pending->change, last + 1);
        if (outcome.kind != CommitOutcome::Committed)
        {
            outcome.sequence = last;
            continue;
        }
        ++last;
        (Database::Run(m_writer->database, m_writer->addRecord)
         << outcome.sequence << static_cast<long long>(m_self) << pending->number
         << static_cast<int>(pending->change.kind) << outcome.address << std::string_view(m_writer->record))
            .Do();
    }
    if (last == before)
        writing.Cancel();
    else
        writing.Commit(last);
}

// Into m_writer->record.
void SqliteStore::RecordOf(TicketChange const& change)
{
    m_writer->record.clear();
    try
    {
        CheckAddress(change);
        AppendChangeRecord(m_writer->record, change);
    }
    catch (StoreError const& error)
    {
        throw StoreError(m_file.string() + ": " + error.what());
    }
}

// Changes the rows, in a transaction of the caller's.
CommitOutcome SqliteStore::Make(TicketChange const& change, Sequence next)
{
    using Run = Database::Run;
    Writer& writer = *m_writer;
    Database& database = writer.database;
    TicketAddress address = change.address;
    ProgramId const owner = change.owner == TicketChange::Owner::ThisProgram ? m_self : 0;
    for (TicketChange::Basis const& other : change.others)
    {
        Run basis(database, writer.isAsPlannedOn);
        basis << other.address << other.incarnation << other.revision;
        if (!basis.Step())
            return {CommitOutcome::Conflict, next, address};
    }
    switch (change.kind)
    {
    case TicketChange::Create:
        if (address.id == TicketChange::NextId)
            address.id = NextId(change);
        if (address.id < 0)
            return {CommitOutcome::NoFreeId, next, change.address};
        (Run(database, writer.create) << address << next << next << static_cast<long long>(owner)).Do();
        break;
    case TicketChange::Write:
        if (change.owner == TicketChange::Owner::Unchanged)
            (Run(database, writer.write) << address << change.incarnation << change.revision << next).Do();
        else
            (Run(database, writer.writeAndOwn)
             << address << change.incarnation << change.revision << next << static_cast<long long>(owner))
                .Do();
        break;
    case TicketChange::Delete:
        if (change.revision == TicketChange::AnyRevision)
            (Run(database, writer.removeAny) << address << change.incarnation).Do();
        else
            (Run(database, writer.remove) << address << change.incarnation << change.revision).Do();
        break;
    }
    if (database.Changes() != 1)
        return {CommitOutcome::Conflict, next, address};
    if (change.kind == TicketChange::Delete)
        (Run(database, writer.removeParameters) << address).Do();
    else
        PutParameters(address, change);
    return {CommitOutcome::Committed, next, address};
}

// With the largest possible id in use there is nothing above, and the smallest free one is due. -1: there is
// none.
int SqliteStore::NextId(TicketChange const& change)
{
    Database::Run largestInUse(m_writer->database, m_writer->largestId);
    largestInUse << change.address.type;
    largestInUse.Step();
    int const largest = std::max(largestInUse.Int(0), change.aboveId);  // NULL reads as 0
    if (largest < m_options.limits.largestId)
        return largest + 1;
    int free = 0;
    Database::Run ids(m_writer->database, m_writer->ids);
    ids << change.address.type;
    while (ids.Step() && ids.Int(0) == free)
        ++free;
    return free <= m_options.limits.largestId ? free : -1;
}

void SqliteStore::PutParameters(TicketAddress address, TicketChange const& change)
{
    using Run = Database::Run;
    Writer& writer = *m_writer;
    Run put(writer.database, writer.putParameter);
    put << address;
    for (ParameterChange const& parameter : change.parameters)
    {
        bool const isDeletion = IsDeletion(parameter);
        if (parameter.pos == -1 && (isDeletion || parameter.hadOthers))
            (Run(writer.database, writer.dropKey) << address << std::string_view(parameter.key)).Do();
        else if (isDeletion)
            (Run(writer.database, writer.dropValue)
             << address << std::string_view(parameter.key) << parameter.pos)
                .Do();
        if (isDeletion)
            continue;
        TicketValue const& value = parameter.value;
        put.AgainFrom(2);
        put << std::string_view(parameter.key) << std::max(parameter.pos, 0) << static_cast<int>(value.type);
        if (IsText(value.type))
            put << (value.text ? std::string_view(value.text->bytes) : std::string_view());
        else  // a double as bits: SQLite makes NULL of a NaN and an integer of a whole number
            put << ColumnOf(value);
        put.Do();
    }
}

std::optional<CommitOutcome> SqliteStore::FindCommit(std::uint64_t number)
{
    std::optional<CommitOutcome> outcome;
    {
        auto const lock = Lock(m_reading);
        Database& database = m_reader->database;
        Database::Statement const find =
            database.Prepare("SELECT sequence, type, id FROM journal WHERE program = ? AND number = ? "
                             "ORDER BY sequence DESC LIMIT 1");
        Database::Run run(database, find);
        run << static_cast<long long>(m_self) << number;
        if (run.Step())
            outcome = {CommitOutcome::Committed, run.Number(0), {run.Int(1), run.Int(2)}};
    }
    if (outcome && m_options.durability == Durability::Full)
        Flush(outcome->sequence);
    return outcome;
}

// --- the disk

void SqliteStore::Sync() { Flush(0); }

void SqliteStore::Flush(Sequence sequence)
{
    CheckUsable();
    m_flusher->Flush(sequence);
}
}  // namespace standin
