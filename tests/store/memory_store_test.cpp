#include "standin/server/store/memory/MemoryStore.h"

#include "tests/store/StoreContract.h"
#include <gmock/gmock.h>

using namespace standin;
using testing::HasSubstr;

namespace
{
constexpr TicketAddress Job{3, 1};

class SiteInMemory : public StoreSite
{
public:
    explicit SiteInMemory(StoreLimits const& limits) : m_site(std::make_shared<MemorySite>(limits)) {}
    std::unique_ptr<Store> Open() override { return std::make_unique<MemoryStore>(m_site); }

private:
    std::shared_ptr<MemorySite> m_site;
};

STORE_ENGINE const Memory{"Memory", [](StoreLimits const& limits) -> std::unique_ptr<StoreSite> {
                              return std::make_unique<SiteInMemory>(limits);
                          }};

class MemorySiteTest : public testing::Test
{
protected:
    std::shared_ptr<MemorySite> site = std::make_shared<MemorySite>();
    MemoryStore store{site};
    Writer writer{store};
};
}  // namespace

INSTANTIATE_TEST_SUITE_P(Memory, StoreContract, testing::Values(Memory),
                         [](auto const& engine) { return std::string(engine.param.name); });

TEST_F(MemorySiteTest, WhatATestPutsIntoIt_IsCommittedByNobody)
{
    site->AddTicket({17, 1});
    site->Put(Job, "A", 0, Integer(PARAM_INT, 1));
    site->Put(Job, "A", 0, Integer(PARAM_INT, 2));
    site->PutUser({"admin", "$y$", 16, 1});
    EXPECT_THAT(AddressesIn(store), testing::ElementsAre(Job, TicketAddress{17, 1}));
    EXPECT_EQ(ValuesOf(store, Job).at({"A", 0}).value.integer, 2);
    EXPECT_EQ(store.FindUser("admin")->role, 16);
    for (CommittedChange const& change : FeedOf(store, 0))
        EXPECT_EQ(change.program, 0);
    EXPECT_EQ(site->Commits(), 0);
}

TEST_F(MemorySiteTest, Counters_CountLoadsAndCommits)
{
    writer.Make(Job);
    writer.Try(Creation(Job));
    ValuesOf(store, Job);
    ValuesOf(store, {9, 9});
    EXPECT_EQ(site->Commits(), 1);
    EXPECT_EQ(site->Loads(), 2);
}

TEST_F(MemorySiteTest, ToldToFail_EveryOperationThrowsAndChangesNothing)
{
    writer.Make(Job);
    site->FailAll(true);
    EXPECT_FALSE(site->HasFailed());
    EXPECT_THROW(writer.Try(DeletionOf(Job, {1, 1})), StoreError);
    EXPECT_TRUE(site->HasFailed());
    EXPECT_THROW(ValuesOf(store, Job), StoreError);
    EXPECT_THROW(store.ChangesSince(0, [](CommittedChange&&) {}), StoreError);
    EXPECT_THROW(store.FindUser("admin"), StoreError);
    EXPECT_THROW(MemoryStore{site}, StoreError);
    site->FailAll(false);
    EXPECT_EQ(writer.State(Job).revision, 1u);
}

TEST_F(MemorySiteTest, ToldToFailOnce_TheOperationThatWasNamedThrows)
{
    site->FailOperation(2);
    writer.Make(Job);
    EXPECT_FALSE(site->HasFailed());
    EXPECT_THROW(writer.Try(Creation({3, 2})), StoreError);
    EXPECT_TRUE(site->HasFailed());
    writer.Make({3, 2});
}

TEST_F(MemorySiteTest, ToldToAnswerUnknown_TheCommitHappensOrNot)
{
    site->AnswerUnknownOnce(true);
    EXPECT_EQ(writer.Try(Creation(Job)).kind, CommitOutcome::Unknown);
    EXPECT_TRUE(site->HasFailed());
    ASSERT_TRUE(store.FindCommit(writer.LastNumber()));
    EXPECT_EQ(store.FindCommit(writer.LastNumber())->sequence, 1u);

    site->AnswerUnknownOnce(false);
    EXPECT_EQ(writer.Try(Creation({3, 2})).kind, CommitOutcome::Unknown);
    EXPECT_TRUE(site->HasFailed());
    EXPECT_FALSE(store.FindCommit(writer.LastNumber()));
    EXPECT_EQ(store.Committed(), 1u);
    writer.Make({3, 2});
}

TEST_F(MemorySiteTest, Interjection_RunsBeforeTheNextCommitAndOnce)
{
    MemoryStore other(site);
    Writer otherWriter(other);
    writer.Make(Job);
    TicketState const planned = writer.State(Job);
    int runs = 0;
    site->Interject(
        [&]
        {
            ++runs;
            otherWriter.Put(Job, "A", 0, 1);
        });
    EXPECT_EQ(writer.Try(WriteTo(Job, planned)).kind, CommitOutcome::Conflict);
    EXPECT_EQ(runs, 1);
    writer.Put(Job, "A", 0, 2);
    EXPECT_EQ(runs, 1);
}

TEST_F(MemorySiteTest, DeadProgram_CanDoNothing)
{
    MemoryStore other(site);
    writer.Make(Job);
    store.Die();
    EXPECT_THROW(writer.Try(Creation({3, 2})), StoreError);
    EXPECT_EQ(other.Bury([](Estate const&) {}), 1);
}

TEST_F(MemorySiteTest, StoreUsedByAFunctionThatTakesItsValues_IsReported)
{
    site->Put(Job, "A", 0, Integer(PARAM_INT, 1));
    auto const nested = [this](auto const&...) { store.FindUser("admin"); };
    EXPECT_THROW(store.Load(Job, nested), std::logic_error);
    EXPECT_THROW(store.Tickets(nested), std::logic_error);
    EXPECT_FALSE(store.FindUser("admin"));
}
