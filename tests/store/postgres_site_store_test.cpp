// What a PostgreSQL store has beside what every lasting store has, for who opens it as a site and for tools.
#include "standin/server/store/postgres/PostgresReplacement.h"

#include "tests/store/PostgresSite.h"
#include "tests/store/SiteStoreContract.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/NetworkProxy.h"
#include <atomic>
#include <future>
#include <gmock/gmock.h>
#include <unistd.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::ContainsRegex;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using Old = PostgresReplacement::Old;

namespace
{
class SiteInASchema : public LastingSite
{
public:
    std::unique_ptr<SiteStore> Open(bool keepOpening) override
    {
        PostgresOptions options;
        options.keepOpening = keepOpening;
        return m_schema.Open(options);
    }

private:
    PostgresSchema m_schema;
};

std::unique_ptr<LastingSite> MakeSite() { return std::make_unique<SiteInASchema>(); }

using PostgresOpening = PostgresSite;
using PostgresFolder = PostgresSite;

class PostgresUsers : public PostgresSite
{
protected:
    // Ends the connection of who has the turn to change users.
    std::string TerminateTurn() const
    {
        return schema.cluster.Run(
            "SELECT pg_terminate_backend(pid, 60000) FROM pg_locks WHERE locktype = "
            "'advisory' AND granted AND objsubid = 2 AND objid = 2147483648 AND classid "
            "= '" +
            schema.Name() + "'::regnamespace");
    }
};

class PostgresCheck : public PostgresSite
{
protected:
    PostgresCheck() { writer.Put(Job, "Key", 0, 1); }

    std::vector<std::string> Problems() const { return store->Check({}); }

    std::unique_ptr<PostgresStore> const store =
        schema.OpenAs(schema.cluster.Uri(), [] { return OneTicket(Job, "Text", 1); }, {});
    Writer writer{*store};
};

class PostgresReplacing : public PostgresSite
{
protected:
    PostgresReplacing() { options.schema = schema.Name(); }
    ~PostgresReplacing() override
    {
        std::string const aside =
            schema.cluster.Run("SELECT string_agg(nspname, ', ') FROM pg_namespace WHERE nspname LIKE '" +
                               schema.Name() + "\\_%'");
        if (!aside.empty())
            schema.cluster.Run("DROP SCHEMA " + aside + " CASCADE");
    }

    std::unique_ptr<PostgresReplacement> Begin(Old old) const { return Begin(old, schema.cluster.Uri()); }
    std::unique_ptr<PostgresReplacement> Begin(Old old, std::string const& uri) const
    {
        auto replacement = std::make_unique<PostgresReplacement>(uri, old, options);
        Writer(replacement->Store()).Do(Creation(Job).Put("Key", 0, 2));
        return replacement;
    }
    std::string ReasonOfBeginning(Old old) const
    {
        return ReasonOf([&] { Begin(old); });
    }
    void MakeSiteWith(int value) const
    {
        schema.OpenAs(schema.cluster.Uri(), [=] { return OneTicket(Job, "Key", value); }, {})->Leave();
    }
    int Value() const
    {
        auto const store = schema.Open();
        StoreValues const values = ValuesOf(*store, Job);
        store->Leave();
        return values.empty() ? -1 : static_cast<int>(values.begin()->second.value.integer);
    }
    bool HasLeftovers() const
    {
        return schema.cluster.Run("SELECT count(*) FROM pg_namespace WHERE nspname = '" + schema.Name() +
                                  "_new'") != "0";
    }

    PostgresOptions options;
};

class PostgresReplacingOverANetwork : public PostgresReplacing
{
protected:
    PostgresReplacingOverANetwork()
    {
        MakeSiteWith(1);
        proxy.Start();
        options.connectLimit = options.statementLimit = options.openingLimit = 3s;
        replacement = Begin(Old::SetAside, "host=127.0.0.1 port=" + proxy.Port() + " user=postgres");
    }

    // Returns when the server works on the last step, which waits for the obstacle's end.
    std::future<std::string> FinishUpToTheLastStep()
    {
        obstacle.Run("BEGIN");
        obstacle.Run("SELECT FROM " + schema.Name() + "_new.site FOR UPDATE");
        auto finishing = std::async(std::launch::async, [this] { return replacement->Finish(); });
        schema.cluster.Await("SELECT count(*) FROM " + Waiting(), "1");
        return finishing;
    }

    std::string Waiting() const
    {
        return "pg_stat_activity WHERE wait_event_type = 'Lock' AND query LIKE '%UPDATE \"" + schema.Name() +
               "%'";
    }

    NetworkProxy proxy{schema.cluster.Folder() / ".s.PGSQL.5432"};
    SqlSession const obstacle{schema.cluster.Uri()};
    std::unique_ptr<PostgresReplacement> replacement;
};
}  // namespace

INSTANTIATE_TEST_SUITE_P(Postgres, SiteStoreContract, testing::Values(LASTING_ENGINE{"Schema", MakeSite}),
                         testing::PrintToStringParamName());

TEST_F(PostgresOpening, ThatIsKept_EndsWithTheConnection_AndIsNotTakenFromTheNext)
{
    PostgresOptions keeping;
    keeping.keepOpening = true;
    auto const first = schema.Open(keeping);
    ASSERT_TRUE(Terminate(*first));
    EXPECT_FALSE(first->KeepsOpening());
    auto const second = schema.Open(keeping);
    EXPECT_FALSE(first->KeepsOpening());
    first->EndOpening();
    auto third = std::async(std::launch::async, [this] { return schema.Open(); });
    EXPECT_EQ(third.wait_for(100ms), std::future_status::timeout);
    second->EndOpening();
    EXPECT_NE(third.get(), nullptr);
}

// The threads of a handle may be at work while what it begins with fails.
TEST_F(PostgresOpening, ThatBreaksAtAnyInstant_FailsInOrder)
{
    schema.Open()->Leave();
    std::atomic<bool> isOver{false};
    auto const breaking =
        std::async(std::launch::async,
                   [&]
                   {
                       SqlSession const vandal(schema.cluster.Uri());
                       std::string const lives = "(SELECT DISTINCT pid FROM " + schema.Name() + ".living) l";
                       while (!isOver)
                           vandal.Run("SELECT count(pg_terminate_backend(l.pid)) FROM " + lives);
                   });
    PostgresOptions options;
    options.pulse = 1ms;
    int failed = 0;
    for (auto const end = std::chrono::steady_clock::now() + 20s;
         failed < 5 && std::chrono::steady_clock::now() < end;)
        failed += ReasonOf([&] { schema.Open(options); }).empty() ? 0 : 1;
    isOver = true;
    breaking.wait();
    EXPECT_EQ(failed, 5);
    EXPECT_NO_THROW(schema.Open()->Leave());
}

TEST_F(PostgresOpening, ThatOthersKeepTooLong_IsGivenUp)
{
    PostgresOptions keeping;
    keeping.keepOpening = true;
    auto const first = schema.Open(keeping);
    PostgresOptions impatient;
    impatient.openingLimit = 200ms;
    EXPECT_THAT(
        ReasonOf([&] { schema.Open(impatient); }),
        HasSubstr("another program has been opening the site all the time; end that, then try again"));
}

TEST_F(PostgresOpening, WaitsForAReplacementLongerThanForAnAnswer)
{
    schema.Open()->Leave();
    SqlSession const replacing(schema.cluster.Uri());
    std::string const lock = "(hashtextextended('comgui " + schema.Name() + "', 0))";
    replacing.Run("SELECT pg_advisory_lock" + lock);
    PostgresOptions options;
    options.statementLimit = 500ms;
    PostgresOptions impatient = options;
    impatient.openingLimit = 200ms;
    auto patient = std::async(std::launch::async, [&] { return schema.Open(options); });
    EXPECT_EQ(patient.wait_for(1s), std::future_status::timeout);
    EXPECT_THAT(ReasonOf([&] { schema.Open(impatient); }),
                HasSubstr("another program is opening or replacing the site; wait until that is done"));
    replacing.Run("SELECT pg_advisory_unlock" + lock);
    EXPECT_NE(patient.get(), nullptr);
}

TEST_F(PostgresFolder, NumberOfTheSite_IsTheSameForAll_AndNoOthers)
{
    auto const store = schema.Open();
    auto const other = schema.Open();
    PostgresSchema const elsewhere;
    EXPECT_EQ(store->SiteNumber().size(), 36u);
    EXPECT_EQ(other->SiteNumber(), store->SiteNumber());
    EXPECT_NE(elsewhere.Open()->SiteNumber(), store->SiteNumber());
}

TEST_F(PostgresFolder, IsThereOnceSomebodyHasSaidSo)
{
    auto const store = schema.Open();
    EXPECT_FALSE(store->HasFolder());
    store->NoteFolder();
    EXPECT_TRUE(store->HasFolder());
    EXPECT_TRUE(schema.Open()->HasFolder());
}

TEST_F(PostgresCheck, FindsWhatSomebodyHasEditedByHand)
{
    EXPECT_THAT(Problems(), IsEmpty());
    schema.Run("INSERT INTO S.ticket VALUES (3, 5, 9, 8, 77)");
    schema.Run("INSERT INTO S.parameter VALUES (3, 9, 'Key', -4, 999, 0, NULL)");
    schema.Run("UPDATE S.journal SET sequence = 12, record = 'nonsense'");
    EXPECT_THAT(Problems(),
                ElementsAre("ticket 3/5: made by change 9 and changed by 8, which cannot be",
                            "ticket 3/5: belongs to a program that nobody knows",
                            "ticket 3/9: a value does not fit its type 999",
                            "ticket 3/9: a value at position -4", "ticket 3/9: has values but is no ticket",
                            "journal: record 12 where 2 is due", HasSubstr("journal: record 12: ")));
}

// To count the rows of a large site may take longer than a statement may otherwise.
TEST_F(PostgresCheck, TakesTheTimeThatItTakes)
{
    PostgresOptions impatient;
    impatient.statementLimit = 200ms;
    auto const handle = schema.Open(impatient);
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("BEGIN");
    obstacle.Run("LOCK TABLE " + schema.Name() + ".parameter");
    auto problems = std::async(std::launch::async, [&] { return handle->Check({}); });
    auto sizes = std::async(std::launch::async, [&] { return handle->Measure(); });
    auto content = std::async(std::launch::async,
                              [&] { handle->ReadContent([](TicketChange&&) {}, [](User&&) {}, {}); });
    obstacle.Run("SELECT pg_sleep(1)");
    obstacle.Run("ROLLBACK");
    EXPECT_THAT(problems.get(), IsEmpty());
    EXPECT_EQ(sizes.get().tickets, 1);
    EXPECT_NO_THROW(content.get());
}

TEST_F(PostgresCheck, ListsAHundredProblemsAtMost)
{
    schema.Run("INSERT INTO S.parameter SELECT 3, 9, 'Key', n, 999, 0, NULL FROM generate_series(0, 300) n");
    EXPECT_EQ(Problems().size(), 100u);
}

TEST_F(PostgresReplacing, ASiteThatIsThere_IsRefusedUnlessItMayBeSetAside)
{
    MakeSiteWith(1);
    EXPECT_THAT(ReasonOfBeginning(Old::Forbidden),
                HasSubstr("there is a site already; name another database"));
    EXPECT_EQ(ReasonOfBeginning(Old::SetAside), "");
    EXPECT_EQ(Value(), 1);
}

TEST_F(PostgresReplacing, Finished_IsTheSite)
{
    auto const replacement = Begin(Old::Forbidden);
    replacement->Store().PutUser({"anna", "$y$", 16, 1});
    EXPECT_EQ(replacement->Finish(), "");
    EXPECT_FALSE(HasLeftovers());
    EXPECT_EQ(Value(), 2);
    EXPECT_TRUE(schema.Open()->FindUser("anna"));
}

TEST_F(PostgresReplacing, Finished_SetsTheOldOneAsideAndHasItsNumberAndFolder)
{
    MakeSiteWith(1);
    std::string number;
    {
        auto const store = schema.Open();
        store->NoteFolder();
        number = store->SiteNumber();
        store->Leave();
    }
    auto const replacement = Begin(Old::SetAside);
    std::string const aside = replacement->Finish();
    EXPECT_THAT(aside, ContainsRegex("^" + schema.Name() + "_replaced_[0-9]{8}_[0-9]{6}_[0-9]{6}$"));
    EXPECT_EQ(Value(), 2);
    EXPECT_EQ(schema.cluster.Run("SELECT number FROM " + aside + ".parameter"), "1");
    auto const store = schema.Open();
    EXPECT_EQ(store->SiteNumber(), number);
    EXPECT_TRUE(store->HasFolder());
}

TEST_F(PostgresReplacing, Finished_LetsInWhoWasLetInBefore_AndGivesNobodyMore)
{
    MakeSiteWith(1);
    std::string const name = schema.Name();
    schema.Run("CREATE ROLE presser LOGIN");
    schema.Run("CREATE ROLE shop");
    schema.Run("GRANT USAGE ON SCHEMA " + name + " TO presser");
    schema.Run("GRANT SELECT, INSERT, UPDATE, DELETE ON ALL TABLES IN SCHEMA " + name + " TO presser");
    schema.Run("REVOKE DELETE ON S.account FROM presser");
    schema.Run("REVOKE EXECUTE ON FUNCTION S.leave_site FROM public");
    schema.Run("ALTER TABLE S.era OWNER TO shop");
    ASSERT_EQ(ReasonOfOpeningAs(schema.cluster.Uri("presser")), "");
    EXPECT_NE(Begin(Old::SetAside)->Finish(), "");
    EXPECT_EQ(ReasonOfOpeningAs(schema.cluster.Uri("presser")), "");
    EXPECT_EQ(schema.Run("SELECT has_table_privilege('presser', 'S.account', 'DELETE')"), "f");
    EXPECT_EQ(schema.Run("SELECT has_function_privilege('presser', 'S.leave_site(bigint)', 'EXECUTE')"), "f");
    EXPECT_EQ(schema.Run("SELECT relowner::regrole FROM pg_class WHERE oid = 'S.era'::regclass"), "shop");
    EXPECT_EQ(Value(), 2);
}

TEST_F(PostgresReplacing, NotFinished_LeavesTheOldOneAndNothingElse)
{
    MakeSiteWith(1);
    Begin(Old::SetAside);
    EXPECT_FALSE(HasLeftovers());
    EXPECT_EQ(Value(), 1);
}

TEST_F(PostgresReplacing, AfterAKill_BeginsAnew)
{
    ChildProcess killed(
        [this](ChildProcess::Report const& report)
        {
            auto const begun = Begin(Old::Forbidden);
            report(1);
            sleep(60);
        });
    ASSERT_EQ(killed.Next(), 1);
    killed.Kill();
    ASSERT_TRUE(HasLeftovers());
    auto const replacement = Begin(Old::Forbidden);
    replacement->Finish();
    EXPECT_EQ(Value(), 2);
}

// As any owner of the database may have made one.
TEST_F(PostgresReplacing, WhoseSchemaHasTheNameOfAnothers_IsRefusedAndLeavesThat)
{
    schema.cluster.Run("CREATE SCHEMA " + schema.Name() + "_new");
    schema.cluster.Run("CREATE TABLE " + schema.Name() + "_new.site (rest integer)");
    EXPECT_THAT(ReasonOfBeginning(Old::Forbidden),
                HasSubstr("its schema " + schema.Name() + "_new belongs to another program"));
    EXPECT_EQ(schema.cluster.Run("SELECT count(*) FROM " + schema.Name() + "_new.site"), "0");
}

// By it the next one would take the site itself for what a kill has left.
TEST_F(PostgresReplacing, Finished_BearsNoMark)
{
    Begin(Old::Forbidden)->Finish();
    EXPECT_EQ(schema.Run("SELECT obj_description('" + schema.Name() + "'::regnamespace, 'pg_namespace')"),
              "");
}

TEST_F(PostgresReplacing, OfASiteThatIsOpen_IsRefusedWithTheNameOfWhoHasIt)
{
    MakeSiteWith(1);
    auto const open = schema.Open();
    EXPECT_THAT(ReasonOfBeginning(Old::SetAside),
                ContainsRegex("in use by [^ ]*postgres_store[^ ]* \\(process " + std::to_string(getpid()) +
                              " on [^)]+\\); end what has it open, then try again"));
}

TEST_F(PostgresReplacing, KeepsOthersFromOpening)
{
    MakeSiteWith(1);
    auto replacement = Begin(Old::SetAside);
    EXPECT_THAT(ReasonOfBeginning(Old::SetAside),
                HasSubstr("another program is opening or replacing the site"));
    auto opening = std::async(std::launch::async, [this] { return Value(); });
    EXPECT_EQ(opening.wait_for(200ms), std::future_status::timeout);
    replacement->Finish();
    replacement.reset();
    EXPECT_EQ(opening.get(), 2);
}

// As an owner prepares one who lets the program make no schema of its own.
TEST_F(PostgresReplacing, OfAnEmptySchema_FillsThatAndKeepsItsRights)
{
    schema.Run("CREATE SCHEMA " + schema.Name());
    schema.Run("GRANT USAGE ON SCHEMA " + schema.Name() + " TO pg_monitor");
    EXPECT_EQ(Begin(Old::Forbidden)->Finish(), "");
    EXPECT_FALSE(HasLeftovers());
    EXPECT_EQ(Value(), 2);
    EXPECT_EQ(schema.Run("SELECT has_schema_privilege('pg_monitor', '" + schema.Name() + "', 'USAGE')"), "t");
}

TEST_F(PostgresReplacing, ThatFailsInItsLastStep_LeavesNothing)
{
    {
        auto const replacement = Begin(Old::Forbidden);
        schema.Run("CREATE SCHEMA " + schema.Name());
        EXPECT_THAT(ReasonOf([&] { replacement->Finish(); }), HasSubstr("already exists"));
    }
    EXPECT_FALSE(HasLeftovers());
}

TEST_F(PostgresReplacing, OfASiteThatSeveralHaveOpen_NamesThemAll)
{
    MakeSiteWith(1);
    auto const one = schema.Open();
    auto const another = schema.Open();
    std::string const who =
        "[^ ]*postgres_store[^ ]* \\(process " + std::to_string(getpid()) + " on [^)]+\\)";
    EXPECT_THAT(ReasonOfBeginning(Old::SetAside), ContainsRegex("in use by " + who + ", " + who + "; end"));
}

TEST_F(PostgresReplacingOverANetwork, ThatLosesTheAnswerToItsLastStep_AsksWhetherItIsDone)
{
    auto finishing = FinishUpToTheLastStep();
    proxy.Lose(NetworkProxy::ToClient);
    obstacle.Run("COMMIT");
    schema.cluster.Await("SELECT count(*) FROM pg_namespace WHERE nspname = '" + schema.Name() + "_new'",
                         "0");
    proxy.CloseAll();
    proxy.Lose(NetworkProxy::None);
    EXPECT_THAT(finishing.get(), HasSubstr("_replaced_"));
    EXPECT_EQ(Value(), 2);
}

TEST_F(PostgresReplacingOverANetwork, ThatBreaksInItsLastStep_LeavesTheOldOneAndNothingElse)
{
    auto finishing = FinishUpToTheLastStep();
    schema.cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM " + Waiting());
    EXPECT_THAT(ReasonOf([&] { finishing.get(); }), HasSubstr("terminating connection"));
    obstacle.Run("COMMIT");
    replacement.reset();
    EXPECT_FALSE(HasLeftovers());
    EXPECT_EQ(Value(), 1);
}

TEST_F(PostgresReplacingOverANetwork, ThatIsLostInItsLastStep_SaysThatNobodyKnows)
{
    auto finishing = FinishUpToTheLastStep();
    proxy.Lose(NetworkProxy::Both);
    EXPECT_THROW(finishing.get(), UnknownReplacement);
    schema.cluster.Run("SELECT pg_terminate_backend(pid, 60000) FROM " + Waiting());
    obstacle.Run("COMMIT");
    proxy.CloseAll();
    proxy.Lose(NetworkProxy::None);
    replacement.reset();
    EXPECT_FALSE(HasLeftovers());
    EXPECT_EQ(Value(), 1);
}

TEST_F(PostgresReplacingOverANetwork, ThatBreaksBeforeItsLastStep_LeavesTheOldOneAndNothingElse)
{
    proxy.CloseAll();
    EXPECT_NE(ReasonOf([&] { replacement->Finish(); }), "");
    ASSERT_TRUE(HasLeftovers());
    replacement.reset();
    EXPECT_FALSE(HasLeftovers());
    EXPECT_EQ(Value(), 1);
}

// What it finds is not its own any more.
TEST_F(PostgresReplacingOverANetwork, ThatBreaks_LeavesWhatAnotherHasBegunSince)
{
    proxy.CloseAll();
    auto const next = Begin(Old::SetAside);
    replacement.reset();
    EXPECT_TRUE(HasLeftovers());
    next->Finish();
    EXPECT_EQ(Value(), 2);
}

// --- users

TEST_F(PostgresUsers, TurnThatIsFree_NeedsNoPatience)
{
    auto const store = schema.Open();
    EXPECT_NE(store->TakeUsersTurn(0ms), nullptr);
}

// Others may have taken it meanwhile and looked at the users as they were, or changed them.
TEST_F(PostgresUsers, TurnThatEndsWithItsConnection_LetsNothingBeChangedUnderIt)
{
    auto const store = schema.Open();
    auto const other = schema.Open();
    store->PutUser({"anna", "$y$", 16, 1});
    store->PutUser({"bob", "$y$", 16, 2});
    auto turn = store->TakeUsersTurn(10s);
    ASSERT_NE(turn, nullptr);
    store->PutUser({"carl", "$y$", 1, 3});
    ASSERT_EQ(TerminateTurn(), "t");
    auto const next = other->TakeUsersTurn(10s);
    ASSERT_NE(next, nullptr);
    EXPECT_TRUE(other->RemoveUser("bob"));
    EXPECT_THAT(ReasonOf([&] { store->RemoveUser("anna"); }), HasSubstr("the turn to change users"));
    EXPECT_THROW(store->PutUser({"dora", "$y$", 1, 4}), StoreError);
    EXPECT_EQ(other->Users().size(), 2u);
    turn.reset();
    EXPECT_TRUE(store->RemoveUser("carl"));
}

TEST_F(PostgresUsers, ChangeWhoseTurnBreaksUnderIt_IsAnUnknownOutcomeAndNotRepeated)
{
    auto const store = schema.Open();
    store->PutUser({"anna", "$y$", 16, 1});
    auto const turn = store->TakeUsersTurn(10s);
    SqlSession const obstacle(schema.cluster.Uri());
    obstacle.Run("BEGIN");
    obstacle.Run("LOCK TABLE " + schema.Name() + ".account IN EXCLUSIVE MODE");
    auto removing = std::async(std::launch::async, [&] { store->RemoveUser("anna"); });
    schema.cluster.Await("SELECT count(*) FROM pg_locks WHERE NOT granted AND relation = '" + schema.Name() +
                             ".account'::regclass",
                         "1");
    EXPECT_EQ(TerminateTurn(), "t");
    obstacle.Run("COMMIT");
    EXPECT_THROW(removing.get(), UnknownOutcome);
    EXPECT_TRUE(store->FindUser("anna"));
}
