// When memory that readers may have found is freed: not while one of them can still look at it, and no later
// than that.
#include "standin/server/feed/Epochs.h"

#include "tests/support/Allocations.h"
#include <condition_variable>
#include <future>
#include <gtest/gtest.h>
#include <thread>

using namespace standin;

namespace
{
// Notes what it is given to keep.
class COUNTING_KEEPER : public TextKeeper
{
public:
    void Keep(TicketTexts texts) noexcept override
    {
        std::lock_guard const lock(m_lock);
        for (auto& text : texts)
            m_kept.push_back(std::move(text));
    }
    std::size_t Kept() const
    {
        std::lock_guard const lock(m_lock);
        return m_kept.size();
    }

private:
    mutable std::mutex m_lock;
    TicketTexts m_kept;
};

// One text that somebody outside has: it is kept at the moment at which its memory would be freed.
Garbage OneText()
{
    Garbage garbage;
    garbage.texts.push_back(std::make_unique<TicketText>("a text that is long enough to be on the heap"));
    garbage.texts.back()->HandOut(1);
    return garbage;
}

// A thread that is in a reading section from its making on until it is told to leave.
class READER
{
public:
    READER() : m_thread([this] { Run(); })
    {
        std::unique_lock lock(m_lock);
        m_changed.wait(lock, [this] { return m_isIn; });
    }
    ~READER() { Leave(); }
    READER(READER const&) = delete;
    READER& operator=(READER const&) = delete;

    void Leave()
    {
        {
            std::lock_guard const lock(m_lock);
            m_isToLeave = true;
        }
        m_changed.notify_all();
        if (m_thread.joinable())
            m_thread.join();
    }

private:
    void Run()
    {
        Epochs::Guard const guard;
        std::unique_lock lock(m_lock);
        m_isIn = true;
        m_changed.notify_all();
        m_changed.wait(lock, [this] { return m_isToLeave; });
    }

    std::mutex m_lock;
    std::condition_variable m_changed;
    bool m_isIn = false;
    bool m_isToLeave = false;
    std::thread m_thread;
};

class ReadingSections : public testing::Test
{
protected:
    ReadingSections() { Epochs::Get(); }  // made at its first use, which takes memory of its own
    ~ReadingSections() override { Epochs::Get().Drain(); }

    void Retire() { Epochs::Get().Retire(OneText(), keeper); }
    std::size_t Collected()
    {
        Epochs::Get().Collect();
        return keeper.Kept();
    }

    COUNTING_KEEPER keeper;
};
}  // namespace

TEST_F(ReadingSections, WithNobodyInOne_EverythingGoesAtOnce)
{
    Retire();
    EXPECT_EQ(keeper.Kept(), 0u);  // that it can go is found out by who collects
    EXPECT_EQ(Collected(), 1u);
}

TEST_F(ReadingSections, WhatAReaderMayHaveFound_StaysUntilItLeaves)
{
    READER reader;
    Retire();
    EXPECT_EQ(Collected(), 0u);
    EXPECT_EQ(Collected(), 0u);
    reader.Leave();
    EXPECT_EQ(Collected(), 1u);
}

TEST_F(ReadingSections, AReaderThatComesLater_HoldsNothingUp)
{
    READER first;
    Retire();
    EXPECT_EQ(Collected(), 0u);  // whoever enters from here on cannot find it
    READER second;
    first.Leave();
    EXPECT_EQ(Collected(), 1u);
}

TEST_F(ReadingSections, TheOldestReader_Decides)
{
    READER first;
    Retire();
    EXPECT_EQ(Collected(), 0u);
    READER second;
    Retire();
    EXPECT_EQ(Collected(), 0u);
    first.Leave();
    EXPECT_EQ(Collected(), 1u);
    second.Leave();
    EXPECT_EQ(Collected(), 2u);
}

TEST_F(ReadingSections, OfOneThread_MayBeNested)
{
    {
        Epochs::Guard const outer;
        {
            Epochs::Guard const inner;
            Retire();
        }
        EXPECT_EQ(Collected(), 0u);  // the inner one's end ends nothing
        {
            Epochs::Guard const another;
        }
        EXPECT_EQ(Collected(), 0u);
    }
    EXPECT_EQ(Collected(), 1u);
}

TEST_F(ReadingSections, Drain_WaitsForReaders)
{
    READER reader;
    Retire();
    std::atomic<bool> drained{false};
    std::thread drain(
        [&]
        {
            Epochs::Get().Drain();
            drained = true;
        });
    for (int i = 0; i < 1000; ++i)
        std::this_thread::yield();
    EXPECT_FALSE(drained);
    EXPECT_EQ(keeper.Kept(), 0u);
    reader.Leave();
    drain.join();
    EXPECT_EQ(keeper.Kept(), 1u);
}

TEST_F(ReadingSections, AThreadThatEnds_LeavesItsReaderToTheNext)
{
    std::thread([] { Epochs::Guard const guard; }).join();
    long const before = LiveAllocations();
    for (int i = 0; i < 50; ++i)
        std::thread([] { Epochs::Guard const guard; }).join();
    EXPECT_EQ(LiveAllocations(), before);
    READER reader;  // and it guards as the first one did
    Retire();
    EXPECT_EQ(Collected(), 0u);
    reader.Leave();
    EXPECT_EQ(Collected(), 1u);
}

TEST_F(ReadingSections, NothingToRetire_IsForgottenAtOnce)
{
    long const before = LiveAllocations();
    Epochs::Get().Retire({}, keeper);
    EXPECT_EQ(LiveAllocations(), before);
}

TEST_F(ReadingSections, Memory_GoesWhenItsReadersHaveLeft)
{
    Epochs::Get().Drain();
    READER reader;
    long const before = LiveAllocations();
    for (int i = 0; i < 300; ++i)
    {
        Garbage garbage;
        garbage.memory.emplace_back(::operator new(100));
        Epochs::Get().Retire(std::move(garbage), keeper);
    }
    EXPECT_GE(LiveAllocations(), before + 300);
    reader.Leave();
    Epochs::Get().Drain();
    EXPECT_LE(LiveAllocations(), before);  // the reader's thread is gone, too
}

TEST_F(ReadingSections, TextsThatNobodyOutsideHas_AreNotKept)
{
    Garbage garbage;
    garbage.texts.push_back(std::make_unique<TicketText>("never handed out"));
    Epochs::Get().Retire(std::move(garbage), keeper);
    EXPECT_EQ(Collected(), 0u);
}

// The keeper may go when Drain has returned, also if another thread has taken its texts out to free them.
TEST_F(ReadingSections, Drain_WaitsForWhoCollects)
{
    struct SlowKeeper : TextKeeper
    {
        void Keep(TicketTexts) noexcept override
        {
            begun.set_value();
            gate.get_future().wait();
        }
        std::promise<void> begun, gate;
    } slow;
    Epochs::Get().Retire(OneText(), slow);
    auto const collecting = std::async(std::launch::async, [] { Epochs::Get().Collect(); });
    slow.begun.get_future().wait();
    auto const draining = std::async(std::launch::async, [] { Epochs::Get().Drain(); });
    EXPECT_EQ(draining.wait_for(std::chrono::milliseconds(50)), std::future_status::timeout);
    slow.gate.set_value();
    EXPECT_EQ(draining.wait_for(std::chrono::minutes(1)), std::future_status::ready);
}

// What was retired on the way is freed without anybody's asking for it: memory does not grow without bound.
TEST_F(ReadingSections, ManyRetirements_CollectByThemselves)
{
    for (int i = 0; i < 1000; ++i)
        Retire();
    EXPECT_GT(keeper.Kept(), 800u);
}

TEST_F(ReadingSections, WithoutMemoryForANote_ItGoesBeforeRetireReturns)
{
    Garbage garbage = OneText();
    {
        FailingAllocation const failing(0);
        Epochs::Get().Retire(std::move(garbage), keeper);
        EXPECT_TRUE(failing.HasHappened());
    }
    EXPECT_EQ(keeper.Kept(), 1u);
}

TEST_F(ReadingSections, Collecting_NeedsNoMemory)
{
    READER reader;
    for (int i = 0; i < 200; ++i)
    {
        Garbage garbage;
        garbage.memory.emplace_back(::operator new(100));
        Epochs::Get().Retire(std::move(garbage), keeper);
    }
    reader.Leave();
    FailingAllocation const failing(0);
    Epochs::Get().Collect();
    EXPECT_FALSE(failing.HasHappened());
}

// Whoever reads a snapshot after it was freed is seen by the sanitizers, and by its content without them.
TEST_F(ReadingSections, FourReadersAndAWriter_SeeWholeSnapshotsOnly)
{
    KeyPool keys;
    Key const key = keys.Intern("Key");
    std::atomic<TicketSnapshot const*> newest{nullptr};
    auto const write = [&](char letter)
    {
        TicketSnapshot const* const before = newest.load();
        TicketValue value = TicketValue::String(std::string(100, letter));
        SnapshotEdit edit(before);
        edit.Put(key, 0, value);
        edit.Put(key, 1, TicketValue::Int(letter));
        Garbage garbage;
        newest.store(edit.Finish({1, 1}, garbage), std::memory_order_release);
        static_cast<void>(value.text.release());
        Epochs::Get().Retire(std::move(garbage), keeper);
    };
    write('a');
    std::atomic<bool> done{false};
    std::atomic<int> torn{0};
    std::atomic<int> reads{0};
    std::vector<std::thread> readers;
    for (int i = 0; i < 4; ++i)
        readers.emplace_back(
            [&]
            {
                for (bool last = false; !last; ++reads)
                {
                    last = done;
                    Epochs::Guard const guard;
                    KeyValues const* const values = newest.load(std::memory_order_acquire)->Find(key);
                    auto const letter = static_cast<char>(values->At(1)->word);
                    torn += values->At(0)->text->bytes == std::string(100, letter) ? 0 : 1;
                }
            });
    for (int i = 0; i < 20000; ++i)
        write(static_cast<char>('a' + i % 26));
    done = true;
    for (std::thread& reader : readers)
        reader.join();
    EXPECT_EQ(torn, 0) << "of " << reads;
    Epochs::Get().Retire(SnapshotEdit::Dismantle(newest), keeper);
    Epochs::Get().Drain();
    EXPECT_EQ(keeper.Kept(), 0u);
}
