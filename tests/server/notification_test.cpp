// Which keys a filter selects, and what the server says of changes without a module around it.
#include "tests/server/ServerTest.h"

#include "comgui/ticket/TICKET_ID.h"
#include "tests/support/Threads.h"
#include <condition_variable>
#include <set>

using standin::KeyFilter;
using standin::Notification;

namespace
{
bool Selects(std::vector<char const*> patterns, char const* key)
{
    patterns.push_back(nullptr);
    return KeyFilter(patterns.data()).Selects(key);
}

class Told : public ServerTest
{
protected:
    ~Told() override { server.reset(); }  // ends the thread that uses the members below

    // Registers the user's session for all of a type, and counts what it gets.
    void Listen(std::string const& user, int type)
    {
        auto& service = Server().Notifications();
        int const id = service.NewId();
        EXPECT_TRUE(service.Register(As(user), id, [this](Notification const& told) { Take(told); }));
        EXPECT_TRUE(service.Enable(As(user), id, {type, TICKET_ID_ALL}, KeyFilter(nullptr)));
    }

    void Take(Notification const& told)
    {
        std::unique_lock guard(lock);
        changed.wait(guard, [this] { return !held; });
        ++calls;
        for (standin::ChangedParameter const& change : told.parameters)
            keys.insert(change.key->CStr());
        changed.notify_all();
        if (throws)
            throw std::runtime_error("told to fail");
    }

    void Hold(bool value)
    {
        std::lock_guard const guard(lock);
        held = value;
        changed.notify_all();
    }

    int CallsUpTo(int count)
    {
        std::unique_lock guard(lock);
        changed.wait_for(guard, std::chrono::minutes(2), [&] { return calls >= count; });
        return calls;
    }

    std::mutex lock;
    std::condition_variable changed;
    std::set<std::string> keys;
    int calls = 0;
    bool held = false;
    bool throws = false;
};
}  // namespace

TEST(KeyFilter, NoPatterns_SelectEveryKey)
{
    EXPECT_TRUE(KeyFilter(nullptr).SelectsAll());
    EXPECT_TRUE(KeyFilter(nullptr).Selects("A"));
    EXPECT_TRUE(Selects({}, "A"));
}

TEST(KeyFilter, AKey_IsItselfOnly)
{
    EXPECT_TRUE(Selects({"Job/Name", "B"}, "Job/Name"));
    EXPECT_FALSE(Selects({"Job/Name", "B"}, "Job/Names"));
    EXPECT_FALSE(Selects({"Job/Name", "B"}, "Job/Nam"));
    EXPECT_FALSE(Selects({"Job/Name"}, "job/name"));
    EXPECT_FALSE(Selects({""}, "A"));
}

TEST(KeyFilter, ABeginning_IsEveryKeyThatBeginsWithIt)
{
    EXPECT_TRUE(Selects({"Job/*"}, "Job/Name"));
    EXPECT_TRUE(Selects({"Job/*"}, "Job/"));
    EXPECT_FALSE(Selects({"Job/*"}, "Job"));
    EXPECT_FALSE(Selects({"Job/*"}, "Jobs/Name"));
    EXPECT_TRUE(Selects({"*"}, "A"));
    EXPECT_FALSE(Selects({"A*B"}, "AxB"));  // a star elsewhere is a character like others
    EXPECT_TRUE(Selects({"A*B"}, "A*B"));
}

TEST(KeyFilter, BeginningsOfBeginnings_AreFoundInAnyOrder)
{
    for (auto const& patterns : {std::vector{"A*", "AB*", "ABC*", "B"}, {"ABC*", "B", "AB*", "A*"}})
    {
        EXPECT_TRUE(Selects(patterns, "A"));
        EXPECT_TRUE(Selects(patterns, "AA"));
        EXPECT_TRUE(Selects(patterns, "ABD"));
        EXPECT_TRUE(Selects(patterns, "AZ"));
        EXPECT_TRUE(Selects(patterns, "B"));
        EXPECT_FALSE(Selects(patterns, "BA"));
        EXPECT_FALSE(Selects(patterns, ""));
    }
}

TEST_F(Told, AWriteThatTheStoreRefused_IsNot)
{
    Listen("admin", Job.type);
    site->FailAll(true);
    EXPECT_FALSE(Set(Job, "Refused", 1));
    EXPECT_FALSE(Tickets().Create(As("admin"), {Job.type, 77}));
    site->FailAll(false);
    EXPECT_TRUE(Set(Job, "Done", 1));
    EXPECT_EQ(CallsUpTo(1), 1);
    EXPECT_EQ(keys, std::set<std::string>{"Done"});
}

TEST_F(Told, ACallbackThatThrows_IsCalledAgainForTheNextChange)
{
    Listen("admin", Job.type);
    throws = true;
    testing::internal::CaptureStderr();
    Set(Job, "A", 1);
    Set(Job, "B", 1);
    EXPECT_EQ(CallsUpTo(2), 2);
    server.reset();
    EXPECT_NE(testing::internal::GetCapturedStderr().find("the callback failed: told to fail"),
              std::string::npos);
}

TEST_F(Told, LargeTexts_CountByTheirSize)
{
    auto& service = Server().Notifications();
    Listen("admin", Job.type);
    Hold(true);
    std::string const text(16u << 20, 'x');
    for (int i = 0; i < 3; ++i)  // the first may be under way, and does not count then
        Set(Job, ("T" + std::to_string(i)).c_str(), text.c_str());
    EXPECT_TRUE(service.HasRoom());
    for (int i = 3; i < 6; ++i)
        Set(Job, ("T" + std::to_string(i)).c_str(), text.c_str());
    EXPECT_FALSE(service.HasRoom());
    Hold(false);
    EXPECT_EQ(CallsUpTo(6), 6);
    EXPECT_TRUE(service.HasRoom());
}

TEST_F(Told, AfterStop_NobodyIs)
{
    Listen("admin", Job.type);
    Set(Job, "A", 1);
    EXPECT_EQ(CallsUpTo(1), 1);
    Server().Notifications().Stop(std::chrono::minutes(1));
    EXPECT_TRUE(Set(Job, "B", 1));
    server.reset();
    EXPECT_EQ(calls, 1);
}

TEST_F(Told, Stop_EndsTheThread)
{
    auto& service = Server().Notifications();  // with the threads of the server
    auto const before = Threads();
    Listen("admin", Job.type);
    EXPECT_EQ(Threads(), before + 1);
    service.Stop(std::chrono::minutes(1));
    EXPECT_EQ(ThreadsOnceThereAre(before), before);
    EXPECT_FALSE(service.Register(As("admin"), 7, [](Notification const&) {}));
    EXPECT_EQ(ThreadsOnceThereAre(before), before);
}

TEST_F(Told, Stop_DoesNotWaitLongerThanTold)
{
    Listen("admin", Job.type);
    Hold(true);
    Set(Job, "A", 1);
    Server().Notifications().Stop(std::chrono::milliseconds(1));  // the callback still hangs, or never ran
    Hold(false);
}

TEST_F(Told, EnablingManyTimes_IsForgottenByOneDisable)
{
    Listen("admin", Job.type);
    auto& service = Server().Notifications();
    for (int id = 0; id < 100; ++id)
        EXPECT_TRUE(service.Enable(As("admin"), 1, {Job.type, id}, KeyFilter(nullptr)));
    EXPECT_TRUE(service.Wants(Job));
    EXPECT_TRUE(service.Disable(As("admin"), 1, standin::AllTickets));
    EXPECT_FALSE(service.Wants(Job));
}

TEST_F(Told, AnEndedSession_CannotRegister)
{
    auto& session = As("operator");
    Server().Logout(session);
    EXPECT_FALSE(Server().Notifications().Register(session, 1, [](Notification const&) {}));
}
