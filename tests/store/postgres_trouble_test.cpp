// What befalls a PostgreSQL server while a site is in use, and clocks that differ.
#include "standin/server/store/postgres/PostgresStore.h"

#include "comgui/testing/TemporaryFolder.h"
#include "tests/store/PostgresSite.h"
#include "tests/store/WriterProcesses.h"
#include "tests/support/SmallDisk.h"
#include "tests/support/sanitizers.h"
#include <atomic>
#include <csignal>
#include <cstdlib>
#include <ctime>
#include <gmock/gmock.h>

using comgui::test::TemporaryFolder;

using namespace standin;
using namespace std::chrono_literals;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace
{
using Clock = std::chrono::steady_clock;

std::atomic<long> clockError{0};  // of this program's clock, in seconds
}  // namespace

// Instead of the system's, for this program.
time_t time(time_t* result) noexcept
{
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    time_t const told = now.tv_sec + clockError;
    if (result != nullptr)
        *result = told;
    return told;
}

namespace
{
long long WritesWanted()
{
    char const* const text = std::getenv("COMGUI_STORM_WRITES");
    return text ? std::stoll(text) : IsSanitized ? 3000 : 10'000;
}

class PostgresTrouble : public PostgresSite
{
protected:
    // Expects that the reason is one line that says what it is and what helps.
    static void ExpectReason(std::string const& reason, char const* what, char const* remedy)
    {
        EXPECT_THAT(reason, HasSubstr(what));
        EXPECT_THAT(reason, HasSubstr(remedy));
        EXPECT_THAT(reason, HasSubstr("; "));
        EXPECT_THAT(reason, Not(HasSubstr("\n")));
        EXPECT_THAT(reason, Not(HasSubstr("s3cret")));
    }

    static constexpr int Programs = 8;  // each a process of its own

    WriterProcesses StartWriters(long long steps = std::numeric_limits<long long>::max()) const
    {
        auto const options = OptionsOfWriters(schema.Name());
        schema.OpenAs(schema.cluster.Uri(), ContentOfWriters, options)->Leave();
        return {Programs, schema.cluster.Uri(), options, steps, 1};
    }

    void TerminateAll() const
    {
        schema.cluster.Run("SELECT pg_terminate_backend(pid) FROM pg_stat_activity "
                           "WHERE backend_type = 'client backend' AND pid <> pg_backend_pid()");
    }
};

using PostgresClocks = PostgresSite;
}  // namespace

// --- the server and its connections

TEST_F(PostgresTrouble, EndOfAllConnectionsEverySecond_LosesNothingAndMakesNothingTwice)
{
    long long const steps = WritesWanted() / (3LL * Programs) + 1;
    auto const writers = StartWriters(steps);
    ASSERT_TRUE(writers.AwaitSteps(1));  // who opens the site is not to be disturbed
    int storms = 0;
    long long stepsBefore = -1;  // on a busy machine it may take more than a second to come back
    for (auto next = Clock::now() + 1s; !writers.HaveDone(steps); std::this_thread::sleep_for(10ms))
        if (Clock::now() >= next && writers.StepsOfAll() > stepsBefore)
        {
            stepsBefore = writers.StepsOfAll();
            TerminateAll();
            ++storms;
            next = Clock::now() + 1s;
        }
    writers.AwaitEnd();
    EXPECT_GT(storms, 0);
    RecordProperty("storms", storms);
    auto const store = schema.Open();
    EXPECT_EQ(writers.board->writers[0].steps, steps);
    ExpectWorkOf(*writers.board, writers.Count(), *store);
}

// The server ends all connections, recovers and goes on.
TEST_F(PostgresTrouble, CrashOfTheServer_LosesNothingAndMakesNothingTwice)
{
    auto writers = StartWriters();
    for (int i = 0; i < 2; ++i)
    {
        ASSERT_TRUE(writers.AwaitSteps(5));
        schema.cluster.Crash();
        writers.ExpectAnswers(5s);
    }
    writers.Finish();
    ExpectWorkOf(*writers.board, writers.Count(), *schema.Open());
}

TEST_F(PostgresTrouble, NoConnectionLeft_IsSaidAndEndsByItself)
{
    schema.cluster.Run("CREATE ROLE crowd LOGIN PASSWORD 's3cret'");
    schema.cluster.Run("GRANT CREATE ON DATABASE postgres TO crowd");
    std::string const uri = schema.cluster.Uri("crowd:s3cret");
    auto const store = schema.OpenAs(uri, NoContent);
    std::vector<SqlSession> crowd;
    auto const fill = [&]
    {
        try
        {
            for (;;)
                crowd.emplace_back(uri).Run("SELECT 1");
        }
        catch (std::runtime_error const&)
        {
            // There is no connection left.
        }
    };
    std::string reason;
    auto start = Clock::now();
    while (reason.empty())
    {
        ASSERT_LT(Clock::now() - start, 60s);
        Terminate(*store);
        fill();
        reason = ReasonOf([&] { store->Users(); });  // what has just ended may still leave it a connection
    }
    ExpectReason(reason, "connection slots", "raise max_connections");
    std::this_thread::sleep_for(300ms);  // a break that is shorter is nobody's concern
    EXPECT_NE(ReasonOf([&] { store->Users(); }), "");
    EXPECT_FALSE(store->IsReachable());
    crowd.clear();
    start = Clock::now();
    while (!ReasonOf([&] { store->Users(); }).empty())
        ASSERT_LT(Clock::now() - start, 20s);
    EXPECT_TRUE(store->IsReachable());
}

// By a server that lets nobody in: the program makes no call just now.
TEST_F(PostgresTrouble, RefusalOfBothConnections_IsNoticedWithoutACall_AndTheEndOfIt)
{
    schema.cluster.Run("CREATE ROLE unwanted LOGIN SUPERUSER");
    auto const store = schema.OpenAs(schema.cluster.Uri("unwanted"), NoContent, PostgresOptions());
    schema.cluster.LetIn("unwanted", "reject");
    schema.cluster.Run("SELECT pg_terminate_backend(pid) FROM pg_stat_activity WHERE usename = 'unwanted'");
    AwaitReach(*store, false);
    for (auto const end = Clock::now() + 2s; Clock::now() < end; std::this_thread::sleep_for(1ms))
        ASSERT_FALSE(store->IsReachable());
    schema.cluster.LetIn("unwanted", "trust");
    AwaitReach(*store, true);
}

// --- the server's disk

TEST_F(PostgresTrouble, FullDisk_IsSaid_AndNothingIsDoneByHalf)
{
    TemporaryFolder folder;
    SmallDisk const disk(folder / "disk", true);
    if (!disk.IsThere())
        GTEST_SKIP() << "only root may mount a small disk";
    std::filesystem::path const space = folder / "disk/space";
    std::filesystem::create_directory(space);
    PostgresCluster::LetServerInto(folder.Path());
    PostgresCluster::LetServerInto(folder / "disk");
    PostgresCluster::LetServerInto(space);
    PostgresCluster cluster;  // after the disk, so that it sees it
    cluster.Run("CREATE TABLESPACE small LOCATION '" + space.string() + "'");
    cluster.Run("ALTER ROLE postgres SET default_tablespace = small");
    PostgresStore store(cluster.Uri("postgres:s3cret"), NoContent);
    Writer writer(store);
    writer.Do(Creation(Job).Put("Key", 0, 1));
    disk.Fill();
    std::string large(3'000'000, '\0');
    for (std::size_t i = 0; i < large.size(); ++i)
        large[i] = static_cast<char>(i * 2654435761u >> 13);
    TicketState const before = writer.State(Job);
    ExpectReason(
        ReasonOf(
            [&] {
                writer.Try(
                    WriteTo(Job, before).Put("Key", 0, 2).Put("Large", 0, Bytes(PARAM_BINSTRING, large)));
            }),
        "No space left on device", "free some space on the server's disk");
    EXPECT_EQ(ValuesOf(store, Job).size(), 1u);
    EXPECT_EQ(ValuesOf(store, Job).at({"Key", 0}).value.integer, 1);
    EXPECT_TRUE(store.IsReachable());
    disk.Free();
    writer.Put(Job, "Large", 0, Bytes(PARAM_BINSTRING, large));
    EXPECT_THAT(FeedOf(store, 0), SizeIs(2));
}

// --- clocks

// What a program tells of its own clock is only shown to people.
TEST_F(PostgresClocks, ThatDiffer_ChangeNothing)
{
    constexpr long Years = 10L * 365 * 24 * 3600;
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    options.grace = 300ms;
    clockError = Years;
    auto early = schema.Open(options);
    auto const lost = schema.Open(options);
    early->OpenSession("admin");
    clockError = -Years;
    auto const late = schema.Open(options);
    ASSERT_GT(late->Programs().at(0).since - late->Programs().at(2).since, 19L * 365 * 24 * 3600);

    Writer earlyWriter(*early), lateWriter(*late);
    Writer(*lost).Make({7, 1});
    earlyWriter.Make(Job);
    EXPECT_EQ(lateWriter.Put(Job, "Key", 0, 1).sequence, 3u);
    EXPECT_THAT(FeedOf(*early, 0), SizeIs(3));

    Terminate(*lost);
    late->Maintain(3);
    clockError = Years;
    early->Maintain(3);
    EXPECT_FALSE(early->ChangesSince(0, [](CommittedChange&&) { ADD_FAILURE(); }));
    EXPECT_TRUE(lost->FindCommit(1));

    early.reset();
    clockError = -Years;
    EXPECT_EQ(late->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    std::this_thread::sleep_for(options.grace);
    EXPECT_EQ(late->Bury([](Estate const&) {}), 1);
    EXPECT_THAT(late->Sessions(), IsEmpty());
    clockError = 0;
}
