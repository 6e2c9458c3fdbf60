// What the PostgreSQL store does over a network that swallows what it is given, and says nothing of it.
#include "standin/server/store/postgres/PostgresStore.h"

#include "comgui/testing/TemporaryFolder.h"
#include "tests/store/PostgresSite.h"
#include "tests/store/WriterProcesses.h"
#include "tests/support/NetworkProxy.h"
#include "tests/support/sanitizers.h"
#include <cstdlib>
#include <future>
#include <gmock/gmock.h>
#include <optional>
#include <random>

using comgui::test::TemporaryFolder;

using namespace standin;
using namespace std::chrono_literals;
using testing::AllOf;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace
{
using Clock = std::chrono::steady_clock;

PostgresOptions Brief()
{
    PostgresOptions options;
    options.connectLimit = 3s;  // longer than the silence that is noticed
    options.statementLimit = 1500ms;
    return options;
}

class PostgresProxy : public PostgresSite
{
protected:
    // Of the server behind the proxy.
    std::string Uri() const
    {
        return "host=127.0.0.1 port=" + proxy.Port() + " user=postgres dbname=postgres";
    }

    NetworkProxy proxy{schema.cluster.Folder() / ".s.PGSQL.5432"};
};

class PostgresNetwork : public PostgresProxy
{
protected:
    PostgresNetwork()
    {
        proxy.Start();
        store = schema.OpenAs(Uri(), NoContent, Brief());
        writer.emplace(*store);
    }

    CommitOutcome LoseDuringACommit(NetworkProxy::Loss loss)
    {
        writer->Do(Creation(Job).Put("Key", 0, 1));
        auto const state = writer->State(Job);
        proxy.Lose(loss);
        auto const start = Clock::now();
        auto const outcome = store->Commit(WriteTo(Job, state).Put("Key", 0, 2), 50);
        EXPECT_LT(Clock::now() - start, 4s);
        return outcome;
    }

    // Asks until there is an answer.
    std::optional<CommitOutcome> Found()
    {
        std::optional<CommitOutcome> found;
        auto const start = Clock::now();
        while (!ReasonOf([&] { found = store->FindCommit(50); }).empty() && Clock::now() - start < 60s)
            std::this_thread::sleep_for(1ms);
        return found;
    }

    static int Value(Store& handle)
    {
        return static_cast<int>(ValuesOf(handle, Job).at({"Key", 0}).value.integer);
    }

    std::unique_ptr<PostgresStore> store;
    std::unique_ptr<PostgresStore> const other = schema.Open();
    std::optional<Writer> writer;
};

class PostgresLoss : public PostgresNetwork, public testing::WithParamInterface<NetworkProxy::Loss>
{
};
}  // namespace

INSTANTIATE_TEST_SUITE_P(Of, PostgresLoss,
                         testing::Values(NetworkProxy::ToServer, NetworkProxy::ToClient, NetworkProxy::Both),
                         [](auto const& loss)
                         {
                             return loss.param == NetworkProxy::Both       ? "Both"
                                    : loss.param == NetworkProxy::ToServer ? "WhatIsSent"
                                                                           : "WhatComes";
                         });

// The request comes late: over a connection that nobody waits for.
TEST_P(PostgresLoss, DuringACommitThatGoesOn_IsUnknownUntilItIsAskedAfter)
{
    EXPECT_EQ(LoseDuringACommit(GetParam()).kind, CommitOutcome::Unknown);
    proxy.Lose(NetworkProxy::None);
    auto const found = Found();
    EXPECT_EQ(Value(*other), found ? 2 : 1);
    EXPECT_EQ(Value(*store), found ? 2 : 1);
    EXPECT_THAT(FeedOf(*other, 0), SizeIs(found ? 2 : 1));
}

TEST_P(PostgresLoss, DuringACommitThatEndsForGood_IsUnknownUntilItIsAskedAfter)
{
    EXPECT_EQ(LoseDuringACommit(GetParam()).kind, CommitOutcome::Unknown);
    proxy.CloseAll();
    proxy.Lose(NetworkProxy::None);
    EXPECT_EQ(Found().has_value(), GetParam() == NetworkProxy::ToClient);
    EXPECT_EQ(Value(*other), GetParam() == NetworkProxy::ToClient ? 2 : 1);
    EXPECT_EQ(writer->Put(Job, "Key", 0, 3).kind, CommitOutcome::Committed);
}

TEST_P(PostgresLoss, IsNoticedWithoutACall_AndTheEndOfIt)
{
    writer->Make(Job);
    EXPECT_TRUE(store->IsReachable());
    proxy.Lose(GetParam());
    AwaitReach(*store, false);
    std::string const reason = ReasonAtOnce([&] { ValuesOf(*store, Job); });
    EXPECT_THAT(reason, HasSubstr("does not answer; check the server and the network"));
    EXPECT_THAT(reason, Not(HasSubstr("\n")));
    proxy.Lose(NetworkProxy::None);
    AwaitReach(*store, true);
    EXPECT_THAT(ValuesOf(*store, Job), IsEmpty());
}

// Rings come all the time, so that the server is asked for nothing but the journal.
TEST_F(PostgresNetwork, LostAmongManyChanges_IsBackWhileTheyGoOn)
{
    std::atomic<bool> isOver{false};
    auto const writes = std::async(std::launch::async,
                                   [&]
                                   {
                                       for (Writer busy(*other); !isOver;)
                                           busy.Do(CreationOfNext(5));
                                   });
    for (int i = 0; i < 3; ++i)
    {
        proxy.Lose(NetworkProxy::ToServer);  // the question after the next ring
        std::this_thread::sleep_for(200ms);
        proxy.Lose(NetworkProxy::Both);
        AwaitReach(*store, false);
        proxy.Lose(NetworkProxy::None);
        AwaitReach(*store, true);
    }
    isOver = true;
    writes.wait();
}

TEST_F(PostgresNetwork, LostForLong_FailsEveryCallAtOnce)
{
    writer->Make(Job);
    proxy.Lose(NetworkProxy::Both);
    AwaitReach(*store, false);
    for (auto const end = Clock::now() + 4s; Clock::now() < end; std::this_thread::sleep_for(50ms))
        EXPECT_THAT(ReasonAtOnce([&] { store->Users(); }), Not(IsEmpty()));
    EXPECT_FALSE(store->IsReachable());
    proxy.Lose(NetworkProxy::None);
    AwaitReach(*store, true);
    EXPECT_THAT(ReasonOf([&] { store->Users(); }), IsEmpty());
}

// Calls that wait for one that waits for the network.
TEST_F(PostgresNetwork, LostDuringACall_EndsTheWaitOfOthers)
{
    PostgresOptions options = Brief();
    options.statementLimit = 60s;
    auto const patient = schema.OpenAs(Uri(), NoContent, options);
    proxy.Lose(NetworkProxy::Both);
    auto const first = std::async(std::launch::async, [&] { return ReasonOf([&] { patient->Users(); }); });
    auto const second = std::async(std::launch::async, [&] { return ReasonOf([&] { patient->Users(); }); });
    auto const start = Clock::now();
    while (first.wait_for(1ms) != std::future_status::ready &&
           second.wait_for(1ms) != std::future_status::ready)
        ASSERT_LT(Clock::now() - start, 20s);
    proxy.CloseAll();
    proxy.Lose(NetworkProxy::None);
}

TEST_F(PostgresNetwork, LostDuringACall_EndsItWhenTheLossIsFound)
{
    PostgresOptions options = Brief();
    options.statementLimit = 60s;
    auto const patient = schema.OpenAs(Uri(), NoContent, options);
    proxy.Lose(NetworkProxy::Both);
    auto const start = Clock::now();
    EXPECT_THAT(ReasonOf([&] { patient->Users(); }), HasSubstr("the server does not answer"));
    EXPECT_LT(Clock::now() - start, 15s);
    proxy.Lose(NetworkProxy::None);
    AwaitReach(*patient, true);
    EXPECT_THAT(ReasonOf([&] { patient->Users(); }), IsEmpty());
}

TEST_F(PostgresNetwork, Lost_IsLeftWithinASecond)
{
    proxy.Lose(NetworkProxy::Both);
    auto start = Clock::now();
    EXPECT_THROW(store->Leave(), StoreError);
    store.reset();
    EXPECT_LT(Clock::now() - start, 2s);
    proxy.Lose(NetworkProxy::None);
}

TEST_F(PostgresNetwork, KnownToBeLost_IsLeftAtOnce)
{
    proxy.Lose(NetworkProxy::Both);
    AwaitReach(*store, false);
    EXPECT_THAT(ReasonAtOnce([&] { store->Leave(); }), Not(IsEmpty()));
    auto const start = Clock::now();
    store.reset();
    EXPECT_LT(Clock::now() - start, 1s);
}

// It is silence that counts, not the time that a large answer takes.
TEST_F(PostgresNetwork, ThatIsSlow_LetsALargeTicketThrough)
{
    std::string const large(4'000'000, 'x');
    Writer(*other).Do(Creation(Job).Put("Key", 0, Bytes(PARAM_STRING, large)));
    proxy.Slow(20'000);  // more than two seconds for all of it, above the limit
    EXPECT_TRUE(ValuesOf(*store, Job).at({"Key", 0}).bytes == large);
    EXPECT_THAT(FeedOf(*store, 0), SizeIs(1));
}

TEST_F(PostgresNetwork, RefusedForLong_IsAskedAgainLessAndLess)
{
    schema.cluster.Run("CREATE ROLE refused LOGIN SUPERUSER");
    auto const refused = schema.OpenAs(
        "host=127.0.0.1 port=" + proxy.Port() + " user=refused dbname=postgres", NoContent, Brief());
    schema.cluster.LetIn("refused", "reject");
    int const before = proxy.Accepted();
    schema.cluster.Run("SELECT pg_terminate_backend(pid) FROM pg_stat_activity WHERE usename = 'refused'");
    std::this_thread::sleep_for(1500ms);
    int const attempts = proxy.Accepted() - before;
    EXPECT_GT(attempts, 2);
    EXPECT_LT(attempts, 20);  // of both connections: after 50, 100, 200, 400 and 800 ms
}

// A statement is prepared on its way to be run.
TEST_F(PostgresProxy, OfAStatement_IsCrossedOnceEachWay_AlsoTheFirstTime)
{
    proxy.Start();
    postgres::Connection connection({Uri(), schema.Name()}, 60s, Clock::now() + 60s);
    char const* const sql = "SELECT $1::integer / $2::integer";
    auto const run = [&](int divisor)
    { return connection.Run(sql, postgres::Parameters() << 6 << divisor, Clock::now() + 60s); };
    int turns = proxy.Turns();
    EXPECT_EQ(run(3).Integer(0, 0), 2);
    EXPECT_EQ(proxy.Turns(), ++turns);
    EXPECT_EQ(run(2).Integer(0, 0), 3);
    EXPECT_EQ(proxy.Turns(), ++turns);
    char const* const failing = "SELECT 1 / $1::integer";
    EXPECT_THROW(connection.Run(failing, postgres::Parameters() << 0, Clock::now() + 60s), StoreError);
    EXPECT_EQ(proxy.Turns(), ++turns);
    EXPECT_EQ(connection.Run(failing, postgres::Parameters() << 1, Clock::now() + 60s).Integer(0, 0), 1);
    EXPECT_EQ(proxy.Turns(), ++turns);
    char const* const wrong = "SELECT nothing";
    EXPECT_THROW(connection.Run(wrong, {}, Clock::now() + 60s), postgres::RefusedStatement);
    EXPECT_THROW(connection.Run(wrong, {}, Clock::now() + 60s), postgres::RefusedStatement);
    EXPECT_EQ(run(1).Integer(0, 0), 6);
}

TEST_F(PostgresProxy, WordsOfTheServerInSeveralLines_AreOne)
{
    proxy.Start();
    postgres::Connection connection({Uri(), schema.Name()}, 60s, Clock::now() + 60s);
    auto const fail = [&]
    {
        connection.Execute(
            "DO $$ BEGIN RAISE EXCEPTION E'one\n\n\ttwo' USING DETAIL = E'three\nfour'; END $$",
            Clock::now() + 60s);
    };
    EXPECT_THAT(ReasonOf(fail), AllOf(HasSubstr(": one two; "), Not(HasSubstr("\n"))));
}

// It takes its share of the time alone, and that once.
TEST_F(PostgresNetwork, WithAHostThatIsSilent_FindsTheNext)
{
    proxy.Lose(NetworkProxy::Both);
    auto const start = Clock::now();
    auto const found = schema.OpenAs("host=127.0.0.1," + schema.cluster.Folder().string() +
                                         " port=" + proxy.Port() + ",5432 user=postgres dbname=postgres",
                                     NoContent, Brief());
    EXPECT_LT(Clock::now() - start, 5s);
    Terminate(*found);
    EXPECT_EQ(Writer(*found).Make(Job).sequence, 1u);
    Terminate(*found);
    EXPECT_THAT(ReasonAtOnce([&] { found->Users(); }), IsEmpty());

    postgres::Target const target{"host=127.0.0.1," + schema.cluster.Folder().string() +
                                      " port=" + proxy.Port() + ",5432 user=postgres dbname=postgres",
                                  schema.Name()};
    postgres::Connection(target, 1s, Clock::now() + 4s);
    EXPECT_THAT(ReasonAtOnce([&] { postgres::Connection(target, 1s, Clock::now() + 4s); }), IsEmpty());
}

// Of a service file, whose hosts only libpq knows, and with a port that is left out.
TEST_F(PostgresNetwork, WithASilentHostOfAService_FindsTheNext)
{
    TemporaryFolder const folder;
    folder.Write("services", "[site]\nhost=127.0.0.1," + schema.cluster.Folder().string() +
                                 "\nport=" + proxy.Port() + ",\nuser=postgres\ndbname=postgres\n");
    setenv("PGSERVICEFILE", (folder / "services").c_str(), 1);
    proxy.Lose(NetworkProxy::Both);
    std::string const reason = ReasonOf(
        [&]
        {
            for (std::string const uri : {"service=site", "postgresql://?service=site"})
                postgres::Connection({uri, schema.Name()}, 1s, Clock::now() + 2s);
        });
    unsetenv("PGSERVICEFILE");
    EXPECT_EQ(reason, "");
}

TEST_F(PostgresProxy, LostAgainAndAgain_LosesNothingAndMakesNothingTwice)
{
    auto options = OptionsOfWriters(schema.Name());
    options.connectLimit = options.statementLimit = IsSanitized ? 3s : 1s;
    schema.OpenAs(schema.cluster.Uri(), ContentOfWriters, options)->Leave();
    WriterProcesses writers(2, Uri(), options);
    proxy.Start();
    ASSERT_TRUE(writers.AwaitSteps(5));
    std::minstd_rand random(1);
    for (int i = 0; i < (IsSanitized ? 5 : 12); ++i)
    {
        proxy.Lose(static_cast<NetworkProxy::Loss>(1 + random() % 3));
        std::this_thread::sleep_for(std::chrono::milliseconds(random() % 1500));
        if (random() % 2 == 0)
            proxy.CloseAll();
        proxy.Lose(NetworkProxy::None);
        std::this_thread::sleep_for(std::chrono::milliseconds(random() % 500));
    }
    writers.ExpectAnswers(10s);
    writers.Finish();
    ExpectWorkOf(*writers.board, writers.Count(), *schema.Open());
}
