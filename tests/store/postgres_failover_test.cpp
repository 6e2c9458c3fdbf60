// Two servers of which one follows the other, as a site on several machines has them: the first breaks down,
// and the second takes its place.
#include "standin/server/store/postgres/PostgresStore.h"

#include "tests/store/PostgresSite.h"
#include "tests/store/WriterProcesses.h"
#include <gmock/gmock.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::HasSubstr;
using testing::Not;

namespace
{
class PostgresFailover : public testing::Test
{
protected:
    std::string Uri() const
    {
        return "host=" + primary.Folder().string() + "," + standby->Folder().string() +
               " user=postgres dbname=postgres";
    }

    PostgresCluster primary;
    std::unique_ptr<PostgresCluster> const standby = primary.MakeStandby();
};
}  // namespace

TEST_F(PostgresFailover, WhileManyWrite_LosesNothingAndBuriesNobody)
{
    auto options = OptionsOfWriters("comgui");
    options.settling = 2s;
    PostgresStore(Uri(), ContentOfWriters, options).Leave();
    WriterProcesses writers(2, Uri(), options);
    ASSERT_TRUE(writers.AwaitSteps(20));
    primary.Kill();
    standby->Promote();
    writers.ExpectAnswers(5s);
    std::this_thread::sleep_for(options.settling + 2s);  // so that the living could be buried
    writers.Finish();
    PostgresStore store(Uri(), NoContent, options);
    ExpectWorkOf(*writers.board, writers.Count(), store);
}

TEST_F(PostgresFailover, ToAStandbyThatIsNone_IsNamedAndFailsAtOnceUntilItIsPromoted)
{
    EXPECT_THAT(ReasonOf([&] { PostgresStore(standby->Uri(), NoContent); }), HasSubstr("is a standby"));
    auto const uri = Uri() + " password=s3cret";
    PostgresStore store(uri, NoContent);
    Writer writer(store);
    writer.Make({3, 1});
    long long const session = store.OpenSession("admin");
    primary.Kill();
    AwaitReach(store, false);
    std::string const reason = ReasonAtOnce([&] { store.Sessions(); });
    EXPECT_THAT(reason, HasSubstr(standby->Folder().string()));
    EXPECT_THAT(reason, HasSubstr("is a standby"));
    EXPECT_THAT(reason, HasSubstr("promote"));
    EXPECT_THAT(reason, Not(HasSubstr("s3cret")));
    EXPECT_THAT(reason, Not(HasSubstr("\n")));
    ReasonAtOnce([&] { store.Leave(); });
    standby->Promote();
    AwaitReach(store, true);
    EXPECT_EQ(store.Sessions().at(0).id, session);
    EXPECT_EQ(writer.Make({3, 2}).sequence, 2u);
}

// The standby has been there for long, but others have not had the time to come back to it. One that knows no
// other host never does.
TEST_F(PostgresFailover, IsNoReasonToBury_ForWhoOpensTheSiteAfterIt)
{
    PostgresOptions options = AtOnce();
    options.settling = 10s;
    PostgresStore const store(primary.Uri(), NoContent, options);
    standby->Await("SELECT clock_timestamp() - pg_postmaster_start_time() > '10 s'", "t");
    primary.Kill();
    standby->Promote();
    PostgresStore fresh(Uri(), NoContent, options);
    EXPECT_EQ(fresh.Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    EXPECT_FALSE(fresh.Programs().at(0).isAlive);
}
