// Brings the journal of a database to the disk, once for all threads that ask at the same time.
//
// A flush that fails is told once by most systems, and the next one succeeds without what was lost. So after
// a failure nothing counts as flushed until the whole journal has been worked into the database and that is
// on the disk; all programs of a site know of it by their shared page.
#pragma once

#include "standin/server/store/sqlite/Database.h"
#include "standin/server/store/sqlite/SharedPage.h"
#include <condition_variable>
#include <filesystem>
#include <mutex>
#include <optional>

struct sqlite3_file;

namespace standin
{
class Flusher
{
public:
    // The page outlives it. Opens nothing before the first flush.
    Flusher(std::filesystem::path file, SharedPage& page) : m_file(std::move(file)), m_page(page) {}
    Flusher(Flusher const&) = delete;
    Flusher& operator=(Flusher const&) = delete;

    // Up to that change, 0 for everything that was committed before. Throws StoreError. For any thread.
    void Flush(Sequence sequence);

    // Waits until nobody is in Flush any more, and closes the database. Who comes later is refused.
    void Close();

    // A child process must not work on its parent's database, not even to close it.
    void Abandon() noexcept;

private:
    // A connection of its own, so that it meets nobody. The journal is flushed by the database's own
    // descriptor: any other that is opened and closed would take the process's locks along.
    struct Connection
    {
        explicit Connection(std::filesystem::path const& file);

        Database database;
        sqlite3_file* journal = nullptr;
    };
    class User;

    bool Run(Connection& connection, std::unique_lock<std::mutex>& lock);
    bool FlushJournal(Connection& connection) const;
    bool WorkJournalIn(Connection& connection) const;

    std::filesystem::path const m_file;
    SharedPage& m_page;

    std::mutex m_lock;  // the members below
    std::unique_ptr<Connection> m_connection;
    std::condition_variable m_changed;
    int m_users = 0;  // threads in Flush
    bool m_isClosed = false;
    bool m_isRunning = false;
    std::uint64_t m_begun = 0;   // flushes
    std::uint64_t m_ended = 0;   // the last of them that is over
    std::uint64_t m_failed = 0;  // the last of them that has failed
};
}  // namespace standin
