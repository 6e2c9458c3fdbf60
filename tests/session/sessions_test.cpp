// Preparing and ending sessions: records, counters, flags.
#include "comgui/session/ComGUIManager.h"

#include "tests/session/FakeModule.h"
#include "tests/session/Records.h"
#include "tests/session/Sleep.h"
#include <chrono>
#include <cstdlib>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAre;

namespace
{
class Sessions : public WithManager
{
protected:
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
    TLogin expected = {};
    expected.nSize = 2632;
    EXPECT_THAT(*own, IsRecord(expected));
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

TEST_F(Sessions, InitializeByRecord_HandsTheStampOverToo)
{
    EXPECT_EQ(manager.Initialize(&record, 99), 0);
    EXPECT_EQ(module.stamp, 99);
    EXPECT_EQ(module.copy.iClientStamp, 99);
    EXPECT_EQ(module.copy.iLocalPort, 50106u);  // already there when the plug-in is asked
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

// --- logging out -----------------------------------------------------------------------------------------

TEST_F(Ports, LogoutBackwardOfANeverInitializedSession_TakesThePortTo50004_ByDesign)
{
    manager.LogoutBackward(&record);
    EXPECT_EQ(BackwardPort(), 50004u);
}

TEST_F(Sessions, Logout_PassesThePlugInsCodeOn)
{
    module.results["LogoutEntry"] = 12;
    EXPECT_EQ(manager.Logout(), 12);
    EXPECT_EQ(manager.Logout(&record), 12);
    EXPECT_EQ(manager.LogoutBackward(&record), 12);
}

TEST_F(Sessions, Logout_ClearsBothFlagsWhateverThePlugInAnswers)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    module.results["LogoutEntry"] = -7;
    manager.Logout();
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
}

TEST_F(Sessions, LogoutByRecord_OfAnyOther_ClearsBothFlagsToo_ByDesign)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    manager.Logout(&record);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
}

TEST_F(Sessions, Logout_ClearsFlagsAndTakesThePortBackBeforeThePlugInIsAsked)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    bool stillLoggedIn = true;
    module.onLogout = [&]
    {
        stillLoggedIn = IsLoggedIn();
        manager.Initialize(&record, 0);
    };
    manager.Logout();
    EXPECT_FALSE(stillLoggedIn);
    EXPECT_EQ(record.iLocalPort, 50105u);
}

TEST_F(Sessions, LogoutBackward_ClearsTheFlagAndTakesThePortBackBeforeThePlugInIsAsked)
{
    manager.InitializeBackward(&record, 0);
    TLogin next = {};
    module.onLogout = [&] { manager.InitializeBackward(&next, 0); };
    manager.LogoutBackward(&record);
    EXPECT_EQ(next.iLocalPort, 50005u);
}

TEST_F(Sessions, LogoutBackward_EndsTheGivenRecordsSession)
{
    TLogin loggedIn = {};
    loggedIn.hSession = &loggedIn;
    manager.LoginBackward(&loggedIn);
    record.hSession = &record;
    manager.LogoutBackward(&record);
    EXPECT_EQ(module.session, &record);
}

TEST_F(Sessions, Logout_KeepsTheContainer)
{
    LogIn();
    manager.Logout();
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Sessions, Logout_LeavesTheBackwardSessionAlone)
{
    manager.InitializeBackward(&record, 1);
    manager.Logout();
    EXPECT_TRUE(IsBackwardInitialized());
}

TEST_F(Sessions, LogoutBackward_LeavesTheImplicitSessionAlone)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    manager.InitializeBackward(&record, 1);
    manager.LogoutBackward(&record);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(IsInitialized());
    EXPECT_FALSE(IsBackwardInitialized());
}

// --- ending ----------------------------------------------------------------------------------------------

namespace
{
struct ENDING
{
    char const* name;
    int (*call)(ComGUIManager& manager, TLogin* given);
    char const* entry;
};

class Uninitializing : public Sessions, public testing::WithParamInterface<ENDING>
{
protected:
    // Instead of sleeping it is written down among the calls.
    Uninitializing()
    {
        insteadOfSleeping = [this](int seconds)
        { module.calls.push_back("wxSleep(" + std::to_string(seconds) + ")"); };
    }
    ~Uninitializing() override { insteadOfSleeping = nullptr; }

    int Call() { return GetParam().call(manager, &record); }
};
}  // namespace

TEST_P(Uninitializing, CallsTheEntryAndThenSleepsFor4Seconds)
{
    Call();
    EXPECT_THAT(module.calls, ElementsAre(GetParam().entry, "wxSleep(4)"));
}

TEST_P(Uninitializing, PassesThePlugInsCodeOn)
{
    module.results[GetParam().entry] = 21;
    EXPECT_EQ(Call(), 21);
}

TEST_P(Uninitializing, ChangesNoFlagAndNoCounter_ByDesign)
{
    manager.Initialize(&record, 0);
    manager.InitializeBackward(&record, 0);
    LogIn();
    Call();
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(IsInitialized());
    EXPECT_TRUE(IsBackwardInitialized());
    manager.Logout();
    manager.Initialize(&record, 0);
    EXPECT_EQ(record.iLocalPort, 50106u);
}

TEST_P(Uninitializing, WhenIdle_SetsNoFlag)
{
    Call();
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
    EXPECT_FALSE(IsBackwardInitialized());
}

// The Async forms sleep just as long.
INSTANTIATE_TEST_SUITE_P(
    AllForms_ByDesign, Uninitializing,
    testing::Values(
        ENDING{"Plain", [](ComGUIManager& m, TLogin*) { return m.Uninitialize(); }, "UninitializeEntry"},
        ENDING{"ByRecord", [](ComGUIManager& m, TLogin* r) { return m.Uninitialize(r); },
               "UninitializeEntry"},
        ENDING{"Async", [](ComGUIManager& m, TLogin*) { return m.UninitializeAsync(); },
               "UninitializeAsyncEntry"},
        ENDING{"AsyncByRecord", [](ComGUIManager& m, TLogin* r) { return m.UninitializeAsync(r); },
               "UninitializeAsyncEntry"}),
    [](auto const& ending) { return std::string(ending.param.name); });

TEST_F(Sessions, Uninitialize_ReallyBlocks)
{
    auto const start = std::chrono::steady_clock::now();
    manager.Uninitialize(&record);
    EXPECT_GE(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count(), 3.9);
}
