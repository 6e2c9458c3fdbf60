// A site of the PostgreSQL store, in a schema of its own of the test program's cluster.
#pragma once

#include "standin/server/store/postgres/PostgresStore.h"
#include "tests/store/StoreContract.h"
#include "tests/support/PostgresCluster.h"
#include <chrono>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <thread>

// Of a program that buries others at once, and comes back after a break only when it is called.
inline standin::PostgresOptions AtOnce()
{
    standin::PostgresOptions options;
    options.grace = options.settling = std::chrono::milliseconds(0);
    options.pulse = std::chrono::hours(1);
    return options;
}

class PostgresSchema
{
public:
    PostgresSchema() : m_name(NextName()) {}
    ~PostgresSchema() { cluster.Run("DROP SCHEMA IF EXISTS " + m_name + " CASCADE"); }
    PostgresSchema(PostgresSchema const&) = delete;
    PostgresSchema& operator=(PostgresSchema const&) = delete;

    std::string const& Name() const { return m_name; }

    std::unique_ptr<standin::PostgresStore> Open(standin::PostgresOptions const& options = AtOnce()) const
    {
        return OpenAs(cluster.Uri(), NoContent, options);
    }

    std::unique_ptr<standin::PostgresStore> OpenAs(std::string const& uri,
                                                   std::function<standin::StoreContent()> const& first,
                                                   standin::PostgresOptions options = AtOnce()) const
    {
        options.schema = m_name;
        return std::make_unique<standin::PostgresStore>(uri, first, options);
    }

    // SQL in which S. stands for the schema.
    std::string Run(std::string sql) const
    {
        for (auto at = sql.find("S."); at != sql.npos; at = sql.find("S.", at + 1))
            sql.replace(at, 1, m_name);
        return cluster.Run(sql);
    }

    PostgresCluster& cluster = PostgresCluster::Instance();

private:
    static std::string NextName()
    {
        static int last = 0;
        return "site_" + std::to_string(++last);
    }

    std::string const m_name;
};

// What a call throws that takes no time; empty if it throws nothing.
inline std::string ReasonAtOnce(std::function<void()> const& call)
{
    auto const start = std::chrono::steady_clock::now();
    std::string reason = ReasonOf(call);
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(1)) << reason;
    return reason;
}

inline void AwaitReach(standin::PostgresStore const& store, bool isReachable)
{
    auto const start = std::chrono::steady_clock::now();
    while (store.IsReachable() != isReachable &&
           std::chrono::steady_clock::now() - start < std::chrono::seconds(10))
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_EQ(store.IsReachable(), isReachable);
}

class PostgresSite : public testing::Test
{
protected:
    static constexpr standin::TicketAddress Job{3, 1};
    static constexpr standin::TicketAddress OtherJob{3, 2};

    std::string ReasonOfOpeningAs(std::string const& uri) const
    {
        return ReasonOf([&] { schema.OpenAs(uri, NoContent); });
    }

    // The locks by which a handle's working connection is known.
    std::string LocksOf(standin::Store const& store) const
    {
        return "pg_locks WHERE locktype = 'advisory' AND mode = 'ShareLock' AND granted AND objid = " +
               std::to_string(store.Self()) + " AND classid = '" + schema.Name() + "'::regnamespace";
    }

    // Ends the handle's working connection, and returns when it has ended. False if it has none just now.
    bool Terminate(standin::Store const& store) const
    {
        return schema.cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM " + LocksOf(store)) == "t";
    }

    PostgresSchema schema;
};
