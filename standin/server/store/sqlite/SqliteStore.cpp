#include "standin/server/store/sqlite/SqliteStore.h"

#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/sqlite/Schema.h"
#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <sqlite3.h>
#include <sys/stat.h>
#include <tuple>
#include <unistd.h>

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

// To the last who leaves, another one who opens or leaves at the same moment is worth waiting for.
constexpr std::chrono::milliseconds LeavingLimit = 5s;

#define COMGUI_LAST_SEQUENCE                                                                                 \
    "max(coalesce((SELECT max(sequence) FROM journal), 0), (SELECT value FROM site WHERE name = 'pruned'))"

std::string ProgramName()
{
#if defined(__GLIBC__)
    return program_invocation_short_name;
#else
    return getprogname();
#endif
}

std::string MachineName()
{
    char name[256] = {};
    return gethostname(name, sizeof name - 1) == 0 && name[0] != '\0' ? name : "localhost";
}

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

bool IsDeletion(ParameterChange const& parameter)
{
    return parameter.value.type == PARAM_NONE || parameter.value.type == PARAM_POINTER;
}
}  // namespace

struct SqliteStore::Writer
{
    Writer(std::filesystem::path const& file, bool mayMake) : database(file, mayMake) {}

    void Prepare()
    {
        lastSequence = database.Prepare("SELECT " COMGUI_LAST_SEQUENCE);
        isAsPlannedOn = database.Prepare(
            "SELECT 1 FROM ticket WHERE type = ? AND id = ? AND incarnation = ? AND revision = ?");
        write = database.Prepare("UPDATE ticket SET revision = ?5 "
                                 "WHERE type = ?1 AND id = ?2 AND incarnation = ?3 AND revision = ?4");
        writeAndOwn = database.Prepare("UPDATE ticket SET revision = ?5, owner = ?6 "
                                       "WHERE type = ?1 AND id = ?2 AND incarnation = ?3 AND revision = ?4");
        create = database.Prepare("INSERT INTO ticket VALUES (?, ?, ?, ?, ?) ON CONFLICT DO NOTHING");
        remove = database.Prepare("DELETE FROM ticket WHERE type = ? AND id = ? AND incarnation = ? "
                                  "AND revision = ?");
        removeAny = database.Prepare("DELETE FROM ticket WHERE type = ? AND id = ? AND incarnation = ?");
        removeParameters = database.Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ?");
        largestId = database.Prepare("SELECT max(id) FROM ticket WHERE type = ?");
        ids = database.Prepare("SELECT id FROM ticket WHERE type = ? ORDER BY id");
        putParameter = database.Prepare("REPLACE INTO parameter VALUES (?, ?, ?, ?, ?, ?)");
        dropKey =
            database.Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ? AND key = ?");
        dropValue =
            database.Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ? AND key = ? "
                             "AND pos = ?");
        addRecord = database.Prepare("INSERT INTO journal VALUES (?, ?, ?, ?, ?, ?, ?)");
        putUser = database.Prepare("REPLACE INTO user VALUES (?, ?, ?, ?)");
    }

    Database database;
    Database::Statement lastSequence, isAsPlannedOn, write, writeAndOwn, create, remove, removeAny,
        removeParameters, largestId, ids, putParameter, dropKey, dropValue, addRecord, putUser;
    std::string record;  // the one that is being written
};

struct SqliteStore::Reader
{
    explicit Reader(std::filesystem::path const& file)
        : database(file, false), lastSequence(database.Prepare("SELECT " COMGUI_LAST_SEQUENCE)),
          tickets(database.Prepare("SELECT type, id, incarnation, revision FROM ticket ORDER BY type, id")),
          ticket(database.Prepare("SELECT incarnation, revision, " COMGUI_LAST_SEQUENCE
                                  " FROM ticket WHERE type = ? AND id = ?")),
          parameters(database.Prepare("SELECT key, pos, value_type, value FROM parameter "
                                      "WHERE ticket_type = ? AND ticket_id = ? ORDER BY key, pos")),
          pruned(database.Prepare("SELECT value FROM site WHERE name = 'pruned'")),
          journal(database.Prepare("SELECT sequence, program, number, kind, type, id, record FROM journal "
                                   "WHERE sequence > ? ORDER BY sequence LIMIT ?")),
          findUser(database.Prepare("SELECT name, password_hash, role, ticket_id FROM user WHERE name = ?"))
    {
    }

    Database database;
    Database::Statement lastSequence, tickets, ticket, parameters, pruned, journal, findUser;
};

// A transaction of the writer in its turn, for who holds m_writing. Undone at its end unless committed.
class SqliteStore::Writing
{
public:
    explicit Writing(SqliteStore& store)
        : m_store(store), m_turn(*store.m_page, store.m_options.turnLimit),
          m_transaction(store.m_writer->database, Database::Transaction::Write)
    {
        if (m_turn.IsAfterFailure())
            store.m_page->RaiseCommitted(
                store.LastSequence(store.m_writer->database, store.m_writer->lastSequence));
    }

    // newest: the number of the change that this is, if it is one.
    void Commit(Sequence newest = 0)
    {
        m_transaction.Commit();
        m_store.m_page->RaiseCommitted(newest);
        m_turn.End();
        if (newest != 0)
            m_store.m_page->Ring(SharedPage::For::Others);
    }

    void Cancel()
    {
        m_transaction.RollBack();
        m_turn.End();
    }

private:
    SqliteStore& m_store;
    SharedPage::Turn m_turn;
    Database::Transaction m_transaction;
};

// A moment of the database, for who holds m_reading.
class SqliteStore::Reading
{
public:
    explicit Reading(SqliteStore& store)
        : m_transaction(store.m_reader->database, Database::Transaction::Read)
    {
    }

private:
    Database::Transaction m_transaction;
};

// --- opening

SqliteStore::SqliteStore(std::filesystem::path const& folder, std::function<StoreContent()> const& first,
                         SqliteOptions options)
    : m_folder(folder), m_file(folder / "site.db"), m_options(std::move(options))
{
    Enter();
    m_flusher = std::make_unique<Flusher>(m_file, *m_page);
    m_group = std::make_unique<GroupCommit>([this](GroupCommit::Group group) { CommitTogether(group); },
                                            [this](Sequence sequence) { Flush(sequence); });
    OpenDatabase(first);
    auto const noteDamage = [this] { m_page->NoteDamage(); };
    m_writer->database.ReportDamageTo(noteDamage);
    m_reader = std::make_unique<Reader>(m_file);
    m_reader->database.Execute("PRAGMA query_only = ON");
    m_reader->database.ReportDamageTo(noteDamage);
    m_reader->database.TrustJournal();
    Register();
    struct stat found = {};
    m_inode = stat(m_file.c_str(), &found) == 0 ? static_cast<std::int64_t>(found.st_ino) : 0;
    if (m_wasFirst && !m_lock->TryLock(LockFile::Site, LockFile::Hold::Shared))
        throw StoreError(m_lock->Path().string() +
                         ": somebody else locks it; end that program, then try again");
    if (!m_options.keepOpening)
        EndOpening();
}

SqliteStore::~SqliteStore()
{
    if (!m_lock->IsForeign())
        return;
    // The parent's connections: closing them here would work on its database.
    std::ignore = m_writer.release();
    std::ignore = m_reader.release();
    m_flusher->Abandon();
}

// Takes the right to open, and a share of the site.
void SqliteStore::Enter()
{
    do
    {
        m_lock = std::make_unique<LockFile>(m_folder);
        if (!m_lock->LockWithin(LockFile::Opening, LockFile::Hold::Exclusive, m_options.openingLimit))
            throw StoreError(m_folder.string() +
                             ": another program has been opening it all the time; end that, then try again");
    } while (!m_lock->IsAtItsPath());
    m_isOpening = true;
    m_page = std::make_unique<SharedPage>(*m_lock);
    m_wasFirst = m_lock->TryLock(LockFile::Site, LockFile::Hold::Exclusive);
    if (m_wasFirst && m_lock->IsFolderHeldElsewhere())
        throw StoreError(m_lock->Path().string() +
                         ": was removed while programs have the site open, which therefore "
                         "cannot be seen; end them, then try again");
    m_lock->HoldFolder();
    if (!m_wasFirst && !m_lock->TryLock(LockFile::Site, LockFile::Hold::Shared))
        throw StoreError(m_lock->Path().string() +
                         ": somebody else locks it; end that program, then try again");
}

void SqliteStore::OpenDatabase(std::function<StoreContent()> const& first)
{
    if (!m_wasFirst)
        return OpenBesideOthers();
    try
    {
        OpenAlone(first);
    }
    catch (DamagedStore const& damage)
    {
        m_writer.reset();
        if (!m_options.setAside)
            throw;
        m_options.setAside(damage);
        OpenAlone(first);
    }
}

void SqliteStore::OpenAlone(std::function<StoreContent()> const& first)
{
    auto const note = m_page->TakeNote();
    SharedPage::ClosingNote now;
    m_endedInOrder = note && MayHaveNote(now) && now == *note;
    std::error_code missing;
    auto const journalSize = std::filesystem::file_size(m_file.string() + "-wal", missing);
    bool const hasJournal = !missing && journalSize > 0;

    m_writer = std::make_unique<Writer>(m_file, true);
    Database& database = m_writer->database;
    bool const isNew = schema::IsNew(database);
    if (!isNew)
    {
        schema::CheckMarks(database);
        if (!m_endedInOrder)
            schema::CheckPages(database, hasJournal);
    }
    database.Execute("PRAGMA journal_mode = WAL");
    database.Execute("PRAGMA synchronous = NORMAL");
    database.Execute("PRAGMA journal_size_limit = 16777216");
    if (isNew)
        Fill(first());
    else if (schema::IsOfVersion1(database))
    {
        Database::Transaction transaction(database, Database::Transaction::Write);
        schema::Upgrade(database);
        transaction.Commit();
    }
    schema::CheckTables(database);
    m_writer->Prepare();
    database.TrustJournal();
    m_page->Reset(LastSequence(database, m_writer->lastSequence), m_endedInOrder && m_page->IsTidy());
}

void SqliteStore::OpenBesideOthers()
{
    m_page->Check();
    try
    {
        m_writer = std::make_unique<Writer>(m_file, false);
        Database& database = m_writer->database;
        schema::CheckMarks(database);
        database.Execute("PRAGMA synchronous = NORMAL");
        database.Execute("PRAGMA journal_size_limit = 16777216");
        schema::CheckTables(database);
        m_writer->Prepare();
        database.TrustJournal();
        if (database.Number("SELECT value FROM site WHERE name = 'lock file'") != m_lock->Inode())
            throw StoreError(m_lock->Path().string() +
                             ": is not the file by which the programs that have the site "
                             "open know each other; end them all, then try again");
    }
    catch (DamagedStore const& damage)
    {
        m_page->NoteDamage();
        throw StoreError(damage.what());  // nobody can set the file aside now
    }
}

void SqliteStore::Fill(StoreContent const& content)
{
    Database& database = m_writer->database;
    Database::Transaction transaction(database, Database::Transaction::Write);
    schema::Make(database);
    m_writer->Prepare();
    Sequence last = 0;
    for (TicketChange const& change : content.tickets)
    {
        RecordOf(change);  // refuses what cannot be stored
        if (Make(change, ++last).kind != CommitOutcome::Committed)
            throw StoreError(m_file.string() +
                             ": a site cannot begin with a ticket twice; correct its content");
    }
    // Nobody has heard of the site before, so its journal begins behind what it began with.
    Database::Statement const prune = database.Prepare("UPDATE site SET value = ? WHERE name = 'pruned'");
    (Database::Run(database, prune) << last).Do();
    for (User const& user : content.users)
        Put(user);
    transaction.Commit();
}

void SqliteStore::Register()
{
    Database& database = m_writer->database;
    Writing writing(*this);
    if (m_wasFirst)
    {
        Database::Statement const note =
            database.Prepare("UPDATE site SET value = ? WHERE name = 'lock file'");
        (Database::Run(database, note) << static_cast<long long>(m_lock->Inode())).Do();
    }
    m_heard = Committed();
    std::string const machine = MachineName();
    std::string const name = ProgramName();
    Database::Statement const add =
        database.Prepare("INSERT INTO program (process, machine, name, since, heard) VALUES (?, ?, ?, ?, ?)");
    (Database::Run(database, add) << static_cast<long long>(getpid()) << std::string_view(machine)
                                  << std::string_view(name) << static_cast<long long>(std::time(nullptr))
                                  << m_heard)
        .Do();
    m_self = database.LastRow();
    // Before anybody can see the program, lest it be taken for dead.
    if (!m_lock->TryLock(LockFile::Life(m_self), LockFile::Hold::Exclusive))
        throw StoreError(m_lock->Path().string() +
                         ": somebody else locks it; end that program, then try again");
    writing.Commit();
}

void SqliteStore::EndOpening()
{
    std::lock_guard const lock(m_opening);
    if (std::exchange(m_isOpening, false))
        m_lock->Unlock(LockFile::Opening);
}

// The note of the database as it is, if it is all in one file.
bool SqliteStore::MayHaveNote(SharedPage::ClosingNote& note) const
{
    struct stat found = {};
    std::error_code error;
    auto const journalSize = std::filesystem::file_size(m_file.string() + "-wal", error);
    if ((!error && journalSize > 0) || stat(m_file.c_str(), &found) != 0)
        return false;
    auto const changed = std::filesystem::last_write_time(m_file, error);
    note.size = static_cast<std::int64_t>(found.st_size);
    note.inode = static_cast<std::int64_t>(found.st_ino);
    note.changed = static_cast<std::int64_t>(changed.time_since_epoch() / 1ns);
    return !error;
}

// --- what every operation begins with

void SqliteStore::CheckUsable() const
{
    if (m_lock->IsForeign())
        throw StoreError(m_folder.string() +
                         ": was opened by the parent of this process; open it in a program that "
                         "was started anew");
    if (m_hasLeft)
        throw StoreError(m_folder.string() + ": has been left; open it anew");
    if (m_isReplaced)
        throw StoreError(m_file.string() +
                         ": was removed or replaced while programs have it open; end them all, put "
                         "the right file in its place, then start them again");
}

// What is written to a file that has lost its name is lost with the last program.
void SqliteStore::CheckInPlace()
{
    struct stat found = {};
    if (stat(m_file.c_str(), &found) != 0 || static_cast<std::int64_t>(found.st_ino) != m_inode)
        m_isReplaced = true;
    CheckUsable();
}

std::unique_lock<std::mutex> SqliteStore::Lock(std::mutex& mutex) const
{
    CheckUsable();  // a copy in a child may have inherited a locked mutex
    std::unique_lock lock(mutex);
    CheckUsable();
    return lock;
}

Sequence SqliteStore::LastSequence(Database& database, Database::Statement const& statement) const
{
    Database::Run run(database, statement);
    return run.Step() ? run.Number(0) : 0;
}

// --- changes

// Into m_writer->record.
void SqliteStore::RecordOf(TicketChange const& change)
{
    m_writer->record.clear();
    TicketAddress const address = change.address;
    bool const isNext = change.kind == TicketChange::Create && address.id == TicketChange::NextId;
    try
    {
        if (!IsValid({address.type, isNext ? 0 : address.id}))
            throw StoreError("no ticket can have the address " + std::to_string(address.type) + "/" +
                             std::to_string(address.id) + "; choose another");
        AppendChangeRecord(m_writer->record, change);
    }
    catch (StoreError const& error)
    {
        throw StoreError(m_file.string() + ": " + error.what());
    }
}

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
        if (value.type == PARAM_STRING || value.type == PARAM_BINSTRING)
            put << (value.text ? std::string_view(value.text->bytes) : std::string_view());
        else if (value.type == PARAM_INT)
            put << static_cast<int>(value.word);
        else if (value.type == PARAM_UNSIGNED)
            put << static_cast<long long>(static_cast<unsigned>(value.word));
        else  // a double as bits: SQLite makes NULL of a NaN and an integer of a whole number
            put << static_cast<long long>(value.word);
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

// --- what holds

std::atomic<Sequence> const& SqliteStore::Committed() const noexcept { return m_page->Committed(); }

Sequence SqliteStore::Tickets(std::function<void(TicketAddress, TicketState const&)> const& take)
{
    auto const lock = Lock(m_reading);
    Reading const reading(*this);
    Sequence const sequence = LastSequence(m_reader->database, m_reader->lastSequence);
    Database::Run run(m_reader->database, m_reader->tickets);
    while (run.Step())
        take({run.Int(0), run.Int(1)}, {run.Number(2), run.Number(3)});
    return sequence;
}

std::optional<Store::Loaded>
SqliteStore::Load(TicketAddress address,
                  std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take)
{
    auto const lock = Lock(m_reading);
    Reading const reading(*this);
    Database::Run ticket(m_reader->database, m_reader->ticket);
    ticket << address;
    if (!ticket.Step())
        return std::nullopt;
    Loaded const loaded{{ticket.Number(0), ticket.Number(1)}, ticket.Number(2)};
    Database::Run run(m_reader->database, m_reader->parameters);
    run << address;
    while (run.Step())
        take(run.Bytes(0), run.Int(1), schema::ValueOf(m_reader->database, run, 2));
    return loaded;
}

// --- the feed

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

// --- programs

ProgramId SqliteStore::Self() const noexcept { return m_self; }

bool SqliteStore::IsAlive(ProgramId program) const
{
    return program == m_self || m_lock->IsLockedElsewhere(LockFile::Life(program));
}

std::vector<ProgramInfo> SqliteStore::Programs()
{
    std::vector<ProgramInfo> programs;
    {
        auto const lock = Lock(m_reading);
        Database& database = m_reader->database;
        Database::Statement const list =
            database.Prepare("SELECT id, process, machine, name, since, heard FROM program ORDER BY id");
        Database::Run run(database, list);
        while (run.Step())
            programs.push_back({run.Integer(0), static_cast<long>(run.Integer(1)), run.Text(2), run.Text(3),
                                run.Integer(4), run.Number(5), false});
    }
    for (ProgramInfo& program : programs)
        program.isAlive = IsAlive(program.id);
    return programs;
}

int SqliteStore::Bury(std::function<void(Estate const&)> const& clear)
{
    int buried = 0;
    std::exception_ptr failure;
    for (ProgramInfo const& program : Programs())
    {
        try
        {
            if (!program.isAlive)
                buried += BuryOne(program.id, clear) ? 1 : 0;
        }
        catch (...)
        {
            failure = failure ? failure : std::current_exception();
        }
    }
    if (failure)
        std::rethrow_exception(failure);
    return buried;
}

// False if somebody else does it or has done it.
bool SqliteStore::BuryOne(ProgramId program, std::function<void(Estate const&)> const& clear)
{
    {
        std::lock_guard const lock(m_burials);
        if (!m_burying.insert(program).second)
            return false;
    }
    off_t const byte = LockFile::Burial(program);
    bool isOurs = false;
    auto const end = [&]() noexcept
    {
        std::lock_guard const lock(m_burials);
        m_burying.erase(program);
        if (isOurs)
            m_lock->Unlock(byte);
    };
    bool isBuried = false;
    try
    {
        Estate estate;
        estate.program = program;
        isOurs = m_lock->TryLock(byte, LockFile::Hold::Exclusive);
        if (isOurs && TakeEstate(estate))
        {
            clear(estate);
            Forget(program);
            isBuried = true;
        }
    }
    catch (...)
    {
        end();
        throw;
    }
    end();
    return isBuried;
}

// False if the program is buried already.
bool SqliteStore::TakeEstate(Estate& estate)
{
    auto const lock = Lock(m_reading);
    Database& database = m_reader->database;
    auto const id = static_cast<long long>(estate.program);
    Reading const reading(*this);
    Database::Statement const program = database.Prepare("SELECT 1 FROM program WHERE id = ?");
    Database::Statement const tickets =
        database.Prepare("SELECT type, id, incarnation FROM ticket WHERE owner = ? AND owner <> 0");
    Database::Statement const partFiles = database.Prepare("SELECT path FROM part_file WHERE program = ?");
    Database::Run programRun(database, program);
    programRun << id;
    if (!programRun.Step())
        return false;
    Database::Run ticketRun(database, tickets);
    ticketRun << id;
    while (ticketRun.Step())
        estate.tickets.push_back({{ticketRun.Int(0), ticketRun.Int(1)}, ticketRun.Number(2)});
    Database::Run fileRun(database, partFiles);
    fileRun << id;
    while (fileRun.Step())
        estate.partFiles.push_back(fileRun.Text(0));
    return true;
}

void SqliteStore::Forget(ProgramId program)
{
    auto const lock = Lock(m_writing);
    Writing writing(*this);
    for (char const* const sql :
         {"UPDATE ticket SET owner = 0 WHERE owner = ? AND owner <> 0",
          "DELETE FROM session WHERE program = ?", "DELETE FROM part_file WHERE program = ?",
          "DELETE FROM program WHERE id = ?"})
        Change(sql, program);
    writing.Commit();
}

// One statement with one parameter, in a transaction of the caller's.
long long SqliteStore::Change(char const* sql, long long parameter)
{
    Database& database = m_writer->database;
    Database::Statement const statement = database.Prepare(sql);
    (Database::Run(database, statement) << parameter).Do();
    return database.Changes();
}

void SqliteStore::Leave()
{
    auto const writing = Lock(m_writing);
    {
        Writing leaving(*this);
        for (char const* const sql : {"DELETE FROM session WHERE program = ?",
                                      "DELETE FROM program WHERE id = ?1 "
                                      "AND NOT EXISTS (SELECT 1 FROM ticket WHERE owner = ?1 AND owner <> 0) "
                                      "AND NOT EXISTS (SELECT 1 FROM part_file WHERE program = ?1)"})
            Change(sql, m_self);
        leaving.Commit();
    }
    bool const mayOpen = [this]
    {
        std::lock_guard const lock(m_opening);
        return m_isOpening || m_lock->LockWithin(LockFile::Opening, LockFile::Hold::Exclusive, LeavingLimit);
    }();
    std::lock_guard const reading(m_reading);
    m_hasLeft = true;
    m_flusher->Close();
    m_reader.reset();
    bool const isLast = mayOpen && m_lock->TryLock(LockFile::Site, LockFile::Hold::Exclusive);
    if (isLast)
        sqlite3_wal_checkpoint_v2(m_writer->database.Handle(), nullptr, SQLITE_CHECKPOINT_TRUNCATE, nullptr,
                                  nullptr);
    m_writer.reset();
    SharedPage::ClosingNote note;
    if (isLast && MayHaveNote(note))
        m_page->LeaveNote(note);
    m_lock->Close();
}

// --- sessions and part files

long long SqliteStore::OpenSession(std::string_view user)
{
    auto const lock = Lock(m_writing);
    Database& database = m_writer->database;
    Database::Statement const add =
        database.Prepare("INSERT INTO session (program, user, since) VALUES (?, ?, ?)");
    Writing writing(*this);
    (Database::Run(database, add) << static_cast<long long>(m_self) << user
                                  << static_cast<long long>(std::time(nullptr)))
        .Do();
    long long const session = database.LastRow();
    writing.Commit();
    return session;
}

void SqliteStore::CloseSession(long long session)
{
    auto const lock = Lock(m_writing);
    Writing writing(*this);
    Change("DELETE FROM session WHERE id = ?", session);
    writing.Commit();
}

std::vector<SessionInfo> SqliteStore::Sessions()
{
    auto const lock = Lock(m_reading);
    Database& database = m_reader->database;
    std::vector<SessionInfo> sessions;
    Database::Statement const list =
        database.Prepare("SELECT id, program, user, since FROM session ORDER BY id");
    Database::Run run(database, list);
    while (run.Step())
        sessions.push_back({run.Integer(0), run.Integer(1), run.Text(2), run.Integer(3)});
    return sessions;
}

bool SqliteStore::AddPartFile(std::string_view path)
{
    auto const lock = Lock(m_writing);
    Database& database = m_writer->database;
    // Touches a row of this program's, too, so that the changes tell whether the note stands.
    Database::Statement const add =
        database.Prepare("INSERT INTO part_file VALUES (?1, ?2) "
                         "ON CONFLICT (path) DO UPDATE SET program = ?2 WHERE program = ?2");
    Writing writing(*this);
    (Database::Run(database, add) << path << static_cast<long long>(m_self)).Do();
    bool const isNoted = database.Changes() == 1;
    writing.Commit();
    return isNoted;
}

void SqliteStore::RemovePartFile(std::string_view path)
{
    auto const lock = Lock(m_writing);
    Database& database = m_writer->database;
    Database::Statement const drop = database.Prepare("DELETE FROM part_file WHERE path = ? AND program = ?");
    Writing writing(*this);
    (Database::Run(database, drop) << path << static_cast<long long>(m_self)).Do();
    writing.Commit();
}

// --- users

std::optional<User> SqliteStore::FindUser(std::string_view name)
{
    auto const lock = Lock(m_reading);
    Database::Run run(m_reader->database, m_reader->findUser);
    run << name;
    if (!run.Step())
        return std::nullopt;
    return User{run.Text(0), run.Text(1), run.Int(2), run.Int(3)};
}

std::vector<User> SqliteStore::Users()
{
    auto const lock = Lock(m_reading);
    Database& database = m_reader->database;
    std::vector<User> users;
    Database::Statement const list =
        database.Prepare("SELECT name, password_hash, role, ticket_id FROM user ORDER BY name");
    Database::Run run(database, list);
    while (run.Step())
        users.push_back({run.Text(0), run.Text(1), run.Int(2), run.Int(3)});
    return users;
}

void SqliteStore::PutUser(User const& user)
{
    {
        auto const lock = Lock(m_writing);
        Writing writing(*this);
        Put(user);
        writing.Commit();
    }
    if (m_options.durability == Durability::Full)
        Sync();
}

// In a transaction of the caller's.
void SqliteStore::Put(User const& user)
{
    (Database::Run(m_writer->database, m_writer->putUser)
     << std::string_view(user.name) << std::string_view(user.passwordHash) << user.role << user.ticketId)
        .Do();
}

bool SqliteStore::RemoveUser(std::string_view name)
{
    bool isRemoved = false;
    {
        auto const lock = Lock(m_writing);
        Database& database = m_writer->database;
        Database::Statement const remove = database.Prepare("DELETE FROM user WHERE name = ?");
        Writing writing(*this);
        (Database::Run(database, remove) << name).Do();
        isRemoved = database.Changes() == 1;
        writing.Commit();
    }
    if (isRemoved && m_options.durability == Durability::Full)
        Sync();
    return isRemoved;
}
}  // namespace standin
