#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tests/module_kit/FakePlugIn.h"
#include <chrono>
#include <condition_variable>
#include <functional>
#include <gmock/gmock.h>
#include <thread>

using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
namespace plugin = comgui::plugin;

namespace
{
// A client that hears, as lines "kind argA code key[pos]=value ...".
class CLIENT
{
public:
    static void Hear(void* user, int kind, int argA, int argB, int code, void* data)
    {
        static_cast<CLIENT*>(user)->Take(kind, argA, argB, code, static_cast<SETMULTIPAR const*>(data));
    }

    // The lines, once there are so many.
    std::vector<std::string> Await(std::size_t count)
    {
        std::unique_lock lock(m_lock);
        EXPECT_TRUE(m_heard.wait_for(lock, 20s, [&] { return m_lines.size() >= count; })) << m_lines.size();
        return m_lines;
    }
    std::vector<std::string> Lines() { return Await(0); }
    int Id()
    {
        std::lock_guard const lock(m_lock);
        return m_id;
    }

    std::function<void()> inCall;  // called first

private:
    void Take(int kind, int argA, int argB, int code, SETMULTIPAR const* table)
    {
        if (inCall)
            inCall();
        std::string line = std::to_string(kind) + " " + std::to_string(argA) + " " + std::to_string(code);
        char const* before = nullptr;
        for (; table && table->key; ++table)
        {
            line += std::string(table->key == before ? " same" : " ") + table->key;
            line += "[" + std::to_string(table->pos) + "]=" + ValueOf(*table);
            before = table->key;
        }
        std::lock_guard const lock(m_lock);
        m_id = argB;
        m_lines.push_back(line);
        m_heard.notify_all();
    }

    static std::string ValueOf(SETMULTIPAR const& record)
    {
        if (record.type == PARAM_INT)
            return std::to_string(*static_cast<int const*>(record.value));
        if (record.type == PARAM_STRING)
            return static_cast<char const*>(record.value);
        return record.value ? "?" : "none";
    }

    std::mutex m_lock;
    std::condition_variable m_heard;
    std::vector<std::string> m_lines;
    int m_id = 0;
};

class NotificationsOfTheKit : public PlugInTest
{
protected:
    NotificationsOfTheKit() : hSession(LogIn()), container(ContainerOf(hSession)), ticket(NewTicket()) {}
    ~NotificationsOfTheKit() override
    {
        table.LogoutEntry(hInstance, hSession);  // no call reaches a client that has gone
    }

    int Register(CLIENT& which) const
    {
        STICKET_ACCESS const* answer = table.STicketFactory->CreateTicket(nullptr);
        answer->SSETPARAMETER(answer->Instance, "pGUI2Notification", PARAM_POINTER,
                              reinterpret_cast<void*>(&CLIENT::Hear), -1);
        answer->SSETPARAMETER(answer->Instance, "pUser", PARAM_POINTER, &which, -1);
        EXPECT_EQ(table.SendCommandEntry(hInstance, hSession, "local.set.callback", 0,
                                         const_cast<STICKET_ACCESS*>(answer)),
                  0);
        int id = -1;
        EXPECT_EQ(answer->SGETPARAMETER(answer->Instance, "iGUINotificationID", PARAM_INT, &id, -1), 1);
        table.STicketFactory->DestroyTicket(&answer);
        return id;
    }

    int Switch(int id, int ofTicket, bool enable, std::vector<char const*> keys = {}) const
    {
        keys.push_back(nullptr);
        return container->MENDISNOTIF(container->Instance, 3, ofTicket, id, enable,
                                      enable ? keys.data() : nullptr);
    }

    void Write(char const* key, int value) const { EXPECT_TRUE(GetServer().Write(ticket, key, value, -1)); }

    std::string Line(char const* kind, std::string const& rest = "") const
    {
        return std::string(kind) + " " + std::to_string(ticket.id) + " 3" + rest;
    }

    void* hSession;
    MTICKET_ACCESS const* container;
    fake::Address ticket;
    CLIENT client;
};
}  // namespace

TEST_F(NotificationsOfTheKit, AChange_IsToldWithItsRecordsInOrder)
{
    int const id = Register(client);
    EXPECT_GE(id, 0);
    EXPECT_EQ(Switch(id, ticket.id, true), 1);
    for (int i = 0; i < 100; ++i)
        Write("K", i);
    auto const lines = client.Await(100);
    for (int i = 0; i < 100; ++i)
        EXPECT_EQ(lines.at(static_cast<std::size_t>(i)), Line("1", " K[-1]=" + std::to_string(i)));
    EXPECT_EQ(client.Id(), id);
}

TEST_F(NotificationsOfTheKit, RecordsOfOneKey_ShareItsAddress)
{
    int const id = Register(client);
    EXPECT_EQ(Switch(id, ticket.id, true), 1);
    auto& notifications = plugin::PlugIn<fake::Module>::GetModule().GetNotifications();
    notifications.Changed(ticket, {{"K", 1, 0}, {"K", std::string("two"), 1}, {"K", {}, 2}, {"L", 4, -1}});
    EXPECT_THAT(client.Await(1), ElementsAre(Line("1", " K[0]=1 sameK[1]=two sameK[2]=none L[-1]=4")));
}

TEST_F(NotificationsOfTheKit, OfAWholeType_TellOfEveryTicketAndItsBeginningAndEnd)
{
    int const id = Register(client);
    EXPECT_EQ(Switch(id, TICKET_ID_ALL, true), 1);
    auto const made = GetServer().CreateNext(3);
    ASSERT_TRUE(made);
    EXPECT_TRUE(GetServer().Delete({3, *made}));
    Write("K", 1);
    std::string const number = std::to_string(*made);
    EXPECT_THAT(client.Await(3),
                ElementsAre("4 " + number + " 3", "5 " + number + " 3", Line("1", " K[-1]=1")));
}

TEST_F(NotificationsOfTheKit, OnlyKeysThatWereAskedFor_AreTold)
{
    int const id = Register(client);
    EXPECT_EQ(Switch(id, ticket.id, true, {"Wanted", "Job/*"}), 1);
    Write("Unwanted", 1);
    Write("Wanted", 2);
    Write("Job/Name", 3);
    EXPECT_THAT(client.Await(2), ElementsAre(Line("1", " Wanted[-1]=2"), Line("1", " Job/Name[-1]=3")));
}

TEST_F(NotificationsOfTheKit, AfterSwitchingOff_NoCallRunsOrComes)
{
    int const id = Register(client);
    std::atomic<int> running = 0;
    std::atomic<bool> isOff = false;
    client.inCall = [&]
    {
        ++running;
        EXPECT_FALSE(isOff);
        std::this_thread::sleep_for(100us);
        --running;
    };
    for (int round = 0; round < 20; ++round)
    {
        isOff = false;
        EXPECT_EQ(Switch(id, ticket.id, true), 1);
        for (int i = 0; i < 20; ++i)
            Write("K", i);
        EXPECT_EQ(Switch(id, round % 2 ? ticket.id : int{TICKET_ID_ALL}, false), 1);
        EXPECT_EQ(running, 0);
        isOff = true;
        Write("K", -1);
    }
    EXPECT_THAT(client.Lines(), testing::Not(testing::Contains(HasSubstr("=-1"))));
}

TEST_F(NotificationsOfTheKit, AfterALogoutThatFailed_NoCallComesEither)
{
    EXPECT_EQ(Switch(Register(client), ticket.id, true), 1);
    fake::Trouble::Set(
        [](std::string const& where)
        {
            if (where == "End")
                throw std::runtime_error("the end failed");
        });
    EXPECT_NE(table.LogoutEntry(hInstance, hSession), 0);
    fake::Trouble::Set({});
    Write("A", 1);
    std::this_thread::sleep_for(50ms);
    EXPECT_THAT(client.Lines(), IsEmpty());
}

TEST_F(NotificationsOfTheKit, AfterTheLogout_NoCallComes)
{
    int const id = Register(client);
    EXPECT_EQ(Switch(id, ticket.id, true), 1);
    Write("K", 1);
    EXPECT_EQ(table.LogoutEntry(hInstance, hSession), 0);
    auto const before = client.Lines();
    Write("K", 2);

    CLIENT other;
    hSession = LogIn();
    container = ContainerOf(hSession);
    EXPECT_EQ(Switch(Register(other), ticket.id, true), 1);
    Write("K", 3);
    EXPECT_THAT(other.Await(1),
                ElementsAre(Line("1", " K[-1]=3")));  // the first client's would have come before
    EXPECT_EQ(client.Lines(), before);
}

TEST_F(NotificationsOfTheKit, ACall_MayUseThePlugInAndSwitchItselfOff)
{
    int const id = Register(client);
    client.inCall = [&]
    {
        int value = -1;
        EXPECT_EQ(container->MGETPARAMETER(container->Instance, 3, ticket.id, "K", PARAM_INT, &value, -1), 1);
        EXPECT_EQ(Switch(id, ticket.id, false), 1);
    };
    EXPECT_EQ(Switch(id, ticket.id, true), 1);
    Write("K", 1);
    EXPECT_THAT(client.Await(1), ElementsAre(Line("1", " K[-1]=1")));
}

TEST_F(NotificationsOfTheKit, ACallThatThrows_IsNotTheLast)
{
    int const id = Register(client);
    EXPECT_EQ(Switch(id, ticket.id, true), 1);
    std::atomic<int> calls = 0;
    client.inCall = [&]
    {
        if (++calls == 1)
            throw 7;
    };
    testing::internal::CaptureStderr();
    Write("K", 1);
    Write("K", 2);
    EXPECT_THAT(client.Await(1), ElementsAre(Line("1", " K[-1]=2")));
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("callback threw"));
}

TEST_F(NotificationsOfTheKit, WhatIsToldToOneSession_ReachesItWithoutBeingSwitchedOn)
{
    int const id = Register(client);
    auto& notifications = plugin::PlugIn<fake::Module>::GetModule().GetNotifications();
    plugin::Session const another;
    notifications.Tell(another, 6, 0, 0, {{"Code", 1, -1}});
    EXPECT_EQ(Switch(id, ticket.id, true), 1);
    Write("K", 1);
    EXPECT_THAT(client.Await(1), ElementsAre(Line("1", " K[-1]=1")));
}

TEST_F(NotificationsOfTheKit, SwitchesThatCannotBe_AreRefused)
{
    EXPECT_EQ(Switch(1, ticket.id, true), 0);  // nobody has registered
    int const id = Register(client);
    EXPECT_EQ(Switch(id + 1, ticket.id, true), 0);
    EXPECT_EQ(Switch(id, TICKET_ID_NEXT, true), 0);
    EXPECT_EQ(Switch(id, 1 << 24, true), 0);
    EXPECT_EQ(container->MENDISNOTIF(container->Instance, 3, ticket.id, id, true, nullptr), 0);
    EXPECT_EQ(container->MENDISNOTIF(container->Instance, 100, TICKET_ID_ALL, id, false, nullptr), 0);
    EXPECT_EQ(Switch(id, ticket.id, false), 1);
    EXPECT_EQ(Switch(id, ticket.id, false), 1);
}

TEST_F(NotificationsOfTheKit, AnotherRegistration_TakesThePlaceOfTheFirst)
{
    int const first = Register(client);
    EXPECT_EQ(Switch(first, ticket.id, true), 1);
    CLIENT other;
    int const second = Register(other);
    EXPECT_NE(first, second);
    EXPECT_EQ(Switch(first, ticket.id, true), 0);
    EXPECT_EQ(Switch(second, ticket.id, true), 1);
    Write("K", 1);
    EXPECT_THAT(other.Await(1), ElementsAre(Line("1", " K[-1]=1")));
    EXPECT_THAT(client.Lines(), IsEmpty());
    EXPECT_EQ(table.LogoutEntry(hInstance, hSession), 0);  // before the other client goes
}

namespace
{
// A client whose calls wait until they are let go, and a second thread that wants something meanwhile.
class WhileACallRuns : public testing::Test
{
protected:
    WhileACallRuns()
    {
        EXPECT_TRUE(notifications.Register(session, id, plugin::Callback(Hang, this)));
        EXPECT_TRUE(notifications.Enable(session, id, ticket, {}));
        notifications.Changed(ticket, {{"K", 1}});
        while (!isInside)
            std::this_thread::yield();
    }

    static void Hang(void* user, int, int, int, int, void*)
    {
        auto& self = *static_cast<WhileACallRuns*>(user);
        self.isInside = true;
        std::lock_guard const wait(self.m_hanging);
        ++self.calls;
    }

    // Runs it on another thread, looks that it waits for the call, and lets that go.
    void ExpectToWait(std::function<void()> const& work)
    {
        int callsAtItsEnd = 0;
        std::atomic<bool> isDone{false};
        std::thread other(
            [&]
            {
                work();
                callsAtItsEnd = calls;
                isDone = true;
            });
        std::this_thread::sleep_for(50ms);
        EXPECT_FALSE(isDone);
        m_lock.unlock();
        other.join();
        EXPECT_EQ(callsAtItsEnd, 1);
        std::this_thread::sleep_for(50ms);
        EXPECT_EQ(calls, 1);  // none came behind it
    }

    plugin::Address const ticket{3, 1};
    plugin::Session const session;
    plugin::Notifications notifications;
    int const id = notifications.NewId();
    std::atomic<bool> isInside{false};
    std::atomic<int> calls{0};

private:
    std::mutex m_hanging;
    std::unique_lock<std::mutex> m_lock{m_hanging};
};
}  // namespace

TEST_F(WhileACallRuns, TheEndOfASession_WaitsForIt)
{
    notifications.Changed(ticket, {{"K", 2}});
    ExpectToWait([&] { notifications.Remove(session); });
}

TEST_F(WhileACallRuns, SwitchingOff_WaitsForItAndTakesBackWhatWaits)
{
    notifications.Changed(ticket, {{"K", 2}});
    ExpectToWait([&] { EXPECT_TRUE(notifications.Disable(session, id, ticket)); });
}

TEST(NotificationsAtTheirEnd, ASessionThatIsSilent_IsNotRegistered)
{
    plugin::Notifications notifications;
    plugin::Session session;
    session.Begin(notifications);
    session.Silence();
    plugin::MemoryTicket answer;
    auto const hear = [](void*, int, int, int, int, void*) { ADD_FAILURE() << "called after the end"; };
    EXPECT_EQ(session.SetCallback(plugin::Callback(hear, nullptr), *answer.Access()), plugin::UnknownSession);
    int const id =
        *std::get_if<int>(&static_cast<plugin::Value const&>(answer.Read("iGUINotificationID", 0)));
    EXPECT_FALSE(notifications.Enable(session, id, {3, 1}, {}));
}

TEST(NotificationsAtTheirEnd, Stop_WaitsNoLongerThanToldForACallThatHangs)
{
    static std::mutex hanging;
    static std::atomic<bool> isInside{false};
    static auto& notifications = *new plugin::Notifications;  // its thread stays
    static plugin::Session const session;
    std::unique_lock lock(hanging);
    auto const hang = [](void*, int, int, int, int, void*)
    {
        isInside = true;
        std::lock_guard const wait(hanging);
    };
    int const id = notifications.NewId();
    ASSERT_TRUE(notifications.Register(session, id, plugin::Callback(hang, nullptr)));
    ASSERT_TRUE(notifications.Enable(session, id, {3, 1}, {}));
    notifications.Changed({3, 1}, {{"K", 1}});
    while (!isInside)
        std::this_thread::yield();
    notifications.Stop(10ms);
    EXPECT_FALSE(notifications.Register(session, id, plugin::Callback(hang, nullptr)));
    lock.unlock();
}
