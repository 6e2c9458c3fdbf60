// One connection to an SQLite database, with what every use of it needs: statements whose failures throw, and
// transactions that are rolled back unless they are committed. For one thread at a time.
#pragma once

#include "standin/server/store/Store.h"
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

struct sqlite3;
struct sqlite3_stmt;

namespace standin
{
// The file is no database of ours or a broken one. Nothing in it has been changed.
class DamagedStore : public StoreError
{
public:
    DamagedStore(std::string const& damage, std::string const& remedy)
        : StoreError(damage + "; " + remedy), m_damageSize(damage.size())
    {
    }

    // File and reason without the remedy, for who has a better one.
    std::string Damage() const { return std::string(what(), m_damageSize); }

private:
    std::size_t m_damageSize;  // a text of its own would make copies of the exception fail
};

class Database
{
    struct FinalizeStatement
    {
        void operator()(sqlite3_stmt* statement) const noexcept;
    };

public:
    using Statement = std::unique_ptr<sqlite3_stmt, FinalizeStatement>;
    class Run;
    class Transaction;

    // Opens the file, and makes it if it is missing and may be made. Until it is known to be sound its
    // journal belongs to the evidence: closing does not work it in before TrustJournal.
    Database(std::filesystem::path file, bool mayMake);
    ~Database();
    Database(Database const&) = delete;
    Database& operator=(Database const&) = delete;

    void TrustJournal();

    // From now on what is found to be damaged is told to that function and throws a plain StoreError, since
    // nobody can set the file aside while it is in use.
    void ReportDamageTo(std::function<void()> report);

    Statement Prepare(char const* sql);
    void Execute(char const* sql);
    long long Number(char const* sql);  // the first column of the first row; 0 without a row
    long long Changes() const;          // rows that the last statement has changed
    long long LastRow() const;          // the number of the row that was inserted last

    sqlite3* Handle() const { return m_database; }
    std::filesystem::path const& File() const { return m_file; }

    // Throw what the last call has failed with, or with that reason.
    [[noreturn]] void Fail() const;
    [[noreturn]] void FailAsDamaged(std::string const& reason) const;

private:
    std::filesystem::path const m_file;
    sqlite3* m_database = nullptr;
    std::function<void()> m_report;
    Statement m_beginWrite, m_beginRead, m_commit, m_rollback;
};

// One execution of a prepared statement; what it has bound is let go at its end. Parameters are bound in the
// order in which they come.
class Database::Run
{
public:
    Run(Database const& database, Statement const& statement)
        : m_database(database), m_statement(statement.get())
    {
    }
    ~Run();
    Run(Run const&) = delete;
    Run& operator=(Run const&) = delete;

    Run& operator<<(long long number);
    Run& operator<<(int number) { return *this << static_cast<long long>(number); }
    Run& operator<<(Sequence number) { return *this << static_cast<long long>(number); }
    Run& operator<<(std::string_view bytes);  // they live until the end of the run
    Run& operator<<(TicketAddress address) { return *this << address.type << address.id; }

    // True for a row, false at the end.
    bool Step();
    void Do() { Step(); }

    // Makes ready for another execution, in which the parameters from that one on (0 for the first) are bound
    // anew and those before it are as they were.
    void AgainFrom(int parameter);

    bool IsInteger(int column) const;
    bool IsBlob(int column) const;
    long long Integer(int column) const;
    int Int(int column) const { return static_cast<int>(Integer(column)); }
    Sequence Number(int column) const { return static_cast<Sequence>(Integer(column)); }
    std::string_view Bytes(int column) const;  // until the next step
    std::string Text(int column) const { return std::string(Bytes(column)); }

private:
    void Check(int code);

    Database const& m_database;
    sqlite3_stmt* m_statement;
    int m_bound = 0;
};

// Rolled back at its end unless committed.
class Database::Transaction
{
public:
    enum Kind
    {
        Read,   // sees one moment from its first statement on
        Write,  // nobody else writes from its beginning on
    };
    Transaction(Database& database, Kind kind);
    ~Transaction();
    Transaction(Transaction const&) = delete;
    Transaction& operator=(Transaction const&) = delete;

    void Commit();
    void RollBack();

private:
    Database& m_database;
};
}  // namespace standin
