// The ring between a traced program and what writes its records down.
#include "standin/trace/TraceRing.h"

#include "comgui/testing/TemporaryFolder.h"
#include <atomic>
#include <filesystem>
#include <gtest/gtest.h>
#include <iterator>
#include <map>
#include <thread>
#include <vector>

using comgui::test::TemporaryFolder;

using namespace trace;

namespace
{
struct Numbered
{
    RecordHead head{sizeof(Numbered), Kind::Began, Call::Open, 0, 0, 0};
    std::uint64_t content = 0;  // the number again
};

class Ring : public testing::Test
{
protected:
    void Put(TraceRing& to, std::uint32_t thread, std::uint64_t number)
    {
        Numbered record;
        record.head.thread = thread;
        record.head.number = record.content = number;
        to.Put(&record, sizeof record);
    }
    std::vector<std::uint64_t> TakeAll()
    {
        std::vector<std::uint64_t> numbers;
        ring->TakeAll([&](char const* bytes, std::size_t size) { numbers.push_back(NumberOf(bytes, size)); });
        return numbers;
    }
    static std::uint64_t NumberOf(char const* bytes, std::size_t size)
    {
        Numbered record;
        EXPECT_EQ(size, sizeof record);
        std::memcpy(&record, bytes, sizeof record);
        EXPECT_EQ(record.content, record.head.number);
        return record.head.number;
    }

    TemporaryFolder const folder;
    std::string const file = folder.Path() / "x.ring";
    std::unique_ptr<TraceRing> ring = TraceRing::Make(file);
};
}  // namespace

TEST_F(Ring, WhatIsPutIn_ComesOutInItsOrderAndOnce)
{
    ASSERT_TRUE(ring);
    for (std::uint64_t number = 1; number <= 3; ++number)
        Put(*ring, 1, number);
    EXPECT_EQ(TakeAll(), (std::vector<std::uint64_t>{1, 2, 3}));
    EXPECT_TRUE(TakeAll().empty());
}

TEST_F(Ring, FullOne_DropsAndCounts_AndGoesOnWhenThereIsRoom)
{
    for (std::uint64_t number = 0; number < TraceRing::Slots + 5; ++number)
        Put(*ring, 1, number);
    EXPECT_EQ(ring->Dropped(), 5U);
    EXPECT_EQ(TakeAll().size(), TraceRing::Slots);
    Put(*ring, 1, 77);
    EXPECT_EQ(TakeAll(), std::vector<std::uint64_t>{77});
    EXPECT_EQ(ring->Dropped(), 5U);
}

TEST_F(Ring, ManyRounds_LoseNothing)
{
    for (std::uint64_t round = 0; round < 5; ++round)
    {
        for (std::uint64_t i = 0; i < TraceRing::Slots - 1; ++i)
            Put(*ring, 1, i);
        auto const taken = TakeAll();
        ASSERT_EQ(taken.size(), TraceRing::Slots - 1);
        EXPECT_EQ(taken.back(), TraceRing::Slots - 2);
    }
    EXPECT_EQ(ring->Dropped(), 0U);
}

TEST_F(Ring, ThreadsThatPutWhileOneTakes_LoseNothingButWhatIsCounted)
{
    constexpr std::uint32_t Threads = 3;
    constexpr std::uint64_t Each = 20'000;
    std::atomic<std::uint32_t> running{Threads};
    std::map<std::uint32_t, std::uint64_t> last;
    std::uint64_t taken = 0;
    auto const take = [&]
    {
        ring->TakeAll(
            [&](char const* bytes, std::size_t size)
            {
                RecordHead head;
                std::memcpy(&head, bytes, sizeof head);
                EXPECT_GT(NumberOf(bytes, size), last[head.thread]);  // a thread's own keep their order
                last[head.thread] = head.number;
                ++taken;
            });
    };
    std::vector<std::thread> threads;
    for (std::uint32_t thread = 1; thread <= Threads; ++thread)
        threads.emplace_back(
            [&, thread]
            {
                for (std::uint64_t number = 1; number <= Each; ++number)
                    Put(*ring, thread, number);
                --running;
            });
    while (running)
        take();
    for (std::thread& thread : threads)
        thread.join();
    take();
    EXPECT_EQ(taken + ring->Dropped(), Threads * Each);
}

TEST_F(Ring, AnotherProcess_SeesWhatIsLeftAndLeavesIt)
{
    Put(*ring, 1, 1);
    Put(*ring, 1, 2);
    EXPECT_EQ(TakeAll().size(), 2U);
    Put(*ring, 1, 3);
    auto const other = TraceRing::Open(file);
    ASSERT_TRUE(other);
    std::vector<std::uint64_t> seen;
    other->LookAtAll([&](char const* bytes, std::size_t size) { seen.push_back(NumberOf(bytes, size)); });
    EXPECT_EQ(seen, std::vector<std::uint64_t>{3});
    EXPECT_EQ(TakeAll(), std::vector<std::uint64_t>{3});
}

TEST_F(Ring, TheSwitch_IsSharedWithOthers)
{
    auto const other = TraceRing::Open(file);
    EXPECT_FALSE(ring->IsOn());
    other->Switch(true);
    EXPECT_TRUE(ring->IsOn());
    ring->Switch(false);
    EXPECT_FALSE(other->IsOn());
}

TEST_F(Ring, MadeOrOpened_KeepsNoFileOpen)
{
    auto const openFiles = []
    {
        std::filesystem::directory_iterator const files("/proc/self/fd");
        return std::distance(begin(files), end(files));
    };
    auto const before = openFiles();
    auto const made = TraceRing::Make(folder.Path() / "another.ring");
    auto const opened = TraceRing::Open(file);
    EXPECT_FALSE(TraceRing::Open(folder.Write("short", "CGRING_1")));
    EXPECT_TRUE(made && opened);
    EXPECT_EQ(openFiles(), before);
}

TEST_F(Ring, WhatIsNoRing_IsNotOpened)
{
    EXPECT_FALSE(TraceRing::Open(folder.Path() / "missing"));
    EXPECT_FALSE(TraceRing::Open(folder.Write("short", "CGRING_1")));
    EXPECT_FALSE(TraceRing::Open(folder.Write("long", std::string(std::filesystem::file_size(file), 'x'))));
    EXPECT_FALSE(TraceRing::Make(folder.Path() / "no/such/folder"));
}
