#include "standin/server/store/sqlite/Schema.h"

#include "standin/server/store/StoreRows.h"

namespace standin::schema
{
namespace
{
constexpr int ApplicationId = 0x434F4D47;  // "COMG": names us to file(1) and to ourselves
constexpr int Version = 2;

// Texts and keys are blobs: they hold whatever bytes came, compare bytewise and pass no character set.
// The column parameter.value has no type, so that SQLite converts nothing.
//
// The journal has no index but its number: what is asked for by program and number is asked so seldom that a
// search is cheaper than an index that every change pays for. Few tickets have an owner, and only they are in
// the index of owners.
constexpr char const* Tables = R"(
    CREATE TABLE ticket (
        type INTEGER NOT NULL, id INTEGER NOT NULL, incarnation INTEGER NOT NULL, revision INTEGER NOT NULL,
        owner INTEGER NOT NULL,
        PRIMARY KEY (type, id)) WITHOUT ROWID;
    CREATE INDEX ticket_by_owner ON ticket (owner) WHERE owner <> 0;
    CREATE TABLE parameter (
        ticket_type INTEGER NOT NULL, ticket_id INTEGER NOT NULL, key BLOB NOT NULL, pos INTEGER NOT NULL,
        value_type INTEGER NOT NULL, value NOT NULL,
        PRIMARY KEY (ticket_type, ticket_id, key, pos)) WITHOUT ROWID;
    CREATE TABLE journal (
        sequence INTEGER PRIMARY KEY, program INTEGER NOT NULL, number INTEGER NOT NULL, kind INTEGER NOT NULL,
        type INTEGER NOT NULL, id INTEGER NOT NULL, record BLOB NOT NULL);
    CREATE TABLE program (
        id INTEGER PRIMARY KEY AUTOINCREMENT, process INTEGER NOT NULL, machine BLOB NOT NULL,
        name BLOB NOT NULL, since INTEGER NOT NULL, heard INTEGER NOT NULL);
    CREATE TABLE session (
        id INTEGER PRIMARY KEY AUTOINCREMENT, program INTEGER NOT NULL, user BLOB NOT NULL,
        since INTEGER NOT NULL);
    CREATE TABLE part_file (path BLOB NOT NULL PRIMARY KEY, program INTEGER NOT NULL) WITHOUT ROWID;
    CREATE TABLE site (name TEXT NOT NULL PRIMARY KEY, value INTEGER NOT NULL) WITHOUT ROWID;
    INSERT INTO site VALUES ('pruned', 0), ('lock file', 0);
)";

constexpr char const* Users = R"(
    CREATE TABLE user (
        name BLOB NOT NULL PRIMARY KEY, password_hash BLOB NOT NULL,
        role INTEGER NOT NULL, ticket_id INTEGER NOT NULL) WITHOUT ROWID;
)";

constexpr char const* Marks = R"(
    PRAGMA application_id = 0x434F4D47;
    PRAGMA user_version = 2;
)";

constexpr char const* MoveOldTablesAside = R"(
    ALTER TABLE ticket RENAME TO old_ticket;
    ALTER TABLE parameter RENAME TO old_parameter;
)";

constexpr char const* TakeOldTablesOver = R"(
    INSERT INTO ticket SELECT type, id, 1, 1, 0 FROM old_ticket;
    INSERT INTO parameter SELECT * FROM old_parameter;
    DROP TABLE old_parameter;
    DROP TABLE old_ticket;
    UPDATE site SET value = 1 WHERE name = 'pruned';
    INSERT INTO program (process, machine, name, since, heard) VALUES (0, X'', CAST('version 1' AS BLOB), 0, 1);
    UPDATE ticket SET owner = (SELECT max(id) FROM program) WHERE type = 3
        AND EXISTS (SELECT 1 FROM parameter WHERE ticket_type = 3 AND ticket_id = ticket.id
            AND key = CAST('Job/Prepared' AS BLOB))
        AND NOT EXISTS (SELECT 1 FROM parameter WHERE ticket_type = 3 AND ticket_id = ticket.id
            AND key = CAST('Job/File' AS BLOB));
)";
}  // namespace

bool IsNew(Database& database)
{
    return database.Number("PRAGMA application_id") == 0 && database.Number("PRAGMA user_version") == 0 &&
           database.Number("SELECT count(*) FROM sqlite_master") == 0;
}

void CheckMarks(Database& database)
{
    if (database.Number("PRAGMA application_id") != ApplicationId)
        database.FailAsDamaged("a database of another program");
    long long const version = database.Number("PRAGMA user_version");
    if (version > Version)
        throw StoreError(database.File().string() + ": written by a newer version of this program (schema " +
                         std::to_string(version) + ", known up to " + std::to_string(Version) +
                         "); use the newer version, or move the file away to begin anew");
    if (version != Version && version != 1)
        database.FailAsDamaged("its schema has the unknown number " + std::to_string(version));
}

void CheckTables(Database& database)
{
    for (char const* const columns :
         {"SELECT type, id, incarnation, revision, owner FROM ticket",
          "SELECT ticket_type, ticket_id, key, pos, value_type, value FROM parameter",
          "SELECT name, password_hash, role, ticket_id FROM user",
          "SELECT sequence, program, number, kind, type, id, record FROM journal",
          "SELECT id, process, machine, name, since, heard FROM program",
          "SELECT id, program, user, since FROM session", "SELECT path, program FROM part_file",
          "SELECT name, value FROM site"})
        database.Prepare(columns);
}

void CheckPages(Database& database, bool hasJournal)
{
    // SQLite reads zeros where the last page ends early. Beside a journal that is no damage: the whole page
    // may be there.
    auto const pageSize = static_cast<unsigned long long>(database.Number("PRAGMA page_size"));
    if (!hasJournal && std::filesystem::file_size(database.File()) % pageSize != 0)
        database.FailAsDamaged("its last page is cut short");
    Database::Statement const check = database.Prepare("PRAGMA quick_check(1)");
    Database::Run run(database, check);
    if (!run.Step() || run.Bytes(0) != "ok")
        database.FailAsDamaged(run.Text(0));
}

void Make(Database& database)
{
    database.Execute(Tables);
    database.Execute(Users);
    database.Execute(Marks);
}

bool IsOfVersion1(Database& database) { return database.Number("PRAGMA user_version") == 1; }

void Upgrade(Database& database)
{
    database.Execute(MoveOldTablesAside);
    database.Execute(Tables);
    database.Execute(TakeOldTablesOver);
    database.Execute(Marks);
}

std::optional<StoredValue> FittingValueOf(Database::Run const& row, int column)
{
    std::optional<long long> number;
    std::optional<std::string_view> bytes;
    if (row.IsBlob(column + 1))
        bytes = row.Bytes(column + 1);
    else if (row.IsInteger(column + 1))
        number = row.Integer(column + 1);
    return FittingValue(row.Int(column), number, bytes);
}

StoredValue ValueOf(Database const& database, Database::Run const& row, int column)
{
    auto const value = FittingValueOf(row, column);
    if (!value)
        database.FailAsDamaged("a value does not fit its type " + std::to_string(row.Int(column)));
    return *value;
}
}  // namespace standin::schema
