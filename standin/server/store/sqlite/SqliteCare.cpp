// What an owner's tools ask of the store. On connections of their own, so that nobody waits for them.
#include "standin/server/store/Inspection.h"
#include "standin/server/store/StoreRows.h"
#include "standin/server/store/sqlite/Schema.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include <sqlite3.h>

namespace standin
{
namespace
{
constexpr int ReportEvery = 4096;  // rows
constexpr int CopiedAtOnce = 256;  // pages

class SqliteInspection
{
public:
    SqliteInspection(Database& database, SqliteStore::Progress const& progress)
        : m_database(database), m_moment(database, Database::Transaction::Read),
          m_pages(database.Number("PRAGMA page_count")),
          m_inspection(progress, m_pages + database.Number("SELECT (SELECT count(*) FROM ticket) + "
                                                           "(SELECT count(*) FROM parameter) + "
                                                           "(SELECT count(*) FROM journal)"))
    {
    }

    std::vector<std::string> Problems()
    {
        LookAtPages();
        LookAtTickets();
        LookAtParameters();
        LookAtJournal();
        return std::move(m_inspection).Problems();
    }

private:
    // Steps through the rows and tells the progress now and then.
    void ForEachRow(char const* sql, std::function<void(Database::Run const&)> const& look)
    {
        Database::Statement const statement = m_database.Prepare(sql);
        Database::Run run(m_database, statement);
        int seen = 0;
        for (; run.Step(); ++seen)
        {
            look(run);
            if (seen == ReportEvery)
                m_inspection.Advance(std::exchange(seen, 0));
        }
        m_inspection.Advance(seen);
    }

    void LookAtPages()
    {
        Database::Statement const statement = m_database.Prepare("PRAGMA integrity_check");
        Database::Run run(m_database, statement);
        while (run.Step())
            if (run.Bytes(0) != "ok")
                m_inspection.Add(run.Text(0));
        m_inspection.Advance(m_pages);
    }

    void LookAtTickets()
    {
        auto const last = static_cast<Sequence>(m_database.Number(schema::SelectLastSequence));
        ForEachRow("SELECT type, id, incarnation, revision, "
                   "owner = 0 OR EXISTS (SELECT 1 FROM program WHERE program.id = owner) FROM ticket",
                   [this, last](Database::Run const& row)
                   {
                       m_inspection.LookAtTicket({row.Int(0), row.Int(1)}, {row.Number(2), row.Number(3)},
                                                 last, row.Int(4) != 0);
                   });
    }

    void LookAtParameters()
    {
        ForEachRow("SELECT ticket_type, ticket_id, value_type, value, pos, "
                   "EXISTS (SELECT 1 FROM ticket WHERE type = ticket_type AND id = ticket_id) FROM parameter",
                   [this](Database::Run const& row)
                   {
                       m_inspection.LookAtParameter({row.Int(0), row.Int(1)}, row.Int(4), row.Int(2),
                                                    schema::FittingValueOf(row, 2), row.Int(5) != 0);
                   });
    }

    void LookAtJournal()
    {
        auto expected =
            static_cast<Sequence>(m_database.Number("SELECT value FROM site WHERE name = 'pruned'")) + 1;
        ForEachRow("SELECT sequence, kind, type, id, record FROM journal ORDER BY sequence",
                   [this, &expected](Database::Run const& row) {
                       m_inspection.LookAtRecord(row.Number(0), expected, row.Int(1),
                                                 {row.Int(2), row.Int(3)}, row.Bytes(4));
                   });
    }

    Database& m_database;
    Database::Transaction m_moment;
    long long const m_pages;
    Inspection m_inspection;
};

struct FinishBackup
{
    void operator()(sqlite3_backup* backup) const noexcept { sqlite3_backup_finish(backup); }
};

// Copies within one read transaction: a copy in several would begin anew with each change of the site.
void Copy(Database& from, Database& to, SqliteStore::Progress const& progress)
{
    Database::Transaction const moment(from, Database::Transaction::Read);
    from.Number("SELECT count(*) FROM site");
    std::unique_ptr<sqlite3_backup, FinishBackup> backup(
        sqlite3_backup_init(to.Handle(), "main", from.Handle(), "main"));
    if (!backup)
        to.Fail();
    int code = SQLITE_OK;
    while (code == SQLITE_OK)
    {
        code = sqlite3_backup_step(backup.get(), CopiedAtOnce);
        int const total = sqlite3_backup_pagecount(backup.get());
        if (progress)
            progress(total - sqlite3_backup_remaining(backup.get()), total);
    }
    if (sqlite3_backup_finish(backup.release()) != SQLITE_OK)
        to.Fail();
}

// The programs of that moment are not those of the copy: who opens it would take them for dead and clear up
// after them, in folders that may be in use elsewhere. What they had begun was acknowledged to nobody. Nobody
// has heard of the copy either, so its journal begins behind it.
void ForgetPrograms(Database& copy)
{
    Database::Transaction transaction(copy, Database::Transaction::Write);
    for (char const* const sql :
         {"DELETE FROM parameter WHERE (ticket_type, ticket_id) IN "
          "(SELECT type, id FROM ticket WHERE owner <> 0)",
          "DELETE FROM ticket WHERE owner <> 0", "DELETE FROM session", "DELETE FROM part_file",
          "DELETE FROM program",
          "UPDATE site SET value = max(value, coalesce((SELECT max(sequence) FROM journal), 0)) "
          "WHERE name = 'pruned'",
          "DELETE FROM journal"})
        copy.Execute(sql);
    transaction.Commit();
    copy.Execute("PRAGMA wal_checkpoint(TRUNCATE)");
    copy.TrustJournal();
}
}  // namespace

std::vector<std::string> SqliteStore::Check(Progress const& progress)
{
    CheckUsable();
    Database database(m_file, false);
    database.ReportDamageTo([this] { m_page->NoteDamage(); });
    auto problems = SqliteInspection(database, progress).Problems();
    if (!problems.empty())
        m_page->NoteDamage();
    return problems;
}

void SqliteStore::BackupTo(std::filesystem::path const& file, Progress const& progress)
{
    CheckUsable();
    if (std::filesystem::exists(std::filesystem::symlink_status(file)))
        throw StoreError(file.string() + ": is there already; choose another name, or move it away");
    try
    {
        Database from(m_file, false);
        from.ReportDamageTo([this] { m_page->NoteDamage(); });
        Database to(file, true);
        Copy(from, to, progress);
        ForgetPrograms(to);
    }
    catch (...)
    {
        std::error_code ignored;
        for (char const* const suffix : {"", "-wal", "-shm"})
            std::filesystem::remove(file.string() + suffix, ignored);
        throw;
    }
}

void SqliteStore::ReadContent(std::function<void(TicketChange&&)> const& takeTicket,
                              std::function<void(User&&)> const& takeUser, Progress const& progress)
{
    CheckUsable();
    Database database(m_file, false);
    database.ReportDamageTo([this] { m_page->NoteDamage(); });
    Database::Transaction const moment(database, Database::Transaction::Read);
    long long const total = database.Number("SELECT count(*) FROM parameter");
    Database::Statement const rows =
        database.Prepare("SELECT t.type, t.id, p.key, p.pos, p.value_type, p.value FROM ticket t "
                         "LEFT JOIN parameter p ON p.ticket_type = t.type AND p.ticket_id = t.id "
                         "WHERE t.owner = 0 ORDER BY t.type, t.id, p.key, p.pos");
    Database::Run run(database, rows);
    TicketAssembly tickets(takeTicket);
    for (long long done = 0; run.Step(); ++done)
    {
        tickets.Begin({run.Int(0), run.Int(1)});
        if (run.IsInteger(3))
            tickets.Add(run.Bytes(2), run.Int(3), schema::ValueOf(database, run, 4));
        if (progress && done % ReportEvery == 0)
            progress(done, total);
    }
    tickets.End();
    for (User& user : UsersIn(database))
        takeUser(std::move(user));
}

SqliteStore::Sizes SqliteStore::Measure()
{
    CheckUsable();
    Database database(m_file, false);
    Sizes sizes;
    sizes.tickets = database.Number("SELECT count(*) FROM ticket");
    sizes.users = database.Number("SELECT count(*) FROM user");
    sizes.records = database.Number("SELECT count(*) FROM journal");
    std::error_code error;
    sizes.databaseBytes = static_cast<long long>(std::filesystem::file_size(m_file, error));
    auto const journal = std::filesystem::file_size(m_file.string() + "-wal", error);
    sizes.walBytes = error ? 0 : static_cast<long long>(journal);
    return sizes;
}
}  // namespace standin
