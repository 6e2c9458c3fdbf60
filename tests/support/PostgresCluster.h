// A PostgreSQL server of the test program's own: a cluster in a temporary folder, reached by a socket in it
// and by no port, so that any number of them run side by side. It is gone with the object, or with the test
// program, however that ends: a process beside it waits for the end, stops the server and removes the folder.
//
// Not for a power cut: it does not wait for the disk.
#pragma once

#include <filesystem>
#include <memory>
#include <string>
#include <sys/types.h>
#include <vector>

struct pg_conn;

// A connection for SQL of a test's own. Failures throw std::runtime_error.
class SqlSession
{
public:
    explicit SqlSession(std::string const& uri);

    // The first column of the first row; empty if there is none.
    std::string Run(std::string const& sql) const;

private:
    std::unique_ptr<pg_conn, void (*)(pg_conn*)> m_connection;
};

class PostgresCluster
{
public:
    // That of all tests which do it no harm. Made at the first use.
    static PostgresCluster& Instance();

    // Throws std::runtime_error, with the server's own words, if it cannot be started.
    PostgresCluster();
    ~PostgresCluster();
    PostgresCluster(PostgresCluster const&) = delete;
    PostgresCluster& operator=(PostgresCluster const&) = delete;

    // As libpq takes it: of a database that is there, for its owner or another user.
    std::string Uri(std::string const& user = "postgres", std::string const& database = "postgres") const;

    // In a session with all rights.
    std::string Run(std::string const& sql) const { return SqlSession(Uri()).Run(sql); }

    // Returns when the SQL answers that; throws if it has not within a minute.
    void Await(std::string const& sql, std::string const& answer) const;

    // Gives a folder to the user as whom servers run.
    static void LetServerInto(std::filesystem::path const& folder);

    // How that role is let in from now on, for example scram-sha-256 or reject; everybody is by trust at
    // first.
    void LetIn(std::string const& role, std::string const& method) const;

    // The server with all its processes stands still, and goes on.
    void Stop();
    void Continue();

    // A server that follows this one and can be read. From then on this one acknowledges only what that one
    // has, too.
    std::unique_ptr<PostgresCluster> MakeStandby() const;

    // One of the server's processes dies, so that it ends all connections and recovers from its journal.
    // Returns when it lets programs in again.
    void Crash() const;

    // Ends the server with all its processes at one instant, for good.
    void Kill();

    // Makes a primary of a standby, which needs nobody else then.
    void Promote() const;

    std::filesystem::path const& Folder() const { return m_folder; }

private:
    explicit PostgresCluster(PostgresCluster const* primary);

    void MakeFolder();
    void Make(std::vector<std::string> const& command);
    void Start();
    void AwaitAnswer() const;
    [[noreturn]] void Fail(std::string const& what) const;

    std::filesystem::path m_folder;
    int m_lifeline = -1;  // its other end sees this process die
    pid_t m_watchdog = -1;
    std::vector<pid_t> m_stopped;
};
