// A site that is made in a database beside the one that may be there, under another name, and takes its place
// when it is whole. For tools of the owner; for one thread.
#pragma once

#include "standin/server/store/postgres/PostgresStore.h"

namespace standin
{
// The server was lost over the last step, and whether the new site is in its place nobody knows.
class UnknownReplacement : public StoreError
{
public:
    using StoreError::StoreError;
};

class PostgresReplacement
{
public:
    enum class Old
    {
        Forbidden,  // a site that is there already is an error
        SetAside,   // it gets another name, and the new one has its number, its owners and what they permit
    };

    // Begins it. Until it is finished, or the object goes, nobody can open the site that is there. Throws
    // StoreError: also if programs have that open, or if the name that is needed meanwhile, with _new at its
    // end, is another schema's.
    PostgresReplacement(std::string const& uri, Old old, PostgresOptions options = {});
    // Nothing of it is left unless it was finished, or the server cannot be reached: then the next one drops
    // what is.
    ~PostgresReplacement();
    PostgresReplacement(PostgresReplacement const&) = delete;
    PostgresReplacement& operator=(PostgresReplacement const&) = delete;

    bool HasOld() const { return m_hasOld; }

    // The new site, which has no tickets and no users yet.
    PostgresStore& Store() { return *m_store; }

    // Ends the work on the new one, which is the site then. The result: the schema in which the old one is
    // now; empty if there was none. Throws StoreError, and nothing has changed; but UnknownReplacement if the
    // server was lost and did not come back within the limit of opening.
    std::string Finish();

private:
    std::unique_ptr<postgres::Connection> Connected() const;
    postgres::Clock::time_point Deadline() const;
    void LookForOld();
    void CheckIsNotOpen();
    void MakeMarkedSchema();
    void DropUnfinished();
    void DropAfterFailure() noexcept;
    std::string FreeName();
    std::string Rights();
    std::string Exchange(std::string const& aside);
    std::string MoveAll(std::string const& made, std::string const& name);
    void MakeSure(long long site, StoreError const& failure);
    std::optional<bool> IsInPlace(long long site, postgres::Clock::time_point end);

    std::string const m_uri;
    PostgresOptions const m_options;
    std::unique_ptr<postgres::Connection> m_connection;  // null: of no more use
    bool m_hasOld = false;
    bool m_isPrepared = false;  // the schema is there, and empty
    std::unique_ptr<PostgresStore> m_store;
};
}  // namespace standin
