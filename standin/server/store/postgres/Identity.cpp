#include "standin/server/store/postgres/Identity.h"

namespace standin::postgres
{
void Identity::Check(Connection& connection, Sequence known, Clock::time_point deadline)
{
    SITE found = Found(connection, deadline);
    std::lock_guard const lock(m_lock);
    if (m_site)
        Compare(found, known, connection.Name());
    m_site = std::move(found);
}

Identity::SITE Identity::Found(Connection& connection, Clock::time_point deadline)
{
    Result const rows =
        connection.Run("SELECT site_number, schema, last, server, begun_at FROM enter_era()", {}, deadline);
    SITE found{rows.Text(0, 0), rows.Integer(0, 1), rows.Number(0, 2), {}};
    for (int row = 0; row < rows.Rows(); ++row)
        found.eras.push_back({rows.Integer(row, 3), rows.Number(row, 4)});
    return found;
}

// Who has seen the same eras begin has seen the same changes, as far as they were made in those.
Identity::Eras Identity::Before(Eras eras, Sequence known)
{
    std::erase_if(eras, [known](ERA const& era) { return era.since >= known; });
    return eras;
}

void Identity::Compare(SITE const& found, Sequence known, std::string const& name) const
{
    if (found.number != m_site->number || found.schema != m_site->schema)
        throw UnusableStore(name +
                            ": another site has taken the place of the one that this program has open; "
                            "start the program anew");
    if (found.newest < known || Before(found.eras, known) != Before(m_site->eras, known))
        throw UnusableStore(name +
                            ": this server has not got all changes that this program knows of, the "
                            "newest of which is " +
                            std::to_string(known) + "; if it is the right server, start the program anew");
}
}  // namespace standin::postgres
