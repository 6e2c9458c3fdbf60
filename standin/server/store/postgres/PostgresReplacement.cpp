#include "standin/server/store/postgres/PostgresReplacement.h"

#include "standin/server/store/postgres/Schema.h"
#include <thread>

namespace standin
{
using postgres::BrokenConnection;
using postgres::Clock;
using postgres::Connection;
using postgres::Parameters;

namespace
{
constexpr std::chrono::seconds PatienceWithOthers(5);
constexpr std::chrono::milliseconds PauseForServer(100);

// The comment of a schema in which a new site is being made. Who finds one may drop it: two who make one at a
// time are kept apart, so somebody was killed.
constexpr std::string_view Mark = "a site that is being made";

// What permits in the second schema what the first one permits to whom, and makes it the same owners': the
// statements, in order. Sequences go with their tables' owners. Nobody is permitted anything yet in a schema
// that was just made, but for what the server permits everybody.
constexpr char const* SelectRights = R"(
    WITH old AS (SELECT * FROM pg_namespace WHERE nspname = convert_from($1, 'UTF8')),
    new AS (SELECT * FROM pg_namespace WHERE nspname = convert_from($2, 'UTF8')),
    pair AS (
        SELECT 'SCHEMA ' || new.oid::regnamespace AS what, old.nspowner AS owner, new.nspowner AS maker,
            old.nspacl AS rights, true AS has_owner FROM old, new
        UNION ALL
        SELECT CASE o.relkind WHEN 'S' THEN 'SEQUENCE ' ELSE 'TABLE ' END || n.oid::regclass, o.relowner,
            n.relowner, o.relacl, o.relkind <> 'S'
            FROM old, new, pg_class o JOIN pg_class n USING (relname, relkind)
            WHERE o.relnamespace = old.oid AND n.relnamespace = new.oid AND relkind IN ('r', 'v', 'S')
        UNION ALL
        SELECT 'FUNCTION ' || n.oid::regprocedure, o.proowner, n.proowner, o.proacl, true
            FROM old, new, pg_proc o JOIN pg_proc n USING (proname, proargtypes)
            WHERE o.pronamespace = old.oid AND n.pronamespace = new.oid)
    SELECT 1 AS place, 'ALTER ' || what || ' OWNER TO ' || owner::regrole AS statement FROM pair
        WHERE owner <> maker AND has_owner
    UNION ALL
    SELECT 2, 'REVOKE ALL ON ' || what || ' FROM PUBLIC' FROM pair WHERE rights IS NOT NULL
    UNION ALL
    SELECT 3, 'GRANT ' || g.privilege_type || ' ON ' || what || ' TO ' ||
            CASE g.grantee WHEN 0 THEN 'PUBLIC' ELSE g.grantee::regrole::text END ||
            CASE WHEN g.is_grantable THEN ' WITH GRANT OPTION' ELSE '' END
        FROM pair, aclexplode(rights) g
    ORDER BY place
)";

std::string NewNameFor(PostgresOptions const& options) { return options.schema + "_new"; }

PostgresOptions Beside(PostgresOptions options)
{
    options.schema = NewNameFor(options);
    return options;
}
}  // namespace

PostgresReplacement::PostgresReplacement(std::string const& uri, Old old, PostgresOptions options)
    : m_uri(uri), m_options(std::move(options)), m_connection(Connected())
{
    if (!postgres::KeepFromOpening(*m_connection, m_options.schema, Clock::now() + PatienceWithOthers))
        throw StoreError(m_connection->Name() + postgres::BeingOpened);
    LookForOld();
    if (m_hasOld && old == Old::Forbidden)
        throw StoreError(m_connection->Name() + ": there is a site already; name another database");
    if (m_hasOld)
        CheckIsNotOpen();
    DropUnfinished();
    MakeMarkedSchema();
    try
    {
        m_store = std::make_unique<PostgresStore>(
            uri, [] { return StoreContent(); }, Beside(m_options));
    }
    catch (...)
    {
        DropAfterFailure();
        throw;
    }
}

PostgresReplacement::~PostgresReplacement()
{
    if (!m_store)
        return;
    m_store.reset();
    DropAfterFailure();
}

// Statements of one call are one transaction.
void PostgresReplacement::MakeMarkedSchema()
{
    std::string const name = m_connection->Quoted(NewNameFor(m_options));
    m_connection->Execute("CREATE SCHEMA " + name + "; COMMENT ON SCHEMA " + name + " IS '" +
                              std::string(Mark) + '\'',
                          Deadline());
}

// Whoever's it was. Throws StoreError if the schema is no unfinished site.
void PostgresReplacement::DropUnfinished()
{
    std::string const name = NewNameFor(m_options);
    auto const found = m_connection->Run(
        "SELECT coalesce(obj_description(oid, 'pg_namespace') = convert_from($2, 'UTF8'), false) "
        "FROM pg_namespace WHERE nspname = convert_from($1, 'UTF8')",
        Parameters() << std::string_view(name) << Mark, Deadline());
    if (found.Rows() == 0)
        return;
    if (!found.Bool(0, 0))
        throw StoreError(m_connection->Name() + ": its schema " + name +
                         " belongs to another program; rename that, then try again");
    m_connection->Execute("DROP SCHEMA " + m_connection->Quoted(name) + " CASCADE", Deadline());
}

// The connection may be what has failed, and with it went what keeps others away: somebody else may have
// begun another one since.
void PostgresReplacement::DropAfterFailure() noexcept
{
    try
    {
        if (!m_connection || !m_connection->IsSound())
        {
            m_connection = Connected();
            if (!postgres::KeepFromOpening(*m_connection, m_options.schema,
                                           Clock::now() + PatienceWithOthers))
                return;
        }
        DropUnfinished();
    }
    catch (std::exception const&)
    {
        // The next one drops it.
    }
}

std::string PostgresReplacement::Finish()
{
    m_store->Sync();
    m_store->Leave();
    std::string aside = m_hasOld ? FreeName() : "";
    std::string const exchange = Exchange(aside);
    long long const site =
        m_connection
            ->Run("SELECT c.oid::bigint FROM pg_class c JOIN pg_namespace n ON n.oid = c.relnamespace "
                  "WHERE n.nspname = convert_from($1, 'UTF8') AND c.relname = 'site'",
                  Parameters() << std::string_view(NewNameFor(m_options)), Deadline())
            .Integer(0, 0);
    try
    {
        m_connection->Execute(exchange, Deadline());
    }
    catch (BrokenConnection const& failure)
    {
        MakeSure(site, failure);
    }
    m_store.reset();
    m_connection.reset();
    return aside;
}

// Statements of one call are one transaction.
std::string PostgresReplacement::Exchange(std::string const& aside)
{
    std::string const name = m_connection->Quoted(m_options.schema);
    std::string const made = m_connection->Quoted(NewNameFor(m_options));
    if (m_isPrepared)
        return MoveAll(made, name);
    std::string rename =
        "COMMENT ON SCHEMA " + made + " IS NULL; ALTER SCHEMA " + made + " RENAME TO " + name;
    if (!m_hasOld)
        return rename;
    return "UPDATE " + made + ".site SET (number, has_folder) = (SELECT number, has_folder FROM " + name +
           ".site);" + Rights() + "ALTER SCHEMA " + name + " RENAME TO " + m_connection->Quoted(aside) + ';' +
           rename;
}

// Who could open the site can open it afterwards.
std::string PostgresReplacement::Rights()
{
    std::string const made = NewNameFor(m_options);
    auto const rights = m_connection->Run(
        SelectRights, Parameters() << std::string_view(m_options.schema) << std::string_view(made),
        Deadline());
    std::string all;
    for (int row = 0; row < rights.Rows(); ++row)
        all += rights.Text(row, 1) + ';';
    return all;
}

// A schema that somebody has prepared keeps its owner and what it permits to whom.
std::string PostgresReplacement::MoveAll(std::string const& made, std::string const& name)
{
    auto const moves =
        m_connection->Run("SELECT 'TABLE ' || c.oid::regclass FROM pg_class c WHERE c.relkind IN ('r', 'v') "
                          "AND c.relnamespace = convert_from($1, 'UTF8')::regnamespace "
                          "UNION ALL SELECT 'FUNCTION ' || p.oid::regprocedure FROM pg_proc p "
                          "WHERE p.pronamespace = convert_from($1, 'UTF8')::regnamespace",
                          Parameters() << std::string_view(made), Deadline());
    std::string all;
    for (int row = 0; row < moves.Rows(); ++row)
        all += "ALTER " + moves.Text(row, 0) + " SET SCHEMA " + name + ';';
    return all + "DROP SCHEMA " + made;
}

// After a break in the last step. site: the table by which the new one is known in whatever schema.
void PostgresReplacement::MakeSure(long long site, StoreError const& failure)
{
    std::string const name = m_connection->Name();
    auto const end = Clock::now() + m_options.openingLimit;
    auto isInPlace = IsInPlace(site, end);
    for (; !isInPlace && Clock::now() < end; isInPlace = IsInPlace(site, end))
        std::this_thread::sleep_for(PauseForServer);
    if (isInPlace == false)
        throw StoreError(failure);
    if (isInPlace)
        return;
    m_connection.reset();
    throw UnknownReplacement(name + ": was lost over the last step, and the new site may be in its place or "
                                    "not; look at what is there when the server can be reached again");
}

// Over a new connection. Nothing if it cannot be said yet: who replaces a site keeps others from opening it
// as long as the server works on that.
std::optional<bool> PostgresReplacement::IsInPlace(long long site, Clock::time_point end)
try
{
    m_connection = Connected();
    auto const isThere = [&]
    {
        return m_connection
            ->Run("SELECT EXISTS (SELECT FROM pg_class c JOIN pg_namespace n ON n.oid = c.relnamespace "
                  "WHERE c.oid::bigint = $1 AND n.nspname = convert_from($2, 'UTF8'))",
                  Parameters() << site << std::string_view(m_options.schema), Deadline())
            .Bool(0, 0);
    };
    if (isThere())
        return true;
    if (!postgres::KeepFromOpening(*m_connection, m_options.schema, end))
        return std::nullopt;
    return isThere();
}
catch (BrokenConnection const&)
{
    return std::nullopt;
}

std::unique_ptr<Connection> PostgresReplacement::Connected() const
{
    return std::make_unique<Connection>(postgres::Target{m_uri, m_options.schema}, m_options.statementLimit,
                                        Clock::now() + m_options.connectLimit);
}

Clock::time_point PostgresReplacement::Deadline() const { return Clock::now() + m_options.statementLimit; }

void PostgresReplacement::LookForOld()
{
    auto const found = m_connection->Run(
        "SELECT count(DISTINCT n.oid), count(c.oid) FROM pg_namespace n "
        "LEFT JOIN pg_class c ON c.relnamespace = n.oid WHERE n.nspname = convert_from($1, 'UTF8')",
        Parameters() << std::string_view(m_options.schema), Deadline());
    m_hasOld = found.Integer(0, 1) > 0;
    m_isPrepared = !m_hasOld && found.Integer(0, 0) > 0;
}

void PostgresReplacement::CheckIsNotOpen()
{
    auto const rows = m_connection->Run(
        "SELECT p.name, p.process, p.machine FROM program p WHERE p.id IN (SELECT program FROM living)", {},
        Deadline());
    std::string names;
    for (int row = 0; row < rows.Rows(); ++row)
        names += (row == 0 ? "" : ", ") + rows.Text(row, 0) + " (process " +
                 std::to_string(rows.Integer(row, 1)) + " on " + rows.Text(row, 2) + ")";
    if (!names.empty())
        throw StoreError(m_connection->Name() + ": in use by " + names +
                         "; end what has it open, then try again");
}

std::string PostgresReplacement::FreeName()
{
    return m_connection
        ->Run("SELECT convert_from($1, 'UTF8') || to_char(clock_timestamp(), "
              "'\"_replaced_\"YYYYMMDD_HH24MISS_US')",
              Parameters() << std::string_view(m_options.schema), Deadline())
        .Text(0, 0);
}
}  // namespace standin
