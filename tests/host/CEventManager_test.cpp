#include "comgui/host/CEventManager.h"

#include "comgui/host/ServerNotificationEvent.h"
#include <atomic>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

using testing::ElementsAre;

namespace
{
class EventManager : public testing::Test
{
protected:
    void Publish()
    {
        NotifData const data(nullptr, 1, 0, 0, 0, 0, "key");
        ServerNotificationEvent event(42, data);
        bus.PublishEvent(event);
    }

    CEventManager::Handler Note(char const* name)
    {
        return [this, name](wxEvent&) { heard.emplace_back(name); };
    }

    CEventManager bus;
    std::vector<std::string> heard;
};
}  // namespace

TEST_F(EventManager, GetInstance_IsAlwaysTheSame)
{
    EXPECT_NE(CEventManager::GetInstance(), nullptr);
    EXPECT_EQ(CEventManager::GetInstance(), CEventManager::GetInstance());
}

TEST_F(EventManager, Handlers_HearTheEventItselfInTheOrderOfSubscription)
{
    wxEvent* seen = nullptr;
    bus.Subscribe(Note("a"));
    bus.Subscribe([&](wxEvent& event) { seen = &event; });
    bus.Subscribe(Note("b"));
    NotifData const data(nullptr, 1, 0, 0, 0, 0, nullptr);
    ServerNotificationEvent event(42, data);
    bus.PublishEvent(event);
    EXPECT_EQ(seen, &event);
    EXPECT_THAT(heard, ElementsAre("a", "b"));
}

TEST_F(EventManager, UnsubscribedHandler_HearsNothingMore)
{
    auto const a = bus.Subscribe(Note("a"));
    bus.Subscribe(Note("b"));
    EXPECT_TRUE(bus.Unsubscribe(a));
    Publish();
    EXPECT_THAT(heard, ElementsAre("b"));
}

TEST_F(EventManager, Unsubscribe_OfWhatIsNoSubscription_IsFalse)
{
    auto const a = bus.Subscribe(Note("a"));
    EXPECT_FALSE(bus.Unsubscribe(0));
    EXPECT_FALSE(bus.Unsubscribe(a + 1));
    EXPECT_TRUE(bus.Unsubscribe(a));
    EXPECT_FALSE(bus.Unsubscribe(a));
}

TEST_F(EventManager, Tokens_AreNeverGivenOutTwice)
{
    auto const a = bus.Subscribe(Note("a"));
    bus.Unsubscribe(a);
    auto const b = bus.Subscribe(Note("b"));
    EXPECT_NE(a, 0u);
    EXPECT_NE(a, b);
}

TEST_F(EventManager, HandlerAddedDuringAnEvent_HearsTheNextOne)
{
    bool added = false;
    bus.Subscribe(
        [&](wxEvent&)
        {
            if (!added)
                bus.Subscribe(Note("new"));
            added = true;
        });
    Publish();
    EXPECT_TRUE(heard.empty());
    Publish();
    EXPECT_THAT(heard, ElementsAre("new"));
}

TEST_F(EventManager, HandlerRemovedDuringAnEvent_DoesNotHearIt)
{
    unsigned long long second = 0;
    bus.Subscribe([&](wxEvent&) { bus.Unsubscribe(second); });
    second = bus.Subscribe(Note("second"));
    Publish();
    EXPECT_TRUE(heard.empty());
}

TEST_F(EventManager, HandlerThatRemovesItself_IsCalledOnce)
{
    unsigned long long token = 0;
    token = bus.Subscribe(
        [&](wxEvent&)
        {
            heard.emplace_back("once");
            bus.Unsubscribe(token);
        });
    Publish();
    Publish();
    EXPECT_THAT(heard, ElementsAre("once"));
}

TEST_F(EventManager, HandlerThatPublishes_IsDeliveredAtOnce)
{
    int depth = 0;
    bus.Subscribe(
        [&](wxEvent&)
        {
            heard.push_back("in " + std::to_string(depth));
            if (depth++ < 2)
                Publish();
            heard.push_back("out");
        });
    Publish();
    EXPECT_THAT(heard, ElementsAre("in 0", "in 1", "in 2", "out", "out", "out"));
}

TEST_F(EventManager, ExceptionOfAHandler_ReachesThePublisherAndEndsTheDelivery)
{
    bus.Subscribe([](wxEvent&) { throw std::runtime_error("a handler's"); });
    auto const behind = bus.Subscribe(Note("behind"));
    EXPECT_THROW(Publish(), std::runtime_error);
    EXPECT_TRUE(heard.empty());
    EXPECT_TRUE(bus.Unsubscribe(behind));  // and nothing stays locked
}

TEST_F(EventManager, Unsubscribe_WaitsForTheHandlerOnAnotherThread)
{
    std::atomic<bool> entered = false;
    std::atomic<bool> left = false;
    auto const token = bus.Subscribe(
        [&](wxEvent&)
        {
            entered = true;
            for (int i = 0; i < 1000; ++i)
                std::this_thread::yield();
            left = true;
        });
    std::thread publisher([&] { Publish(); });
    while (!entered)
        std::this_thread::yield();
    bus.Unsubscribe(token);
    EXPECT_TRUE(left);
    publisher.join();
}

TEST_F(EventManager, ManyThreads_MaySubscribePublishAndUnsubscribeAtOnce)
{
    std::atomic<int> calls = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(
            [&]
            {
                for (int round = 0; round < 500; ++round)
                {
                    std::atomic<bool> alive = true;
                    auto const token = bus.Subscribe(
                        [&](wxEvent&)
                        {
                            EXPECT_TRUE(alive);
                            ++calls;
                        });
                    Publish();
                    EXPECT_TRUE(bus.Unsubscribe(token));
                    alive = false;
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_GE(calls, 4 * 500);
}
