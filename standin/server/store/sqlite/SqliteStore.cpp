#include "standin/server/store/sqlite/SqliteStore.h"

#include "standin/server/store/StoreRows.h"
#include "standin/server/store/sqlite/SqliteConnections.h"
#include <ctime>
#include <sys/stat.h>
#include <tuple>
#include <unistd.h>

namespace standin
{
namespace
{
using namespace std::chrono_literals;

std::vector<std::filesystem::path> FilesOf(std::filesystem::path const& database)
{
    return {database, database.string() + "-wal", database.string() + "-shm",
            database.parent_path() / "site.lock"};
}
}  // namespace

// --- opening

SqliteStore::SqliteStore(std::filesystem::path const& folder, std::function<StoreContent()> const& first,
                         SqliteOptions options)
    : m_folder(folder), m_file(folder / "site.db"), m_options(std::move(options)), m_files(FilesOf(m_file))
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

bool SqliteStore::KeepsOpening()
{
    std::lock_guard const lock(m_opening);
    return m_isOpening;
}

std::unique_ptr<SiteStore::UsersTurn> SqliteStore::TakeUsersTurn(std::chrono::milliseconds limit)
{
    struct Turn : UsersTurn
    {
        explicit Turn(std::filesystem::path const& folder) : lock(folder) {}

        LockFile lock;
    };
    CheckUsable();
    auto turn = std::make_unique<Turn>(m_folder);
    return turn->lock.LockWithin(LockFile::Users, LockFile::Hold::Exclusive, limit) ? std::move(turn)
                                                                                    : nullptr;
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
    Loaded const loaded{{ticket.Number(0), ticket.Number(1)},
                        LastSequence(m_reader->database, m_reader->lastSequence)};
    Database::Run run(m_reader->database, m_reader->parameters);
    run << address;
    while (run.Step())
        take(run.Bytes(0), run.Int(1), schema::ValueOf(m_reader->database, run, 2));
    return loaded;
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
    return UsersIn(m_reader->database);
}

std::vector<User> SqliteStore::UsersIn(Database& database)
{
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
