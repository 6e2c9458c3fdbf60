// The programs that have a PostgresStore open, what belongs to them, and their end.
#include "standin/server/store/postgres/PostgresTurn.h"
#include <ctime>

namespace standin
{
using postgres::Clock;
using postgres::Parameters;
using postgres::Result;

namespace
{
constexpr std::chrono::seconds LeavingLimit(1);
}

ProgramId PostgresStore::Self() const noexcept { return m_self; }

std::vector<ProgramInfo> PostgresStore::Programs()
{
    Result const rows = Turn(*this).Run("SELECT id, process, machine, name, since, heard, "
                                        "id IN (SELECT program FROM living) FROM program ORDER BY id");
    return rows.Each(
        [&rows](int row)
        {
            return ProgramInfo{rows.Integer(row, 0), static_cast<long>(rows.Integer(row, 1)),
                               rows.Text(row, 2),    rows.Text(row, 3),
                               rows.Integer(row, 4), rows.Number(row, 5),
                               rows.Bool(row, 6)};
        });
}

int PostgresStore::Bury(std::function<void(Estate const&)> const& clear)
{
    int buried = 0;
    std::exception_ptr failure;
    for (ProgramId const program : DueForBurial())
    {
        try
        {
            buried += BuryOne(program, clear) ? 1 : 0;
        }
        catch (...)
        {
            failure = failure ? failure : std::current_exception();
        }
    }
    if (failure)
        std::rethrow_exception(failure);
    return buried;
}

// When the server breaks down, all programs are missing at first and come back one by one. Who was seen alive
// over the connection that this program still has, or has come since, is missing for a reason of its own.
std::vector<ProgramId> PostgresStore::DueForBurial()
{
    std::uint64_t connection = 0;
    Clock::time_point connectedSince;
    {
        Turn const turn(*this);
        connection = m_connected;
        connectedSince = m_connectedSince;
    }
    auto const programs = Programs();
    auto const now = Clock::now();
    std::lock_guard const lock(m_burials);
    if (m_looks.connection != connection)
        m_looks = {connection, programs.empty() ? 0 : programs.back().id, {}, {}};
    LOOKS looks{connection, m_looks.newest, {}, {}};
    std::vector<ProgramId> due;
    for (ProgramInfo const& program : programs)
    {
        bool const isKnown = m_looks.known.contains(program.id) || program.id > m_looks.newest;
        if (program.isAlive || isKnown)
            looks.known.insert(program.id);
        if (program.isAlive)
            continue;
        auto const since = m_looks.missing.try_emplace(program.id, now).first->second;
        looks.missing[program.id] = since;
        if (now - since >= m_options.grace && (isKnown || now - connectedSince >= m_options.settling))
            due.push_back(program.id);
    }
    m_looks = std::move(looks);
    return due;
}

// The lock of a dead program's life, so that nobody else buries it, and that it waits if it is not dead after
// all. It goes with the connection; threads of this handle share that, and are kept apart by m_burying.
class PostgresStore::Burial
{
public:
    Burial(PostgresStore& store, ProgramId program) : m_store(store), m_program(program)
    {
        {
            std::lock_guard const lock(store.m_burials);
            m_isFirst = store.m_burying.insert(program).second;
        }
        if (!m_isFirst)
            return;
        try
        {
            Turn turn(store);
            m_connection = store.m_connected;
            m_isOurs = turn.Run("SELECT pg_try_advisory_lock($1, $2)", Key()).Bool(0, 0);
        }
        catch (...)
        {
            NoteEnd();
            throw;
        }
    }
    ~Burial()
    {
        try
        {
            if (m_isOurs)
                IfStillOurs([this](Turn& turn) { turn.Run("SELECT pg_advisory_unlock($1, $2)", Key()); });
        }
        catch (StoreError const&)
        {
            // The lock has gone with the connection.
        }
        if (m_isFirst)
            NoteEnd();
    }
    Burial(Burial const&) = delete;
    Burial& operator=(Burial const&) = delete;

    bool IsOurs() const { return m_isOurs; }

    void Forget()
    {
        IfStillOurs([this](Turn& turn) { turn.Run("SELECT forget_program($1)", Parameters() << m_program); });
    }

private:
    template <typename Action>
    void IfStillOurs(Action const& action)
    {
        Turn turn(m_store);
        if (m_store.m_connected != m_connection)
            throw StoreError(m_store.m_name +
                             ": the connection broke during a burial; it is repeated by itself");
        action(turn);
    }

    Parameters Key() const { return Parameters() << m_store.m_lockClass << static_cast<int>(m_program); }

    void NoteEnd() noexcept
    {
        std::lock_guard const lock(m_store.m_burials);
        m_store.m_burying.erase(m_program);
    }

    PostgresStore& m_store;
    ProgramId const m_program;
    std::uint64_t m_connection = 0;  // which of the handle's connections has the lock
    bool m_isFirst = false;
    bool m_isOurs = false;
};

// False if somebody else does it or has done it.
bool PostgresStore::BuryOne(ProgramId program, std::function<void(Estate const&)> const& clear)
{
    Burial burial(*this, program);
    Estate estate;
    estate.program = program;
    if (!burial.IsOurs() || !TakeEstate(estate))
        return false;
    clear(estate);
    burial.Forget();
    return true;
}

// False if the program is buried already.
bool PostgresStore::TakeEstate(Estate& estate)
{
    Turn turn(*this);
    Parameters const id = Parameters() << estate.program;
    if (turn.Run("SELECT FROM program WHERE id = $1", id).Rows() == 0)
        return false;
    Result const tickets =
        turn.Run("SELECT type, id, incarnation, revision FROM ticket WHERE owner = $1 AND owner <> 0", id);
    estate.tickets = tickets.Each(
        [&tickets](int row)
        {
            return Estate::Ticket{
                {tickets.Int(row, 0), tickets.Int(row, 1)}, tickets.Number(row, 2), tickets.Number(row, 3)};
        });
    Result const files = turn.Run("SELECT path FROM part_file WHERE program = $1", id);
    estate.partFiles = files.Each([&files](int row) { return files.Text(row, 0); });
    return true;
}

void PostgresStore::Leave()
{
    Turn turn(*this, LeavingLimit);
    turn.Run("SELECT leave_site($1)", Parameters() << m_self);
    m_hasLeft = true;
    m_bell.reset();
    turn.Run("SELECT pg_advisory_unlock_all()");
}

// --- sessions and part files

long long PostgresStore::OpenSession(std::string_view user)
{
    Turn turn(*this);
    auto const since = static_cast<long long>(std::time(nullptr));
    long long const id =
        turn.Run("INSERT INTO session (program, account, since) VALUES ($1, $2, $3) RETURNING id",
                 Parameters() << m_self << user << since)
            .Integer(0, 0);
    std::lock_guard const lock(m_belongings);
    m_sessions[id] = {std::string(user), since};
    return id;
}

void PostgresStore::CloseSession(long long session)
{
    TakeAway("DELETE FROM session WHERE id = $1", Parameters() << session,
             [&] { m_sessions.erase(session); });
}

// What cannot be reached now is not to come back: it is taken away once it can be reached.
void PostgresStore::TakeAway(char const* sql, Parameters const& parameters,
                             std::function<void()> const& forget)
{
    CheckUsable();
    try
    {
        Turn turn(*this);
        {
            std::lock_guard const lock(m_belongings);
            forget();
        }
        turn.Run(sql, parameters);
    }
    catch (StoreError const&)
    {
        std::lock_guard const lock(m_belongings);
        forget();
        m_hasLeftovers = true;
        throw;
    }
}

std::vector<SessionInfo> PostgresStore::Sessions()
{
    Result const rows = Turn(*this).Run("SELECT id, program, account, since FROM session ORDER BY id");
    return rows.Each(
        [&rows](int row) {
            return SessionInfo{rows.Integer(row, 0), rows.Integer(row, 1), rows.Text(row, 2),
                               rows.Integer(row, 3)};
        });
}

bool PostgresStore::AddPartFile(std::string_view path)
{
    // Touches a row of this program's, too, so that the changes tell whether the note stands.
    Turn turn(*this);
    bool const isOurs =
        turn.Run("INSERT INTO part_file AS f VALUES ($1, $2) ON CONFLICT (place(path)) DO UPDATE "
                 "SET program = $2 WHERE f.program = $2",
                 Parameters() << path << m_self)
            .Changes() == 1;
    std::lock_guard const lock(m_belongings);
    if (isOurs)
        m_partFiles.emplace(path);
    return isOurs;
}

void PostgresStore::RemovePartFile(std::string_view path)
{
    TakeAway("DELETE FROM part_file WHERE place(path) = place($1) AND program = $2",
             Parameters() << path << m_self, [&] { m_partFiles.erase(std::string(path)); });
}

// For who has the turn. What others have forgotten with this program while it was away is there again, and
// what a call has put there that broke before its answer is gone.
void PostgresStore::PutBelongingsBack(Clock::time_point deadline)
{
    std::unique_lock lock(m_belongings);
    auto const sessions = m_sessions;
    auto const partFiles = m_partFiles;
    lock.unlock();
    std::vector<long long> ids, since;
    std::vector<std::string_view> users;
    for (auto const& [id, session] : sessions)
    {
        ids.push_back(id);
        since.push_back(session.since);
        users.push_back(session.user);
    }
    m_working->Run("DELETE FROM session WHERE program = $1 AND id <> ALL ($2)", Parameters() << m_self << ids,
                   deadline);
    m_working->Run("INSERT INTO session (id, program, account, since) OVERRIDING SYSTEM VALUE "
                   "SELECT s.id, $1, s.account, s.since FROM unnest($2, $3, $4) AS s (id, account, since) "
                   "ON CONFLICT DO NOTHING",
                   Parameters() << m_self << ids << users << since, deadline);
    std::vector<std::string_view> const files(partFiles.begin(), partFiles.end());
    m_working->Run("DELETE FROM part_file WHERE program = $1 AND path <> ALL ($2)",
                   Parameters() << m_self << files, deadline);
    m_working->Run(
        "INSERT INTO part_file SELECT f.path, $1 FROM unnest($2) AS f (path) ON CONFLICT DO NOTHING",
        Parameters() << m_self << files, deadline);
}
}  // namespace standin
