#include "tests/foundation/WatchedLock.h"

#include <future>
#include <gtest/gtest.h>
#include <optional>
#include <thread>

using SysLib::MUTEX_INSTANCE;
using SysLib::MUTEX_LOCK;

namespace
{
using STEPS = std::vector<std::string>;

class LockSteps : public testing::Test
{
protected:
    LockSteps() { watchedLock = &watched; }
    ~LockSteps() override { watchedLock = nullptr; }
    LockSteps(LockSteps const&) = delete;
    LockSteps& operator=(LockSteps const&) = delete;

    // What happened since the last look.
    STEPS Steps() { return std::exchange(watched.steps, {}); }

    // Lets the next step of that name look at the instance.
    void At(std::string const& wanted, std::function<void(MUTEX_INSTANCE const&)> const& look)
    {
        watched.atStep = [wanted, look](MUTEX_INSTANCE const& instance, std::string const& step)
        {
            if (step == wanted)
                look(instance);
        };
    }

    WATCHED_LOCK watched;
};

template <typename Action>
std::string TextThrownBy(Action action)
{
    try
    {
        action();
    }
    catch (char const* text)
    {
        return text;
    }
    return "nothing";
}
}  // namespace

TEST_F(LockSteps, Instance_IsNamedThenMadeThenTold)
{
    MUTEX_INSTANCE const instance;
    EXPECT_EQ(Steps(), (STEPS{"InitID", "init", "0"}));
}

TEST_F(LockSteps, InitID_FindsTheFieldsSet)
{
    bool looked = false;
    At("InitID",
       [&](MUTEX_INSTANCE const& instance)
       {
           looked = true;
           EXPECT_EQ(instance.locker, MUTEX_INSTANCE::NO_LOCKER());
           EXPECT_EQ(instance.lockCount, 0);
       });
    MUTEX_INSTANCE const instance;
    EXPECT_TRUE(looked);
}

TEST_F(LockSteps, InstanceWithoutMutex_ThrowsItsTextAndIsNotTold)
{
    watched.failing = "init";
    EXPECT_EQ(TextThrownBy([] { MUTEX_INSTANCE const instance; }), "MUTEX_INSTANCE: pthread_mutex_init fail");
    EXPECT_EQ(Steps(), (STEPS{"InitID", "init"}));
}

TEST_F(LockSteps, InstanceThatEnds_IsToldThenDestroyed)
{
    std::optional<MUTEX_INSTANCE> instance(std::in_place);
    Steps();
    instance.reset();
    EXPECT_EQ(Steps(), (STEPS{"1", "destroy"}));
}

TEST_F(LockSteps, DestroyThatFails_IsIgnored)
{
    std::optional<MUTEX_INSTANCE> instance(std::in_place);
    pthread_mutex_destroy(&instance->mutex);
    watched.failing = "destroy";
    EXPECT_EQ(TextThrownBy([&] { instance.reset(); }), "nothing");
}

TEST_F(LockSteps, Lock_IsWantedThenTakenThenHeld)
{
    MUTEX_INSTANCE instance;
    Steps();
    MUTEX_LOCK const lock(instance);
    EXPECT_EQ(Steps(), (STEPS{"2", "lock", "3"}));
}

TEST_F(LockSteps, LockThatEnds_IsToldThenReleased)
{
    MUTEX_INSTANCE instance;
    std::optional<MUTEX_LOCK> lock(std::in_place, instance);
    Steps();
    lock.reset();
    EXPECT_EQ(Steps(), (STEPS{"4", "unlock"}));
}

TEST_F(LockSteps, NestedLocks_TouchThePosixMutexOnce)
{
    MUTEX_INSTANCE instance;
    Steps();
    {
        MUTEX_LOCK const first(instance);
        MUTEX_LOCK const second(instance);
        MUTEX_LOCK const third(instance);
    }
    EXPECT_EQ(Steps(), (STEPS{"2", "lock", "3", "2", "3", "2", "3", "4", "4", "4", "unlock"}));
}

TEST_F(LockSteps, Wanted_FindsTheFieldsAsTheyWere)
{
    MUTEX_INSTANCE instance;
    int count = -1;
    At("2", [&](MUTEX_INSTANCE const& found) { count = found.lockCount; });
    MUTEX_LOCK const lock(instance);
    EXPECT_EQ(count, 0);
    MUTEX_LOCK const nested(instance);
    EXPECT_EQ(count, 1);
}

TEST_F(LockSteps, Held_FindsTheFieldsSet)
{
    MUTEX_INSTANCE instance;
    int count = -1;
    At("3",
       [&](MUTEX_INSTANCE const& found)
       {
           EXPECT_EQ(&found, &instance);
           EXPECT_EQ(found.locker, pthread_self());
           count = found.lockCount;
       });
    MUTEX_LOCK const lock(instance);
    EXPECT_EQ(count, 1);
    MUTEX_LOCK const nested(instance);
    EXPECT_EQ(count, 2);
}

TEST_F(LockSteps, Released_FindsTheFieldsStillSet)
{
    MUTEX_INSTANCE instance;
    std::optional<MUTEX_LOCK> lock(std::in_place, instance);
    int count = -1;
    At("4", [&](MUTEX_INSTANCE const& found) { count = found.lockCount; });
    lock.reset();
    EXPECT_EQ(count, 1);
}

TEST_F(LockSteps, Unlock_FindsTheFieldsReset)
{
    MUTEX_INSTANCE instance;
    std::optional<MUTEX_LOCK> lock(std::in_place, instance);
    bool looked = false;
    At("unlock",
       [&](MUTEX_INSTANCE const& found)
       {
           looked = true;
           EXPECT_EQ(found.locker, MUTEX_INSTANCE::NO_LOCKER());
           EXPECT_EQ(found.lockCount, 0);
       });
    lock.reset();
    EXPECT_TRUE(looked);
}

TEST_F(LockSteps, RefusedLock_ThrowsItsTextAndHoldsNothing)
{
    MUTEX_INSTANCE instance;
    Steps();
    watched.failing = "lock";
    EXPECT_EQ(TextThrownBy([&] { MUTEX_LOCK const lock(instance); }), "MUTEX_LOCK: pthread_mutex_lock fail");
    EXPECT_EQ(Steps(), (STEPS{"2", "lock"}));
    EXPECT_EQ(instance.locker, MUTEX_INSTANCE::NO_LOCKER());
    EXPECT_EQ(instance.lockCount, 0);
}

TEST_F(LockSteps, RefusedUnlock_IsIgnored)
{
    MUTEX_INSTANCE instance;
    std::optional<MUTEX_LOCK> lock(std::in_place, instance);
    watched.failing = "unlock";
    EXPECT_EQ(TextThrownBy([&] { lock.reset(); }), "nothing");
    EXPECT_EQ(instance.locker, MUTEX_INSTANCE::NO_LOCKER());
    pthread_mutex_unlock(&instance.mutex);  // what was refused
}

TEST_F(LockSteps, ExceptionWhereALockEnds_EndsTheProcess)
{
    At("4", [](MUTEX_INSTANCE const&) { throw "from the hook"; });
    EXPECT_DEATH(
        {
            MUTEX_INSTANCE instance;
            TextThrownBy([&] { MUTEX_LOCK const lock(instance); });
        },
        "");
}

TEST_F(LockSteps, ExceptionWhereAnInstanceEnds_EndsTheProcess)
{
    At("1", [](MUTEX_INSTANCE const&) { throw "from the hook"; });
    EXPECT_DEATH(TextThrownBy([] { MUTEX_INSTANCE const instance; }), "");
}

TEST_F(LockSteps, SecondThread_WaitsForTheOutermostLockOfTheFirst)
{
    MUTEX_INSTANCE instance;
    std::optional<MUTEX_LOCK> outer(std::in_place, instance);
    std::optional<MUTEX_LOCK> inner(std::in_place, instance);
    std::promise<void> wanted;
    watched.atStep = [&](MUTEX_INSTANCE const&, std::string const& step)
    {
        if (step == "lock")
            wanted.set_value();
    };
    bool left = false;
    bool leftAtEntry = false;
    int countAtEntry = -1;
    std::thread second(
        [&]
        {
            MUTEX_LOCK const lock(instance);
            leftAtEntry = left;
            countAtEntry = instance.lockCount;
        });
    wanted.get_future().wait();
    inner.reset();
    left = true;
    outer.reset();
    second.join();
    EXPECT_TRUE(leftAtEntry);
    EXPECT_EQ(countAtEntry, 1);
}
