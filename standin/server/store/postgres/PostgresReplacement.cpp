#include "standin/server/store/postgres/PostgresReplacement.h"

#include "standin/server/store/postgres/Schema.h"

namespace standin
{
using postgres::Clock;
using postgres::Connection;
using postgres::Parameters;

namespace
{
constexpr std::chrono::seconds PatienceWithOthers(5);

std::string NewNameFor(PostgresOptions const& options) { return options.schema + "_new"; }

PostgresOptions Beside(PostgresOptions options)
{
    options.schema = NewNameFor(options);
    return options;
}
}  // namespace

PostgresReplacement::PostgresReplacement(std::string const& uri, Old old, PostgresOptions options)
    : m_options(std::move(options)),
      m_connection(std::make_unique<Connection>(postgres::Target{uri, m_options.schema},
                                                m_options.statementLimit,
                                                Clock::now() + m_options.connectLimit))
{
    if (!postgres::KeepFromOpening(*m_connection, m_options.schema, Clock::now() + PatienceWithOthers))
        throw StoreError(m_connection->Name() +
                         ": another program is opening or replacing the site; wait until "
                         "that is done, then try again");
    m_hasOld = IsThere();
    if (m_hasOld && old == Old::Forbidden)
        throw StoreError(m_connection->Name() + ": there is a site already; name another database");
    if (m_hasOld)
        CheckIsNotOpen();
    // Of somebody who was killed: two at a time are kept apart above.
    m_connection->Execute("DROP SCHEMA IF EXISTS " + m_connection->Quoted(NewNameFor(m_options)) + " CASCADE",
                          Deadline());
    m_store = std::make_unique<PostgresStore>(
        uri, [] { return StoreContent(); }, Beside(m_options));
}

PostgresReplacement::~PostgresReplacement()
{
    if (!m_store)
        return;
    m_store.reset();
    try
    {
        m_connection->Execute("DROP SCHEMA " + m_connection->Quoted(NewNameFor(m_options)) + " CASCADE",
                              Deadline());
    }
    catch (StoreError const&)
    {
        // The next one drops it.
    }
}

std::string PostgresReplacement::Finish()
{
    m_store->Sync();
    m_store->Leave();
    std::string const name = m_connection->Quoted(m_options.schema);
    std::string const made = m_connection->Quoted(NewNameFor(m_options));
    std::string aside = m_hasOld ? FreeName() : "";
    std::string all = "BEGIN;";
    if (m_hasOld)
        all += "UPDATE " + made + ".site SET (number, has_folder) = (SELECT number, has_folder FROM " + name +
               ".site); ALTER SCHEMA " + name + " RENAME TO " + m_connection->Quoted(aside) + ';';
    m_connection->Execute(all + "ALTER SCHEMA " + made + " RENAME TO " + name + "; COMMIT", Deadline());
    m_store.reset();
    m_connection.reset();
    return aside;
}

Clock::time_point PostgresReplacement::Deadline() const { return Clock::now() + m_options.statementLimit; }

bool PostgresReplacement::IsThere()
{
    return m_connection
        ->Run("SELECT EXISTS (SELECT FROM pg_class c JOIN pg_namespace n ON n.oid = c.relnamespace "
              "WHERE n.nspname = convert_from($1, 'UTF8'))",
              Parameters() << std::string_view(m_options.schema), Deadline())
        .Bool(0, 0);
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
