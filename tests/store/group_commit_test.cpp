#include "standin/server/store/sqlite/GroupCommit.h"

#include <atomic>
#include <future>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <thread>

using namespace standin;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
// A store that only counts: of the numbers of the changes, 13 cannot be made, and from 1000 on they conflict.
class GroupCommitTest : public testing::Test
{
protected:
    CommitOutcome Commit(std::uint64_t number) { return group.Commit(change, number); }
    std::future<CommitOutcome> CommitInAThread(std::uint64_t number)
    {
        return std::async(std::launch::async, [this, number] { return Commit(number); });
    }

    void Make(GroupCommit::Group changes)
    {
        if (isFirst.exchange(false))
        {
            begun.set_value();
            gate.get_future().wait();
        }
        for (PendingChange const* const pending : changes)
            if (pending->number == 13)
                throw StoreError("13 cannot be made");
        std::vector<std::uint64_t> numbers;
        for (PendingChange* const pending : changes)
        {
            bool const isConflict = pending->number >= 1000;
            pending->outcome.kind = isConflict ? CommitOutcome::Conflict : CommitOutcome::Committed;
            pending->outcome.sequence = isConflict ? last : ++last;
            numbers.push_back(pending->number);
        }
        made.push_back(numbers);
    }
    void Flush(Sequence sequence)
    {
        flushed.push_back(sequence);
        if (failsToFlush)
            throw StoreError("told to fail");
    }

    // Commits that one, and the others while it is being made.
    std::vector<std::future<CommitOutcome>> CommitBehind(std::uint64_t first,
                                                         std::vector<std::uint64_t> const& others)
    {
        isFirst = true;
        std::vector<std::future<CommitOutcome>> outcomes;
        outcomes.push_back(CommitInAThread(first));
        begun.get_future().wait();
        for (std::uint64_t const number : others)
            outcomes.push_back(CommitInAThread(number));
        std::this_thread::sleep_for(std::chrono::milliseconds(100));  // until they wait
        gate.set_value();
        return outcomes;
    }

    TicketChange change;
    std::atomic<bool> isFirst{false};
    std::promise<void> begun, gate;
    Sequence last = 0;
    bool failsToFlush = false;
    std::vector<std::vector<std::uint64_t>> made;
    std::vector<Sequence> flushed;
    GroupCommit group{[this](GroupCommit::Group changes) { Make(changes); },
                      [this](Sequence sequence) { Flush(sequence); }};
};
}  // namespace

TEST_F(GroupCommitTest, AloneChange_IsMadeAndFlushed)
{
    EXPECT_EQ(Commit(1).sequence, 1u);
    EXPECT_EQ(Commit(2).sequence, 2u);
    EXPECT_THAT(made, ElementsAre(ElementsAre(1u), ElementsAre(2u)));
    EXPECT_THAT(flushed, ElementsAre(1u, 2u));
}

TEST_F(GroupCommitTest, ThoseThatComeMeanwhile_GoTogether)
{
    auto outcomes = CommitBehind(1, {2, 3, 4, 5});
    for (auto& outcome : outcomes)
        EXPECT_EQ(outcome.get().kind, CommitOutcome::Committed);
    ASSERT_EQ(made.size(), 2u);
    EXPECT_THAT(made[1], testing::UnorderedElementsAre(2u, 3u, 4u, 5u));
    EXPECT_THAT(flushed, ElementsAre(1u, 5u));
    EXPECT_EQ(Commit(6).sequence, 6u);  // who comes alone afterwards waits for nobody in vain
}

TEST_F(GroupCommitTest, OneThatCannotBeMade_KeepsNobodyElse)
{
    auto outcomes = CommitBehind(1, {2, 13, 4});
    EXPECT_EQ(outcomes[1].get().kind, CommitOutcome::Committed);
    EXPECT_THROW(outcomes[2].get(), StoreError);
    EXPECT_EQ(outcomes[3].get().kind, CommitOutcome::Committed);
    EXPECT_EQ(made.size(), 3u);  // each by itself
    EXPECT_THAT(flushed, ElementsAre(1u, 3u));
}

TEST_F(GroupCommitTest, AConflict_IsAnsweredAsSuch)
{
    auto outcomes = CommitBehind(1, {2, 1000});
    EXPECT_EQ(outcomes[1].get().kind, CommitOutcome::Committed);
    EXPECT_EQ(outcomes[2].get().kind, CommitOutcome::Conflict);
    EXPECT_THAT(flushed, ElementsAre(1u, 2u));
}

TEST_F(GroupCommitTest, NothingMade_NeedsNoFlush)
{
    EXPECT_EQ(Commit(1000).kind, CommitOutcome::Conflict);
    EXPECT_THROW(Commit(13), StoreError);
    EXPECT_THAT(flushed, IsEmpty());
}

TEST_F(GroupCommitTest, FlushThatFails_LeavesWhatWasMadeUnknown)
{
    failsToFlush = true;
    auto outcomes = CommitBehind(1, {2, 1000});
    EXPECT_EQ(outcomes[0].get().kind, CommitOutcome::Unknown);
    EXPECT_EQ(outcomes[1].get().kind, CommitOutcome::Unknown);
    EXPECT_EQ(outcomes[2].get().kind, CommitOutcome::Conflict);
    failsToFlush = false;
    EXPECT_EQ(Commit(3).kind, CommitOutcome::Committed);
}
