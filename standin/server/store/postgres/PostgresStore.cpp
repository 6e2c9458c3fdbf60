#include "standin/server/store/postgres/PostgresStore.h"

#include "standin/server/store/Outcome.h"
#include "standin/server/store/StoreRows.h"
#include "standin/server/store/postgres/PostgresTurn.h"
#include "standin/server/store/postgres/Schema.h"
#include <algorithm>
#include <ctime>
#include <thread>
#include <unistd.h>
#include <utility>

namespace standin
{
using namespace std::chrono_literals;
using postgres::BrokenConnection;
using postgres::Clock;
using postgres::Connection;
using postgres::Parameters;
using postgres::Result;

namespace
{
constexpr std::chrono::milliseconds ClosingLimit = 1s;
constexpr std::chrono::milliseconds PauseForLock = 10ms;
constexpr std::chrono::milliseconds PauseBetweenAttempts = 100ms;

// A break is not noticed by callers if the server can be had again within so long.
constexpr std::chrono::milliseconds Patience = 300ms;

// A caller waits for a connection no longer; where that takes more, the keeper's thread gets it.
constexpr std::chrono::milliseconds CallersLimit = 2s;

[[noreturn]] void FailAsUnknown(StoreError const& reason)
{
    throw UnknownOutcome(std::string(reason.what()) +
                         "; whether a user was changed is not known: look before you repeat the change");
}

// The server gives a statement up before the client does, so that the connection can be kept.
std::chrono::milliseconds OnServer(std::chrono::milliseconds limit) { return limit - limit / 10; }
}  // namespace

// --- opening and closing

PostgresStore::PostgresStore(std::string const& uri, std::function<StoreContent()> const& first,
                             PostgresOptions options)
    : m_target{uri, options.schema}, m_options(std::move(options)), m_process(getpid()),
      m_machine(MachineName()), m_program(ProgramName()), m_since(std::time(nullptr))
{
    m_working = NewConnection(Clock::now() + m_options.connectLimit);
    m_name = m_working->Name();
    {
        Turn opening(*this, m_options.openingLimit);
        postgres::OpenSchema(
            opening.Connection(), m_options.schema, [&] { Fill(opening, first()); }, opening.Deadline());
        CheckSite(opening.Connection(), opening.Deadline());
        if (!TakeLock(opening.Connection(), LockOfOpening, opening.Deadline()))
            throw StoreError(
                m_name +
                ": another program has been opening the site all the time; end that, then try again");
        m_isOpening = true;
    }
    m_keeper = std::make_unique<postgres::Keeper>([this] { Mend(); });
    // Listens before it looks: what is committed after the look rings.
    m_bell = std::make_unique<postgres::Bell>(
        m_target,
        postgres::Bell::Limits{m_options.connectLimit, OnServer(m_options.statementLimit), m_options.pulse},
        postgres::Bell::Calls{[this](Connection& connection)
                              { CheckSite(connection, Clock::now() + m_options.statementLimit); },
                              [this](Sequence newest) { RaiseCommitted(newest); }, [this] { Look(); }},
        m_reach, m_hurry);
    Register();
    if (!m_options.keepOpening)
        EndOpening();
}

// Not by waiting in the server, which would end the statement after a limit of its own. Who has little
// patience for others has as much for the server's answer as anybody.
bool PostgresStore::TakeLock(Connection& connection, int lock, Clock::time_point deadline) const
{
    auto const isTaken = [&]
    {
        return connection
            .Run("SELECT pg_try_advisory_lock(lock_class(), $1)", Parameters() << lock,
                 Clock::now() + m_options.statementLimit)
            .Bool(0, 0);
    };
    while (!isTaken())
    {
        if (Clock::now() + PauseForLock >= deadline)
            return false;
        std::this_thread::sleep_for(PauseForLock);
    }
    return true;
}

PostgresStore::~PostgresStore()
{
    if (IsForeign())
    {
        if (m_bell)
            m_bell.release()->Abandon();
        if (m_keeper)
            m_keeper.release()->Abandon();
        if (m_working)
            m_working.release()->Abandon();
        return;
    }
    m_bell.reset();
    m_keeper.reset();
    try
    {
        // The server notices the end of a connection a moment later, and so would who asks for the dead.
        if (m_working && !m_working->IsBroken() && m_reach.IsThere())
            m_working->Run("SELECT pg_advisory_unlock_all()", {}, Clock::now() + ClosingLimit);
    }
    catch (StoreError const&)
    {
    }
}

// In the transaction that makes the schema.
void PostgresStore::Fill(Turn& turn, StoreContent const& content) const
{
    std::uint64_t number = 0;
    for (TicketChange const& change : content.tickets)
        if (Send(turn, RequestOf(change, 0, ++number), change.address).kind != CommitOutcome::Committed)
            throw StoreError(m_name + ": a site cannot begin with a ticket twice; correct its content");
    // Nobody has heard of the site before, so its journal begins behind what it began with.
    turn.Run("UPDATE site SET pruned = (SELECT sequence FROM newest)");
    turn.Run("DELETE FROM journal");
    for (User const& user : content.users)
        Put(turn.Connection(), turn.Deadline(), user);
}

void PostgresStore::Register()
{
    Turn turn(*this);
    // The writer of the log runs since the server takes changes: since its start, a crash, or its promotion.
    // Who may not see that counts from now.
    Result const found = turn.Run(
        "SELECT number::text, NOT EXISTS (SELECT FROM program WHERE id NOT IN (SELECT program FROM living)), "
        "coalesce((SELECT extract(epoch FROM clock_timestamp() - a.backend_start) * 1000 FROM "
        "pg_stat_activity a WHERE a.backend_type = 'walwriter'), 0)::bigint FROM site");
    m_siteNumber = found.Text(0, 0);
    m_isTidy = found.Bool(0, 1);
    m_connectedSince = Clock::now() - std::chrono::milliseconds(std::max(0LL, found.Integer(0, 2)));
    Result const registered =
        turn.Run("SELECT self, heard, lock_class() FROM register_program($1, $2, $3, $4)",
                 Parameters() << static_cast<long long>(m_process) << std::string_view(m_machine)
                              << std::string_view(m_program) << m_since);
    m_self = registered.Integer(0, 0);
    m_committed = m_settled = registered.Number(0, 1);
    m_lockClass = registered.Int(0, 2);
    postgres::EndRegistering(turn.Connection(), m_options.schema, turn.Deadline());
}

// If the connection has broken meanwhile the lock is gone already, and another's may not be given up.
void PostgresStore::EndOpening()
{
    std::lock_guard const lock(m_opening);
    if (std::exchange(m_isOpening, false))
        Turn(*this).Run("SELECT pg_advisory_unlock($1, $2)", Parameters() << m_lockClass << LockOfOpening);
}

bool PostgresStore::KeepsOpening()
{
    std::lock_guard const lock(m_opening);
    return m_isOpening && Turn(*this)
                                  .Run("SELECT FROM pg_locks WHERE locktype = 'advisory' AND granted AND "
                                       "pid = pg_backend_pid() AND classid = $1::oid AND objid = $2::oid "
                                       "AND objsubid = 2",
                                       Parameters() << m_lockClass << LockOfOpening)
                                  .Rows() == 1;
}

bool PostgresStore::HasFolder() { return Turn(*this).Run("SELECT has_folder FROM site").Bool(0, 0); }

void PostgresStore::NoteFolder() { Turn(*this).Run("UPDATE site SET has_folder = true"); }

bool PostgresStore::IsForeign() const noexcept { return getpid() != m_process; }

void PostgresStore::CheckUsable() const
{
    if (IsForeign())
        throw UnusableStore(m_name + ": was opened by the parent of this process; open it in a program that "
                                     "was started anew");
    if (m_hasLeft)
        throw UnusableStore(m_name + ": has been left; open it anew");
    if (m_reach.IsOver())
        throw UnusableStore(m_reach.Reason());
}

// On each new connection, before anything else is done there.
void PostgresStore::CheckSite(Connection& connection, Clock::time_point deadline)
{
    try
    {
        // What is known is looked up first: it may grow meanwhile, and the server's answer would not have it.
        m_identity.Check(connection, m_committed, deadline);
    }
    catch (UnusableStore const& error)
    {
        End(error.what());
    }
}

void PostgresStore::End(std::string const& reason)
{
    m_reach.NoteEnd(reason);
    {
        std::lock_guard const lock(m_hearing);  // lest a waiter has looked and does not wait yet
        m_heard.notify_all();
    }
    throw UnusableStore(reason);
}

// --- the working connection

PostgresStore::Turn::Turn(PostgresStore& store, std::chrono::milliseconds limit)
    : m_store(store), m_deadline(Clock::now() + limit)
{
    store.CheckUsable();  // a copy in a child may have inherited a locked mutex
    {
        std::unique_lock lock(store.m_turns);
        if (!store.m_turnEnded.wait_until(lock, m_deadline,
                                          [&store] { return !store.m_isTaken || !store.m_reach.IsThere(); }))
            throw StoreError(store.m_name + ": other calls wait for its answer; check the server and the "
                                            "network");
        if (!store.m_isTaken)
            store.m_turnEnded.notify_one();  // if this one does not take it
        store.CheckReach();
        store.m_isTaken = true;
    }
    try
    {
        store.CheckUsable();
        m_connection = &store.Working(m_deadline);
    }
    catch (...)
    {
        store.EndTurn();
        throw;
    }
}

PostgresStore::Turn::~Turn()
{
    if (m_connection->IsBroken())
        m_store.m_brokenSince = Clock::now();
    else
        m_store.m_reach.NoteService(true);
    if (m_connection->IsBroken() || m_store.m_hasLeft || m_store.m_reach.IsOver())
        m_store.m_working.reset();
    m_store.EndTurn();
}

void PostgresStore::EndTurn() noexcept
{
    std::lock_guard const lock(m_turns);
    m_isTaken = false;
    m_turnEnded.notify_one();
}

void PostgresStore::CheckReach() const
{
    if (!m_reach.IsThere())
        throw BrokenConnection(m_reach.Reason());
}

// In the thread of the bell, which waits for nothing. Who waits for a turn is not to wait for a server that
// is known to be lost.
void PostgresStore::Look() noexcept
{
    if (m_reach.IsThere())
        return m_keeper->Wake();
    std::lock_guard const lock(m_turns);
    m_turnEnded.notify_all();
    if (m_reach.IsOver() && !m_isTaken)
        m_working.reset();
}

// In the thread of the keeper. A program that makes no call just now is not to be taken for dead.
void PostgresStore::Mend() noexcept
{
    {
        std::lock_guard const lock(m_turns);
        if (m_isTaken || m_hasLeft || !m_reach.IsThere())
            return;
        m_isTaken = true;
    }
    try
    {
        if (HasSoundConnection())
            m_reach.NoteService(true);
        else if (IsAttemptDue())
            Attempt(Clock::now() + m_options.statementLimit, m_options.connectLimit);
    }
    catch (std::exception const&)
    {
        // Calls report it.
    }
    EndTurn();
}

// For who has the turn, like all below.
Connection& PostgresStore::Working(Clock::time_point deadline)
{
    if (!HasSoundConnection())
        ConnectAgain(deadline);
    return *m_working;
}

bool PostgresStore::HasSoundConnection()
{
    if (m_working && !m_working->IsSound())
    {
        m_working.reset();
        m_brokenSince = Clock::now();
    }
    return m_working != nullptr;
}

// The bell notices sooner that the server is lost than a statement's limit is over.
std::unique_ptr<Connection> PostgresStore::NewConnection(Clock::time_point deadline)
{
    auto connection =
        std::make_unique<Connection>(m_target, OnServer(m_options.statementLimit), deadline, &m_hurry);
    connection->GiveUpWhen([this] { return !m_reach.IsThere(); });
    return connection;
}

bool PostgresStore::IsAttemptDue() const
{
    return Clock::now() >= m_nextAttempt || m_reach.Returns() != m_returnsBeforeFailure;
}

void PostgresStore::ConnectAgain(Clock::time_point deadline)
{
    auto const isNew = [&]
    { return Clock::now() < std::min(m_brokenSince + Patience, deadline) && m_reach.IsThere(); };
    while (!m_working)
    {
        if (!IsAttemptDue() && !isNew())
        {
            m_reach.NoteService(false);
            throw BrokenConnection(m_failure);
        }
        if (!IsAttemptDue())
            std::this_thread::sleep_until(std::min(m_nextAttempt, deadline));
        try
        {
            Attempt(deadline, std::min(m_options.connectLimit, CallersLimit));
        }
        catch (StoreError const&)
        {
            if (!isNew())
                throw;
        }
    }
}

void PostgresStore::Attempt(Clock::time_point deadline, std::chrono::milliseconds connectLimit)
{
    auto const returns = m_reach.Returns();
    try
    {
        m_working = NewConnection(std::min(deadline, Clock::now() + connectLimit));
        ComeBack(deadline);
        ++m_connected;
        m_connectedSince = Clock::now();
        m_pause.Reset();
        m_reach.NoteService(true);
    }
    catch (StoreError const& error)
    {
        m_working.reset();
        if (Clock::now() - m_brokenSince > Patience)
            m_reach.NoteService(false);
        m_failure = error.what();
        m_returnsBeforeFailure = returns;
        m_nextAttempt = Clock::now() + m_pause.Take();
        throw;
    }
}

// While the site is opened it goes on to be kept from being replaced.
void PostgresStore::ComeBack(Clock::time_point deadline)
{
    if (!postgres::BeginRegistering(*m_working, m_options.schema, deadline))
        throw BrokenConnection(m_name + ": the site is being replaced; wait until that is done", true);
    CheckSite(*m_working, deadline);
    if (m_self == 0)
        return;
    bool const isAnothers =
        m_working
            ->Run("SELECT FROM program p WHERE p.id = $1 AND "
                  "(p.process, p.machine, p.name, p.since) <> ($2, $3, $4, $5)",
                  Parameters() << m_self << static_cast<long long>(m_process) << std::string_view(m_machine)
                               << std::string_view(m_program) << m_since,
                  deadline)
            .Rows() != 0;
    if (isAnothers)
        End(m_name + ": another program has got the number of this one; start the program anew");
    TakeLifeBack(deadline);
    postgres::EndRegistering(*m_working, m_options.schema, deadline);
}

// The old connection, of which the server may know nothing yet, still holds the lock: when it is ours alone,
// all that was sent over the old one has ended, and FindCommit can be certain. So has a burial.
void PostgresStore::TakeLifeBack(Clock::time_point deadline)
{
    Parameters const key = Parameters() << m_lockClass << static_cast<int>(m_self);
    if (!m_working->Run("SELECT pg_try_advisory_lock($1, $2)", key, deadline).Bool(0, 0))
    {
        try
        {
            m_working->Run("SELECT pg_terminate_backend(pid) FROM living WHERE program = $1",
                           Parameters() << m_self, deadline);
        }
        catch (postgres::RefusedStatement const&)
        {
            // Not permitted: the server will find out by itself.
        }
        m_working->Run("SELECT pg_advisory_lock($1, $2)", key, deadline);
    }
    m_working->Run("SELECT pg_advisory_lock_shared($1, $2)", key, deadline);
    m_working->Run("SELECT pg_advisory_unlock($1, $2)", key, deadline);
    m_working->Run("INSERT INTO program (id, process, machine, name, since, heard) "
                   "VALUES ($1, $2, $3, $4, $5, $6) ON CONFLICT DO NOTHING",
                   Parameters() << m_self << static_cast<long long>(m_process) << std::string_view(m_machine)
                                << std::string_view(m_program) << m_since << Needed(m_settled),
                   deadline);
    PutBelongingsBack(deadline);
}

// --- what holds

std::atomic<Sequence> const& PostgresStore::Committed() const noexcept { return m_committed; }

Sequence PostgresStore::Tickets(std::function<void(TicketAddress, TicketState const&)> const& take)
{
    Result const rows = Turn(*this).Run("SELECT n.sequence, t.type, t.id, t.incarnation, t.revision "
                                        "FROM newest n LEFT JOIN ticket t ON true ORDER BY t.type, t.id");
    for (int row = 0; row < rows.Rows() && !rows.IsNull(row, 1); ++row)
        take({rows.Int(row, 1), rows.Int(row, 2)}, {rows.Number(row, 3), rows.Number(row, 4)});
    return rows.Number(0, 0);
}

std::optional<Store::Loaded>
PostgresStore::Load(TicketAddress address,
                    std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take)
{
    // One statement, hence one moment.
    Result const rows = Turn(*this).Run(
        "SELECT t.incarnation, t.revision, n.sequence, p.key, p.pos, p.value_type, p.number, "
        "p.bytes FROM newest n, ticket t LEFT JOIN parameter p ON p.type = t.type AND p.id = t.id "
        "WHERE t.type = $1 AND t.id = $2 ORDER BY p.key, p.pos",
        Parameters() << address);
    if (rows.Rows() == 0)
        return std::nullopt;
    for (int row = 0; row < rows.Rows() && !rows.IsNull(row, 3); ++row)
        take(rows.Bytes(row, 3), rows.Int(row, 4), ValueOf(rows, row, 5, address));
    return Loaded{{rows.Number(0, 0), rows.Number(0, 1)}, rows.Number(0, 2)};
}

// Of three columns: type, number, bytes.
StoredValue PostgresStore::ValueOf(Result const& rows, int row, int column, TicketAddress address) const
{
    auto const bytes =
        rows.IsNull(row, column + 2) ? std::nullopt : std::optional(rows.Bytes(row, column + 2));
    auto const value = FittingValue(rows.Int(row, column), rows.Integer(row, column + 1), bytes);
    if (!value)
        throw StoreError(m_name + ": a value of ticket " + std::to_string(address.type) + "/" +
                         std::to_string(address.id) + " does not fit its type " +
                         std::to_string(rows.Int(row, column)) + "; bring a backup back");
    return *value;
}

// --- users

std::optional<User> PostgresStore::FindUser(std::string_view name)
{
    Result const rows = Turn(*this).Run("SELECT name, password_hash, role, ticket_id FROM account "
                                        "WHERE place(name) = place($1)",
                                        Parameters() << name);
    auto users = UsersOf(rows);
    return users.empty() ? std::nullopt : std::optional(std::move(users[0]));
}

std::vector<User> PostgresStore::Users() { return UsersOf(Turn(*this).Run(SelectUsers)); }

std::vector<User> PostgresStore::UsersOf(Result const& rows)
{
    return rows.Each(
        [&rows](int row) {
            return User{rows.Text(row, 0), rows.Text(row, 1), rows.Int(row, 2), rows.Int(row, 3)};
        });
}

void PostgresStore::ChangeUsers(ChangeOfUsers const& change)
{
    std::unique_lock lock(m_usersTurns);
    auto const turn = m_usersTurn.lock();
    lock.unlock();
    if (turn)
        ChangeInTurn(*turn, change);
    else
        UntilKnown(change);
}

// Not again after a break: others may have taken the turn since, and what was looked at is not so any more.
void PostgresStore::ChangeInTurn(USERS_TURN& turn, ChangeOfUsers const& change)
{
    CheckUsable();
    std::lock_guard const lock(turn.lock);
    if (!turn.connection->IsSound())
        throw BrokenConnection(m_name +
                               ": the turn to change users has ended with its connection, and nothing "
                               "was changed; try again");
    try
    {
        change(*turn.connection, Clock::now() + OutcomeLimit, false);
    }
    catch (BrokenConnection const& error)
    {
        FailAsUnknown(error);
    }
}

// Runs what may be run again, until it is known to be done or refused: when a connection breaks, the server
// may have done it all the same. Once a new one is there, nothing of the old one is on its way any more.
void PostgresStore::UntilKnown(ChangeOfUsers const& change)
{
    bool isLost = false;  // an answer
    for (auto const end = Clock::now() + OutcomeLimit;; std::this_thread::sleep_for(PauseBetweenAttempts))
    {
        bool isSent = false;
        try
        {
            Turn turn(*this);
            isSent = true;
            return change(turn.Connection(), turn.Deadline(), isLost);
        }
        catch (StoreError const& error)
        {
            isLost = isLost || (isSent && dynamic_cast<BrokenConnection const*>(&error) != nullptr);
            if (!isLost)
                throw;
            if (Clock::now() >= end || dynamic_cast<UnusableStore const*>(&error) != nullptr)
                FailAsUnknown(error);
        }
    }
}

void PostgresStore::PutUser(User const& user)
{
    ChangeUsers([&user](Connection& connection, Clock::time_point deadline, bool)
                { Put(connection, deadline, user); });
}

void PostgresStore::Put(Connection& connection, Clock::time_point deadline, User const& user)
{
    connection.Run("INSERT INTO account VALUES ($1, $2, $3, $4) ON CONFLICT (place(name)) DO UPDATE "
                   "SET password_hash = excluded.password_hash, role = excluded.role, "
                   "ticket_id = excluded.ticket_id",
                   Parameters() << std::string_view(user.name) << std::string_view(user.passwordHash)
                                << user.role << user.ticketId,
                   deadline);
}

bool PostgresStore::RemoveUser(std::string_view name)
{
    bool wasThere = false;
    ChangeUsers(
        [&](Connection& connection, Clock::time_point deadline, bool isRepeated)
        {
            Parameters const user = Parameters() << name;
            if (!isRepeated)
                wasThere = connection.Run("SELECT FROM account WHERE place(name) = place($1)", user, deadline)
                               .Rows() == 1;
            bool const isRemoved =
                connection.Run("DELETE FROM account WHERE place(name) = place($1)", user, deadline)
                    .Changes() == 1;
            wasThere = isRemoved || (isRepeated && wasThere);
            if (wasThere && !isRemoved)
                MakeLasting(connection, deadline);
        });
    return wasThere;
}
}  // namespace standin
