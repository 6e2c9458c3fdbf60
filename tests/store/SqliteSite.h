// A folder with a site of the SQLite store, and ways to spoil it.
#pragma once

#include "standin/server/store/sqlite/SqliteStore.h"
#include "tests/server/MemoryFolder.h"
#include "tests/store/StoreContract.h"
#include "tests/support/Files.h"
#include <gtest/gtest.h>
#include <memory>
#include <sqlite3.h>
#include <string>

inline void RunSql(std::filesystem::path const& file, std::string const& sql)
{
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(file.c_str(), &database), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, sql.c_str(), nullptr, nullptr, nullptr), SQLITE_OK)
        << sqlite3_errmsg(database);
    sqlite3_close(database);
}

class SqliteSite : public testing::Test
{
protected:
    static constexpr standin::TicketAddress Job{3, 1};

    std::filesystem::path File() const { return folder / "site.db"; }
    std::filesystem::path LockedFile() const { return folder / "site.lock"; }

    std::unique_ptr<standin::SqliteStore> Open(standin::SqliteOptions const& options = {}) const
    {
        return std::make_unique<standin::SqliteStore>(folder.Path(), NoContent, options);
    }

    // A site with one ticket that has the value 5 under "Key", left in order.
    void MakeWithOneTicket() const
    {
        standin::SqliteStore(folder.Path(), [] { return OneTicket(Job, "Key", 5); }).Leave();
    }

    std::string ReasonOfOpening() const
    {
        return ReasonOf([this] { Open(); });
    }

    bool IsReportedAsDamaged() const
    {
        try
        {
            Open();
        }
        catch (standin::DamagedStore const&)
        {
            return true;
        }
        return false;
    }

    // Replaces the database's bytes. keepingTime: as if nobody had.
    void Overwrite(std::string const& content, bool keepingTime = false) const
    {
        auto const before = std::filesystem::last_write_time(File());
        WriteFile(File(), content);
        std::filesystem::last_write_time(File(), keepingTime ? before : before + std::chrono::seconds(1));
    }

    MemoryFolder folder;
};
