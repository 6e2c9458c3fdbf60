// How long the keys of tickets stay.
#include "standin/server/tickets/KeyPool.h"

#include "standin/server/feed/TicketCache.h"
#include "standin/server/sessions/KeptTexts.h"
#include "standin/server/tickets/OwnedTicket.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/Program.h"
#include "tests/support/Allocations.h"
#include <condition_variable>
#include <gmock/gmock.h>
#include <mutex>
#include <thread>

using namespace standin;
using testing::IsEmpty;
using testing::Le;
using testing::SizeIs;

namespace
{
constexpr TicketAddress Job{3, 1};

std::string KeyOf(int number) { return "Key/" + std::to_string(number); }

// A cache with one ticket, as the feed handles it.
class CachedKeys : public testing::Test
{
protected:
    CachedKeys() { cache.Note(Job, {1, 1}); }

    void Make(std::string const& key, TicketValue value)
    {
        TicketChange change;
        change.kind = TicketChange::Write;
        change.address = Job;
        change.parameters.push_back({key, -1, std::move(value)});
        cache.Make(change, ++sequence);
    }
    void Load()
    {
        std::vector<TicketCache::LoadedValue> none;
        ASSERT_TRUE(cache.Publish(Job, {1, 1}, none));
    }
    void WriteAndDelete(int from, int to)
    {
        for (int i = from; i < to; ++i)
        {
            Make(KeyOf(i), TicketValue::Int(i));
            Make(KeyOf(i), {});
        }
    }

    KeptTexts texts;
    TicketCache cache{texts};
    Sequence sequence = 1;
};
}  // namespace

TEST(KeyPool, AKey_IsThereOnce_WithItsText)
{
    KeyPool keys;
    Key const key = keys.Intern("Job/State");
    EXPECT_EQ(keys.Intern(std::string("Job/State")), key);
    EXPECT_NE(keys.Intern("Job"), key);
    EXPECT_EQ(key->Text(), "Job/State");
    EXPECT_STREQ(key->CStr(), "Job/State");
    EXPECT_EQ(key->Hash(), HashOf("Job/State"));
    EXPECT_EQ(keys.Size(), 2u);
}

TEST(KeyPool, KeysThatNoTicketHas_AreTakenOut)
{
    KeyPool keys;
    Key const used = keys.Intern("used");
    Key const once = keys.Intern("once");
    for (Key const key : {used, once})
        key->Gain();
    once->Lose();
    keys.Intern("never");
    auto const unused = keys.TakeUnused();
    EXPECT_THAT(unused, SizeIs(2));
    EXPECT_EQ(keys.Size(), 1u);
    EXPECT_EQ(keys.Intern("used"), used);
    EXPECT_NE(keys.Intern("once"), once);  // which is still there, for who sees it
    EXPECT_THAT(keys.TakeUnused(), SizeIs(1));
}

TEST(KeyPool, OfTwoTicketsWithAKey_TheLastKeepsIt)
{
    KeyPool keys;
    Key const key = keys.Intern("A");
    key->Gain();
    key->Gain();
    key->Lose();
    EXPECT_THAT(keys.TakeUnused(), IsEmpty());
    key->Lose();
    EXPECT_THAT(keys.TakeUnused(), SizeIs(1));
}

TEST(KeyPool, IsFullAtAThousand_ThenAtTwiceWhatWasLeft)
{
    KeyPool keys;
    auto const add = [&](int from, int to)
    {
        for (int i = from; i < to; ++i)
            keys.Intern(KeyOf(i))->Gain();
    };
    add(0, 999);
    EXPECT_FALSE(keys.IsFull());
    add(999, 1000);
    EXPECT_TRUE(keys.IsFull());
    EXPECT_THAT(keys.TakeUnused(), IsEmpty());
    EXPECT_FALSE(keys.IsFull());
    add(1000, 1999);
    EXPECT_FALSE(keys.IsFull());
    add(1999, 2000);
    EXPECT_TRUE(keys.IsFull());
}

TEST(HeldKey, OutlivesItsPool_AndGoesWithItsLastHolder)
{
    long const before = LiveAllocations();
    {
        HeldKey second;
        {
            HeldKey first;
            {
                KeyPool keys;
                first = keys.Intern("A");
            }
            second = first;
        }
        EXPECT_EQ(LiveAllocations(), before + 1);
        EXPECT_EQ(second->Text(), "A");
        second = HeldKey();
        EXPECT_EQ(LiveAllocations(), before);
    }
    EXPECT_EQ(LiveAllocations(), before);
}

TEST(KeyPool, WithoutMemory_KeepsWhatItHas)
{
    KeyPool keys;
    keys.Intern("A");
    {
        FailingAllocation const failing(0);
        EXPECT_THROW(keys.TakeUnused(), std::bad_alloc);
    }
    EXPECT_EQ(keys.Size(), 1u);
    EXPECT_EQ(keys.Intern("A")->Text(), "A");
}

TEST_F(CachedKeys, KeysThatComeAndGo_DoNotPileUp)
{
    Load();
    Make("stays", TicketValue::Int(1));
    WriteAndDelete(0, 5000);
    EXPECT_THAT(cache.Keys(), Le(1001u));
    EXPECT_NE(cache.Find(Job)->Find("stays"), nullptr);
    EXPECT_EQ(cache.Find(Job)->Keys(), 1u);
}

TEST_F(CachedKeys, WrittenAgainAndAgain_StayTheSame)
{
    Load();
    for (int i = 0; i < 3; ++i)
        Make("stays", TicketValue::Int(i));
    WriteAndDelete(0, 3000);
    EXPECT_EQ(cache.Intern("stays"), cache.Find(Job)->Find("stays")->Name());
    Make("stays", TicketValue::Int(4));
    EXPECT_EQ(cache.Find(Job)->Keys(), 1u);
}

TEST_F(CachedKeys, OfDeletedTickets_DoNotPileUp)
{
    for (int i = 0; i < 5000; ++i)
    {
        std::vector<TicketCache::LoadedValue> values;
        values.push_back({KeyOf(i), 0, TicketValue::Int(i)});
        ASSERT_TRUE(cache.Publish(Job, {1, 1}, values));
        cache.Forget(Job);
        cache.Note(Job, {1, 1});
    }
    EXPECT_THAT(cache.Keys(), Le(1001u));
}

TEST_F(CachedKeys, ThatAReaderMaySee_AreThereUntilItLeaves)
{
    Load();
    Make("seen", TicketValue::Int(1));
    {
        Epochs::Guard const guard;
        KeyValues const* const values = cache.Find(Job)->Find("seen");
        Make("seen", {});
        std::thread([&] { WriteAndDelete(0, 3000); }).join();
        EXPECT_NE(cache.Intern("seen"), values->Name());  // it has left the pool
        EXPECT_EQ(values->Name()->Text(), "seen");        // freed memory has other bytes
    }
    Epochs::Get().Drain();
}

// The callback for the first change waits while the key of the second goes from the ticket.
TEST(NotifiedKeys, StayUntilTheyAreTold)
{
    MemoryFolder const folder;
    auto const site = std::make_shared<MemorySite>();
    site->AddTicket(SystemTicket);
    site->AddTicket(Job);
    Program program(site, folder.Path());
    auto& service = program.server.Notifications();
    int const id = service.NewId();
    std::atomic<bool> mayGoOn{false};
    std::mutex lock;
    std::condition_variable changed;
    std::vector<std::string> told;
    ASSERT_TRUE(service.Register(program.session, id,
                                 [&](Notification const& each)
                                 {
                                     while (!mayGoOn)
                                         std::this_thread::yield();
                                     std::lock_guard const guard(lock);
                                     for (ChangedParameter const& change : each.parameters)
                                         told.emplace_back(change.key->CStr());
                                     changed.notify_all();
                                 }));
    ASSERT_TRUE(service.Enable(program.session, id, Job, KeyFilter(nullptr)));
    std::vector<std::string> written{"first", "second", "second"};
    EXPECT_TRUE(program.Set(Job, "first", 1) && program.Set(Job, "second", 2) && program.Drop(Job, "second"));
    for (int i = 0; i < 3000; ++i)
    {
        EXPECT_TRUE(program.Set(Job, KeyOf(i).c_str(), i) && program.Drop(Job, KeyOf(i).c_str()));
        written.insert(written.end(), 2, KeyOf(i));
    }
    Epochs::Get().Drain();
    mayGoOn = true;
    std::unique_lock guard(lock);
    changed.wait_for(guard, std::chrono::minutes(2), [&] { return told.size() == written.size(); });
    EXPECT_EQ(told, written);
}

TEST(TicketFileKeys, ThatComeAndGo_DoNotPileUp)
{
    OwnedTicket ticket;
    long const before = LiveAllocations();
    for (int i = 0; i < 5000; ++i)
        for (bool const isWrite : {true, false})
        {
            std::string const key = KeyOf(i);
            TicketWrite write{key, -1, isWrite ? TicketValue::Int(i) : TicketValue{}};
            ticket.Write({&write, 1});
        }
    EXPECT_THAT(LiveAllocations() - before, Le(3100));
}
