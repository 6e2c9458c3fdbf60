// Preparing and ending sessions: records, counters, flags.
#include "comgui/session/ComGUIManager.h"

#include "tests/session/FakeModule.h"
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
class Sessions : public WithManager
{
protected:
    Sessions() { module.calls.clear(); }  // of Open

    // A guarded call tells whether the manager counts as logged in: -1 it does not, 1 the fake answers.
    int GuardedCall()
    {
        int value = 0;
        fake.Put(0, 0, "Key", 5);
        return manager.GetParameter(fake.Access(), 0, 0, "Key", PARAM_INT, &value, -1);
    }

    TLogin record = {};
};

// The local port that the next Initialize of that kind hands out, seen by the plug-in.
class Ports : public Sessions
{
protected:
    unsigned int PortByTexts()
    {
        manager.Initialize("u", "p", "h", 1);
        return module.copy.iLocalPort;
    }
    unsigned int PortByRecord()
    {
        manager.Initialize(&record, 0);
        return module.copy.iLocalPort;
    }
    unsigned int BackwardPort()
    {
        manager.InitializeBackward(&record, 0);
        return module.copy.iLocalPort;
    }
};
}  // namespace

TEST_F(Sessions, ManagersOwnRecord_StartsZeroedWithItsSize)
{
    manager.MacLogin();
    TLogin expected = {};
    expected.nSize = 2632;
    EXPECT_EQ(std::memcmp(&module.copy, &expected, sizeof expected), 0);
}

TEST_F(Sessions, InitializeByTexts_FillsTheRecordAndHandsItOver)
{
    EXPECT_EQ(manager.Initialize("user", "secret", "host", 4711), 0);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry"));
    EXPECT_STREQ(module.copy.szUser, "user");
    EXPECT_STREQ(module.copy.szPassword, "secret");
    EXPECT_STREQ(module.copy.szServerHost, "host");
    EXPECT_EQ(module.copy.iServerPort, 4711);
    EXPECT_EQ(module.copy.iClientStamp, 30312656);
    EXPECT_EQ(module.stamp, 30312656);
}

TEST_F(Sessions, InitializeByTexts_KeepsTextsOf127BytesAndCutsLongerOnes)
{
    std::string const fits(127, 'a');
    std::string const tooLong(128, 'b');
    manager.Initialize(fits.c_str(), tooLong.c_str(), tooLong.c_str(), 1);
    EXPECT_EQ(module.copy.szUser, fits);
    EXPECT_EQ(module.copy.szPassword, std::string(127, 'b'));
    EXPECT_EQ(module.copy.szServerHost, std::string(127, 'b'));
}

TEST_F(Sessions, InitializeByTexts_NullText_CountsAsEmpty)
{
    manager.Login("old", "old", "old", 1);
    manager.Initialize(nullptr, nullptr, nullptr, 1);
    EXPECT_STREQ(module.copy.szUser, "");
    EXPECT_STREQ(module.copy.szPassword, "");
    EXPECT_STREQ(module.copy.szServerHost, "");
}

TEST_F(Sessions, InitializeByTexts_Twice_Gives0AndDoesNothing)
{
    manager.Initialize("user", "p", "h", 1);
    EXPECT_EQ(manager.Initialize("other", "p", "h", 2), 0);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry"));
    EXPECT_STREQ(module.login->szUser, "user");
}

TEST_F(Sessions, InitializeByTexts_Failing_PassesTheCodeOnAndMayBeTriedAgain)
{
    module.results["InitializeEntry"] = 77;
    EXPECT_EQ(manager.Initialize("user", "p", "h", 1), 77);
    EXPECT_STREQ(module.login->szUser, "user");  // the record stays filled in
    module.results.clear();
    EXPECT_EQ(manager.Initialize("user", "p", "h", 1), 0);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry", "InitializeEntry"));
}

TEST_F(Sessions, InitializeByRecord_HandsOverTheCallersRecordAndStamp)
{
    EXPECT_EQ(manager.Initialize(&record, 99), 0);
    EXPECT_EQ(module.login, &record);
    EXPECT_EQ(record.iClientStamp, 99);
    EXPECT_EQ(module.stamp, 99);
}

TEST_F(Sessions, InitializeByRecord_Twice_WritesTheStampAllTheSame_ByDesign)
{
    manager.Initialize(&record, 1);
    unsigned int const port = record.iLocalPort;
    EXPECT_EQ(manager.Initialize(&record, 2), 0);
    EXPECT_EQ(record.iClientStamp, 2);
    EXPECT_EQ(record.iLocalPort, port);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry"));
}

TEST_F(Sessions, InitializeByRecord_Failing_PassesTheCodeOnAndMayBeTriedAgain)
{
    module.results["InitializeEntry"] = 78;
    EXPECT_EQ(manager.Initialize(&record, 1), 78);
    EXPECT_EQ(manager.Initialize(&record, 1), 78);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry", "InitializeEntry"));
}

TEST_F(Sessions, ImplicitAndExplicitFamily_ShareTheInitializedFlag)
{
    manager.Initialize("u", "p", "h", 1);
    EXPECT_EQ(manager.Initialize(&record, 5), 0);
    EXPECT_EQ(record.iClientStamp, 5);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry"));
}

TEST_F(Sessions, BackwardFamily_HasAnInitializedFlagOfItsOwn)
{
    manager.Initialize("u", "p", "h", 1);
    EXPECT_EQ(manager.InitializeBackward(&record, 5), 0);
    EXPECT_EQ(manager.InitializeBackward(&record, 6), 0);
    EXPECT_EQ(record.iClientStamp, 6);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry", "InitializeEntry"));
}

TEST_F(Ports, OfRecords_StartAt50106AndGoUpByOne)
{
    EXPECT_EQ(PortByRecord(), 50106u);
    manager.Logout();  // takes the port back
    manager.Logout();  // and one more
    EXPECT_EQ(PortByRecord(), 50105u);
}

TEST_F(Ports, LogoutOfANeverInitializedManager_TakesThePortTo50105_ByDesign)
{
    manager.Logout();
    EXPECT_EQ(PortByRecord(), 50105u);
}

TEST_F(Ports, LogoutByRecord_TakesThePortBackToo)
{
    manager.Logout(&record);
    EXPECT_EQ(PortByRecord(), 50105u);
}

TEST_F(Ports, LogoutAfterInitializeByTexts_LowersTheOtherCounter_ByDesign)
{
    PortByTexts();
    manager.Logout();
    EXPECT_EQ(PortByRecord(), 50105u);
}

TEST_F(Ports, OfFailedInitializations_AreSpentAllTheSame)
{
    module.results["InitializeEntry"] = 1;
    EXPECT_EQ(PortByRecord(), 50106u);
    EXPECT_EQ(PortByRecord(), 50107u);
    EXPECT_EQ(BackwardPort(), 50005u);
    EXPECT_EQ(BackwardPort(), 50006u);
    unsigned int const port = PortByTexts();
    EXPECT_EQ(PortByTexts(), port + 1);
}

TEST_F(Ports, OfTexts_NeverGoDown)
{
    unsigned int const port = PortByTexts();
    manager.Logout();
    EXPECT_EQ(PortByTexts(), port + 1);
}

TEST_F(Ports, OfTexts_AreOneCounterForAllManagers)
{
    unsigned int const port = PortByTexts();
    ComGUIManager other;
    other.Initialize("u", "p", "h", 1);
    EXPECT_EQ(module.copy.iLocalPort, port + 1);
}

TEST_F(Ports, SecondInitialize_TakesNoPort)
{
    PortByRecord();
    manager.Initialize(&record, 0);
    EXPECT_EQ(record.iLocalPort, 50106u);
    manager.Logout();
    EXPECT_EQ(PortByRecord(), 50106u);
}

TEST_F(Ports, OfBackwardSessions_StartAt50005AndGoDownWithTheirLogout)
{
    EXPECT_EQ(BackwardPort(), 50005u);
    manager.LoginBackward(&record);
    manager.LogoutBackward(&record);
    EXPECT_EQ(BackwardPort(), 50005u);
    EXPECT_EQ(PortByRecord(), 50106u);
}

using PortsDeathTest = Ports;

TEST_F(PortsDeathTest, OfTexts_StartAt50006InANewProcess)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");  // runs in a new process, not in a copy of this one
    EXPECT_EXIT(
        {
            bool const asExpected = PortByTexts() == 50006;
            std::quick_exit(asExpected ? 0 : 1);
        },
        testing::ExitedWithCode(0), "");
}

TEST_F(Sessions, Logout_HandsOverTheSessionOfTheManagersRecord)
{
    module.onLogin = [this](TLogin& login) { login.hSession = this; };
    LogIn();
    module.results["LogoutEntry"] = 12;
    EXPECT_EQ(manager.Logout(), 12);
    EXPECT_EQ(module.calls.back(), "LogoutEntry");
    EXPECT_EQ(module.session, this);
}

TEST_F(Sessions, LogoutByRecord_HandsOverItsSession)
{
    record.hSession = &record;
    module.results["LogoutEntry"] = 13;
    EXPECT_EQ(manager.Logout(&record), 13);
    EXPECT_EQ(module.session, &record);
}

TEST_F(Sessions, Logout_ClearsTheFlagsWhateverThePlugInAnswers)
{
    LogIn();
    manager.Initialize("u", "p", "h", 1);
    ASSERT_EQ(GuardedCall(), 1);
    module.results["LogoutEntry"] = -7;
    manager.Logout();
    EXPECT_EQ(GuardedCall(), -1);
    module.calls.clear();
    manager.Initialize("u", "p", "h", 1);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry"));
}

TEST_F(Sessions, Logout_ClearsTheFlagsBeforeThePlugInIsAsked)
{
    LogIn();
    int guardDuringLogout = 0;
    module.onLogout = [&] { guardDuringLogout = GuardedCall(); };
    manager.Logout();
    EXPECT_EQ(guardDuringLogout, -1);
}

TEST_F(Sessions, Logout_KeepsTheContainer)
{
    LogIn();
    fake.Put(0, 0, "Key", 5);
    manager.Logout();
    int value = 0;
    EXPECT_EQ(manager.GetSystemTicketParamForKey("Key", PARAM_INT, &value, -1), 1);
    EXPECT_EQ(value, 5);
}

TEST_F(Sessions, LogoutBackward_LeavesTheImplicitSessionAlone)
{
    LogIn();
    manager.Initialize("u", "p", "h", 1);
    manager.InitializeBackward(&record, 1);
    manager.LoginBackward(&record);
    module.results["LogoutEntry"] = 14;
    record.hSession = &record;
    EXPECT_EQ(manager.LogoutBackward(&record), 14);
    EXPECT_EQ(module.session, &record);
    EXPECT_EQ(GuardedCall(), 1);
    module.calls.clear();
    manager.Initialize("u", "p", "h", 1);
    EXPECT_THAT(module.calls, IsEmpty());  // still initialised
    manager.InitializeBackward(&record, 1);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry"));  // no longer
}

// Each of the four takes 4 seconds, so each has a test, and a process, of its own.
namespace
{
class Uninitializing : public Sessions
{
protected:
    // Runs one of the four and returns the seconds it took.
    template <typename Call>
    double Seconds(int expected, Call call)
    {
        auto const start = std::chrono::steady_clock::now();
        EXPECT_EQ(call(), expected);
        return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    }
};
}  // namespace

TEST_F(Uninitializing, HandsOverTheRecordItselfAndBlocksFor4Seconds)
{
    module.results["UninitializeEntry"] = 21;
    EXPECT_GE(Seconds(21, [this] { return manager.Uninitialize(&record); }), 3.9);
    EXPECT_THAT(module.calls, ElementsAre("UninitializeEntry"));
    EXPECT_EQ(module.login, &record);
}

TEST_F(Uninitializing, WithoutArgument_TakesTheManagersRecord)
{
    LogIn();
    TLogin* const own = module.login;
    module.login = nullptr;
    EXPECT_GE(Seconds(0, [this] { return manager.Uninitialize(); }), 3.9);
    EXPECT_EQ(module.calls.back(), "UninitializeEntry");
    EXPECT_EQ(module.login, own);
}

TEST_F(Uninitializing, Async_BlocksJustAsLong_ByDesign)
{
    module.results["UninitializeAsyncEntry"] = 22;
    EXPECT_GE(Seconds(22, [this] { return manager.UninitializeAsync(&record); }), 3.9);
    EXPECT_THAT(module.calls, ElementsAre("UninitializeAsyncEntry"));
    EXPECT_EQ(module.login, &record);
}

TEST_F(Uninitializing, AsyncWithoutArgument_TakesTheManagersRecordAndChangesNoFlag)
{
    LogIn();
    TLogin* const own = module.login;
    module.login = nullptr;
    EXPECT_GE(Seconds(0, [this] { return manager.UninitializeAsync(); }), 3.9);
    EXPECT_EQ(module.calls.back(), "UninitializeAsyncEntry");
    EXPECT_EQ(module.login, own);
    EXPECT_EQ(GuardedCall(), 1);
}
