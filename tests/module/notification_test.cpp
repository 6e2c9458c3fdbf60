// What clients are told of changes, when, and when no more.
#include "tests/module/NotificationListener.h"

#include "comgui/ticket/BIN_STRING.h"
#include "standin/module/ModuleCodes.h"
#include <gmock/gmock.h>
#include <thread>
#include <utility>

using namespace standin;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
constexpr int Type = 50;  // a new site has no ticket of it
constexpr int All = TICKET_ID_ALL;

// A gate that a callback waits at until it is opened.
class GATE
{
public:
    void Pass()
    {
        std::unique_lock lock(m_lock);
        m_reached = true;
        m_changed.notify_all();
        m_changed.wait(lock, [this] { return m_open; });
    }
    void AwaitSomebody()
    {
        std::unique_lock lock(m_lock);
        m_changed.wait(lock, [this] { return m_reached; });
    }
    void Open()
    {
        std::lock_guard const lock(m_lock);
        m_open = true;
        m_changed.notify_all();
    }

private:
    std::mutex m_lock;
    std::condition_variable m_changed;
    bool m_reached = false;
    bool m_open = false;
};

// Stands for whatever a host's callback uses and destroys at its end.
struct HOST_STATIC
{
    ~HOST_STATIC() { gone = true; }
    static inline std::atomic<bool> gone{false};
} const hostStatic;
}  // namespace

class Notifications : public ClientTest
{
protected:
    ~Notifications() override
    {
        admin.Logout();  // the listeners go before the site does
        other.Logout();
    }

    // After everything that came before it on this session.
    std::vector<std::string> CallsUpTo(LISTENER& client, int id)
    {
        EXPECT_EQ(admin.Enable(2, 1, id), 1);
        EXPECT_EQ(admin.Write(2, 1, "Fence", 1), 1);
        for (std::size_t calls = 1;; ++calls)
        {
            auto all = client.Wait(calls);
            if (all.size() < calls)
                ADD_FAILURE() << "the fence never came";
            if (all.size() < calls || all.back() == "changed 2/1 Fence@-1=1")
            {
                if (!all.empty())
                    all.pop_back();
                return all;
            }
        }
    }

    LISTENER listener;
    LISTENER second;
};

using Registering = Notifications;
using Switching = Notifications;
using EndsDeathTest = Notifications;
using Slowness = Notifications;
using FromTheCallback = Notifications;
using Ends = Notifications;

TEST_F(Registering, GivesIdsFrom1ThatAreNeverGivenTwice)
{
    EXPECT_EQ(admin.Register(listener), 1);
    EXPECT_EQ(other.Register(second), 2);
    EXPECT_EQ(admin.Register(listener), 3);
    other.Logout();
    EXPECT_EQ(admin.Register(listener), 4);
}

TEST_F(Registering, WithoutATicketOrACallback_IsRefused)
{
    TICKET_FACTORY const factory;
    TICKET const request(factory, nullptr);
    void* const data = const_cast<STICKET_ACCESS*>(request.Access());
    auto const send = [&](char const* command, void* argument)
    { return module->SendCommandEntry(module.Instance(), admin.Session(), command, 0, argument); };
    EXPECT_EQ(send("local.set.callback", nullptr), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(send("local.set.callback", data), MODULE_INVALID_ARGUMENT);
    request.Set("pGUI2Notification", PARAM_POINTER, nullptr);
    EXPECT_EQ(send("local.set.callback", data), MODULE_INVALID_ARGUMENT);
    request.Set("pGUI2Notification", 5);
    EXPECT_EQ(send("local.set.callback", data), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(request.Int("iGUINotificationID"), -1);
    EXPECT_EQ(send("local.set.Callback", data), MODULE_NOT_SUPPORTED);
    EXPECT_EQ(send(nullptr, data), MODULE_INVALID_ARGUMENT);
}

TEST_F(Registering, OfAnEndedSession_IsRefused)
{
    admin.Logout();
    int id = -1;
    EXPECT_EQ(admin.Register(&listener, id), MODULE_UNKNOWN_SESSION);
    EXPECT_EQ(id, -1);
}

TEST_F(Registering, Again_EndsTheIdOfBefore)
{
    int const before = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, before), 1);
    int const id = admin.Register(second);
    EXPECT_EQ(admin.Enable(3, 1, before), 0);
    EXPECT_EQ(admin.Disable(3, 1, before), 0);
    EXPECT_EQ(admin.Enable(Type, All, id), 1);
    admin.Write(3, 1, "K", 1);
    EXPECT_THAT(CallsUpTo(second, id), IsEmpty());
    EXPECT_THAT(listener.Calls(), IsEmpty());
}

TEST_F(Notifications, NameTicketIdTypeAndChange)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, All, id), 1);
    admin.Write(3, 1, "Test/K", 7);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 Test/K@-1=7"));
    EXPECT_EQ(listener.lastId, id);
}

TEST_F(Notifications, GoToEverySessionThatAsked_AlsoTheOneThatWrote)
{
    int const id = admin.Register(listener);
    int const otherId = other.Register(second);
    ASSERT_TRUE(admin.Enable(3, 1, id) && other.Enable(3, All, otherId));
    other.Write(3, 1, "K", 7);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=7"));
    EXPECT_THAT(second.Wait(1), ElementsAre("changed 3/1 K@-1=7"));
    EXPECT_EQ(second.lastId, otherId);
}

TEST_F(Notifications, OfOneTable_ComeAsOneCallWithEachKeysRecordsTogether)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Write(3, 1, "Gone", 1));
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    int const number = 7;
    double const fraction = 1.5;
    long long const large = -5;
    unsigned const small = 6;
    unsigned long long const huge = 8;
    BIN_STRING binary;
    binary.data = "ab";
    binary.size = 2;
    SETMULTIPAR table[] = {{"B", PARAM_INT, 0, &number, -1, false, {}},
                           {"A", PARAM_STRING, 0, "x", -2, false, {}},
                           {"B", PARAM_DOUBLE, 0, &fraction, 1, false, {}},
                           {"Bad", PARAM_COUNT, 0, &number, -1, false, {}},
                           {"Gone", PARAM_NONE, 0, nullptr, -1, false, {}},
                           {"Never", PARAM_NONE, 0, nullptr, -1, false, {}},
                           {"A", PARAM_POINTER, 0, nullptr, -2, false, {}},
                           {"B", PARAM_NONE, 0, nullptr, 1, false, {}},
                           {"B", PARAM_BINSTRING, 0, &binary, 2, false, {}},
                           {"C", PARAM_INT64, 0, &large, 0, false, {}},
                           {"C", PARAM_UNSIGNED, 0, &small, 1, false, {}},
                           {"C", PARAM_UNSIGNED64, 0, &huge, 2, false, {}},
                           {}};
    ASSERT_EQ(admin.Access()->MSETMULTIPAR(admin.Access()->Instance, 3, 1, table), 1);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 B@-1=7 B@1=1.500000 B@1=none B@2=[ab] "
                                              "A@0='x' A@1=->0 Gone@-1=none C@0=-5ll C@1=6u C@2=8ull"));
    EXPECT_TRUE(listener.sharesKeys);
}

TEST_F(Notifications, OfWhatWasRefusedOrChangedNothing_DoNotCome)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, All, id), 1);
    EXPECT_EQ(admin.Write(3, 1, "", 1), 0);
    EXPECT_EQ(admin.Write(3, 999, "K", 1), 0);
    EXPECT_EQ(admin.Delete(3, 1, "Test/Never"), 1);
    EXPECT_EQ(admin.Create(3, 1), nullptr);
    EXPECT_THAT(CallsUpTo(listener, id), IsEmpty());
}

TEST_F(Notifications, OfOtherTicketsAndTypes_DoNotCome)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    admin.Write(7, 1, "K", 1);
    admin.Create(3, 500);
    admin.Write(3, 500, "K", 1);
    EXPECT_THAT(CallsUpTo(listener, id), IsEmpty());
}

TEST_F(Notifications, OfCreatedAndDeletedTickets_HaveNoRecords)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(Type, All, id, {"Nothing"}), 1);
    ASSERT_TRUE(other.Create(Type, 4));
    ASSERT_EQ(other.CreateNext(Type), 5);
    other.Operate(Type, 4, MTICKET_OP_DELETE);
    EXPECT_THAT(listener.Wait(3), ElementsAre("created 50/4", "created 50/5", "deleted 50/4"));
}

TEST_F(Notifications, OfATicketToCome_MayBeAskedFor)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(Type, 4, id), 1);
    other.Create(Type, 3);
    other.Create(Type, 4);
    EXPECT_THAT(listener.Wait(1), ElementsAre("created 50/4"));
}

TEST_F(Notifications, HaveTheKeysThatWereAskedFor)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id, {"Test/*", "Name"}), 1);
    int const number = 7;
    SETMULTIPAR table[] = {{"Other", PARAM_INT, 0, &number, -1, false, {}},
                           {"Test/K", PARAM_INT, 0, &number, -1, false, {}},
                           {"Names", PARAM_INT, 0, &number, -1, false, {}},
                           {"Name", PARAM_INT, 0, &number, -1, false, {}},
                           {}};
    ASSERT_EQ(admin.Access()->MSETMULTIPAR(admin.Access()->Instance, 3, 1, table), 1);
    admin.Write(3, 1, "Other", 8);
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 3/1 Test/K@-1=7 Name@-1=7"));
}

TEST_F(Notifications, AskedForTwice_ComeOnceWithTheKeysOfBoth)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Enable(3, 1, id, {"A"}) && admin.Enable(3, All, id, {"B"}));
    int const number = 7;
    SETMULTIPAR table[] = {
        {"A", PARAM_INT, 0, &number, -1, false, {}}, {"B", PARAM_INT, 0, &number, -1, false, {}}, {}};
    ASSERT_EQ(admin.Access()->MSETMULTIPAR(admin.Access()->Instance, 3, 1, table), 1);
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 3/1 A@-1=7 B@-1=7"));
}

TEST_F(Notifications, HaveTheValuesOfTheirChange)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    GATE gate;
    listener.onCall = [&] { gate.Pass(); };
    for (int value = 1; value <= 3; ++value)
        admin.Write(3, 1, "K", value);
    gate.Open();
    EXPECT_THAT(listener.Wait(3),
                ElementsAre("changed 3/1 K@-1=1", "changed 3/1 K@-1=2", "changed 3/1 K@-1=3"));
}

TEST_F(Notifications, OfFourWriters_AllComeAndInTheOrderOfEachAndOfThemAll)
{
    constexpr int Writes = 250;
    int const id = admin.Register(listener);
    int const otherId = other.Register(second);
    ASSERT_TRUE(admin.Enable(3, 1, id) && other.Enable(3, 1, otherId));
    std::vector<std::thread> writers;
    for (int i = 0; i < 4; ++i)
        writers.emplace_back(
            [this, i]
            {
                std::string const key = "W" + std::to_string(i);
                for (int step = 0; step < Writes; ++step)
                    EXPECT_TRUE((i % 2 ? admin : other).Write(3, 1, key.c_str(), step));
            });
    for (std::thread& writer : writers)
        writer.join();
    auto const calls = listener.Wait(4 * Writes);
    ASSERT_EQ(calls.size(), 4u * Writes);
    EXPECT_EQ(second.Wait(4 * Writes), calls);
    int next[4] = {};
    for (std::string const& call : calls)
    {
        auto const writer = static_cast<std::size_t>(call.at(13) - '0');
        EXPECT_EQ(call, "changed 3/1 W" + std::to_string(writer) + "@-1=" + std::to_string(next[writer]++));
    }
    EXPECT_FALSE(listener.overlapped);
}

TEST_F(Switching, WhatIsNoTicketOrId_IsRefused)
{
    int const id = admin.Register(listener);
    for (auto const& [type, ticket] :
         {std::pair{-1, 1}, {100, 1}, {3, -1}, {3, -4}, {3, 0x1000000}, {-3, 1}, {-1, All}, {100, All}})
    {
        EXPECT_EQ(admin.Enable(type, ticket, id), 0) << type << '/' << ticket;
        EXPECT_EQ(admin.Disable(type, ticket, id), 0) << type << '/' << ticket;
    }
    EXPECT_EQ(admin.Enable(-3, All, id), 0);
    for (int const unknown : {-1, 0, id + 1})
    {
        EXPECT_EQ(admin.Enable(3, 1, unknown), 0) << unknown;
        EXPECT_EQ(admin.Disable(3, 1, unknown), 0) << unknown;
        EXPECT_EQ(admin.Disable(-3, All, unknown), 0) << unknown;
    }
    EXPECT_EQ(admin.Access()->MENDISNOTIF(admin.Access()->Instance, 3, 1, id, true, nullptr), 0);
}

TEST_F(Switching, AnotherSessionsId_IsRefused)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    EXPECT_EQ(other.Enable(7, 1, id), 0);
    EXPECT_EQ(other.Disable(3, 1, id), 0);
    EXPECT_EQ(other.Disable(-3, All, id), 0);
    admin.Write(3, 1, "K", 7);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=7"));
}

TEST_F(Switching, EnablingAgain_ReplacesTheKeys)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Enable(3, 1, id, {"A"}) && admin.Enable(3, 1, id, {"B"}));
    admin.Write(3, 1, "A", 1);
    admin.Write(3, 1, "B", 2);
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 3/1 B@-1=2"));
}

TEST_F(Switching, OffOneTicket_LeavesTheType)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Enable(3, 1, id, {"A"}) && admin.Enable(3, All, id, {"B"}));
    EXPECT_EQ(admin.Disable(3, 1, id), 1);
    admin.Write(3, 1, "A", 1);
    admin.Write(3, 1, "B", 2);
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 3/1 B@-1=2"));
}

TEST_F(Switching, OffAType_TakesItsTicketsAlong)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Enable(3, 1, id) && admin.Enable(3, All, id) && admin.Enable(7, All, id));
    EXPECT_EQ(admin.Disable(3, All, id), 1);
    admin.Write(3, 1, "A", 1);
    admin.Write(7, 1, "B", 2);
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 7/1 B@-1=2"));
}

TEST_F(Switching, OffEverything_KeepsTheId)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Enable(3, 1, id) && admin.Enable(7, All, id));
    EXPECT_EQ(admin.Disable(-3, All, id), 1);
    admin.Write(3, 1, "A", 1);
    admin.Write(7, 1, "B", 2);
    EXPECT_THAT(CallsUpTo(listener, id), IsEmpty());
}

TEST_F(Switching, OffWhatIsNotOn_Succeeds)
{
    int const id = admin.Register(listener);
    EXPECT_EQ(admin.Disable(3, 1, id), 1);
    EXPECT_EQ(admin.Disable(3, All, id), 1);
    EXPECT_EQ(admin.Disable(-3, All, id), 1);
}

TEST_F(Ends, ADisable_WaitsForTheCallbackThatRuns_AndNoneComesAfterIt)
{
    for (int round = 0; round < 30; ++round)
    {
        int const id = admin.Register(listener);
        ASSERT_EQ(admin.Enable(3, 1, id), 1);
        std::atomic<bool> over{false};
        std::atomic<int> late{0};
        listener.onCall = [&]
        {
            std::this_thread::yield();
            late += over;
        };
        auto const before = listener.Calls().size();
        std::thread writer(
            [&]
            {
                for (int step = 0; step < 20; ++step)
                    other.Write(3, 1, "K", step);
            });
        listener.Wait(before + 1);
        EXPECT_EQ(admin.Disable(3, All, id), 1);
        over = true;
        EXPECT_EQ(listener.running, 0);
        writer.join();
        EXPECT_EQ(admin.Register(second), id + 1);  // nothing runs, so onCall may be replaced
        EXPECT_EQ(late, 0);
    }
}

TEST_F(Ends, ALogout_WaitsForTheCallbackThatRuns_AndNoneComesAfterIt)
{
    for (int round = 0; round < 10; ++round)
    {
        CLIENT const client(*this, LogIn("operator", "operator"));
        LISTENER mortal;  // gone before the next round: what came late would touch freed memory
        ASSERT_EQ(client.Enable(3, 1, client.Register(mortal)), 1);
        std::thread writer(
            [&]
            {
                for (int step = 0; step < 20; ++step)
                    admin.Write(3, 1, "K", step);
            });
        mortal.Wait(1);
        EXPECT_EQ(client.Logout(), 0);
        EXPECT_EQ(mortal.running, 0);
        auto const calls = mortal.Calls().size();
        writer.join();
        EXPECT_EQ(mortal.Calls().size(), calls);
    }
}

TEST_F(Ends, ANewRegistration_WaitsForTheCallbackOfTheOldOne)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    GATE gate;
    listener.onCall = [&] { gate.Pass(); };
    admin.Write(3, 1, "K", 1);
    gate.AwaitSomebody();
    std::thread opener([&] { gate.Open(); });
    admin.Register(second);
    EXPECT_EQ(listener.running, 0);
    opener.join();
}

TEST_F(EndsDeathTest, TheEndOfTheProcess_GoesBeforeTheHostsOwnObjects)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    auto const endWhileOthersWrite = [this]
    {
        ASSERT_EQ(admin.Enable(3, 1, admin.Register(listener)), 1);
        listener.onCall = []
        {
            if (HOST_STATIC::gone)
                std::abort();
        };
        std::thread(
            [this]
            {
                for (int value = 0;; ++value)
                    other.Write(3, 1, "K", value);
            })
            .detach();
        listener.Wait(10);
        std::exit(0);
    };
    EXPECT_EXIT(endWhileOthersWrite(), testing::ExitedWithCode(0), "");
}

TEST_F(FromTheCallback, EverySlotMayBeUsed)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    listener.onCall = [&]
    {
        EXPECT_EQ(admin.Read(3, 1, "K"), 7);
        EXPECT_TRUE(admin.Write(7, 1, "FromCallback", 8));
        EXPECT_TRUE(admin.Create(Type, 1));
        EXPECT_TRUE(admin.Open(3, 1));
        EXPECT_EQ(admin.Operate(Type, 1, MTICKET_OP_DELETE), 1);
        EXPECT_EQ(admin.Limit(7, 1, {"Nothing"}), 1);
        EXPECT_EQ(admin.Enable(7, 1, id), 1);
    };
    admin.Write(3, 1, "K", 7);
    listener.Wait(1);
    EXPECT_EQ(other.Read(7, 1, "FromCallback"), 8);
}

TEST_F(FromTheCallback, ADisable_TakesEffectAtOnce)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    GATE gate;
    listener.onCall = [&]
    {
        gate.Pass();
        EXPECT_EQ(admin.Disable(3, 1, id), 1);
    };
    admin.Write(3, 1, "K", 1);
    admin.Write(3, 1, "K", 2);
    gate.Open();
    listener.Wait(1);
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 3/1 K@-1=1"));
}

TEST_F(FromTheCallback, ADisableOfPartOfWhatWaits_LeavesTheRest)
{
    int const id = admin.Register(listener);
    ASSERT_TRUE(admin.Enable(7, 1, id) && admin.Enable(3, 1, id, {"A"}) && admin.Enable(3, All, id, {"B"}));
    GATE gate;
    bool isFirst = true;
    listener.onCall = [&]
    {
        gate.Pass();
        if (std::exchange(isFirst, false))
        {
            EXPECT_EQ(admin.Disable(3, 1, id), 1);
        }
    };
    admin.Write(7, 1, "First", 0);
    int const number = 7;
    SETMULTIPAR table[] = {
        {"A", PARAM_INT, 0, &number, -1, false, {}}, {"B", PARAM_INT, 0, &number, -1, false, {}}, {}};
    ASSERT_EQ(admin.Access()->MSETMULTIPAR(admin.Access()->Instance, 3, 1, table), 1);
    admin.Write(3, 1, "A", 8);
    gate.Open();
    EXPECT_THAT(CallsUpTo(listener, id), ElementsAre("changed 7/1 First@-1=0", "changed 3/1 B@-1=7"));
}

TEST_F(FromTheCallback, ALogoutOrANewRegistration_DoesNotWaitForItself)
{
    int const otherId = other.Register(second);
    ASSERT_EQ(other.Enable(3, 1, otherId), 1);
    second.onCall = [&] { EXPECT_EQ(other.Logout(), 0); };
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    listener.onCall = [&] { EXPECT_GT(admin.Register(listener), id); };
    admin.Write(3, 1, "K", 1);
    admin.Write(3, 1, "K", 2);
    EXPECT_THAT(second.Wait(1), ElementsAre("changed 3/1 K@-1=1"));
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=1"));
    EXPECT_EQ(other.Read(3, 1, "K"), -1);
}

// One write call carries a thousand records.
class MANY_RECORDS
{
public:
    explicit MANY_RECORDS(CLIENT const& client) : m_client(client)
    {
        for (int pos = 0; pos < Size; ++pos)
            m_table.push_back({"Many", PARAM_INT, 0, &m_number, pos, false, {}});
        m_table.push_back({});
    }
    void Write(int number)
    {
        m_number = number;
        MTICKET_ACCESS const* const access = m_client.Access();
        EXPECT_EQ(access->MSETMULTIPAR(access->Instance, 3, 1, m_table.data()), 1);
    }

    static constexpr int Size = 1000;

private:
    CLIENT const& m_client;
    int m_number = 0;
    std::vector<SETMULTIPAR> m_table;
};

TEST_F(Slowness, BeyondTheBound_NoWriterWaits_AndAllIsToldInOrder)
{
    int const id = admin.Register(listener);
    int const otherId = other.Register(second);
    ASSERT_TRUE(admin.Enable(7, 1, id) && admin.Enable(3, 1, id, {"Many"}) && other.Enable(3, 1, otherId));
    GATE gate;
    listener.onCall = [&] { gate.Pass(); };
    admin.Write(7, 1, "K", 1);
    gate.AwaitSomebody();
    MANY_RECORDS many(other);
    testing::internal::CaptureStderr();
    for (int write = 1; write <= 70; ++write)  // while the callback runs: no writer waits for it
        many.Write(write);
    gate.Open();

    listener.Wait(71);
    auto const calls = CallsUpTo(listener, id);
    ASSERT_EQ(calls.size(), 1u + 70u);
    for (std::size_t write = 1; write <= 70; ++write)
        EXPECT_THAT(calls[write], testing::StartsWith("changed 3/1 Many@0=" + std::to_string(write) + " "));
    EXPECT_EQ(second.Wait(70).size(), 70u);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

TEST_F(Slowness, AWriteLargerThanTheBound_StillComesWhenNothingElseWaits)
{
    int const id = admin.Register(listener);
    ASSERT_EQ(admin.Enable(3, 1, id), 1);
    int const number = 1;
    std::vector<SETMULTIPAR> table(70000, {"K", PARAM_INT, 0, &number, -1, false, {}});
    table.push_back({});
    ASSERT_EQ(admin.Access()->MSETMULTIPAR(admin.Access()->Instance, 3, 1, table.data()), 1);
    EXPECT_EQ(listener.Wait(1).size(), 1u);
}
