// What a program does that comes back to its site after a break, and finds another one there, or one that
// lacks changes.
#include "standin/server/store/postgres/PostgresReplacement.h"
#include "standin/server/store/postgres/PostgresStore.h"

#include "tests/store/PostgresSite.h"
#include <future>
#include <gmock/gmock.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;
using Old = PostgresReplacement::Old;

namespace
{
constexpr TicketAddress Job{3, 1};

// A user who can be kept out, with all of his connections.
class Visitor
{
public:
    static constexpr char const* Name = "visitor";

    static void Make(PostgresCluster const& cluster) { cluster.Run("CREATE ROLE visitor LOGIN SUPERUSER"); }

    static void KeepOut(PostgresCluster const& cluster)
    {
        cluster.LetIn(Name, "reject");
        cluster.Run(
            "SELECT pg_terminate_backend(pid, 60000) FROM pg_stat_activity WHERE usename = 'visitor'");
    }
    static void LetIn(PostgresCluster const& cluster) { cluster.LetIn(Name, "trust"); }
};

// For who has made none yet.
void MakeTickets(Store& store, int count)
{
    Writer writer(store);
    for (int i = 0; i < count; ++i)
        writer.Do(CreationOfNext(3));
}

// Expects that no call of the handle does anything any more, and that each says why in one line.
void ExpectEnd(PostgresStore& store, char const* what)
{
    auto const start = std::chrono::steady_clock::now();
    while (ReasonOf([&] { store.Sync(); }).empty())
        ASSERT_LT(std::chrono::steady_clock::now() - start, 20s);
    TicketState const state{1, 1};
    std::function<void()> const calls[] = {
        [&] { store.Commit(WriteTo(Job, state).Put("Key", 0, 1), 99); },
        [&] { store.FindCommit(99); },
        [&] { ValuesOf(store, Job); },
        [&] { AddressesIn(store); },
        [&] { store.WaitForChanges(store.Committed(), 1h); },
        [&] { FeedOf(store, 0); },
        [&] { store.Maintain(0); },
        [&] { store.Bury([](Estate const&) { ADD_FAILURE(); }); },
        [&] { store.Sync(); },
        [&] { store.OpenSession("admin"); },
        [&] {
            store.PutUser({"anna", "$y$", 16, 1});
        },
        [&] { store.TakeUsersTurn(0ms); },
        [&] { store.Leave(); },
    };
    for (auto const& call : calls)
    {
        EXPECT_THROW(call(), UnusableStore);
        std::string const reason = ReasonAtOnce(call);
        EXPECT_THAT(reason, HasSubstr(what));
        EXPECT_THAT(reason, HasSubstr("start the program anew"));
        EXPECT_THAT(reason, Not(HasSubstr("\n")));
    }
    EXPECT_FALSE(store.IsReachable());
}

class PostgresReturn : public PostgresSite
{
protected:
    PostgresReturn() { options.schema = schema.Name(); }
    ~PostgresReturn() override
    {
        std::string const aside =
            schema.cluster.Run("SELECT string_agg(nspname, ', ') FROM pg_namespace WHERE nspname LIKE '" +
                               schema.Name() + "\\_%'");
        if (!aside.empty())
            schema.cluster.Run("DROP SCHEMA " + aside + " CASCADE");
    }

    std::unique_ptr<PostgresReplacement> BeginReplacing() const
    {
        return std::make_unique<PostgresReplacement>(schema.cluster.Uri(), Old::SetAside, options);
    }

    PostgresOptions options;
    std::unique_ptr<PostgresStore> store = schema.Open(PostgresOptions());
    Writer writer{*store};
};

class PostgresReturnElsewhere : public testing::Test
{
protected:
    std::string UriOf(PostgresCluster const& first, PostgresCluster const& second) const
    {
        return "host=" + first.Folder().string() + "," + second.Folder().string() +
               " user=visitor dbname=postgres";
    }

    // From now on the standby gets nothing, and nobody waits for it.
    void CutStandbyOff() const
    {
        primary.Run("ALTER SYSTEM SET synchronous_standby_names = ''");
        primary.Run("SELECT pg_reload_conf()");
        primary.Await("SELECT current_setting('synchronous_standby_names')", "");
        standby->Run("ALTER SYSTEM SET primary_conninfo = ''");
        standby->Run("SELECT pg_reload_conf()");
        primary.Await("SELECT count(*) FROM pg_stat_replication", "0");
    }

    PostgresCluster primary;
    std::unique_ptr<PostgresCluster> const standby = primary.MakeStandby();
};
}  // namespace

// --- another site

TEST_F(PostgresReturn, ToASiteThatWasRestoredMeanwhile_IsTheEnd)
{
    PostgresCluster& cluster = schema.cluster;
    Visitor::Make(cluster);
    auto const visitor = schema.OpenAs(cluster.Uri(Visitor::Name), NoContent, PostgresOptions());
    visitor->OpenSession("admin");
    MakeTickets(*visitor, 5);
    store->Leave();
    Visitor::KeepOut(cluster);
    {
        auto const replacement = BeginReplacing();
        MakeTickets(replacement->Store(), 20);  // more than the visitor knows of
        replacement->Finish();
    }
    Visitor::LetIn(cluster);
    ExpectEnd(*visitor, "another site has taken the place of the one that this program has open");
    EXPECT_EQ(schema.Run("SELECT count(*) FROM S.program"), "0");
    EXPECT_EQ(schema.Run("SELECT count(*) FROM S.session"), "0");
    cluster.Await("SELECT count(*) FROM pg_stat_activity WHERE usename = 'visitor'", "0");
    EXPECT_THAT(AddressesIn(*schema.Open()), SizeIs(20));
}

TEST_F(PostgresReturn, WhileTheSiteIsBeingReplaced_WaitsForTheEnd)
{
    writer.Do(Creation(Job).Put("Key", 0, 1));
    store->Leave();
    auto const idle = schema.Open();
    Terminate(*idle);
    auto replacement = BeginReplacing();
    EXPECT_THAT(ReasonOf([&] { idle->Programs(); }), HasSubstr("the site is being replaced; wait"));
    EXPECT_EQ(schema.Run("SELECT count(*) FROM S.living"), "0");
    replacement.reset();
    auto const start = std::chrono::steady_clock::now();
    while (!ReasonOf([&] { idle->Programs(); }).empty())
        ASSERT_LT(std::chrono::steady_clock::now() - start, 60s);
    EXPECT_EQ(Writer(*idle).Put(Job, "Key", 0, 2).sequence, 2u);
}

TEST_F(PostgresReturn, UnderANumberThatIsAnothers_IsTheEnd)
{
    schema.Run("UPDATE S.program SET since = since - 1");
    Terminate(*store);
    ExpectEnd(*store, "another program has got the number of this one");
}

TEST_F(PostgresReturn, OfADumpUnderASoundConnection_IsTheEnd)
{
    PostgresSchema const restored;
    MakeTickets(*restored.Open(), 20);
    MakeTickets(*store, 5);
    store->Maintain(5);
    schema.Run("DROP SCHEMA " + schema.Name() + " CASCADE");
    schema.Run("ALTER SCHEMA " + restored.Name() + " RENAME TO " + schema.Name());
    EXPECT_THROW(store->Maintain(5), UnusableStore);
    ExpectEnd(*store, "another site has taken the place of the one that this program has open");
    EXPECT_THAT(AddressesIn(*schema.Open()), SizeIs(20));
}

// What somebody has put in its place by hand.
TEST_F(PostgresReturn, ToASiteOfAnotherNumber_IsTheEnd)
{
    schema.Run("UPDATE S.site SET number = gen_random_uuid()");
    Terminate(*store);
    ExpectEnd(*store, "another site has taken the place");
}

// Those of the tools come over connections of their own, each of which may be the first to another server.
TEST_F(PostgresReturn, ToASiteOfAnotherNumber_IsTheEnd_ForACallOnAConnectionOfItsOwn)
{
    store->Leave();
    std::function<void(PostgresStore&)> const calls[] = {
        [](PostgresStore& handle) { handle.ReadContent([](TicketChange&&) {}, [](User&&) {}, {}); },
        [](PostgresStore& handle) { handle.Check({}); },
        [](PostgresStore& handle) { handle.Measure(); },
        [](PostgresStore& handle) { handle.TakeUsersTurn(0ms); },
    };
    for (auto const& call : calls)
    {
        auto const handle = schema.Open();
        schema.Run("UPDATE S.site SET number = gen_random_uuid()");
        EXPECT_THAT(ReasonOf([&] { call(*handle); }), HasSubstr("another site has taken the place"));
    }
}

TEST_F(PostgresReturn, EndsAWaitThatRuns)
{
    auto waiting = std::async(std::launch::async, [&]
                              { return ReasonOf([&] { store->WaitForChanges(store->Committed(), 1h); }); });
    EXPECT_EQ(waiting.wait_for(100ms), std::future_status::timeout);
    schema.Run("UPDATE S.site SET number = gen_random_uuid()");
    Terminate(*store);
    EXPECT_THAT(waiting.get(), HasSubstr("another site has taken the place"));
}

// --- a server that lacks changes

TEST_F(PostgresReturnElsewhere, ToAServerThatIsBehind_IsTheEnd)
{
    Visitor::Make(primary);
    PostgresStore visitor(UriOf(primary, *standby), NoContent);
    Writer writer(visitor);
    writer.Make(Job);
    CutStandbyOff();
    writer.Make({3, 2});
    primary.Kill();
    standby->Promote();
    ExpectEnd(visitor,
              "this server has not got all changes that this program knows of, the newest of which is 2");
    EXPECT_EQ(standby->Run("SELECT count(*) FROM comgui.living"), "0");
}

// By the number of the newest change alone it would be the same.
TEST_F(PostgresReturnElsewhere, ToAServerThatWasBehindAndWentAnotherWay_IsTheEnd)
{
    Visitor::Make(primary);
    PostgresStore visitor(UriOf(primary, *standby), NoContent);
    Writer writer(visitor);
    writer.Make(Job);
    CutStandbyOff();
    writer.Make({3, 2});
    primary.Kill();
    Visitor::KeepOut(*standby);
    standby->Promote();
    PostgresStore other(standby->Uri(), NoContent);
    MakeTickets(other, 5);
    Visitor::LetIn(*standby);
    ExpectEnd(visitor, "this server has not got all changes");
    EXPECT_THAT(other.Programs(), SizeIs(2));
    EXPECT_FALSE(other.Programs().at(0).isAlive);
}

// Which nobody has told that it is none any more.
TEST_F(PostgresReturnElsewhere, ToAnOldPrimaryThatWentOn_IsTheEnd)
{
    Visitor::Make(primary);
    PostgresStore onTheOld(primary.Uri(), NoContent);
    Writer writerOnTheOld(onTheOld);
    writerOnTheOld.Make(Job);
    CutStandbyOff();
    standby->Promote();
    PostgresStore visitor(UriOf(*standby, primary), NoContent);
    MakeTickets(visitor, 1);
    for (int i = 0; i < 5; ++i)
        writerOnTheOld.Do(CreationOfNext(3));
    standby->Kill();
    ExpectEnd(visitor, "this server has not got all changes");
    EXPECT_THAT(onTheOld.Programs(), SizeIs(1));
}

TEST_F(PostgresReturn, ToASiteOfTheFirstVersion_IsAsToANewOne)
{
    writer.Make(Job);
    store->Leave();
    schema.Run("DROP TABLE S.era");
    schema.Run("DROP FUNCTION S.enter_era");
    for (char const* const function : {"prune_journal", "due_for_pruning", "note_heard"})
        schema.Run(std::string("DROP FUNCTION S.") + function);
    schema.Run("CREATE FUNCTION S.prune_journal(kept bigint, largest bigint, at_once bigint) RETURNS bigint "
               "LANGUAGE sql AS 'SELECT 0::bigint'");
    schema.Run("UPDATE S.site SET version = 1");
    auto const reopened = schema.Open();
    Terminate(*reopened);
    EXPECT_THAT(AddressesIn(*reopened), SizeIs(1));
    EXPECT_EQ(schema.Run("SELECT begun_at FROM S.era"), "1");
    reopened->Maintain(1);
}

// Whose pruning forgot what the living might still ask for.
TEST_F(PostgresReturn, ToASiteOfTheSecondVersion_MendsItsPruning)
{
    store->Leave();
    schema.Run("CREATE OR REPLACE FUNCTION S.prune_journal(kept bigint, largest bigint, at_once bigint, gone "
               "bigint[]) RETURNS bigint LANGUAGE sql AS 'SELECT 0::bigint'");
    schema.Run("UPDATE S.site SET version = 2");
    options.limits.journalKept = 0;
    auto const reopened = schema.Open(options);
    Writer(*reopened).Make(Job);
    reopened->Maintain(1);
    EXPECT_EQ(schema.Run("SELECT pruned FROM S.site"), "1");
}

// --- opening

TEST_F(PostgresReturn, OfAReplacement_FindsWhoHasBegunToOpenTheSite)
{
    store->Leave();
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("SELECT pg_advisory_lock('" + schema.Name() + "'::regnamespace::oid::integer, 0)");
    auto opening = std::async(std::launch::async, [this] { return schema.Open(PostgresOptions()); });
    schema.cluster.Await(
        "SELECT count(*) FROM pg_stat_activity WHERE query LIKE 'SELECT pg_try_advisory_lock(lock%'", "1");
    EXPECT_THAT(ReasonOf([&] { BeginReplacing(); }),
                HasSubstr("another program is opening or replacing the site"));
    obstacle.Run("SELECT pg_advisory_unlock_all()");
    auto const opened = opening.get();
    EXPECT_THAT(ReasonOf([&] { BeginReplacing(); }), HasSubstr("in use by"));
    opened->Leave();
    EXPECT_THAT(ReasonOf([&] { BeginReplacing(); }), IsEmpty());
}
