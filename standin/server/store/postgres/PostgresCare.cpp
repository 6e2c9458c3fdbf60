// What an owner's tools ask of a PostgresStore. On connections of their own, so that nobody waits for them.
#include "standin/server/store/Inspection.h"
#include "standin/server/store/StoreRows.h"
#include "standin/server/store/postgres/PostgresStore.h"

namespace standin
{
using namespace std::chrono_literals;
using postgres::Clock;
using postgres::Connection;
using postgres::Result;

namespace
{
// Everything as of one moment, row by row.
class Moment
{
public:
    Moment(Connection& connection, std::chrono::milliseconds statementLimit)
        : m_connection(connection), m_limit(statementLimit)
    {
        m_connection.Execute("BEGIN ISOLATION LEVEL REPEATABLE READ READ ONLY", Deadline());
    }

    Result Run(char const* sql) const { return m_connection.Run(sql, {}, Deadline()); }

    // Rows come in portions; behind each, done is called with their number.
    template <typename Look, typename Done>
    void ForEachRow(std::string const& sql, Look const& look, Done const& done) const
    {
        m_connection.Execute("DECLARE portion NO SCROLL CURSOR FOR " + sql, Deadline());
        for (;;)
        {
            Result const rows = Run("FETCH 200 FROM portion");
            for (int row = 0; row < rows.Rows(); ++row)
                look(rows, row);
            if (rows.Rows() == 0)
                break;
            done(rows.Rows());
        }
        m_connection.Execute("CLOSE portion", Deadline());
    }

private:
    Clock::time_point Deadline() const { return Clock::now() + m_limit; }

    Connection& m_connection;
    std::chrono::milliseconds const m_limit;
};

class PostgresInspection
{
public:
    PostgresInspection(Moment const& moment, SiteStore::Progress const& progress)
        : m_moment(moment),
          m_inspection(progress, moment
                                     .Run("SELECT (SELECT count(*) FROM ticket) + "
                                          "(SELECT count(*) FROM parameter) + (SELECT count(*) FROM journal)")
                                     .Integer(0, 0))
    {
    }

    std::vector<std::string> Problems()
    {
        LookAtTickets();
        LookAtParameters();
        LookAtJournal();
        return std::move(m_inspection).Problems();
    }

private:
    template <typename Look>
    void ForEachRow(std::string const& sql, Look const& look)
    {
        m_moment.ForEachRow(sql, look, [this](int rows) { m_inspection.Advance(rows); });
    }

    void LookAtTickets()
    {
        Sequence const last = m_moment.Run("SELECT sequence FROM newest").Number(0, 0);
        ForEachRow("SELECT t.type, t.id, t.incarnation, t.revision, "
                   "t.owner = 0 OR EXISTS (SELECT FROM program p WHERE p.id = t.owner) FROM ticket t",
                   [this, last](Result const& rows, int row)
                   {
                       m_inspection.LookAtTicket({rows.Int(row, 0), rows.Int(row, 1)},
                                                 {rows.Number(row, 2), rows.Number(row, 3)}, last,
                                                 rows.Bool(row, 4));
                   });
    }

    void LookAtParameters()
    {
        ForEachRow("SELECT p.type, p.id, p.value_type, p.pos, p.number, p.bytes, "
                   "EXISTS (SELECT FROM ticket t WHERE t.type = p.type AND t.id = p.id) FROM parameter p",
                   [this](Result const& rows, int row)
                   {
                       auto const bytes =
                           rows.IsNull(row, 5) ? std::nullopt : std::optional(rows.Bytes(row, 5));
                       m_inspection.LookAtParameter(
                           {rows.Int(row, 0), rows.Int(row, 1)}, rows.Int(row, 3), rows.Int(row, 2),
                           FittingValue(rows.Int(row, 2), rows.Integer(row, 4), bytes), rows.Bool(row, 6));
                   });
    }

    void LookAtJournal()
    {
        Sequence expected = m_moment.Run("SELECT pruned FROM site").Number(0, 0) + 1;
        ForEachRow("SELECT sequence, kind, type, id, record FROM journal ORDER BY sequence",
                   [this, &expected](Result const& rows, int row)
                   {
                       m_inspection.LookAtRecord(rows.Number(row, 0), expected, rows.Int(row, 1),
                                                 {rows.Int(row, 2), rows.Int(row, 3)}, rows.Bytes(row, 4));
                   });
    }

    Moment const& m_moment;
    Inspection m_inspection;
};

// The turn goes with the connection.
class TurnOfConnection final : public SiteStore::UsersTurn
{
public:
    explicit TurnOfConnection(std::shared_ptr<void> turn) : m_turn(std::move(turn)) {}

private:
    std::shared_ptr<void> const m_turn;
};
}  // namespace

// What counts all that there is takes as long as that takes, if only the server is there.
std::unique_ptr<Connection> PostgresStore::OwnConnection()
{
    CheckUsable();
    auto connection = std::make_unique<Connection>(m_target, 0ms, Clock::now() + m_options.connectLimit);
    CheckSite(*connection, Clock::now() + m_options.statementLimit);
    connection->WaitAsLongAs([this] { return m_reach.IsThere(); });
    return connection;
}

std::unique_ptr<SiteStore::UsersTurn> PostgresStore::TakeUsersTurn(std::chrono::milliseconds limit)
{
    auto connection = OwnConnection();
    if (!TakeLock(*connection, LockOfUsers, Clock::now() + limit))
        return nullptr;
    connection->WaitAsLongAs(nullptr);  // a change has its limit
    auto const turn = std::make_shared<USERS_TURN>();
    turn->connection = std::move(connection);
    std::lock_guard const lock(m_usersTurns);
    // The lock of an object that is still there has gone: nothing is to be changed for that one under this.
    if (!m_usersTurn.expired())
        return nullptr;
    m_usersTurn = turn;
    return std::make_unique<TurnOfConnection>(turn);
}

std::vector<std::string> PostgresStore::Check(Progress const& progress)
{
    auto const connection = OwnConnection();
    Moment const moment(*connection, m_options.statementLimit);
    return PostgresInspection(moment, progress).Problems();
}

void PostgresStore::ReadContent(std::function<void(TicketChange&&)> const& takeTicket,
                                std::function<void(User&&)> const& takeUser, Progress const& progress)
{
    auto const connection = OwnConnection();
    Moment const moment(*connection, m_options.statementLimit);
    long long const total = moment.Run("SELECT count(*) FROM parameter").Integer(0, 0);
    long long done = 0;
    TicketAssembly tickets(takeTicket);
    moment.ForEachRow(
        "SELECT t.type, t.id, p.key, p.pos, p.value_type, p.number, p.bytes FROM ticket t "
        "LEFT JOIN parameter p ON p.type = t.type AND p.id = t.id "
        "WHERE t.owner = 0 ORDER BY t.type, t.id, p.key, p.pos",
        [&](Result const& rows, int row)
        {
            TicketAddress const address{rows.Int(row, 0), rows.Int(row, 1)};
            tickets.Begin(address);
            if (!rows.IsNull(row, 2))
                tickets.Add(rows.Bytes(row, 2), rows.Int(row, 3), ValueOf(rows, row, 4, address));
        },
        [&](int rows)
        {
            if (progress)
                progress(done += rows, total);
        });
    tickets.End();
    for (User& user : UsersOf(moment.Run(SelectUsers)))
        takeUser(std::move(user));
}

SiteStore::Sizes PostgresStore::Measure()
{
    auto const connection = OwnConnection();
    Result const row = connection->Run(
        "SELECT (SELECT count(*) FROM ticket), (SELECT count(*) FROM account), "
        "(SELECT count(*) FROM journal), (SELECT sum(pg_table_size(c.oid) + pg_indexes_size(c.oid))::bigint "
        "FROM pg_class c WHERE c.relkind = 'r' AND c.relnamespace = "
        "(SELECT relnamespace FROM pg_class WHERE oid = 'site'::regclass))",
        {}, Clock::now() + m_options.statementLimit);
    return {row.Integer(0, 0), row.Integer(0, 1), row.Integer(0, 2), row.Integer(0, 3), 0};
}
}  // namespace standin
