#include "standin/server/store/SqliteStorage.h"

#include <bit>
#include <sqlite3.h>
#include <system_error>
#include <utility>

namespace standin
{
namespace
{
constexpr int ApplicationId = 0x434F4D47;  // "COMG": tells file(1) and us whose database this is
constexpr int SchemaVersion = 1;

// Texts and keys are blobs: they hold whatever bytes came, compare bytewise and pass no character set.
// The column parameter.value has no type, so that SQLite converts nothing.
constexpr char const* Schema = R"(
    CREATE TABLE ticket (
        type INTEGER NOT NULL, id INTEGER NOT NULL,
        PRIMARY KEY (type, id)) WITHOUT ROWID;
    CREATE TABLE parameter (
        ticket_type INTEGER NOT NULL, ticket_id INTEGER NOT NULL, key BLOB NOT NULL, pos INTEGER NOT NULL,
        value_type INTEGER NOT NULL, value NOT NULL,
        PRIMARY KEY (ticket_type, ticket_id, key, pos),
        FOREIGN KEY (ticket_type, ticket_id) REFERENCES ticket ON DELETE CASCADE) WITHOUT ROWID;
    CREATE TABLE user (
        name BLOB NOT NULL PRIMARY KEY, password_hash BLOB NOT NULL,
        role INTEGER NOT NULL, ticket_id INTEGER NOT NULL) WITHOUT ROWID;
    PRAGMA application_id = 0x434F4D47;
    PRAGMA user_version = 1;
)";

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
        return "start the server again: it sets the file aside and makes a new one";
    case SQLITE_NOMEM:
        return "end other programs, then try again";
    case SQLITE_CONSTRAINT:
        return "create the ticket before its values";
    case SQLITE_TOOBIG:
        return "keep a value below 1 GB";
    default:
        return "check the disk and its free space, then try again";
    }
}
}  // namespace

// One execution of a prepared statement; what it has bound is let go at its end. Parameters are bound in
// the order in which they come.
class SqliteStorage::Run
{
public:
    Run(SqliteStorage const& storage, Statement const& statement)
        : m_storage(storage), m_statement(statement.get())
    {
    }
    ~Run()
    {
        sqlite3_reset(m_statement);
        sqlite3_clear_bindings(m_statement);
    }
    Run(Run const&) = delete;
    Run& operator=(Run const&) = delete;

    Run& operator<<(long long number) { return Check(sqlite3_bind_int64(m_statement, ++m_bound, number)); }
    Run& operator<<(std::string_view bytes)
    {
        // A null address would be stored as NULL, which is not the empty text.
        char const* const first = bytes.data() == nullptr ? "" : bytes.data();
        return Check(sqlite3_bind_blob64(m_statement, ++m_bound, first, bytes.size(), SQLITE_STATIC));
    }
    Run& operator<<(TicketAddress address) { return *this << address.type << address.id; }

    // True for a row, false at the end.
    bool Step()
    {
        int const code = sqlite3_step(m_statement);
        if (code != SQLITE_ROW && code != SQLITE_DONE)
            m_storage.Fail();
        return code == SQLITE_ROW;
    }

    int ColumnType(int column) const { return sqlite3_column_type(m_statement, column); }
    long long Integer(int column) const { return sqlite3_column_int64(m_statement, column); }
    int Int(int column) const { return sqlite3_column_int(m_statement, column); }
    std::string_view Bytes(int column) const
    {
        auto const* const first = static_cast<char const*>(sqlite3_column_blob(m_statement, column));
        auto const size = static_cast<std::size_t>(sqlite3_column_bytes(m_statement, column));
        return first == nullptr ? std::string_view("") : std::string_view(first, size);
    }

private:
    Run& Check(int code)
    {
        if (code != SQLITE_OK)
            m_storage.Fail();
        return *this;
    }

    SqliteStorage const& m_storage;
    sqlite3_stmt* m_statement;
    int m_bound = 0;
};

// Rolled back at its end unless committed.
class SqliteStorage::Transaction
{
public:
    explicit Transaction(SqliteStorage& storage) : m_storage(storage) { storage.Execute("BEGIN IMMEDIATE"); }
    ~Transaction()
    {
        // Some failures have rolled back by themselves; a second time would be an error of its own.
        if (sqlite3_get_autocommit(m_storage.m_database.get()) == 0)
            sqlite3_exec(m_storage.m_database.get(), "ROLLBACK", nullptr, nullptr, nullptr);
    }
    Transaction(Transaction const&) = delete;
    Transaction& operator=(Transaction const&) = delete;

    void Commit() { m_storage.Execute("COMMIT"); }

private:
    SqliteStorage& m_storage;
};

void SqliteStorage::CloseDatabase::operator()(sqlite3* database) const noexcept { sqlite3_close(database); }

void SqliteStorage::FinalizeStatement::operator()(sqlite3_stmt* statement) const noexcept
{
    sqlite3_finalize(statement);
}

SqliteStorage::SqliteStorage(std::filesystem::path file, std::function<StorageContent()> const& first)
    : m_file(std::move(file))
{
    std::error_code missing;
    auto const journalSize = std::filesystem::file_size(m_file.string() + "-wal", missing);
    bool const hasJournal = !missing && journalSize > 0;
    OpenFile();
    bool const isNew = IsNew();
    if (!isNew)
    {
        CheckMarks();
        CheckPages(hasJournal);
    }
    Execute("PRAGMA journal_mode = WAL");
    Execute("PRAGMA synchronous = NORMAL");
    Execute("PRAGMA foreign_keys = ON");
    if (isNew)
        Fill(first());
    PrepareStatements();
    sqlite3_db_config(m_database.get(), SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 0, nullptr);
}

SqliteStorage::~SqliteStorage() = default;

void SqliteStorage::OpenFile()
{
    sqlite3* database = nullptr;
    int const flags =
        SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE;
    int const code = sqlite3_open_v2(m_file.c_str(), &database, flags, nullptr);
    m_database.reset(database);
    if (code != SQLITE_OK)
        Fail();
    sqlite3_busy_timeout(database, 2000);  // somebody may be looking in with sqlite3(1)
    // Until the file is known to be sound its journal belongs to the evidence: closing must not work it in.
    sqlite3_db_config(database, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
}

// Also true for what a process leaves behind that is killed before its first commit.
bool SqliteStorage::IsNew()
{
    return Number("PRAGMA application_id") == 0 && Number("PRAGMA user_version") == 0 &&
           Number("SELECT count(*) FROM sqlite_master") == 0;
}

void SqliteStorage::CheckMarks()
{
    if (Number("PRAGMA application_id") != ApplicationId)
        FailAsDamaged("a database of another program");
    long long const version = Number("PRAGMA user_version");
    if (version > SchemaVersion)
        throw StorageError(m_file.string() + ": written by a newer version of this program (schema " +
                           std::to_string(version) + ", known up to " + std::to_string(SchemaVersion) +
                           "); use the newer version, or move the file away to begin anew");
    if (version != SchemaVersion)
        FailAsDamaged("its schema has the unknown number " + std::to_string(version));
}

void SqliteStorage::CheckPages(bool hasJournal)
{
    // SQLite reads zeros where the last page ends early. Beside a journal that is no damage: the whole page
    // may stand there.
    if (!hasJournal &&
        std::filesystem::file_size(m_file) % static_cast<unsigned long long>(Number("PRAGMA page_size")) != 0)
        FailAsDamaged("its last page is cut short");
    Statement const check = Prepare("PRAGMA quick_check(1)");
    Run run(*this, check);
    if (!run.Step() || run.Bytes(0) != "ok")
        FailAsDamaged(std::string(run.Bytes(0)));
}

void SqliteStorage::Fill(StorageContent const& content)
{
    Transaction transaction(*this);
    Execute(Schema);
    PrepareStatements();
    for (Change const& change : content.changes)
        Make(change);
    for (User const& user : content.users)
        Put(user);
    transaction.Commit();
}

void SqliteStorage::PrepareStatements()
{
    if (m_tickets)
        return;
    m_load =
        Prepare("SELECT key, pos, value_type, value FROM parameter WHERE ticket_type = ? AND ticket_id = ? "
                "ORDER BY key, pos");
    m_findUser = Prepare("SELECT name, password_hash, role, ticket_id FROM user WHERE name = ?");
    m_putUser = Prepare("INSERT INTO user VALUES (?, ?, ?, ?)");
    m_createTicket = Prepare("INSERT INTO ticket VALUES (?, ?) ON CONFLICT DO NOTHING");
    m_deleteTicket = Prepare("DELETE FROM ticket WHERE type = ? AND id = ?");
    m_deleteKey = Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ? AND key = ?");
    m_deleteValue =
        Prepare("DELETE FROM parameter WHERE ticket_type = ? AND ticket_id = ? AND key = ? AND pos = ?");
    m_putValue = Prepare("INSERT INTO parameter VALUES (?, ?, ?, ?, ?, ?) ON CONFLICT DO UPDATE "
                         "SET value_type = excluded.value_type, value = excluded.value");
    // Ticket by ticket, each by the index, rather than over all parameters.
    m_ticketsWith = Prepare("SELECT type, id FROM ticket WHERE type = ?1 AND EXISTS (SELECT 1 FROM parameter "
                            "WHERE ticket_type = ?1 AND ticket_id = ticket.id AND key = ?2) ORDER BY id");
    m_tickets = Prepare("SELECT type, id FROM ticket ORDER BY type, id");
}

std::vector<TicketAddress> SqliteStorage::Tickets()
{
    std::vector<TicketAddress> tickets;
    Run run(*this, m_tickets);
    while (run.Step())
        tickets.push_back({run.Int(0), run.Int(1)});
    return tickets;
}

std::vector<TicketAddress> SqliteStorage::TicketsWith(int type, std::string_view key)
{
    std::vector<TicketAddress> tickets;
    Run run(*this, m_ticketsWith);
    run << type << key;
    while (run.Step())
        tickets.push_back({run.Int(0), run.Int(1)});
    return tickets;
}

void SqliteStorage::Load(
    TicketAddress address,
    std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take)
{
    Run run(*this, m_load);
    run << address;
    while (run.Step())
        take(run.Bytes(0), run.Int(1), ValueOf(run));
}

void SqliteStorage::Apply(std::vector<Change> const& changes)
{
    Transaction transaction(*this);
    for (Change const& change : changes)
        Make(change);
    transaction.Commit();
}

std::optional<User> SqliteStorage::FindUser(std::string_view name)
{
    Run run(*this, m_findUser);
    run << name;
    if (!run.Step())
        return std::nullopt;
    return User{std::string(run.Bytes(0)), std::string(run.Bytes(1)), run.Int(2), run.Int(3)};
}

void SqliteStorage::Make(Change const& change)
{
    switch (change.kind)
    {
    case Change::CreateTicket:
        (Run(*this, m_createTicket) << change.address).Step();
        return;
    case Change::DeleteTicket:
        (Run(*this, m_deleteTicket) << change.address).Step();
        return;
    case Change::DeleteKey:
        (Run(*this, m_deleteKey) << change.address << change.key).Step();
        return;
    case Change::DeleteValue:
        Delete(change);
        return;
    case Change::PutValue:
        Put(change);
        return;
    }
}

void SqliteStorage::Delete(Change const& change)
{
    (Run(*this, m_deleteValue) << change.address << change.key << change.pos).Step();
}

void SqliteStorage::Put(Change const& change)
{
    StoredValue const& value = change.value;
    Run run(*this, m_putValue);
    run << change.address << change.key << change.pos << static_cast<int>(value.type);
    switch (value.type)
    {
    case PARAM_INT:
    case PARAM_INT64:
    case PARAM_UNSIGNED:
    case PARAM_UNSIGNED64:
        run << value.integer;
        break;
    // As bits: SQLite makes NULL of a NaN and an integer of a whole number.
    case PARAM_DOUBLE:
        run << std::bit_cast<long long>(value.number);
        break;
    case PARAM_STRING:
    case PARAM_BINSTRING:
        run << value.bytes;
        break;
    // A pointer means nothing to the next process; what it took the place of is gone all the same.
    case PARAM_NONE:
    case PARAM_POINTER:
        return Delete(change);
    default:
        throw StorageError(m_file.string() + ": a value of type " + std::to_string(value.type) +
                           " cannot be stored; nothing of the change was made");
    }
    run.Step();
}

void SqliteStorage::Put(User const& user)
{
    (Run(*this, m_putUser) << user.name << user.passwordHash << user.role << user.ticketId).Step();
}

// The value of a row of m_load, checked: a database can be edited by hand.
StoredValue SqliteStorage::ValueOf(Run const& row) const
{
    StoredValue value;
    value.type = static_cast<PARAM_TYPE>(row.Int(2));
    bool const isText = value.type == PARAM_STRING || value.type == PARAM_BINSTRING;
    bool const isNumber = value.type == PARAM_INT || value.type == PARAM_INT64 ||
                          value.type == PARAM_DOUBLE || value.type == PARAM_UNSIGNED ||
                          value.type == PARAM_UNSIGNED64;
    if (isText && row.ColumnType(3) == SQLITE_BLOB)
        value.bytes = row.Bytes(3);
    else if (isNumber && row.ColumnType(3) == SQLITE_INTEGER && value.type == PARAM_DOUBLE)
        value.number = std::bit_cast<double>(row.Integer(3));
    else if (isNumber && row.ColumnType(3) == SQLITE_INTEGER)
        value.integer = row.Integer(3);
    else
        FailAsDamaged("a value does not fit its type " + std::to_string(value.type));
    return value;
}

SqliteStorage::Statement SqliteStorage::Prepare(char const* sql)
{
    sqlite3_stmt* statement = nullptr;
    int const code =
        sqlite3_prepare_v3(m_database.get(), sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
    if (code == SQLITE_ERROR)  // our own texts are sound, so a table or column is missing
        FailAsDamaged(sqlite3_errmsg(m_database.get()));
    if (code != SQLITE_OK)
        Fail();
    return Statement(statement);
}

void SqliteStorage::Execute(char const* sql)
{
    if (sqlite3_exec(m_database.get(), sql, nullptr, nullptr, nullptr) != SQLITE_OK)
        Fail();
}

long long SqliteStorage::Number(char const* sql)
{
    Statement const statement = Prepare(sql);
    Run run(*this, statement);
    return run.Step() ? run.Integer(0) : 0;
}

void SqliteStorage::Fail() const
{
    int const code = sqlite3_extended_errcode(m_database.get());
    std::string reason = m_database ? sqlite3_errmsg(m_database.get()) : "no memory";
    if ((code & 0xFF) == SQLITE_IOERR || (code & 0xFF) == SQLITE_CANTOPEN)
        reason += " (" + std::generic_category().message(sqlite3_system_errno(m_database.get())) + ")";
    if ((code & 0xFF) == SQLITE_CORRUPT || (code & 0xFF) == SQLITE_NOTADB)
        FailAsDamaged(reason);
    throw StorageError(m_file.string() + ": " + reason + "; " + RemedyOf(code));
}

void SqliteStorage::FailAsDamaged(std::string const& reason) const
{
    throw DamagedStorage(m_file.string() + ": damaged: " + reason + "; " + RemedyOf(SQLITE_CORRUPT));
}
}  // namespace standin
