// How often the SQLite store waits for the disk, and what it answers when the disk fails. The system's
// functions are replaced by ones that count, and fail when they are told to.
#include "tests/store/SqliteSite.h"
#include <atomic>
#include <cerrno>
#include <future>
#include <gmock/gmock.h>
#include <mutex>
#include <sys/syscall.h>
#include <thread>
#include <unistd.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::AnyOf;
using testing::HasSubstr;

namespace
{
std::atomic<int> begun{0};    // flushes
std::atomic<int> flushes{0};  // that are over
std::atomic<bool> fails{false};
std::atomic<bool> failsOnce{false};
std::mutex gate;  // held: flushes wait

int Flushed(long call, int file)
{
    ++begun;
    std::lock_guard const lock(gate);
    ++flushes;
    if (fails || failsOnce.exchange(false))
    {
        errno = EIO;
        return -1;
    }
    return static_cast<int>(syscall(call, file));
}
}  // namespace

extern "C" __attribute__((visibility("default"))) int fdatasync(int file)
{
    return Flushed(SYS_fdatasync, file);
}
extern "C" __attribute__((visibility("default"))) int fsync(int file) { return Flushed(SYS_fsync, file); }

namespace
{
class SqliteFlush : public SqliteSite
{
protected:
    SqliteFlush()
    {
        full.durability = Durability::Full;
        {
            auto const first = Open();
            Writer(*first).Make(Job);  // the journal's header is flushed with its first change
        }
    }
    ~SqliteFlush() override { fails = false; }

    static int FlushesOf(std::function<void()> const& action)
    {
        int const before = flushes;
        action();
        return flushes - before;
    }

    SqliteOptions full;
};
}  // namespace

TEST_F(SqliteFlush, WithoutNeed_NothingWaitsForTheDisk)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    EXPECT_EQ(FlushesOf(
                  [&]
                  {
                      for (int i = 0; i < 20; ++i)
                          writer.Put(Job, "A", 0, i);
                      store->PutUser({"admin", "", 0, 0});
                  }),
              0);
}

TEST_F(SqliteFlush, FullDurability_FlushesEveryCommitOfOneThread)
{
    auto const store = Open(full);
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    EXPECT_EQ(FlushesOf(
                  [&]
                  {
                      for (int i = 0; i < 20; ++i)
                          writer.Put(Job, "A", 0, i);
                  }),
              20);
    EXPECT_EQ(FlushesOf([&] { store->PutUser({"admin", "", 0, 0}); }), 1);
    EXPECT_EQ(FlushesOf([&] { store->RemoveUser("admin"); }), 1);
    EXPECT_EQ(FlushesOf([&] { store->RemoveUser("admin"); }), 0);
    EXPECT_EQ(FlushesOf([&] { writer.Try(Creation(Job)); }), 0);
}

TEST_F(SqliteFlush, Sync_FlushesWhatWasCommittedWithout)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    EXPECT_GE(FlushesOf([&] { store->Sync(); }), 1);
    writer.Put(Job, "A", 0, 2);
    EXPECT_EQ(FlushesOf([&] { store->Sync(); }), 1);
}

// What comes while a flush runs is perhaps not among what that takes along: it needs the next one.
TEST_F(SqliteFlush, ThatRunsAlready_DoesNotCount)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    store->Sync();
    int const needed = FlushesOf(
        [&]
        {
            std::unique_lock closed(gate);
            int const before = begun;
            std::thread first([&] { store->Sync(); });
            while (begun == before)
                std::this_thread::yield();
            writer.Put(Job, "A", 0, 2);
            std::thread second([&] { store->Sync(); });
            std::this_thread::sleep_for(20ms);  // who counts the first flush waits for it by then
            closed.unlock();
            first.join();
            second.join();
        });
    EXPECT_EQ(needed, 2);
}

// While one flush runs, seven threads commit; they share the next one.
TEST_F(SqliteFlush, ThreadsThatWaitAtTheSameTime_ShareAFlush)
{
    constexpr int Threads = 8;
    auto const store = Open(full);
    Writer(*store).Put(Job, "A", 0, 1);
    std::vector<std::thread> threads;
    int const shared = FlushesOf(
        [&]
        {
            std::unique_lock closed(gate);
            int const before = begun;
            for (int i = 0; i < Threads; ++i)
                threads.emplace_back(
                    [&store, i]
                    {
                        EXPECT_EQ(store->Commit(Creation({5, i}), static_cast<std::uint64_t>(100 + i)).kind,
                                  CommitOutcome::Committed);
                    });
            while (begun == before)
                std::this_thread::yield();
            std::this_thread::sleep_for(200ms);  // until all wait; who is later costs a flush more
            closed.unlock();
            for (std::thread& thread : threads)
                thread.join();
        });
    EXPECT_GE(shared, 1);
    EXPECT_LE(shared, Threads / 2);
}

// What one program could not flush another one has: nobody needs to do it again.
TEST_F(SqliteFlush, OfAnotherProgram_CountsToo)
{
    auto const store = Open(full);
    auto const other = Open(full);
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    other->Sync();
    fails = true;
    EXPECT_EQ(writer.Try(Creation({5, 1})).kind, CommitOutcome::Unknown);
    fails = false;
    EXPECT_GE(FlushesOf([&] { other->Sync(); }), 1);
    EXPECT_EQ(FlushesOf([&] { EXPECT_TRUE(store->FindCommit(writer.LastNumber())); }), 0);
}

// The system reports what it could not write only once, so the next flush that succeeds proves nothing.
TEST_F(SqliteFlush, AfterOneThatFailed_IsTrustedOnlyWhenTheJournalIsInTheDatabase)
{
    auto const store = Open(full);
    auto const other = Open(full);
    Writer writer(*store);
    auto const journal = [this] { return std::filesystem::file_size(folder / "site.db-wal"); };
    for (auto const& next : {store.get(), other.get()})  // whichever program comes to flush next
    {
        writer.Put(Job, "A", 0, 1);
        fails = true;
        EXPECT_EQ(writer.Try(Creation({5, next == other.get()})).kind, CommitOutcome::Unknown);
        EXPECT_EQ(writer.Try(Creation({6, next == other.get()})).kind, CommitOutcome::Unknown);
        fails = false;
        EXPECT_GT(journal(), 0u);
        next->Sync();
        EXPECT_EQ(journal(), 0u);
        EXPECT_EQ(FlushesOf([&] { writer.Put(Job, "A", 0, 2); }), 2);  // of the new journal's header, too
        EXPECT_GT(journal(), 0u);
        EXPECT_EQ(FlushesOf([&] { writer.Put(Job, "A", 0, 3); }), 1);
    }
}

TEST_F(SqliteFlush, AfterOneThatFailed_ADatabaseThatFailsTooIsNoMending)
{
    auto const store = Open(full);
    Writer writer(*store);
    fails = true;
    EXPECT_EQ(writer.Try(Creation({5, 1})).kind, CommitOutcome::Unknown);
    for (int i = 0; i < 3; ++i)
        EXPECT_THAT(ReasonOf([&] { store->Sync(); }), HasSubstr("cannot be flushed"));
    fails = false;
    store->Sync();
    EXPECT_TRUE(store->FindCommit(writer.LastNumber()));
}

// A disk that fails once, as most do: the change is safe by another way.
TEST_F(SqliteFlush, ThatFailsOnce_IsMadeUpForAtOnce)
{
    auto const store = Open(full);
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    failsOnce = true;
    EXPECT_EQ(writer.Try(Creation({5, 1})).kind, CommitOutcome::Committed);
    EXPECT_FALSE(failsOnce);
    EXPECT_EQ(std::filesystem::file_size(folder / "site.db-wal"), 0u);
}

TEST_F(SqliteFlush, OnItsWay_IsWaitedForByWhoLeaves)
{
    auto const store = Open(full);
    Writer(*store).Put(Job, "A", 0, 1);
    std::unique_lock closed(gate);
    int const before = begun;
    std::vector<std::future<std::string>> syncs;
    for (int i = 0; i < 3; ++i)
        syncs.push_back(std::async(std::launch::async, [&] { return ReasonOf([&] { store->Sync(); }); }));
    while (begun == before)
        std::this_thread::yield();
    auto left = std::async(std::launch::async, [&] { store->Leave(); });
    EXPECT_EQ(left.wait_for(50ms), std::future_status::timeout);
    closed.unlock();
    left.get();
    for (auto& sync : syncs)
        EXPECT_THAT(sync.get(), AnyOf("", HasSubstr("has been left")));
}

TEST_F(SqliteFlush, ThatFails_LeavesTheAnswerUnknown)
{
    auto const store = Open(full);
    Writer writer(*store);
    writer.Put(Job, "A", 0, 1);
    fails = true;
    EXPECT_EQ(writer.Try(Creation({5, 1})).kind, CommitOutcome::Unknown);
    EXPECT_THAT(ReasonOf([&] { store->FindCommit(writer.LastNumber()); }), HasSubstr("cannot be flushed"));
    EXPECT_THAT(ReasonOf([&] { store->Sync(); }), HasSubstr("cannot be flushed"));
    fails = false;
    auto const found = store->FindCommit(writer.LastNumber());
    ASSERT_TRUE(found);
    EXPECT_EQ(found->address, (TicketAddress{5, 1}));
    EXPECT_EQ(writer.Make({5, 2}).sequence, found->sequence + 1);
}

// One flush that fails fails for all who waited for it.
TEST_F(SqliteFlush, ThatFails_FailsForAllWhoWaited)
{
    auto const store = Open(full);
    Writer(*store).Put(Job, "A", 0, 1);
    std::atomic<int> unknown{0};
    std::vector<std::thread> threads;
    {
        std::unique_lock const closed(gate);
        fails = true;
        for (int i = 0; i < 4; ++i)
            threads.emplace_back(
                [&, i]
                {
                    auto const kind =
                        store->Commit(Creation({5, i}), static_cast<std::uint64_t>(100 + i)).kind;
                    unknown += kind == CommitOutcome::Unknown ? 1 : 0;
                });
        std::this_thread::sleep_for(20ms);  // until most of them wait for the same
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(unknown, 4);
    fails = false;
    for (std::uint64_t number = 100; number < 104; ++number)
        EXPECT_TRUE(store->FindCommit(number)) << number;
}

// Changes that go together are as if one came after the other.
TEST_F(SqliteFlush, OfAGroup_LeavesEachChangeItsOwnAnswer)
{
    auto const store = Open(full);
    Writer writer(*store);
    auto const state = store->Load(Job, [](auto, int, auto const&) {})->state;
    std::vector<std::future<CommitOutcome>> outcomes;
    {
        std::unique_lock const closed(gate);
        int const before = begun;
        auto const commit = [&](TicketChange change)
        {
            std::uint64_t const number = 100 + outcomes.size();
            outcomes.push_back(std::async(std::launch::async, [&store, change = std::move(change), number]
                                          { return store->Commit(change, number); }));
        };
        commit(CreationOfNext(5));
        while (begun == before)
            std::this_thread::yield();
        for (int value = 0; value < 4; ++value)  // all of them planned on the same revision
        {
            TicketChange change;
            change.address = Job;
            change.incarnation = state.incarnation;
            change.revision = state.revision;
            change.parameters.push_back({"A", 0, TicketValue::Int(value)});
            commit(std::move(change));
        }
        TicketChange wrong = CreationOfNext(5);
        wrong.address.type = -1;
        commit(std::move(wrong));
        std::this_thread::sleep_for(100ms);  // until they wait for the same
    }
    EXPECT_EQ(outcomes[0].get().kind, CommitOutcome::Committed);
    int made = 0;
    for (std::size_t i = 1; i <= 4; ++i)
    {
        auto const outcome = outcomes[i].get();
        made += outcome.kind == CommitOutcome::Committed ? 1 : 0;
        EXPECT_TRUE(outcome.kind == CommitOutcome::Committed || outcome.kind == CommitOutcome::Conflict);
        EXPECT_EQ(store->FindCommit(100 + i).has_value(), outcome.kind == CommitOutcome::Committed);
    }
    EXPECT_EQ(made, 1);
    EXPECT_THROW(outcomes[5].get(), StoreError);
    EXPECT_EQ(FeedOf(*store, state.revision).size(), 2u);
}
