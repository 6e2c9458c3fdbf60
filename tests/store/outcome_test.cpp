// How a commit is asked after whose answer was lost.
#include "standin/server/store/Outcome.h"

#include "standin/server/store/memory/MemoryStore.h"
#include "tests/store/StoreContract.h"
#include <future>
#include <gmock/gmock.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::HasSubstr;
using testing::Not;

namespace
{
constexpr TicketAddress Job{3, 1};

class AwaitedOutcome : public testing::Test
{
protected:
    void Lose(TicketChange const& change, bool isMade)
    {
        site->AnswerUnknownOnce(isMade);
        EXPECT_EQ(writer.Try(change).kind, CommitOutcome::Unknown);
    }

    std::optional<CommitOutcome> Await(std::chrono::milliseconds limit = 60s, TicketAddress changed = Job)
    {
        return AwaitOutcome(store, writer.LastNumber(), changed, limit);
    }

    std::shared_ptr<MemorySite> const site = std::make_shared<MemorySite>();
    MemoryStore store{site};
    Writer writer{store};
};
}  // namespace

TEST_F(AwaitedOutcome, IsThatOfTheCommit)
{
    Lose(Creation(Job), false);
    EXPECT_FALSE(Await());
    Lose(Creation(Job), true);
    EXPECT_EQ(Await()->sequence, 1u);
}

TEST_F(AwaitedOutcome, IsAskedForUntilTheStoreAnswers)
{
    Lose(Creation(Job), true);
    site->Fail("FindCommit", true);
    auto found = std::async(std::launch::async, [&] { return Await(); });
    EXPECT_EQ(found.wait_for(300ms), std::future_status::timeout);
    site->Fail("FindCommit", false);
    EXPECT_EQ(found.get()->sequence, 1u);
}

TEST_F(AwaitedOutcome, ThatIsNotKnownInTime_IsSaid)
{
    Lose(Creation(Job), true);
    site->Fail("FindCommit", true);
    EXPECT_THROW(Await(0ms), UnknownOutcome);
    std::string const reason = ReasonOf([&] { Await(200ms); });
    EXPECT_THAT(reason, HasSubstr("whether ticket 3/1 was changed is not known: look before you repeat"));
    EXPECT_THAT(reason, Not(HasSubstr("\n")));
    EXPECT_THAT(ReasonOf(
                    [&] {
                        Await(0ms, {3, TicketChange::NextId});
                    }),
                HasSubstr("whether a ticket of type 3 was made is not known"));
}

TEST_F(AwaitedOutcome, IsNotAskedForAgainAtTheEnd)
{
    Lose(Creation(Job), true);
    site->Fail("FindCommit", true);
    std::atomic<bool> hasEnded{false};
    auto found = std::async(std::launch::async,
                            [&] { return AwaitOutcome(store, writer.LastNumber(), Job, 60s, &hasEnded); });
    EXPECT_EQ(found.wait_for(300ms), std::future_status::timeout);
    hasEnded = true;
    EXPECT_EQ(found.wait_for(10s), std::future_status::ready);
    EXPECT_THROW(found.get(), UnknownOutcome);
    site->Fail("FindCommit", false);
    EXPECT_EQ(AwaitOutcome(store, writer.LastNumber(), Job, 60s, &hasEnded)->sequence, 1u);
}

TEST_F(AwaitedOutcome, OfAStoreThatIsOfNoMoreUse_IsSaidAtOnce)
{
    Lose(Creation(Job), true);
    store.Die();
    EXPECT_THAT(ReasonOf([&] { Await(); }),
                HasSubstr("this program has ended; open it anew; whether ticket"));
}
