// A PostgreSQL server of the test program's own: a cluster in a temporary folder, reached by a socket in it
// and by no port, so that any number of them run side by side. It is made at the first use, and gone with the
// test program, however that ends: a process beside it waits for the end, stops the server and removes the
// folder.
//
// Not for a power cut: it does not wait for the disk.
#pragma once

#include <filesystem>
#include <string>
#include <sys/types.h>
#include <vector>

class PostgresCluster
{
public:
    // Throws std::runtime_error, with the server's own words, if it cannot be started.
    static PostgresCluster& Instance();

    PostgresCluster(PostgresCluster const&) = delete;
    PostgresCluster& operator=(PostgresCluster const&) = delete;

    // As libpq takes it: of a database that is there, for its owner or another user.
    std::string Uri(std::string const& user = "postgres", std::string const& database = "postgres") const;

    // SQL of the test's own, with all rights; the first column of the first row, empty if there is none.
    std::string Run(std::string const& sql) const;

    // The server with all its processes stands still, and goes on.
    void Stop();
    void Continue();

    std::filesystem::path const& Folder() const { return m_folder; }

private:
    PostgresCluster();
    ~PostgresCluster();

    void Make();
    void Start();
    void AwaitAnswer() const;
    [[noreturn]] void Fail(std::string const& what) const;

    std::filesystem::path m_folder;
    int m_lifeline = -1;  // its other end sees this process die
    pid_t m_watchdog = -1;
    std::vector<pid_t> m_stopped;
};
