#include "tests/support/PostgresCluster.h"

#include "tests/support/Files.h"
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <fstream>
#include <grp.h>
#include <libpq-fe.h>
#include <memory>
#include <pwd.h>
#include <sstream>
#include <stdexcept>
#include <sys/prctl.h>
#include <sys/shm.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace fs = std::filesystem;
using namespace std::chrono_literals;

namespace
{
// PostgreSQL does not run as root.
passwd const* UnprivilegedUser()
{
    if (geteuid() != 0)
        return nullptr;
    passwd const* const user = getpwnam("postgres");
    return user != nullptr ? user : getpwnam("nobody");
}

// In a child: becomes the program, as an unprivileged user, with its output in that file, and is ended when
// its parent ends. That order, since a change of the user ends the wish for the parent's death.
[[noreturn]] void Become(std::vector<std::string> command, fs::path const& output)
{
    passwd const* const user = UnprivilegedUser();
    bool const isReady = user == nullptr || (setgroups(0, nullptr) == 0 && setgid(user->pw_gid) == 0 &&
                                             setuid(user->pw_uid) == 0);
    int const out = open(output.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
    int const in = open("/dev/null", O_RDONLY);
    prctl(PR_SET_PDEATHSIG, SIGQUIT);
    dup2(in, STDIN_FILENO);
    dup2(out, STDOUT_FILENO);
    dup2(out, STDERR_FILENO);
    std::vector<char*> arguments;
    arguments.reserve(command.size() + 1);
    for (std::string& argument : command)
        arguments.push_back(argument.data());
    arguments.push_back(nullptr);
    if (isReady && chdir("/") == 0)
        execv(arguments[0], arguments.data());
    _exit(127);
}

pid_t StartAs(std::vector<std::string> const& command, fs::path const& output)
{
    pid_t const child = fork();
    if (child == 0)
        Become(command, output);
    return child;
}

int ExitOf(pid_t child)
{
    int status = 0;
    while (waitpid(child, &status, 0) < 0 && errno == EINTR)
        ;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

std::string Program(char const* name) { return std::string(COMGUI_POSTGRESQL_PROGRAMS) + "/" + name; }

// The watchdog's life: until the other end of the lifeline is written to or closed.
[[noreturn]] void WatchOver(pid_t server, int lifeline, fs::path const& folder)
{
    char byte = 0;
    while (read(lifeline, &byte, 1) < 0 && errno == EINTR)
        ;
    kill(server, SIGCONT);
    kill(server, SIGQUIT);
    ExitOf(server);
    std::error_code ignored;
    fs::remove_all(folder, ignored);
    _exit(0);
}

}  // namespace

SqlSession::SqlSession(std::string const& uri) : m_connection(PQconnectdb(uri.c_str()), PQfinish) {}

std::string SqlSession::Run(std::string const& sql) const
{
    std::unique_ptr<PGresult, decltype(&PQclear)> const rows(PQexec(m_connection.get(), sql.c_str()),
                                                             PQclear);
    ExecStatusType const status = PQresultStatus(rows.get());
    if (status != PGRES_COMMAND_OK && status != PGRES_TUPLES_OK)
        throw std::runtime_error(sql + ": " + PQerrorMessage(m_connection.get()));
    return PQntuples(rows.get()) > 0 && PQnfields(rows.get()) > 0 ? PQgetvalue(rows.get(), 0, 0) : "";
}

PostgresCluster& PostgresCluster::Instance()
{
    static PostgresCluster cluster;
    return cluster;
}

PostgresCluster::PostgresCluster() : PostgresCluster(nullptr) {}

PostgresCluster::PostgresCluster(PostgresCluster const* primary)
{
    MakeFolder();
    std::string const data = (m_folder / "data").string();
    if (primary == nullptr)
        Make({Program("initdb"), "--no-sync", "--auth=trust", "--username=postgres", "--encoding=UTF8",
              "--locale=C", "--pgdata=" + data});
    else
        Make({Program("pg_basebackup"), "--no-sync", "--checkpoint=fast", "--write-recovery-conf",
              "--dbname=" + primary->Uri(), "--pgdata=" + data});
    Start();
    AwaitAnswer();
}

PostgresCluster::~PostgresCluster()
{
    // A later cluster's watchdog has a copy of this end, so that it takes a word to end before that.
    [[maybe_unused]] ssize_t const ignored = write(m_lifeline, "", 1);
    close(m_lifeline);
    ExitOf(m_watchdog);
}

void PostgresCluster::MakeFolder()
{
    std::string name = (fs::canonical(fs::temp_directory_path()) / "comgui-postgres-XXXXXX").string();
    if (mkdtemp(name.data()) == nullptr)
        throw std::runtime_error("cannot make " + name);
    m_folder = name;
    LetServerInto(m_folder);
}

void PostgresCluster::LetServerInto(fs::path const& folder)
{
    if (passwd const* const user = UnprivilegedUser())
        if (chown(folder.c_str(), user->pw_uid, user->pw_gid) != 0)
            throw std::runtime_error("cannot give " + folder.string() + " to " + user->pw_name);
}

void PostgresCluster::Make(std::vector<std::string> const& command)
{
    if (ExitOf(StartAs(command, m_folder / "log")) != 0)
        Fail(command[0]);
}

void PostgresCluster::Start()
{
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0)
        throw std::runtime_error("cannot make a pipe");
    m_watchdog = fork();
    if (m_watchdog == 0)
    {
        setsid();  // an interrupted terminal ends the test program, and this one only after it
        close(ends[1]);
        WatchOver(
            StartAs({Program("postgres"), "-D", (m_folder / "data").string(), "-k", m_folder.string(), "-c",
                     "listen_addresses=", "-c", "fsync=off", "-c", "shared_buffers=16MB", "-c",
                     "max_connections=200", "-c", "client_min_messages=warning", "-c", "max_wal_size=128MB"},
                    m_folder / "log"),
            ends[0], m_folder);
    }
    close(ends[0]);
    m_lifeline = ends[1];
}

void PostgresCluster::AwaitAnswer() const
{
    for (auto const end = std::chrono::steady_clock::now() + 60s; std::chrono::steady_clock::now() < end;
         std::this_thread::sleep_for(10ms))
        if (PQping(Uri().c_str()) == PQPING_OK)
            return;
    Fail("postgres");
}

void PostgresCluster::Crash() const
{
    // Until the server has noticed, it still lets programs in: it has recovered when there is a successor.
    char const* const query = "SELECT pid FROM pg_stat_activity WHERE backend_type = 'checkpointer'";
    std::string const killed = Run(query);
    kill(std::stoi(killed), SIGKILL);
    for (auto const end = std::chrono::steady_clock::now() + 60s; std::chrono::steady_clock::now() < end;
         std::this_thread::sleep_for(10ms))
    {
        try
        {
            if (std::string const now = Run(query); !now.empty() && now != killed)
                return;
        }
        catch (std::runtime_error const&)
        {
            // It lets nobody in yet.
        }
    }
    Fail("postgres");
}

void PostgresCluster::Fail(std::string const& what) const
{
    throw std::runtime_error(what + " cannot be started: " + ContentOf(m_folder / "log"));
}

std::string PostgresCluster::Uri(std::string const& user, std::string const& database) const
{
    std::string host;
    for (char const letter : m_folder.string())
        host += letter == '/' ? "%2F" : std::string(1, letter);
    return "postgresql://" + user + "@" + host + "/" + database;
}

void PostgresCluster::Await(std::string const& sql, std::string const& answer) const
{
    SqlSession const session(Uri());
    for (auto const end = std::chrono::steady_clock::now() + 60s; std::chrono::steady_clock::now() < end;
         std::this_thread::sleep_for(1ms))
        if (session.Run(sql) == answer)
            return;
    throw std::runtime_error(sql + ": never " + answer);
}

void PostgresCluster::LetIn(std::string const& role, std::string const& method) const
{
    fs::path const rules = m_folder / "data/pg_hba.conf";
    WriteFile(rules, "local all " + role + " " + method + "\n" + ContentOf(rules));
    std::string const before = Run("SELECT pg_conf_load_time()");
    Run("SELECT pg_reload_conf()");
    Await("SELECT pg_conf_load_time() > '" + before + "'", "t");
}

void PostgresCluster::Stop()
{
    std::istringstream numbers(Run("SELECT string_agg(pid::text, ' ') FROM pg_stat_activity"));
    pid_t server = 0;
    std::ifstream(m_folder / "data/postmaster.pid") >> server;
    m_stopped.assign(1, server);
    for (pid_t process = 0; numbers >> process;)
        m_stopped.push_back(process);
    for (pid_t const process : m_stopped)
        kill(process, SIGSTOP);
}

void PostgresCluster::Continue()
{
    for (pid_t const process : m_stopped)
        kill(process, SIGCONT);
    m_stopped.clear();
}

std::unique_ptr<PostgresCluster> PostgresCluster::MakeStandby() const
{
    std::unique_ptr<PostgresCluster> standby(new PostgresCluster(this));
    Await("SELECT state FROM pg_stat_replication", "streaming");
    Run("ALTER SYSTEM SET synchronous_standby_names = '*'");
    Run("SELECT pg_reload_conf()");
    Await("SELECT sync_state FROM pg_stat_replication", "sync");
    return standby;
}

void PostgresCluster::Kill()
{
    // Its seventh line names a piece of shared memory that a killed server leaves to its next start.
    std::istringstream lines(ContentOf(m_folder / "data/postmaster.pid"));
    std::string line;
    for (int i = 0; i < 7; ++i)
        std::getline(lines, line);
    Stop();
    for (pid_t const process : m_stopped)
        kill(process, SIGKILL);
    m_stopped.clear();
    std::istringstream numbers(line);
    int memory = -1;
    if (unsigned long key = 0; numbers >> key >> memory)
        shmctl(memory, IPC_RMID, nullptr);
}

void PostgresCluster::Promote() const
{
    if (Run("SELECT pg_promote()") != "t")
        Fail("a promoted standby");
}
