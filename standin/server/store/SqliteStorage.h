// Tickets and users in one SQLite database file, one row a value, so that a change writes what it changes
// and a ticket is read without its neighbours. For one thread at a time: the caller holds a lock around
// every call, and Load hands out values while it runs, so its function must not call back into the storage.
//
// What Apply has acknowledged outlives the end of the process at any instant, kill -9 included. A power cut
// may take back the changes since the last checkpoint, always the latest ones and each as a whole: waiting
// for the disk at every change would make it a hundred times dearer.
#pragma once

#include "standin/server/store/Storage.h"
#include <filesystem>
#include <functional>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <vector>

struct sqlite3;
struct sqlite3_stmt;

namespace standin
{
// The file is no database of ours or a broken one. Nothing in it has been changed.
class DamagedStorage : public StorageError
{
public:
    using StorageError::StorageError;
};

// What a new database begins with. Keys, bytes and names are borrowed.
struct StorageContent
{
    std::vector<Change> changes;
    std::vector<User> users;
};

class SqliteStorage final : public Storage
{
public:
    // Opens the file. One that is missing or has never been filled is made with what first gives, in a
    // single transaction; first is not called otherwise, and what it throws passes through.
    //
    // Every page, the order of the rows and the marks of schema and application are checked, which takes
    // about a second for 300 MB: a file that is no database, is cut, overwritten or somebody else's throws
    // DamagedStorage. A flipped bit inside a value goes unseen. A file of a newer schema is refused by
    // StorageError and left as it is.
    SqliteStorage(std::filesystem::path file, std::function<StorageContent()> const& first);
    ~SqliteStorage() override;

    std::vector<TicketAddress> Tickets() override;
    std::vector<TicketAddress> TicketsWith(int type, std::string_view key) override;
    void
    Load(TicketAddress address,
         std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take) override;
    void Apply(std::vector<Change> const& changes) override;
    std::optional<User> FindUser(std::string_view name) override;

private:
    struct CloseDatabase
    {
        void operator()(sqlite3* database) const noexcept;
    };
    struct FinalizeStatement
    {
        void operator()(sqlite3_stmt* statement) const noexcept;
    };
    using Statement = std::unique_ptr<sqlite3_stmt, FinalizeStatement>;
    class Run;
    class Transaction;

    void OpenFile();
    bool IsNew();
    void CheckMarks();
    void CheckPages(bool hasJournal);
    void Fill(StorageContent const& content);
    void PrepareStatements();

    void Make(Change const& change);
    void Put(Change const& change);
    void Delete(Change const& change);
    void Put(User const& user);
    StoredValue ValueOf(Run const& row) const;

    Statement Prepare(char const* sql);
    void Execute(char const* sql);
    long long Number(char const* sql);
    [[noreturn]] void Fail() const;
    [[noreturn]] void FailAsDamaged(std::string const& reason) const;

    std::filesystem::path m_file;
    std::unique_ptr<sqlite3, CloseDatabase> m_database;
    Statement m_tickets, m_ticketsWith, m_load, m_findUser, m_putUser;
    Statement m_createTicket, m_deleteTicket, m_deleteKey, m_deleteValue, m_putValue;
};
}  // namespace standin
