// The programs that have a SqliteStore open, what belongs to them, and their end.
#include "standin/server/store/sqlite/SqliteConnections.h"
#include <ctime>
#include <sqlite3.h>

namespace standin
{
namespace
{
using namespace std::chrono_literals;

// To the last who leaves, another one who opens or leaves at the same moment is worth waiting for.
constexpr std::chrono::milliseconds LeavingLimit = 5s;
}  // namespace

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
        database.Prepare("SELECT type, id, incarnation, revision FROM ticket WHERE owner = ? AND owner <> 0");
    Database::Statement const partFiles = database.Prepare("SELECT path FROM part_file WHERE program = ?");
    Database::Run programRun(database, program);
    programRun << id;
    if (!programRun.Step())
        return false;
    Database::Run ticketRun(database, tickets);
    ticketRun << id;
    while (ticketRun.Step())
        estate.tickets.push_back(
            {{ticketRun.Int(0), ticketRun.Int(1)}, ticketRun.Number(2), ticketRun.Number(3)});
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
}  // namespace standin
