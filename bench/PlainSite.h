// What the benchmarks of writes share: a site with one job, and the row statements of its store through plain
// SQLite with the same settings, journal record included.
#pragma once

#include "comgui/testing/TemporaryFolder.h"
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include <benchmark/benchmark.h>
#include <cstdlib>
#include <filesystem>
#include <sqlite3.h>
#include <string>
#include <vector>

using comgui::test::TemporaryFolder;

namespace bench
{
using namespace standin;

inline constexpr int JobType = 3;
inline constexpr int TableSize = 50;
inline constexpr TicketAddress Job{JobType, 1};

// Memory takes the disk's moods out of the comparison with plain SQLite.
inline std::filesystem::path Memory()
{
    std::filesystem::path const memory = "/dev/shm";
    return std::filesystem::is_directory(memory) ? memory : std::filesystem::temp_directory_path();
}

inline std::filesystem::path Disk()
{
    char const* const chosen = std::getenv("COMGUI_BENCH_DISK");
    return chosen ? std::filesystem::path(chosen) : std::filesystem::current_path();
}

inline ParameterChange IntParameter(std::string key, int value)
{
    ParameterChange parameter;
    parameter.key = std::move(key);
    parameter.value.type = PARAM_INT;
    parameter.value.word = static_cast<unsigned>(value);
    parameter.hadOthers = false;
    return parameter;
}

inline std::vector<ParameterChange> Table()
{
    std::vector<ParameterChange> table;
    for (int i = 0; i < TableSize; ++i)
        table.push_back(IntParameter("Job/Parameter/" + std::to_string(i), i));
    return table;
}

inline StoreContent OneJob()
{
    StoreContent content;
    TicketChange creation;
    creation.kind = TicketChange::Create;
    creation.address = Job;
    creation.parameters = Table();
    content.tickets.push_back(std::move(creation));
    return content;
}

inline void Must(bool isDone)
{
    if (!isDone)
        std::abort();
}

// A connection to the database of a site that nobody has open, with the statements of a careful program.
class PLAIN
{
public:
    PLAIN() : m_folder(Memory())
    {
        SqliteStore(m_folder.Path(), OneJob).Leave();
        Must(sqlite3_open_v2((m_folder / "site.db").c_str(), &m_database,
                             SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr) == SQLITE_OK);
        for (char const* const pragma : {"PRAGMA journal_mode = WAL", "PRAGMA synchronous = NORMAL",
                                         "PRAGMA journal_size_limit = 16777216"})
            Must(sqlite3_exec(m_database, pragma, nullptr, nullptr, nullptr) == SQLITE_OK);
        begin = Prepare("BEGIN IMMEDIATE");
        commit = Prepare("COMMIT");
        write = Prepare("UPDATE ticket SET revision = ?5 "
                        "WHERE type = ?1 AND id = ?2 AND incarnation = ?3 AND revision = ?4");
        m_largestId = Prepare("SELECT max(id) FROM ticket WHERE type = ?");
        create = Prepare("INSERT INTO ticket VALUES (?, ?, ?, ?, ?) ON CONFLICT DO NOTHING");
        put = Prepare("REPLACE INTO parameter VALUES (?, ?, ?, ?, ?, ?)");
        record = Prepare("INSERT INTO journal VALUES (?, ?, ?, ?, ?, ?, ?)");
    }
    ~PLAIN()
    {
        for (sqlite3_stmt* const statement : {begin, commit, write, m_largestId, create, put, record})
            sqlite3_finalize(statement);
        sqlite3_close(m_database);
    }
    PLAIN(PLAIN const&) = delete;
    PLAIN& operator=(PLAIN const&) = delete;

    void Integers(sqlite3_stmt* statement, std::initializer_list<long long> numbers)
    {
        int parameter = 0;
        for (long long const number : numbers)
            sqlite3_bind_int64(statement, ++parameter, number);
    }
    void Run(sqlite3_stmt* statement)
    {
        int const code = sqlite3_step(statement);
        Must(code == SQLITE_DONE || code == SQLITE_ROW);
        sqlite3_reset(statement);
    }
    int NextId()
    {
        Integers(m_largestId, {JobType});
        Must(sqlite3_step(m_largestId) == SQLITE_ROW);
        int const id = sqlite3_column_int(m_largestId, 0) + 1;
        sqlite3_reset(m_largestId);
        return id;
    }
    void Put(int id, ParameterChange const& parameter)
    {
        Integers(put, {JobType, id});
        sqlite3_bind_blob(put, 3, parameter.key.data(), static_cast<int>(parameter.key.size()),
                          SQLITE_STATIC);
        sqlite3_bind_int64(put, 4, 0);
        sqlite3_bind_int64(put, 5, parameter.value.type);
        sqlite3_bind_int64(put, 6, static_cast<long long>(parameter.value.word));
        Run(put);
    }
    void Record(long long sequence, int kind, int id, std::string const& bytes)
    {
        Integers(record, {sequence, 1, sequence, kind, JobType, id});
        sqlite3_bind_blob(record, 7, bytes.data(), static_cast<int>(bytes.size()), SQLITE_STATIC);
        Run(record);
    }

    sqlite3_stmt *begin, *commit, *write, *create, *put, *record;

private:
    sqlite3_stmt* Prepare(char const* sql)
    {
        sqlite3_stmt* statement = nullptr;
        Must(sqlite3_prepare_v3(m_database, sql, -1, SQLITE_PREPARE_PERSISTENT, &statement, nullptr) ==
             SQLITE_OK);
        return statement;
    }

    TemporaryFolder m_folder;
    sqlite3* m_database = nullptr;
    sqlite3_stmt* m_largestId = nullptr;
};

inline void OneValuePlain(benchmark::State& state)
{
    PLAIN plain;
    TicketChange change;
    change.parameters.push_back(IntParameter("Job/Parameter/27", 0));
    std::string bytes;
    AppendChangeRecord(bytes, change);
    long long revision = 1;
    for (auto _ : state)
    {
        ++change.parameters[0].value.word;
        plain.Run(plain.begin);
        plain.Integers(plain.write, {JobType, Job.id, 1, revision, revision + 1});
        plain.Run(plain.write);
        plain.Put(Job.id, change.parameters[0]);
        plain.Record(++revision, TicketChange::Write, Job.id, bytes);
        plain.Run(plain.commit);
    }
}

}  // namespace bench
