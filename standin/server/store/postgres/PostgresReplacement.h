// A site that is made in a database beside the one that may be there, under another name, and takes its place
// when it is whole. For tools of the owner; for one thread.
#pragma once

#include "standin/server/store/postgres/PostgresStore.h"

namespace standin
{
class PostgresReplacement
{
public:
    enum class Old
    {
        Forbidden,  // a site that is there already is an error
        SetAside,   // it gets another name, and the new one has its number
    };

    // Begins it. Until it is finished, or the object goes, nobody can open the site that is there. Throws
    // StoreError: also if programs have that open.
    PostgresReplacement(std::string const& uri, Old old, PostgresOptions options = {});
    ~PostgresReplacement();  // nothing of it is left unless it was finished
    PostgresReplacement(PostgresReplacement const&) = delete;
    PostgresReplacement& operator=(PostgresReplacement const&) = delete;

    // The new site, which has no tickets and no users yet.
    PostgresStore& Store() { return *m_store; }

    // Ends the work on the new one, which is the site then. The result: the schema in which the old one is
    // now; empty if there was none.
    std::string Finish();

private:
    postgres::Clock::time_point Deadline() const;
    bool IsThere();
    void CheckIsNotOpen();
    std::string FreeName();

    PostgresOptions const m_options;
    std::unique_ptr<postgres::Connection> m_connection;
    bool m_hasOld = false;
    std::unique_ptr<PostgresStore> m_store;
};
}  // namespace standin
