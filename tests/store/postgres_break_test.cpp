// What the PostgreSQL store does when its connections break, and what becomes of its program meanwhile.
#include "standin/server/store/postgres/Bell.h"
#include "standin/server/store/postgres/Keeper.h"
#include "standin/server/store/postgres/PostgresStore.h"

#include "tests/store/PostgresSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/sanitizers.h"
#include <csignal>
#include <future>
#include <gmock/gmock.h>
#include <set>
#include <thread>

using namespace standin;
using namespace std::chrono_literals;
using testing::IsEmpty;
using testing::SizeIs;

namespace
{
using Clock = std::chrono::steady_clock;

void LeaveAlone(Estate const&) {}

PostgresOptions Impatient()
{
    PostgresOptions options = AtOnce();
    options.connectLimit = 300ms;
    options.statementLimit = 500ms;
    return options;
}

// Every commit of the cluster is made, and waits for a standby that never comes, until the end of this.
class NoStandby
{
public:
    explicit NoStandby(PostgresCluster const& cluster) : m_cluster(cluster) { Name("'nobody'"); }
    ~NoStandby() { Name("''"); }
    NoStandby(NoStandby const&) = delete;
    NoStandby& operator=(NoStandby const&) = delete;

private:
    void Name(std::string const& standby) const
    {
        m_cluster.Run("ALTER SYSTEM SET synchronous_standby_names = " + standby);
        m_cluster.Run("SELECT pg_reload_conf()");
        m_cluster.Await("SELECT current_setting('synchronous_standby_names') = " + standby, "t");
    }

    PostgresCluster const& m_cluster;
};

class PostgresBreak : public PostgresSite
{
protected:
    std::unique_ptr<PostgresStore> store = schema.Open();
    std::unique_ptr<PostgresStore> other = schema.Open();
    Writer writer{*store};
    Writer otherWriter{*other};

    // Returns when the handle knows of that change, and expects that a ring was heard: without one it would
    // look after the minute.
    static void ExpectRing(Store& listener, Sequence committed)
    {
        auto const start = Clock::now();
        listener.WaitForChanges(committed - 1, 60s);
        EXPECT_EQ(listener.Committed(), committed);
        EXPECT_LT(Clock::now() - start, 30s);
    }

    pid_t ServerOfTheBell(std::string const& role) const
    {
        return std::stoi(schema.cluster.Run("SELECT pid FROM pg_stat_activity WHERE usename = '" + role +
                                            "' AND query LIKE '%LISTEN%'"));
    }

    static void AwaitReach(Store& handle, bool isThere)
    {
        for (auto const end = Clock::now() + 60s; handle.IsReachable() != isThere && Clock::now() < end;)
            std::this_thread::sleep_for(1ms);
        ASSERT_EQ(handle.IsReachable(), isThere);
    }

    int Value() { return static_cast<int>(ValuesOf(*other, Job).at({"Key", 0}).value.integer); }

    // Adds one to the value, as a writer does who knows of no break: plans on what holds, asks after an
    // outcome that did not come, and tries again after a failure, which has had no effect. Returns how
    // often it has.
    static int CountUp(Store& handle, std::uint64_t number, std::atomic<bool> const& isOver)
    {
        int done = 0;
        for (; !isOver; ++number)
        {
            auto outcome = CommitOutcome{CommitOutcome::Conflict, 0, {}};
            try
            {
                int count = 0;
                auto const loaded = handle.Load(Job, [&count](std::string_view, int, StoredValue const& value)
                                                { count = static_cast<int>(value.integer); });
                outcome = handle.Commit(WriteTo(Job, loaded->state).Put("Key", 0, count + 1), number);
            }
            catch (StoreError const&)
            {
                continue;
            }
            done += WasCommitted(handle, outcome, number) ? 1 : 0;
        }
        return done;
    }

    static bool WasCommitted(Store& handle, CommitOutcome const& outcome, std::uint64_t number)
    {
        while (outcome.kind == CommitOutcome::Unknown)
        {
            try
            {
                return handle.FindCommit(number).has_value();
            }
            catch (StoreError const&)
            {
                // Broken again.
            }
        }
        return outcome.kind == CommitOutcome::Committed;
    }
};

using PostgresBell = PostgresBreak;
using PostgresDeath = PostgresBreak;
}  // namespace

// --- calls

TEST_F(PostgresBreak, BetweenTwoCalls_IsNotNoticedByTheSecond)
{
    ProgramId const self = store->Self();
    writer.Make(Job);
    Terminate(*store);
    EXPECT_EQ(writer.Put(Job, "Key", 0, 1).sequence, 2u);
    Terminate(*store);
    EXPECT_EQ(Value(), 1);
    EXPECT_EQ(store->Self(), self);
    EXPECT_TRUE(store->Programs().at(0).isAlive);
}

TEST_F(PostgresBreak, InACommitThatIsNotMade_IsUnknownUntilItIsAskedAfter)
{
    writer.Do(Creation(Job).Put("Key", 0, 1));
    TicketState const before = writer.State(Job);
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("BEGIN");
    obstacle.Run("SELECT FROM " + schema.Name() + ".newest FOR UPDATE");
    auto commit = std::async(std::launch::async,
                             [&] { return store->Commit(WriteTo(Job, before).Put("Key", 0, 2), 50); });
    std::string const worker = schema.cluster.Run("SELECT pid FROM " + LocksOf(*store));
    schema.cluster.Await("SELECT wait_event_type FROM pg_stat_activity WHERE pid = " + worker, "Lock");
    Terminate(*store);
    EXPECT_EQ(commit.get().kind, CommitOutcome::Unknown);
    obstacle.Run("ROLLBACK");
    EXPECT_FALSE(store->FindCommit(50));
    EXPECT_EQ(Value(), 1);
    EXPECT_EQ(writer.Put(Job, "Key", 0, 3).sequence, 2u);
}

// The server takes a moment to miss its standby, so the last of several commits is the one.
TEST_F(PostgresBreak, InACommitThatIsMade_IsUnknownUntilItIsAskedAfter)
{
    writer.Do(Creation(Job).Put("Key", 0, 1));
    TicketState state = writer.State(Job);
    std::string const worker = schema.cluster.Run("SELECT pid FROM " + LocksOf(*store));
    std::uint64_t number = 50;
    {
        NoStandby const waiting(schema.cluster);
        auto commits = std::async(std::launch::async,
                                  [&]
                                  {
                                      for (; number < 100'000; ++number)
                                      {
                                          auto const change =
                                              WriteTo(Job, state).Put("Key", 0, static_cast<int>(number));
                                          auto const outcome = store->Commit(change, number);
                                          if (outcome.kind != CommitOutcome::Committed)
                                              return outcome.kind;
                                          state.revision = outcome.sequence;
                                      }
                                      return CommitOutcome::Committed;
                                  });
        schema.cluster.Await("SELECT wait_event FROM pg_stat_activity WHERE pid = " + worker, "SyncRep");
        Terminate(*store);
        EXPECT_EQ(commits.get(), CommitOutcome::Unknown);
    }
    EXPECT_EQ(store->Committed(), state.revision);
    auto const found = store->FindCommit(number);
    ASSERT_TRUE(found);
    EXPECT_EQ(found->kind, CommitOutcome::Committed);
    EXPECT_EQ(found->sequence, state.revision + 1);
    EXPECT_EQ(found->address, Job);
    EXPECT_EQ(store->Committed(), found->sequence);
    ExpectRing(*other, found->sequence);
    EXPECT_EQ(Value(), static_cast<int>(number));
}

// For a client that is slow, or a change that is asked after.
TEST_F(PostgresBreak, ForAMoment_KeepsTheJournalForWhoIsMissing)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    options.settling = 700ms;
    auto const third = schema.Open(options);
    for (int i = 0; i < 5; ++i)
        otherWriter.Do(CreationOfNext(3));
    store->Maintain(2);
    other->Maintain(5);
    Terminate(*store);
    third->Maintain(5);
    EXPECT_THAT(FeedOf(*other, 2), SizeIs(3));
    std::this_thread::sleep_for(options.settling);
    third->Maintain(5);
    EXPECT_FALSE(other->ChangesSince(4, [](CommittedChange&&) { ADD_FAILURE(); }));
}

// All may have lost their connections together, and need the time to come back.
TEST_F(PostgresBreak, OfWhoLooksForTheMissing_GivesThemTheirTimeAnew)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    options.settling = 700ms;
    auto const third = schema.Open(options);
    for (int i = 0; i < 5; ++i)
        otherWriter.Do(CreationOfNext(3));
    store->Maintain(2);
    other->Maintain(5);
    Terminate(*store);
    third->Maintain(5);
    Terminate(*third);
    std::this_thread::sleep_for(options.settling);
    third->Maintain(5);
    EXPECT_THAT(FeedOf(*other, 2), SizeIs(3));
    std::this_thread::sleep_for(options.settling);
    third->Maintain(5);
    EXPECT_FALSE(other->ChangesSince(4, [](CommittedChange&&) { ADD_FAILURE(); }));
}

TEST_F(PostgresDeath, ByMistake_KeepsTheJournalAgainAsFarAsItIsNeeded)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    auto const third = schema.Open(options);
    for (int i = 0; i < 3; ++i)
        writer.Do(CreationOfNext(3));
    ExpectRing(*other, 3);
    store->Maintain(1);
    Terminate(*store);
    ASSERT_EQ(other->Bury(LeaveAlone), 1);
    ASSERT_EQ(store->Programs().size(), 3u);
    EXPECT_EQ(store->Programs()[0].heard, 1u);
    other->Maintain(3);
    third->Maintain(3);
    EXPECT_THAT(FeedOf(*store, 1), SizeIs(2));
}

TEST_F(PostgresBreak, OutcomeThatNobodyAsksFor_KeepsTheJournalNoLonger)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    options.askingPause = 300ms;
    auto const lazy = schema.Open(options);
    other->Leave();
    store->Leave();
    Writer lazyWriter(*lazy);
    lazyWriter.Make(Job);
    {
        SqlSession const obstacle(schema.cluster.Uri());
        obstacle.Run("BEGIN");
        obstacle.Run("LOCK TABLE " + schema.Name() + ".journal IN EXCLUSIVE MODE");
        auto commit =
            std::async(std::launch::async, [&] { return lazy->Commit(Creation(OtherJob), 50).kind; });
        schema.cluster.Await("SELECT count(*) FROM pg_locks WHERE NOT granted AND relation = '" +
                                 schema.Name() + ".journal'::regclass",
                             "1");
        Terminate(*lazy);
        EXPECT_EQ(commit.get(), CommitOutcome::Unknown);
    }
    Sequence const newest = lazyWriter.Do(CreationOfNext(5)).sequence;
    auto const pruned = [&]
    {
        lazy->Maintain(newest);
        return schema.Run("SELECT pruned FROM S.site");
    };
    EXPECT_EQ(pruned(), "1");
    std::this_thread::sleep_for(options.askingPause);
    EXPECT_EQ(pruned(), std::to_string(newest));
    EXPECT_THAT(ReasonOf([&] { lazy->FindCommit(50); }), testing::HasSubstr("nobody has asked for long"));
}

// The server lets everybody see a change whose wait for the standby has been broken off. If it dies then, the
// change is gone with it.
TEST_F(PostgresBreak, InACommitThatNoStandbyHas_IsUnknownUntilOneHasIt)
{
    writer.Do(Creation(Job).Put("Key", 0, 1));
    TicketState const before = writer.State(Job);
    pid_t const worker = std::stoi(schema.cluster.Run("SELECT pid FROM " + LocksOf(*store)));
    std::future<std::optional<CommitOutcome>> found;
    {
        NoStandby const noStandby(schema.cluster);
        auto commit = std::async(std::launch::async,
                                 [&] { return store->Commit(WriteTo(Job, before).Put("Key", 0, 2), 50); });
        schema.cluster.Await("SELECT wait_event FROM pg_stat_activity WHERE pid = " + std::to_string(worker),
                             "SyncRep");
        Terminate(*store);
        EXPECT_EQ(commit.get().kind, CommitOutcome::Unknown);
        EXPECT_EQ(Value(), 2);
        found = std::async(std::launch::async, [&] { return store->FindCommit(50); });
        EXPECT_EQ(found.wait_for(500ms), std::future_status::timeout);
    }
    auto const outcome = found.get();
    ASSERT_TRUE(outcome);
    EXPECT_EQ(outcome->sequence, 2u);
}

// The server has done it, but nobody said so.
TEST_F(PostgresBreak, InAChangeOfAUser_RepeatsIt)
{
    store->PutUser({"bob", "$y$", 16, 2});
    std::string const worker = schema.cluster.Run("SELECT pid FROM " + LocksOf(*store));
    std::string const removing = schema.cluster.Run("SELECT pid FROM " + LocksOf(*other));
    auto const breakIn = [this](PostgresStore& handle, std::string const& process)
    {
        schema.cluster.Await("SELECT wait_event FROM pg_stat_activity WHERE pid = " + process, "SyncRep");
        Terminate(handle);
    };
    std::future<std::string> put;
    std::future<bool> removed;
    {
        NoStandby const noStandby(schema.cluster);
        put = std::async(std::launch::async,
                         [&] {
                             return ReasonOf([&] { store->PutUser({"anna", "$y$", 16, 1}); });
                         });
        removed = std::async(std::launch::async, [&] { return other->RemoveUser("bob"); });
        breakIn(*store, worker);
        breakIn(*other, removing);
        EXPECT_EQ(put.wait_for(300ms), std::future_status::timeout);
        EXPECT_EQ(removed.wait_for(0ms), std::future_status::timeout);
    }
    EXPECT_THAT(put.get(), IsEmpty());
    EXPECT_TRUE(removed.get());
    EXPECT_EQ(store->FindUser("anna")->ticketId, 1);
    EXPECT_FALSE(store->FindUser("bob"));
    EXPECT_FALSE(store->RemoveUser("bob"));
}

TEST_F(PostgresBreak, InAChangeOfAUser_ForGood_IsAnUnknownOutcome)
{
    NoStandby const noStandby(schema.cluster);
    std::string const worker = schema.cluster.Run("SELECT pid FROM " + LocksOf(*store));
    auto put = std::async(std::launch::async, [&] { store->PutUser({"anna", "$y$", 16, 1}); });
    schema.cluster.Await("SELECT wait_event FROM pg_stat_activity WHERE pid = " + worker, "SyncRep");
    SqlSession const vandal(schema.cluster.Uri());
    vandal.Run("SET synchronous_commit = off");
    vandal.Run("UPDATE " + schema.Name() + ".site SET number = gen_random_uuid()");
    Terminate(*store);
    EXPECT_THROW(put.get(), UnknownOutcome);
}

// The connection is lost to the program, but its server process has the commit still before it.
TEST_F(PostgresBreak, WhoseServerProcessMayStillCommit_LeavesItUnknown)
{
    writer.Do(Creation(Job).Put("Key", 0, 1));
    TicketState const before = writer.State(Job);
    auto const impatient = schema.Open(Impatient());
    pid_t const worker = std::stoi(schema.cluster.Run("SELECT pid FROM " + LocksOf(*impatient)));
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("BEGIN");
    obstacle.Run("SELECT FROM " + schema.Name() + ".newest FOR UPDATE");
    auto commit = std::async(std::launch::async,
                             [&] { return impatient->Commit(WriteTo(Job, before).Put("Key", 0, 2), 50); });
    schema.cluster.Await("SELECT wait_event_type FROM pg_stat_activity WHERE pid = " + std::to_string(worker),
                         "Lock");
    kill(worker, SIGSTOP);
    EXPECT_EQ(commit.get().kind, CommitOutcome::Unknown);
    obstacle.Run("ROLLBACK");
    EXPECT_THROW(impatient->FindCommit(50), StoreError);
    EXPECT_THROW(impatient->FindCommit(50), StoreError);
    kill(worker, SIGCONT);
    std::optional<CommitOutcome> found;
    auto const start = Clock::now();
    while (!ReasonOf([&] { found = impatient->FindCommit(50); }).empty())
        ASSERT_LT(Clock::now() - start, 60s);
    EXPECT_EQ(Value(), found ? 2 : 1);
}

// As long as a program cannot be reached, the journal is not kept for it.
TEST_F(PostgresBreak, OutcomeOfACommit_IsFoundThoughTheJournalWasPrunedMeanwhile)
{
    StoreLimits limits;
    limits.journalKept = 0;
    PostgresOptions options = AtOnce();
    options.limits = limits;
    auto const third = schema.Open(options);
    writer.Make(Job);
    Terminate(*store);
    other->Maintain(1);
    third->Maintain(1);
    EXPECT_FALSE(other->ChangesSince(0, [](CommittedChange&&) { ADD_FAILURE(); }));
    auto const found = store->FindCommit(writer.LastNumber());
    ASSERT_TRUE(found);
    EXPECT_EQ(found->sequence, 1u);
    EXPECT_EQ(found->address, Job);
    EXPECT_FALSE(store->FindCommit(writer.LastNumber() + 1));
}

// Nobody waits for it any more, though it is there, as it is for one that has just come back.
TEST_F(PostgresBreak, OutcomeOfACommit_IsFoundThoughTheJournalHasLeftTheLivingProgramBehind)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    options.limits.journalLargest = 1;
    auto const third = schema.Open(options);
    writer.Make(Job);
    for (int i = 0; i < 3; ++i)
        otherWriter.Do(CreationOfNext(3));
    third->Maintain(4);
    EXPECT_FALSE(other->ChangesSince(0, [](CommittedChange&&) { ADD_FAILURE(); }));
    auto const found = store->FindCommit(writer.LastNumber());
    ASSERT_TRUE(found);
    EXPECT_EQ(found->sequence, 1u);
    EXPECT_EQ(found->address, Job);
}

// Of one that was taken for dead, and of what it may ask for alone.
TEST_F(PostgresBreak, OutcomeOfACommit_IsFoundThoughTheProgramWasBuriedAndTheJournalPruned)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    auto const third = schema.Open(options);
    writer.Make(Job);
    store->Maintain(1);
    writer.Make(OtherJob);
    Terminate(*store);
    ASSERT_EQ(other->Bury(LeaveAlone), 1);
    other->Maintain(2);
    third->Maintain(2);
    EXPECT_FALSE(other->ChangesSince(0, [](CommittedChange&&) { ADD_FAILURE(); }));
    EXPECT_EQ(schema.Run("SELECT string_agg(sequence::text, ' ') FROM S.outcome"), "2");
    auto const found = store->FindCommit(writer.LastNumber());
    ASSERT_TRUE(found);
    EXPECT_EQ(found->sequence, 2u);
    EXPECT_EQ(found->address, OtherJob);
}

TEST_F(PostgresBreak, OutcomeOfACommit_IsNotKeptForAProgramThatHasLeft)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    auto const third = schema.Open(options);
    writer.Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    otherWriter.Make(OtherJob);
    store->Leave();
    other->Leave();
    third->Maintain(2);
    EXPECT_EQ(schema.Run("SELECT count(*) FROM S.journal"), "0");
    EXPECT_EQ(schema.Run("SELECT count(*) FROM S.outcome"), "0");
}

// It must not pass for a change that was never made.
TEST_F(PostgresBreak, OutcomeOfACommit_ThatIsForgotten_IsNeverDenied)
{
    PostgresOptions options = AtOnce();
    options.limits.journalKept = 0;
    auto const third = schema.Open(options);
    writer.Do(Creation(Job).Put("Key", 0, 1));
    TicketState const before = writer.State(Job);
    CommitOutcome outcome;
    {
        SqlSession const obstacle(schema.cluster.Uri());
        obstacle.Run("BEGIN");
        obstacle.Run("SELECT FROM " + schema.Name() + ".newest FOR UPDATE");
        auto commit = std::async(std::launch::async,
                                 [&] { return store->Commit(WriteTo(Job, before).Put("Key", 0, 2), 50); });
        schema.cluster.Await("SELECT count(*) FROM pg_stat_activity WHERE wait_event_type = 'Lock'", "1");
        Terminate(*store);
        outcome = commit.get();
    }
    ASSERT_EQ(outcome.kind, CommitOutcome::Unknown);
    // As if it had been made, and nobody had come back for long.
    schema.Run("INSERT INTO S.outcome SELECT id, 50, 2, 3, 1, now() - interval '31 days' FROM S.program p "
               "WHERE p.id = " +
               std::to_string(store->Self()));
    otherWriter.Put(Job, "Key", 0, 3);
    other->Maintain(2);
    third->Maintain(2);
    EXPECT_EQ(schema.Run("SELECT count(*) FROM S.outcome WHERE number = 50"), "0");
    EXPECT_THAT(ReasonOf([&] { store->FindCommit(50); }),
                testing::HasSubstr("nobody knows any more whether a change was made"));
    EXPECT_THAT(ReasonOf([&] { store->FindCommit(50); }), testing::HasSubstr("nobody knows any more"));
    store->Maintain(2);  // it keeps the journal for nothing
    EXPECT_EQ(third->Programs().at(0).heard, 2u);
}

TEST_F(PostgresBreak, AgainAndAgain_LosesNothingAndMakesNothingTwice)
{
    writer.Do(Creation(Job).Put("Key", 0, 0));
    std::atomic<bool> isOver{false};
    auto const count = [&isOver](Store& handle, std::uint64_t firstNumber) {
        return std::async(std::launch::async,
                          [&, firstNumber] { return CountUp(handle, firstNumber, isOver); });
    };
    std::future<int> counts[] = {count(*store, 1'000'000), count(*store, 2'000'000),
                                 count(*other, 3'000'000)};
    for (int terminated = 0; terminated < (IsSanitized ? 20 : 60);)
        terminated += Terminate(terminated % 3 == 0 ? *other : *store) ? 1 : 0;
    isOver = true;
    int made = 0;
    for (std::future<int>& counted : counts)
        made += counted.get();
    EXPECT_EQ(Value(), made);
    EXPECT_THAT(FeedOf(*other, 0), SizeIs(static_cast<std::size_t>(1 + made)));
}

TEST_F(PostgresBreak, ByAServerThatStandsStill_EndsEveryCallAtItsLimit)
{
    writer.Do(Creation(Job).Put("Key", 0, 1));
    TicketState const before = writer.State(Job);
    auto const impatient = schema.Open(Impatient());
    schema.cluster.Stop();
    auto const start = Clock::now();
    CommitOutcome const outcome = impatient->Commit(WriteTo(Job, before).Put("Key", 0, 2), 50);
    EXPECT_THROW(ValuesOf(*impatient, Job), StoreError);
    EXPECT_THROW(impatient->WaitForChanges(1, 10ms), StoreError);
    EXPECT_LT(Clock::now() - start, 5s);
    schema.cluster.Continue();
    EXPECT_EQ(outcome.kind, CommitOutcome::Unknown);
    std::optional<CommitOutcome> found;
    while (!ReasonOf([&] { found = impatient->FindCommit(50); }).empty())
        ASSERT_LT(Clock::now() - start, 60s);
    EXPECT_EQ(Value(), found ? 2 : 1);
}

// What is looked at first on a new connection waits for somebody: within the limit of the call, not its own.
TEST_F(PostgresBreak, ThatIsMendedInACall_EndsTheCallAtItsLimit)
{
    PostgresOptions options = AtOnce();
    options.statementLimit = 4s;
    auto const leaving = schema.Open(options);
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("BEGIN");
    obstacle.Run("LOCK TABLE " + schema.Name() + ".era");
    Terminate(*leaving);
    auto const start = Clock::now();
    EXPECT_THROW(leaving->Leave(), StoreError);
    EXPECT_LT(Clock::now() - start, 2s);
    obstacle.Run("ROLLBACK");
}

// --- care, which comes every moment

TEST_F(PostgresBreak, OfTheStandby_KeepsNoCareWaiting)
{
    PostgresOptions options = Impatient();
    options.limits.journalKept = 0;
    auto const patient = schema.Open(options);
    Writer patientWriter(*patient);
    writer.Make(Job);
    NoStandby const waiting(schema.cluster);
    while (patientWriter.Try(CreationOfNext(3)).kind == CommitOutcome::Committed)
        ;  // the server takes a moment to miss it
    for (Store* const each : {store.get(), other.get(), patient.get()})
        EXPECT_THAT(ReasonAtOnce([&] { each->Maintain(1); }), IsEmpty());
    EXPECT_EQ(schema.Run("SELECT pruned FROM S.site"), "1");
    EXPECT_EQ(patient->Programs().at(2).heard, 1u);
}

TEST_F(PostgresBreak, InQuietTimes_CareWritesNothing)
{
    writer.Make(Job);
    store->Maintain(1);
    auto const rows = [this]
    { return schema.Run("SELECT s.xmin || ' ' || s.xmax || ' ' || p.xmin FROM S.site s, S.program p"); };
    std::string const before = rows();
    store->Maintain(1);
    EXPECT_EQ(rows(), before);
}

// --- the bell

TEST_F(PostgresBell, IsHeardByAHandleThatDoesNotWait)
{
    for (Sequence made = 1; made <= 50; ++made)
    {
        writer.Do(CreationOfNext(3));
        auto const start = Clock::now();
        while (other->Committed() < made && Clock::now() - start < 60s)
            std::this_thread::yield();
        ASSERT_EQ(other->Committed(), made);
    }
}

TEST_F(PostgresBell, ThatIsBack_LooksForWhatWasRungMeanwhile)
{
    PostgresCluster& cluster = schema.cluster;
    cluster.Run("CREATE ROLE listener LOGIN SUPERUSER");
    auto const listener = schema.OpenAs(cluster.Uri("listener"), NoContent);
    cluster.LetIn("listener", "reject");
    EXPECT_EQ(cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM pg_stat_activity "
                          "WHERE usename = 'listener' AND query LIKE '%LISTEN%'"),
              "t");
    writer.Make(Job);
    ExpectRing(*other, 1);
    EXPECT_EQ(listener->Committed(), 0u);
    cluster.LetIn("listener", "trust");
    ExpectRing(*listener, 1);
}

TEST_F(PostgresBell, ThatBrokeBeforeItWasToRing_RingsWhenItIsBack)
{
    PostgresCluster& cluster = schema.cluster;
    cluster.Run("CREATE ROLE ringer LOGIN SUPERUSER");
    auto const ringer = schema.OpenAs(cluster.Uri("ringer"), NoContent);
    cluster.LetIn("ringer", "reject");
    EXPECT_EQ(cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM pg_stat_activity "
                          "WHERE usename = 'ringer' AND query LIKE '%LISTEN%'"),
              "t");
    Writer(*ringer).Make(Job);
    EXPECT_EQ(other->Committed(), 0u);
    cluster.LetIn("ringer", "trust");
    ExpectRing(*other, 1);
}

TEST_F(PostgresBell, ThatBreaksWhileItRings_RingsOnceMore)
{
    schema.cluster.Run("CREATE ROLE interrupted LOGIN SUPERUSER");
    PostgresOptions options = AtOnce();
    options.connectLimit = 1s;
    auto const ringer = schema.OpenAs(schema.cluster.Uri("interrupted"), NoContent, options);
    pid_t const server = ServerOfTheBell("interrupted");
    ASSERT_EQ(kill(server, SIGSTOP), 0);
    Writer(*ringer).Make(Job);
    ExpectRing(*other, 1);
    kill(server, SIGCONT);
}

TEST_F(PostgresBell, ThatIsSilentForAWhile_IsALoss_AndGoesOn)
{
    schema.cluster.Run("CREATE ROLE patient LOGIN SUPERUSER");
    PostgresOptions options = AtOnce();
    options.connectLimit = 60s;
    auto const handle = schema.OpenAs(schema.cluster.Uri("patient"), NoContent, options);
    pid_t const server = ServerOfTheBell("patient");
    ASSERT_EQ(kill(server, SIGSTOP), 0);
    AwaitReach(*handle, false);
    kill(server, SIGCONT);
    AwaitReach(*handle, true);
    EXPECT_EQ(
        schema.cluster.Run("SELECT count(*) FROM pg_stat_activity WHERE pid = " + std::to_string(server)),
        "1");
}

TEST_F(PostgresBell, OfAHandleThatEnds_RingsBeforeIt)
{
    writer.Make(Job);
    store.reset();
    ExpectRing(*other, 1);
}

// It has a right to connect, and to nothing else.
TEST_F(PostgresBell, OfAStranger_IsNotBelieved)
{
    schema.cluster.Run("CREATE ROLE stranger LOGIN");
    SqlSession const stranger(schema.cluster.Uri("stranger"));
    writer.Make(Job);
    ExpectRing(*other, 1);
    stranger.Run("NOTIFY " + schema.Name() + ", '999999999999'");
    stranger.Run("NOTIFY " + schema.Name() + ", 'nonsense'");
    schema.Run("INSERT INTO S.journal VALUES (2, 0, 2, 1, 3, 1, '')");  // of which nobody rings
    stranger.Run("NOTIFY " + schema.Name() + ", '7'");
    ExpectRing(*other, 2);
    ExpectRing(*store, 2);
    otherWriter.Make(OtherJob);
    ExpectRing(*store, 3);
}

TEST(PostgresRingPace, AllowsEightAtOnce_AndThenWaits)
{
    standin::postgres::RingPace pace;
    auto const first = Clock::now();
    for (int i = 0; i < 7; ++i)
        pace.NoteRing();
    EXPECT_LT(pace.Next(), Clock::now());
    pace.NoteRing();
    EXPECT_GE(pace.Next(), first + 16ms);
}

TEST(PostgresKeeper, WokenDuringItsTask_DoesItOnceMore)
{
    std::promise<void> begun, woken;
    std::atomic<int> done{0};
    postgres::Keeper keeper(
        [&]
        {
            if (done == 0)
            {
                begun.set_value();
                woken.get_future().wait();
            }
            ++done;
        });
    keeper.Wake();
    begun.get_future().wait();
    keeper.Wake();
    keeper.Wake();
    woken.set_value();
    for (auto const end = Clock::now() + 10s; done < 2 && Clock::now() < end;)
        std::this_thread::sleep_for(1ms);
    EXPECT_EQ(done, 2);
}

// Each ring wakes all of them: were every program to ring for itself, a second would bring 3,000 rings.
TEST_F(PostgresBell, OfManyWriters_IsRungForAllOfThem)
{
    constexpr int Writers = 6;
    standin::postgres::Connection ear({schema.cluster.Uri(), schema.Name()}, 60s, Clock::now() + 60s);
    ear.Execute("LISTEN " + ear.Quoted(schema.Name()), Clock::now() + 60s);
    std::vector<std::unique_ptr<PostgresStore>> stores;
    for (int i = 0; i < Writers; ++i)
        stores.push_back(schema.Open());
    auto const start = Clock::now();
    std::atomic<Sequence> newest = 0;
    std::vector<std::thread> threads;
    for (auto const& each : stores)
        threads.emplace_back(
            [&]
            {
                for (Writer own(*each); Clock::now() < start + 700ms;)
                {
                    Sequence const made = own.Do(CreationOfNext(3)).sequence;
                    for (Sequence known = newest; known < made && !newest.compare_exchange_weak(known, made);)
                        ;
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    for (auto const& each : stores)
        ExpectRing(*each, newest);
    stores.clear();
    auto const time = Clock::now() - start;

    ear.Run("SELECT", {}, Clock::now() + 60s);  // what was rung has come with the answer
    int rings = 0;
    for (std::string payload; ear.TakeNotification(payload);)
        ++rings;
    EXPECT_GT(rings, 0);
    EXPECT_LT(rings, 2 * (time / 2ms) + 8 * Writers);
}

// --- life and death

TEST_F(PostgresDeath, OfAConnection_LeavesTheProgramToBeBuried_AndItGoesOnUnderItsNumber)
{
    ProgramId const self = store->Self();
    store->OpenSession("admin");
    writer.Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    Terminate(*store);
    EXPECT_FALSE(other->Programs().at(0).isAlive);
    int tickets = 0;
    EXPECT_EQ(
        other->Bury([&tickets](Estate const& estate) { tickets += static_cast<int>(estate.tickets.size()); }),
        1);
    EXPECT_EQ(tickets, 1);
    EXPECT_EQ(writer.Make(OtherJob).sequence, 2u);
    EXPECT_EQ(store->Self(), self);
    ASSERT_EQ(other->Programs().size(), 2u);
    EXPECT_EQ(other->Programs()[0].id, self);
    EXPECT_TRUE(other->Programs()[0].isAlive);
}

TEST_F(PostgresDeath, OfAConnection_LeavesTheSessionsAndPartFilesOfTheLiving)
{
    long long const session = store->OpenSession("admin");
    store->CloseSession(store->OpenSession("guest"));
    long long const since = store->Sessions().at(0).since;
    store->AddPartFile("/tmp/a");
    store->AddPartFile("/tmp/b");
    store->RemovePartFile("/tmp/b");
    Terminate(*store);
    ASSERT_EQ(other->Bury(LeaveAlone), 1);
    EXPECT_THAT(other->Sessions(), IsEmpty());
    auto const sessions = store->Sessions();
    ASSERT_THAT(sessions, SizeIs(1));
    EXPECT_EQ(sessions[0].id, session);
    EXPECT_EQ(sessions[0].program, store->Self());
    EXPECT_EQ(sessions[0].user, "admin");
    EXPECT_EQ(sessions[0].since, since);
    EXPECT_NE(other->OpenSession("admin"), session);
    EXPECT_FALSE(other->AddPartFile("/tmp/a"));
    EXPECT_TRUE(other->AddPartFile("/tmp/b"));
}

TEST_F(PostgresDeath, OfAConnection_LeavesAPartFileToWhoHasNotedItMeanwhile)
{
    store->AddPartFile("/tmp/a");
    Terminate(*store);
    other->Bury(LeaveAlone);
    EXPECT_TRUE(other->AddPartFile("/tmp/a"));
    EXPECT_THAT(store->Programs(), SizeIs(2));
    EXPECT_FALSE(store->AddPartFile("/tmp/a"));
    store->RemovePartFile("/tmp/a");
    EXPECT_FALSE(store->AddPartFile("/tmp/a"));
}

TEST_F(PostgresDeath, OfAConnection_BringsNothingBackThatWasGivenUpMeanwhile)
{
    PostgresCluster& cluster = schema.cluster;
    cluster.Run("CREATE ROLE away LOGIN SUPERUSER");
    auto const away = schema.OpenAs(cluster.Uri("away"), NoContent);
    long long const session = away->OpenSession("admin");
    away->AddPartFile("/tmp/a");
    cluster.LetIn("away", "reject");
    Terminate(*away);
    EXPECT_THROW(away->CloseSession(session), StoreError);
    EXPECT_THROW(away->RemovePartFile("/tmp/a"), StoreError);
    cluster.LetIn("away", "trust");
    auto const start = Clock::now();
    while (!ReasonOf([&] { away->Users(); }).empty())
        ASSERT_LT(Clock::now() - start, 20s);
    EXPECT_THAT(other->Sessions(), IsEmpty());
    EXPECT_TRUE(other->AddPartFile("/tmp/a"));
}

// The connection is sound, so nothing else would take it away.
TEST_F(PostgresDeath, OfASession_ThatTheServerRefuses_IsRepeated)
{
    long long const session = store->OpenSession("admin");
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("ALTER TABLE " + schema.Name() + ".session RENAME TO hidden");
    EXPECT_THROW(store->CloseSession(session), StoreError);
    EXPECT_THROW(store->Maintain(0), StoreError);
    obstacle.Run("ALTER TABLE " + schema.Name() + ".hidden RENAME TO session");
    EXPECT_THAT(other->Sessions(), SizeIs(1));
    store->Maintain(0);
    EXPECT_THAT(other->Sessions(), IsEmpty());
}

// As if the connection had broken between the server and the answer.
TEST_F(PostgresDeath, OfAConnection_TakesAwayWhatACallHasMadeWhoseAnswerWasLost)
{
    std::string const self = std::to_string(store->Self());
    schema.Run("INSERT INTO S.session (program, account, since) VALUES (" + self + ", 'admin', 0)");
    schema.Run("INSERT INTO S.part_file VALUES ('/tmp/a', " + self + ")");
    Terminate(*store);
    EXPECT_THAT(store->Sessions(), IsEmpty());
    EXPECT_TRUE(other->AddPartFile("/tmp/a"));
}

TEST_F(PostgresDeath, OfAConnection_IsMendedByItself)
{
    auto const idle = schema.Open(PostgresOptions());
    Terminate(*idle);
    schema.cluster.Await("SELECT count(*) FROM " + LocksOf(*idle), "1");
    EXPECT_EQ(other->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
}

TEST_F(PostgresDeath, OfAConnectionThatIsBack_BuriesNobody)
{
    store->OpenSession("admin");
    Terminate(*store);
    EXPECT_THAT(store->Sessions(), SizeIs(1));
    EXPECT_EQ(other->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
}

TEST_F(PostgresDeath, WithinTheGrace_IsNoReasonToBury)
{
    PostgresOptions options = AtOnce();
    options.grace = 1h;
    auto const patient = schema.Open(options);
    Terminate(*store);
    EXPECT_EQ(patient->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    EXPECT_EQ(other->Bury(LeaveAlone), 1);
}

// Rounds of who clears up, 0.7 s apart.
TEST_F(PostgresDeath, InQuietTimes_IsFollowedByABurialInTheSecondRound)
{
    PostgresOptions options;
    options.settling = 0s;
    auto const burier = schema.Open(options);
    store.reset();
    EXPECT_EQ(burier->Bury(LeaveAlone), 0);
    std::this_thread::sleep_for(700ms);
    EXPECT_EQ(burier->Bury(LeaveAlone), 1);
}

TEST_F(PostgresDeath, OfWhoWasSeenAliveOrHasComeSince_IsNoneOfTheServer)
{
    PostgresOptions options = AtOnce();
    options.settling = 1h;
    auto const young = schema.Open(options);
    EXPECT_EQ(young->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    ProgramId const come = schema.Open()->Self();
    store.reset();
    std::set<ProgramId> buried;
    EXPECT_EQ(young->Bury([&](Estate const& estate) { buried.insert(estate.program); }), 2);
    EXPECT_TRUE(buried.contains(come));
}

TEST_F(PostgresDeath, IsNoReasonToBury_ForWhoseConnectionIsYoung)
{
    PostgresOptions options = AtOnce();
    options.settling = 1h;
    auto const young = schema.Open(options);
    options.settling = 2s;
    auto const settling = schema.Open(options);
    auto const start = Clock::now();
    Terminate(*settling);
    settling->Programs();
    store.reset();
    EXPECT_EQ(settling->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    EXPECT_EQ(young->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    while (settling->Bury(LeaveAlone) == 0)
        ASSERT_LT(Clock::now() - start, 60s);
    EXPECT_GE(Clock::now() - start, 2s);
}

TEST_F(PostgresDeath, IsNoticedByAProgramThatHasJustBegun_IfTheServerIsOldEnough)
{
    PostgresOptions options = AtOnce();
    options.settling = 2s;
    schema.cluster.Await("SELECT clock_timestamp() - pg_postmaster_start_time() > '2 s'", "t");
    store.reset();
    EXPECT_EQ(schema.Open(options)->Bury(LeaveAlone), 1);
}

TEST_F(PostgresDeath, WhoComesBackDuringItsBurial_WaitsForItsEnd)
{
    Terminate(*store);
    std::future<bool> isBack;
    EXPECT_EQ(other->Bury(
                  [&](Estate const&)
                  {
                      isBack = std::async(std::launch::async, [&] { return store->Programs().size() == 2; });
                      schema.cluster.Await(
                          "SELECT count(*) FROM pg_locks WHERE locktype = 'advisory' AND NOT "
                          "granted AND classid = '" +
                              schema.Name() + "'::regnamespace",
                          "1");
                  }),
              1);
    EXPECT_TRUE(isBack.get());
}

// What the parent had open the child has, too.
TEST_F(PostgresDeath, OfAProgramThatHasForked_ShowsWhileItsChildLives)
{
    std::unique_ptr<PostgresStore> dying;
    ChildProcess parent(
        [&](ChildProcess::Report const& report)
        {
            dying = schema.Open();
            pid_t const child = fork();
            if (child == 0)
                sleep(60);
            report(dying->Self());
            report(child);
            sleep(60);
        });
    auto const id = parent.Next();
    auto const child = parent.Next();
    ASSERT_TRUE(id && child);
    auto const isAlive = [&]
    {
        auto const programs = other->Programs();
        return std::any_of(programs.begin(), programs.end(),
                           [&](ProgramInfo const& program) { return program.id == *id && program.isAlive; });
    };
    EXPECT_TRUE(isAlive());
    parent.Kill();
    for (auto const end = Clock::now() + 10s; isAlive() && Clock::now() < end;)
        std::this_thread::sleep_for(1ms);
    EXPECT_FALSE(isAlive());
    EXPECT_EQ(kill(static_cast<pid_t>(*child), SIGKILL), 0);  // it was there all the time
    EXPECT_EQ(other->Bury(LeaveAlone), 1);
}

// What its working connection waits for keeps nobody from hearing.
TEST_F(PostgresDeath, WhoComesBackDuringItsBurial_HearsAndRingsMeanwhile)
{
    auto const idle = schema.Open(PostgresOptions());
    int buried = 0;
    while (buried == 0)  // it may be back before
    {
        Terminate(*idle);
        buried = other->Bury(
            [&](Estate const&)
            {
                schema.cluster.Await("SELECT count(*) > 0 FROM pg_locks WHERE locktype = 'advisory' AND NOT "
                                     "granted AND classid = '" +
                                         schema.Name() + "'::regnamespace",
                                     "t");
                writer.Make(Job);
                auto const start = Clock::now();
                while (idle->Committed() < 1 && Clock::now() - start < 5s)
                    std::this_thread::sleep_for(1ms);
                EXPECT_EQ(idle->Committed(), 1u);
            });
    }
}

TEST_F(PostgresDeath, OfTheBurier_LeavesTheBurialToBeRepeated)
{
    auto const third = schema.Open();
    store->AddPartFile("/tmp/a");
    Terminate(*store);
    EXPECT_THROW(other->Bury([&](Estate const&) { Terminate(*other); }), StoreError);
    int files = 0;
    EXPECT_EQ(
        third->Bury([&files](Estate const& estate) { files += static_cast<int>(estate.partFiles.size()); }),
        1);
    EXPECT_EQ(files, 1);
}
