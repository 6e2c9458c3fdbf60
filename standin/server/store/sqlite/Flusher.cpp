#include "standin/server/store/sqlite/Flusher.h"

#include <sqlite3.h>
#include <tuple>

namespace standin
{
Flusher::Connection::Connection(std::filesystem::path const& file) : database(file, false)
{
    database.Number("SELECT count(*) FROM site");  // opens the journal
    sqlite3_file_control(database.Handle(), "main", SQLITE_FCNTL_JOURNAL_POINTER, &journal);
}

// Counts a thread in Flush, for who holds the lock.
class Flusher::User
{
public:
    explicit User(Flusher& flusher) : m_flusher(flusher) { ++m_flusher.m_users; }
    ~User()
    {
        if (--m_flusher.m_users == 0)
            m_flusher.m_changed.notify_all();
    }
    User(User const&) = delete;
    User& operator=(User const&) = delete;

private:
    Flusher& m_flusher;
};

// One thread flushes for all who have come before it began; who comes later waits for the next one, since
// nobody knows what the running one still takes along.
void Flusher::Flush(Sequence sequence)
{
    std::unique_lock lock(m_lock);
    if (m_isClosed)
        throw StoreError(m_file.parent_path().string() + ": has been left; open it anew");
    User const user(*this);
    if (!m_connection)
        m_connection = std::make_unique<Connection>(m_file);
    std::uint64_t const ours = m_begun + 1;
    while (m_ended < ours)
    {
        if (sequence != 0 && m_page.Flushed() >= sequence)
            return;  // another program has
        if (m_isRunning)
            m_changed.wait(lock);
        else if (!Run(*m_connection, lock))
            m_failed = m_begun;
    }
    if (m_failed >= ours)
        throw StoreError(
            m_file.string() +
            "-wal: cannot be flushed to the disk; check the disk and its free space, then try again");
}

// The lock is open meanwhile.
bool Flusher::Run(Connection& connection, std::unique_lock<std::mutex>& lock)
{
    m_isRunning = true;
    ++m_begun;
    Sequence const committed = m_page.Committed();
    lock.unlock();
    bool const isDone = FlushJournal(connection) || WorkJournalIn(connection);
    if (isDone)
        m_page.RaiseFlushed(committed);
    lock.lock();
    m_isRunning = false;
    m_ended = m_begun;
    m_changed.notify_all();
    return isDone;
}

bool Flusher::FlushJournal(Connection& connection) const
{
    if (m_page.FailedFlushes() != m_page.MendedFlushes())
        return false;
    if (connection.journal->pMethods->xSync(connection.journal, SQLITE_SYNC_NORMAL) == SQLITE_OK)
        return true;
    m_page.NoteFailedFlush();
    return false;
}

// What could not be flushed is still in memory, and is read from there.
bool Flusher::WorkJournalIn(Connection& connection) const
{
    std::uint32_t const failed = m_page.FailedFlushes();  // before: a later failure is not mended by this
    if (sqlite3_wal_checkpoint_v2(connection.database.Handle(), nullptr, SQLITE_CHECKPOINT_TRUNCATE, nullptr,
                                  nullptr) != SQLITE_OK)
        return false;
    m_page.NoteMendedFlushes(failed);
    return true;
}

void Flusher::Close()
{
    std::unique_lock lock(m_lock);
    m_isClosed = true;
    m_changed.wait(lock, [this] { return m_users == 0; });
    m_connection.reset();
}

void Flusher::Abandon() noexcept { std::ignore = m_connection.release(); }
}  // namespace standin
