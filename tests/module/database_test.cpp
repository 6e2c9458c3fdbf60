// The module over a site in a database that cannot be reached for a while.
#include "comgui/session/TCommandRecord.h"
#include "standin/module/ModuleCodes.h"
#include "standin/server/store/postgres/PostgresStore.h"
#include "tests/module/ModuleUnderTest.h"
#include "tests/module/NotificationListener.h"
#include "tests/support/PostgresCluster.h"
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <gmock/gmock.h>
#include <thread>

using namespace standin;
using namespace std::chrono_literals;
using testing::Contains;

namespace
{
constexpr TicketAddress Job{3, 1};

bool Becomes(std::function<bool()> const& so)
{
    for (auto const end = std::chrono::steady_clock::now() + 60s; std::chrono::steady_clock::now() < end;
         std::this_thread::sleep_for(10ms))
        if (so())
            return true;
    return false;
}

// Before the site is named.
struct OVER_DATABASES
{
    OVER_DATABASES() { setenv("COMGUI_TEST_ENGINE", "postgresql", 1); }
};

class LostDatabase : public testing::Test, OVER_DATABASES, public MODULE_AT_SITE
{
protected:
    LostDatabase() : client(*this, LogIn()) { EXPECT_EQ(client.Write(Job.type, Job.id, "Key", 5), 1); }

    int IsAlive() const { return module->IsAliveEntry(module.Instance(), "localhost", 50000); }

    int IsAliveByCommand() const
    {
        TCommandRecord record{};
        record.nMagic = 0x49494949;
        record.nSize = sizeof record;
        record.iResult = -1;
        int const code = module->SendCommandEntry(module.Instance(), client.Session(),
                                                  "remote.system.isalive", sizeof record, &record);
        EXPECT_EQ(record.iResult, code);
        return code;
    }

    int PrepareJob() const
    {
        TCommandRecord record{};
        record.nMagic = 0x49494949;
        record.nSize = sizeof record;
        std::strcpy(record.szText2, "$(JOB)/a.pdf");
        int const code = module->SendCommandEntry(module.Instance(), client.Session(), "remote.job.prepare",
                                                  sizeof record, &record);
        EXPECT_EQ(record.iResult, -1);
        return code;
    }

    int Read(char const* key = "Key") const { return client.Read(Job.type, Job.id, key); }
    int Write(int value) const { return client.Write(Job.type, Job.id, "Key", value); }

    PostgresCluster& cluster = PostgresCluster::Instance();
    CLIENT const client;
};

// A handle of another machine, that keeps its connections while the module's are gone and stay away.
class ModuleCutOff : public LostDatabase
{
protected:
    ModuleCutOff()
    {
        std::string const uri = std::getenv("COMGUI_SITE");
        m_database = uri.substr(uri.rfind('/') + 1);
        std::string const own = PidsOfSite();
        PostgresOptions options;
        options.limits.journalKept = 0;
        other = std::make_unique<PostgresStore>(
            uri, []() -> StoreContent { throw StoreError("no site"); }, options);
        AllowConnections(false);
        cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM unnest(ARRAY[" + own + "]) pid");
    }
    ~ModuleCutOff() override { AllowConnections(true); }

    void AllowConnections(bool are) const
    {
        cluster.Run("ALTER DATABASE " + m_database + " ALLOW_CONNECTIONS " + (are ? "true" : "false"));
    }

    // As another program writes it.
    void WriteElsewhere(char const* key, int value)
    {
        auto const loaded = other->Load(Job, [](auto, int, auto const&) {});
        TicketChange change;
        change.kind = TicketChange::Write;
        change.address = Job;
        change.incarnation = loaded->state.incarnation;
        change.revision = loaded->state.revision;
        change.parameters.push_back({key, -1, TicketValue::Int(value), false});
        EXPECT_EQ(other->Commit(change, ++m_number).kind, CommitOutcome::Committed);
    }

    std::unique_ptr<PostgresStore> other;

private:
    std::string PidsOfSite() const
    {
        return cluster.Run("SELECT string_agg(pid::text, ',') FROM pg_stat_activity WHERE datname = '" +
                           m_database + "'");
    }

    std::string m_database;
    std::uint64_t m_number = 0;
};
}  // namespace

TEST_F(LostDatabase, IsToldByIsAlive_WhileReadsGoOnAndWritesAreRefused)
{
    EXPECT_EQ(IsAlive(), 0);
    EXPECT_EQ(IsAliveByCommand(), 0);
    for (int round = 0; round < 2; ++round)
    {
        cluster.Stop();
        EXPECT_TRUE(Becomes([&] { return IsAlive() == MODULE_SITE_UNAVAILABLE; }));
        EXPECT_EQ(IsAliveByCommand(), MODULE_SITE_UNAVAILABLE);
        EXPECT_EQ(Read(), 5 + round);
        auto const begun = std::chrono::steady_clock::now();
        EXPECT_EQ(Write(9), 0);
        EXPECT_LT(std::chrono::steady_clock::now() - begun, 5s);
        RECORD login;
        EXPECT_EQ(module->LoginEntry(module.Instance(), &login), MODULE_SITE_UNAVAILABLE);
        EXPECT_EQ(PrepareJob(), MODULE_TARGET_UNWRITABLE);
        cluster.Continue();
        EXPECT_TRUE(Becomes([&] { return IsAlive() == 0; }));
        EXPECT_EQ(IsAliveByCommand(), 0);
        EXPECT_TRUE(Becomes([&] { return Write(6 + round) == 1; }));
        EXPECT_EQ(Read(), 6 + round);
    }
}

TEST_F(LostDatabase, WhoseFilesOthersHaveElsewhere_IsNotOpened)
{
    std::filesystem::path const known = std::getenv("COMGUI_SITE_FOLDER");
    std::filesystem::path const elsewhere = known.parent_path() / "elsewhere";
    std::filesystem::create_directory(elsewhere);
    std::filesystem::copy_file(known / "site.number", elsewhere / "site.number");
    setenv("COMGUI_SITE_FOLDER", elsewhere.c_str(), 1);
    testing::internal::CaptureStderr();
    EXPECT_EQ(IsAlive(), MODULE_SITE_UNAVAILABLE);
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              elsewhere.string() + ": programs that have the site open have its files in " + known.string() +
                  "; mount them there on this machine too, or end those programs first\n");
    setenv("COMGUI_SITE_FOLDER", known.c_str(), 1);
    EXPECT_EQ(IsAlive(), 0);
}

TEST_F(ModuleCutOff, HearsWhatWasChangedMeanwhile_WhenItIsBack)
{
    LISTENER listener;
    ASSERT_EQ(client.Enable(Job.type, Job.id, client.Register(listener)), 1);
    WriteElsewhere("Key", 6);
    WriteElsewhere("Other", 7);
    AllowConnections(true);
    EXPECT_EQ(listener.Wait(2), (std::vector<std::string>{"changed 3/1 Key@-1=6", "changed 3/1 Other@-1=7"}));
    EXPECT_EQ(Read(), 6);
    EXPECT_EQ(IsAlive(), 0);
}

TEST_F(ModuleCutOff, WhoseJournalWasPrunedMeanwhile_HearsTheDifference)
{
    LISTENER listener;
    ASSERT_EQ(client.Enable(Job.type, Job.id, client.Register(listener)), 1);
    for (int value = 6; value < 20; ++value)
        WriteElsewhere("Key", value);
    other->Maintain(other->Committed());
    AllowConnections(true);
    EXPECT_EQ(listener.Wait(1), std::vector<std::string>{"changed 3/1 Key@0=19"});
    EXPECT_EQ(Read(), 19);
}

TEST_F(ModuleCutOff, LogsInAgainByItself_AsFarAsTheSiteCanSee)
{
    EXPECT_EQ(other->Sessions().size(), 1u);
    AllowConnections(true);
    EXPECT_TRUE(Becomes([&] { return Write(8) == 1; }));
    EXPECT_EQ(other->Sessions().size(), 1u);
    EXPECT_EQ(client.Logout(), 0);
    EXPECT_EQ(other->Sessions().size(), 0u);
}
