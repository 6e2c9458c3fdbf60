// A site of the PostgreSQL store, in a schema of its own of the test program's cluster.
#pragma once

#include "standin/server/store/postgres/PostgresStore.h"
#include "tests/store/StoreContract.h"
#include "tests/support/PostgresCluster.h"
#include <gtest/gtest.h>
#include <memory>
#include <string>

class PostgresSchema
{
public:
    PostgresSchema() : m_name(NextName()) {}
    ~PostgresSchema() { cluster.Run("DROP SCHEMA IF EXISTS " + m_name + " CASCADE"); }
    PostgresSchema(PostgresSchema const&) = delete;
    PostgresSchema& operator=(PostgresSchema const&) = delete;

    std::string const& Name() const { return m_name; }

    std::unique_ptr<standin::PostgresStore> Open(standin::PostgresOptions options = {}) const
    {
        options.schema = m_name;
        return std::make_unique<standin::PostgresStore>(cluster.Uri(), NoContent, options);
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
