// What an owner's tools ask of the store. On connections of their own, so that nobody waits for them.
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/sqlite/Schema.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include <sqlite3.h>

namespace standin
{
namespace
{
constexpr std::size_t MostProblems = 100;
constexpr int ReportEvery = 4096;  // rows
constexpr int CopiedAtOnce = 256;  // pages

std::string NameOf(int type, int id) { return "ticket " + std::to_string(type) + "/" + std::to_string(id); }

class Inspection
{
public:
    Inspection(Database& database, SqliteStore::Progress const& progress)
        : m_database(database), m_progress(progress), m_moment(database, Database::Transaction::Read),
          m_tickets(database.Number("SELECT count(*) FROM ticket")),
          m_parameters(database.Number("SELECT count(*) FROM parameter")),
          m_records(database.Number("SELECT count(*) FROM journal")),
          m_pages(database.Number("PRAGMA page_count"))
    {
    }

    std::vector<std::string> Problems()
    {
        Advance(0);
        LookAtPages();
        LookAtTickets();
        LookAtParameters();
        LookAtJournal();
        return std::move(m_problems);
    }

private:
    void Add(std::string problem)
    {
        if (m_problems.size() < MostProblems)
            m_problems.push_back(std::move(problem));
    }

    void Advance(long long done)
    {
        m_done += done;
        if (m_progress)
            m_progress(m_done, m_pages + m_tickets + m_parameters + m_records);
    }

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
                Advance(std::exchange(seen, 0));
        }
        Advance(seen);
    }

    void LookAtPages()
    {
        Database::Statement const statement = m_database.Prepare("PRAGMA integrity_check");
        Database::Run run(m_database, statement);
        while (run.Step())
            if (run.Bytes(0) != "ok")
                Add(run.Text(0));
        Advance(m_pages);
    }

    void LookAtTickets()
    {
        auto const last = static_cast<Sequence>(m_database.Number(schema::SelectLastSequence));
        ForEachRow("SELECT type, id, incarnation, revision, "
                   "owner = 0 OR EXISTS (SELECT 1 FROM program WHERE program.id = owner) FROM ticket",
                   [this, last](Database::Run const& row)
                   {
                       std::string const name = NameOf(row.Int(0), row.Int(1));
                       if (!IsValid({row.Int(0), row.Int(1)}))
                           Add(name + ": no ticket can have this address");
                       if (row.Number(2) < 1 || row.Number(2) > row.Number(3) || row.Number(3) > last)
                           Add(name + ": made by change " + std::to_string(row.Number(2)) +
                               " and changed by " + std::to_string(row.Number(3)) + ", which cannot be");
                       if (row.Int(4) == 0)
                           Add(name + ": belongs to a program that nobody knows");
                   });
    }

    void LookAtParameters()
    {
        ForEachRow("SELECT ticket_type, ticket_id, value_type, value, pos, "
                   "EXISTS (SELECT 1 FROM ticket WHERE type = ticket_type AND id = ticket_id) FROM parameter",
                   [this](Database::Run const& row)
                   {
                       std::string const name = NameOf(row.Int(0), row.Int(1));
                       if (!schema::FittingValueOf(row, 2))
                           Add(name + ": a value does not fit its type " + std::to_string(row.Int(2)));
                       if (row.Int(4) < 0)
                           Add(name + ": a value at position " + std::to_string(row.Int(4)));
                       if (row.Int(5) == 0)
                           Add(name + ": has values but is no ticket");
                   });
    }

    void LookAtJournal()
    {
        auto expected =
            static_cast<Sequence>(m_database.Number("SELECT value FROM site WHERE name = 'pruned'")) + 1;
        ForEachRow("SELECT sequence, kind, type, id, record FROM journal ORDER BY sequence",
                   [this, &expected](Database::Run const& row)
                   {
                       Sequence const found = row.Number(0);
                       if (found != expected)
                           Add("journal: record " + std::to_string(found) + " where " +
                               std::to_string(expected) + " is due");
                       expected = found + 1;
                       try
                       {
                           ReadChangeRecord(row.Int(1), {row.Int(2), row.Int(3)}, row.Bytes(4));
                       }
                       catch (StoreError const& error)
                       {
                           Add("journal: record " + std::to_string(found) + ": " + error.what());
                       }
                   });
    }

    Database& m_database;
    SqliteStore::Progress const& m_progress;
    Database::Transaction m_moment;
    long long const m_tickets, m_parameters, m_records, m_pages;
    long long m_done = 0;
    std::vector<std::string> m_problems;
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
    auto problems = Inspection(database, progress).Problems();
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
