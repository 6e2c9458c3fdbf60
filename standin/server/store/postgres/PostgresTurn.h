// A thread's turn with the working connection of a PostgresStore. For its own sources.
#pragma once

#include "standin/server/store/postgres/PostgresStore.h"

namespace standin
{
class PostgresStore::Turn
{
public:
    // Waits for the turn, and connects again if the connection is broken. All of it, and of what is run in
    // the turn, ends at the limit at the latest. Throws StoreError, at once if the server is known to be
    // lost.
    explicit Turn(PostgresStore& store) : Turn(store, store.m_options.statementLimit) {}
    Turn(PostgresStore& store, std::chrono::milliseconds limit);
    ~Turn();
    Turn(Turn const&) = delete;
    Turn& operator=(Turn const&) = delete;

    postgres::Result Run(char const* sql, postgres::Parameters const& parameters = {})
    {
        return m_connection->Run(sql, parameters, m_deadline);
    }

    postgres::Connection& Connection() const { return *m_connection; }
    postgres::Clock::time_point Deadline() const { return m_deadline; }

private:
    PostgresStore& m_store;
    postgres::Clock::time_point const m_deadline;
    postgres::Connection* m_connection = nullptr;
};
}  // namespace standin
