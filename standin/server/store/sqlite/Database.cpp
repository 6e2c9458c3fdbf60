#include "standin/server/store/sqlite/Database.h"

#include "standin/server/files/Descriptor.h"
#include <cerrno>
#include <sqlite3.h>
#include <system_error>
#include <utility>

namespace standin
{
namespace
{
char const* RemedyOf(int code)
{
    switch (code & 0xFF)
    {
    case SQLITE_FULL:
        return "free some space, then try again";
    case SQLITE_BUSY:
    case SQLITE_LOCKED:
        return "close the other program that uses it, then try again";
    case SQLITE_READONLY:
    case SQLITE_CANTOPEN:
    case SQLITE_PERM:
    case SQLITE_AUTH:
        return "make its folder one that this user may write to";
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
        return "bring a backup back with comgui_site restore, or end all programs of the site and start one "
               "again: it sets the file aside and makes a new one";
    case SQLITE_NOMEM:
        return "end other programs, then try again";
    case SQLITE_TOOBIG:
        return "keep a value below 1 GB";
    default:
        return "check the disk and its free space, then try again";
    }
}
// Hashes of passwords are in it, and SQLite would let everybody read it. Its other files follow its rights.
void MakePrivate(std::filesystem::path const& file)
{
    Descriptor(open(file.c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
}
}  // namespace

void Database::FinalizeStatement::operator()(sqlite3_stmt* statement) const noexcept
{
    sqlite3_finalize(statement);
}

Database::Database(std::filesystem::path file, bool mayMake) : m_file(std::move(file))
{
    if (mayMake)
        MakePrivate(m_file);  // if that fails SQLite will tell why
    int const make = mayMake ? SQLITE_OPEN_CREATE : 0;
    int const flags = SQLITE_OPEN_READWRITE | make | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE;
    if (sqlite3_open_v2(m_file.c_str(), &m_database, flags, nullptr) != SQLITE_OK)
    {
        try
        {
            Fail();
        }
        catch (StoreError const&)
        {
            sqlite3_close(m_database);
            throw;
        }
    }
    sqlite3_busy_timeout(m_database, 2000);  // somebody may be looking in with sqlite3(1)
    sqlite3_db_config(m_database, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
}

Database::~Database()
{
    for (Statement* const statement : {&m_beginWrite, &m_beginRead, &m_commit, &m_rollback})
        statement->reset();
    sqlite3_close_v2(m_database);  // with a statement of somebody's left, its end closes the connection
}

void Database::TrustJournal() { sqlite3_db_config(m_database, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 0, nullptr); }

void Database::ReportDamageTo(std::function<void()> report) { m_report = std::move(report); }

Database::Statement Database::Prepare(char const* sql)
{
    sqlite3_stmt* statement = nullptr;
    int const code = sqlite3_prepare_v3(m_database, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
    if (code == SQLITE_ERROR)  // our own texts are sound, so a table or column is missing
        FailAsDamaged(sqlite3_errmsg(m_database));
    if (code != SQLITE_OK)
        Fail();
    return Statement(statement);
}

void Database::Execute(char const* sql)
{
    if (sqlite3_exec(m_database, sql, nullptr, nullptr, nullptr) != SQLITE_OK)
        Fail();
}

long long Database::Number(char const* sql)
{
    Statement const statement = Prepare(sql);
    Run run(*this, statement);
    return run.Step() ? run.Integer(0) : 0;
}

long long Database::Changes() const { return sqlite3_changes(m_database); }
long long Database::LastRow() const { return sqlite3_last_insert_rowid(m_database); }

void Database::Fail() const
{
    int const code = sqlite3_extended_errcode(m_database);
    std::string reason = m_database ? sqlite3_errmsg(m_database) : "no memory";
    int const error = sqlite3_system_errno(m_database);
    bool const isOfSystem = (code & 0xFF) == SQLITE_IOERR || (code & 0xFF) == SQLITE_CANTOPEN;
    bool const isFull = isOfSystem && (error == ENOSPC || error == EDQUOT || error == EFBIG);
    if (isOfSystem && error != 0)
        reason += " (" + std::generic_category().message(error) + ")";
    if ((code & 0xFF) == SQLITE_CORRUPT || (code & 0xFF) == SQLITE_NOTADB)
        FailAsDamaged(reason);
    throw StoreError(m_file.string() + ": " + reason + "; " + RemedyOf(isFull ? SQLITE_FULL : code));
}

void Database::FailAsDamaged(std::string const& reason) const
{
    std::string const damage = m_file.string() + ": damaged: " + reason;
    if (!m_report)
        throw DamagedStore(damage, RemedyOf(SQLITE_CORRUPT));
    m_report();
    throw StoreError(damage + "; " + RemedyOf(SQLITE_CORRUPT));
}

Database::Run::~Run()
{
    sqlite3_reset(m_statement);
    sqlite3_clear_bindings(m_statement);
}

Database::Run& Database::Run::operator<<(long long number)
{
    Check(sqlite3_bind_int64(m_statement, ++m_bound, number));
    return *this;
}

Database::Run& Database::Run::operator<<(std::string_view bytes)
{
    // A null address would be stored as NULL, which is not the empty text.
    char const* const first = bytes.data() == nullptr ? "" : bytes.data();
    Check(sqlite3_bind_blob64(m_statement, ++m_bound, first, bytes.size(), SQLITE_STATIC));
    return *this;
}

bool Database::Run::Step()
{
    int const code = sqlite3_step(m_statement);
    if (code != SQLITE_ROW && code != SQLITE_DONE)
        m_database.Fail();
    return code == SQLITE_ROW;
}

void Database::Run::AgainFrom(int parameter)
{
    sqlite3_reset(m_statement);
    m_bound = parameter;
}

bool Database::Run::IsInteger(int column) const
{
    return sqlite3_column_type(m_statement, column) == SQLITE_INTEGER;
}

bool Database::Run::IsBlob(int column) const
{
    return sqlite3_column_type(m_statement, column) == SQLITE_BLOB;
}

long long Database::Run::Integer(int column) const { return sqlite3_column_int64(m_statement, column); }

std::string_view Database::Run::Bytes(int column) const
{
    auto const* const first = static_cast<char const*>(sqlite3_column_blob(m_statement, column));
    auto const size = static_cast<std::size_t>(sqlite3_column_bytes(m_statement, column));
    return first == nullptr ? std::string_view("") : std::string_view(first, size);
}

void Database::Run::Check(int code)
{
    if (code != SQLITE_OK)
        m_database.Fail();
}

// The statements are kept: to parse them would cost as much as to run them.
Database::Transaction::Transaction(Database& database, Kind kind) : m_database(database)
{
    Statement& begin = kind == Write ? database.m_beginWrite : database.m_beginRead;
    if (!begin)
        begin = database.Prepare(kind == Write ? "BEGIN IMMEDIATE" : "BEGIN");
    if (!database.m_commit)
        database.m_commit = database.Prepare("COMMIT");
    if (!database.m_rollback)
        database.m_rollback = database.Prepare("ROLLBACK");
    Run(database, begin).Do();
}

Database::Transaction::~Transaction()
{
    // Some failures have rolled back by themselves; a second time would be an error of its own.
    if (sqlite3_get_autocommit(m_database.Handle()) == 0)
    {
        sqlite3_step(m_database.m_rollback.get());
        sqlite3_reset(m_database.m_rollback.get());
    }
}

void Database::Transaction::Commit() { Run(m_database, m_database.m_commit).Do(); }
void Database::Transaction::RollBack() { Run(m_database, m_database.m_rollback).Do(); }
}  // namespace standin
