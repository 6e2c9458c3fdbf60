// The module over a site in a database that cannot be reached for a while.
#include "comgui/session/TCommandRecord.h"
#include "standin/module/ModuleCodes.h"
#include "standin/server/jobs/JobFolder.h"
#include "standin/server/store/postgres/PostgresStore.h"
#include "tests/module/ModuleUnderTest.h"
#include "tests/module/NotificationListener.h"
#include "tests/support/Files.h"
#include "tests/support/PostgresCluster.h"
#include <algorithm>
#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <future>
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

    static std::string Database()
    {
        std::string const uri = std::getenv("COMGUI_SITE");
        return uri.substr(uri.rfind('/') + 1);
    }

    // The program of another machine.
    static std::unique_ptr<PostgresStore> Another(PostgresOptions const& options = {})
    {
        return std::make_unique<PostgresStore>(
            std::getenv("COMGUI_SITE"), []() -> StoreContent { throw StoreError("no site"); }, options);
    }

    // As another program writes it.
    static TicketChange WriteTo(Store& store, TicketAddress address, char const* key, int value)
    {
        auto const loaded = store.Load(address, [](auto, int, auto const&) {});
        TicketChange change;
        change.address = address;
        change.incarnation = loaded->state.incarnation;
        change.revision = loaded->state.revision;
        change.parameters.push_back({key, -1, TicketValue::Int(value), false});
        return change;
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
        std::string const own = PidsOfSite();
        PostgresOptions options;
        options.limits.journalKept = 0;
        options.settling = 0s;  // it keeps nothing for the module
        other = Another(options);
        AllowConnections(false);
        cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM unnest(ARRAY[" + own + "]) pid");
    }
    ~ModuleCutOff() override { AllowConnections(true); }

    void AllowConnections(bool are) const
    {
        cluster.Run("ALTER DATABASE " + database + " ALLOW_CONNECTIONS " + (are ? "true" : "false"));
    }

    void WriteElsewhere(char const* key, int value)
    {
        EXPECT_EQ(other->Commit(WriteTo(*other, Job, key, value), ++m_number).kind, CommitOutcome::Committed);
    }

    std::string const uri = std::getenv("COMGUI_SITE");
    std::string const database = uri.substr(uri.rfind('/') + 1);
    std::unique_ptr<PostgresStore> other;

private:
    std::string PidsOfSite() const
    {
        return cluster.Run("SELECT string_agg(pid::text, ',') FROM pg_stat_activity WHERE datname = '" +
                           database + "'");
    }

    std::uint64_t m_number = 0;
};

// Its bell's connection stands still, which it notices after two seconds at the earliest.
class ModuleThatHearsNothing : public LostDatabase
{
protected:
    ModuleThatHearsNothing()
    {
        // Only the working connection has locks.
        m_bell = static_cast<pid_t>(std::stol(
            cluster.Run("SELECT pid FROM pg_stat_activity WHERE datname = '" + Database() +
                        "' AND pid NOT IN (SELECT pid FROM pg_locks WHERE locktype = 'advisory')")));
        other = Another();
        dying = Another();
    }
    ~ModuleThatHearsNothing() override { LetHear(true); }

    void LetHear(bool hears) const { kill(m_bell, hears ? SIGCONT : SIGSTOP); }

    // The folder of a job as it is sent, with a file in it.
    static std::filesystem::path MakeJobFolder(int id)
    {
        std::filesystem::path const folder =
            std::filesystem::path(std::getenv("COMGUI_SITE_FOLDER")) / "job" / std::to_string(id);
        std::filesystem::create_directory(folder);
        WriteFile(folder / (std::string(".job-") + Mark), "");
        WriteFile(folder / "a.pdf", "content");
        return folder;
    }
    static TicketChange CreationOfJob(int id)
    {
        TicketChange creation;
        creation.kind = TicketChange::Create;
        creation.address = {3, id};
        creation.parameters.push_back({JobMarkKey, -1, TicketValue::String(Mark), false});
        return creation;
    }

    std::unique_ptr<PostgresStore> other, dying;

private:
    static constexpr char Mark[] = "0123456789abcdef";

    pid_t m_bell = -1;
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

// It is lost while the module fetches what another program has just written.
TEST_F(LostDatabase, AmongManyChanges_HoldsUpNeitherReadsNorIsAliveForLong)
{
    auto const other = Another();
    std::atomic<bool> isOver{false};
    std::thread writer(
        [&]
        {
            for (std::uint64_t number = 1; !isOver; ++number)
                try
                {
                    other->Commit(WriteTo(*other, Job, "Key", 5), number);
                }
                catch (StoreError const&)
                {
                    std::this_thread::sleep_for(10ms);
                }
        });
    std::chrono::steady_clock::duration longest{};
    auto const measure = [&](auto const& call)
    {
        auto const begun = std::chrono::steady_clock::now();
        EXPECT_TRUE(call());
        longest = std::max(longest, std::chrono::steady_clock::now() - begun);
    };
    for (int round = 0; round < 3; ++round)
    {
        auto const work = std::chrono::steady_clock::now() + 200ms;
        for (bool isStopped = false; !isStopped || IsAlive() == 0;)
        {
            if (!isStopped && std::chrono::steady_clock::now() > work)
            {
                cluster.Stop();
                isStopped = true;
            }
            measure([&] { return Read() == 5; });
            measure([&] { return IsAlive() == 0 || isStopped; });
        }
        cluster.Continue();
        EXPECT_TRUE(Becomes([&] { return IsAlive() == 0; }));
    }
    isOver = true;
    writer.join();
    EXPECT_LT(longest, 6s);
}

TEST_F(LostDatabase, IsTheReasonOfEveryCallThatItFails)
{
    RECORD login;
    std::pair<std::function<bool()>, char const*> const facts[] = {
        {[&] { return IsAlive() == MODULE_SITE_UNAVAILABLE; }, "the site's database cannot be reached"},
        {[&] { return IsAliveByCommand() == MODULE_SITE_UNAVAILABLE; },
         "the site's database cannot be reached"},
        {[&] { return Write(9) == 0; }, "the server does not answer"},
        {[&] { return module->LoginEntry(module.Instance(), &login) == MODULE_SITE_UNAVAILABLE; },
         "the server does not answer"},
        {[&] { return PrepareJob() == MODULE_TARGET_UNWRITABLE; }, "no ticket can be made"},
        // Of a ticket that nobody has read before.
        {[&] { return client.Read(12, 1, "Key") == -1; }, "the server does not answer"},
    };
    cluster.Stop();
    EXPECT_TRUE(Becomes([&] { return IsAlive() == MODULE_SITE_UNAVAILABLE; }));
    for (int round = 0; round < 2; ++round)
        for (auto const& [isRefused, reason] : facts)
        {
            EXPECT_TRUE(isRefused()) << reason;
            EXPECT_THAT(TakeReason(module), testing::HasSubstr(reason));
        }
    EXPECT_EQ(Read(), 5);
    EXPECT_EQ(TakeReason(module), "none");
    cluster.Continue();
    EXPECT_TRUE(Becomes([&] { return Write(5) == 1; }));
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

// The break comes while a write is on its way, and takes longer than a statement may.
TEST_F(ModuleCutOff, DuringAWrite_AnswersItWhenItsOutcomeIsKnown)
{
    AllowConnections(true);
    EXPECT_TRUE(Becomes([&] { return Write(6) == 1; }));
    SqlSession const obstacle(uri);
    obstacle.Run("BEGIN");
    obstacle.Run("SELECT FROM comgui.ticket FOR UPDATE");
    auto write = std::async(std::launch::async, [&] { return Write(7); });
    std::string const waiting =
        "FROM pg_stat_activity WHERE wait_event_type = 'Lock' AND datname = '" + database + "'";
    cluster.Await("SELECT count(*) " + waiting, "1");
    AllowConnections(false);
    cluster.Run("SELECT pg_terminate_backend(pid, 60000) " + waiting);
    obstacle.Run("ROLLBACK");
    EXPECT_EQ(write.wait_for(12s), std::future_status::timeout);
    AllowConnections(true);
    EXPECT_EQ(write.get(), 1);
    EXPECT_EQ(Read(), 7);
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

TEST_F(ModuleThatHearsNothing, TakesNoJobOfOthersForThatOfTheDead_AndWritesNoOldSystemTicket)
{
    namespace fs = std::filesystem;
    fs::path const stray = MakeJobFolder(1'000'000);  // is looked at last
    dying.reset();
    std::this_thread::sleep_for(500ms);  // it is not buried before 600 ms
    LetHear(false);
    int last = 100;
    std::uint64_t number = 0;
    for (; fs::exists(stray) && IsAlive() == 0; ++last)
    {
        ASSERT_EQ(other->Commit(CreationOfJob(last), ++number).kind, CommitOutcome::Committed);
        MakeJobFolder(last);
        std::string const key = "Written/" + std::to_string(last);
        ASSERT_EQ(other->Commit(WriteTo(*other, SystemTicket, key.c_str(), 1), ++number).kind,
                  CommitOutcome::Committed);
    }
    LetHear(true);
    EXPECT_TRUE(Becomes([&] { return !fs::exists(stray); }));
    for (int id = 100; id < last; ++id)
        EXPECT_TRUE(fs::exists(stray.parent_path() / std::to_string(id) / "a.pdf")) << id;
    // The one before was written when there was still something to sweep.
    std::string const written = "Written/" + std::to_string(last - 2) + '"';
    fs::path const copy = stray.parent_path().parent_path() / "tickets/SYS_0000.xml";
    EXPECT_TRUE(Becomes([&] { return ContentOf(copy).find(written) != std::string::npos; }));
}
