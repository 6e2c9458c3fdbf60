// Logging in, testing a server, getting containers.
#include "comgui/session/ComGUIManager.h"

#include "comgui/foundation/stracpy.h"
#include "tests/session/FakeModule.h"
#include "tests/session/Faults.h"
#include "tests/session/Records.h"
#include <cstdlib>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using comgui::test::ContainerFake;

using testing::ElementsAre;

namespace
{
class Login : public WithManager
{
protected:
    TLogin record = {};
};

using LoginDeathTest = Login;
using IsAlive = Login;
using Containers = Login;

// A record of its own for Login(TLogin*), beside the manager's first one, which is put back in the end.
class LoginByRecord : public Login
{
protected:
    LoginByRecord() { stracpy(mine->szUser, "mine", sizeof mine->szUser); }
    ~LoginByRecord() override
    {
        manager.Login(own);
        std::free(mine);
    }

    TLogin* const mine = NewRecord();
};
}  // namespace

// --- by texts --------------------------------------------------------------------------------------------

TEST_F(Login, ByTexts_LogsInAndFetchesTheContainerOfTheSession)
{
    module.onLogin = [this](TLogin& login) { login.hSession = this; };
    module.container = fake.Access();
    EXPECT_EQ(manager.Login("user", "secret", "host", 4711), 0);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry", "GetClientContainerEntry"));
    EXPECT_EQ(module.session, this);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Login, WithoutInitialize_IsPossibleAndInitializesNothing)
{
    EXPECT_EQ(manager.Login("u", "p", "h", 1), 0);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
}

TEST_F(Login, ByTexts_Failing_PassesTheCodeOnAndFetchesNothing)
{
    module.results["LoginEntry"] = 31;
    EXPECT_EQ(manager.Login("u", "p", "h", 1), 31);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry"));
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(Login, ByTexts_FailingWhileLoggedIn_ClearsThatFlagAloneAndKeepsTheContainer)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    module.results["LoginEntry"] = 31;
    manager.Login("u", "p", "h", 1);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_TRUE(IsInitialized());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Login, MacLogin_TouchesNoFlag_ByDesign)
{
    module.container = fake.Access();
    EXPECT_EQ(manager.MacLogin(), 0);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Login, MacLogin_FailingWhileLoggedIn_TouchesNoFlag_ByDesign)
{
    LogIn();
    module.results["LoginEntry"] = 31;
    EXPECT_EQ(manager.MacLogin(), 31);
    EXPECT_TRUE(IsLoggedIn());
}

TEST_F(LoginDeathTest, MacLogin_StoresTheContainerAlsoIfItIsNull)
{
    LogIn();
    module.container = nullptr;
    EXPECT_EQ(manager.MacLogin(), 0);
    int value = 0;
    EXPECT_EXIT(manager.GetSystemTicketParamForKey("Key", PARAM_INT, &value, -1), Faults, "");
}

namespace
{
bool liveEntryCalled;

int LiveLogin(void*, TLogin*)
{
    liveEntryCalled = true;
    return 0;
}

MTICKET_ACCESS const* LiveContainer(void*, void*)
{
    liveEntryCalled = true;
    return nullptr;
}
}  // namespace

// The one operation that does: the others read the copy.
TEST_F(Login, ByTexts_ReadsTheLiveTable)
{
    module.table.LoginEntry = LiveLogin;
    liveEntryCalled = false;
    manager.Login("u", "p", "h", 1);
    EXPECT_TRUE(liveEntryCalled);
}

TEST_F(Login, ByTexts_ReadsTheLiveTableForTheContainerToo)
{
    module.table.GetClientContainerEntry = LiveContainer;
    liveEntryCalled = false;
    manager.Login("u", "p", "h", 1);
    EXPECT_TRUE(liveEntryCalled);
}

// --- by record -------------------------------------------------------------------------------------------

TEST_F(LoginByRecord, SetsTheFlagAndKeepsTheContainerOfBefore)
{
    LogIn();
    manager.Logout();
    ContainerFake other;
    module.container = other.Access();
    module.calls.clear();
    EXPECT_EQ(manager.Login(mine), 0);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry"));
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(LoginByRecord, MakesItTheManagersBeforeThePlugInIsAsked)
{
    wxString user;
    module.onLogin = [&](TLogin&) { user = manager.GetCurrentlyLoggedUser(); };
    manager.Login(mine);
    EXPECT_EQ(user, "mine");
    module.onLogin = nullptr;
}

TEST_F(LoginByRecord, Failing_PassesTheCodeOnAndKeepsTheRecord)
{
    module.results["LoginEntry"] = 32;
    EXPECT_EQ(manager.Login(mine), 32);
    EXPECT_EQ(module.login, mine);
    EXPECT_EQ(manager.GetCurrentlyLoggedUser(), "mine");
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(LoginByRecord, FailingWhileLoggedIn_ClearsThatFlagAlone)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    module.results["LoginEntry"] = 32;
    manager.Login(mine);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_TRUE(IsInitialized());
}

TEST_F(LoginByRecord, Refused_TriedAgainWithTheSameRecord_KeepsItsLocalPort)
{
    manager.Initialize(mine, 1);
    unsigned int const port = mine->iLocalPort;
    ASSERT_NE(port, 0u);
    module.results["LoginEntry"] = 32;
    manager.Login(mine);
    module.results.clear();
    stracpy(mine->szPassword, "right", sizeof mine->szPassword);
    EXPECT_EQ(manager.Login(mine), 0);
    EXPECT_EQ(module.copy.iLocalPort, port);
    EXPECT_STREQ(module.copy.szPassword, "right");
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry", "LoginEntry", "LoginEntry"));
}

TEST_F(LoginByRecord, Refused_TriedAgainWithANewRecord_HasNoLocalPort_ByDesign)
{
    manager.Initialize(mine, 1);
    module.results["LoginEntry"] = 32;
    manager.Login(mine);
    module.results.clear();
    TLogin* const other = NewRecord();
    EXPECT_EQ(manager.Initialize(other, 1), 0);  // is initialised already
    EXPECT_EQ(manager.Login(other), 0);
    EXPECT_EQ(module.login, other);
    EXPECT_EQ(module.copy.iLocalPort, 0u);
    EXPECT_THAT(module.calls, ElementsAre("InitializeEntry", "LoginEntry", "LoginEntry"));
    manager.Login(own);
    std::free(other);
}

// --- Backward --------------------------------------------------------------------------------------------

TEST_F(Login, Backward_TouchesNothingOfTheImplicitSession)
{
    EXPECT_EQ(manager.LoginBackward(&record), 0);
    EXPECT_EQ(module.login, &record);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry"));
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_FALSE(IsInitialized());
    manager.MacLogin();
    EXPECT_EQ(module.login, own);
}

TEST_F(Login, Backward_StoresTheRecordBeforeThePlugInIsAsked)
{
    record.hSession = &record;
    module.onLogin = [this](TLogin&) { manager.GetBackwardContainer(); };
    manager.LoginBackward(&record);
    EXPECT_EQ(module.session, &record);
}

TEST_F(Login, Backward_Failing_StoresTheRecordAndLeavesTheFirstSessionLoggedIn)
{
    manager.InitializeBackward(&record, 0);
    LogIn();
    record.hSession = &record;
    module.results["LoginEntry"] = 33;
    EXPECT_EQ(manager.LoginBackward(&record), 33);
    manager.GetBackwardContainer();
    EXPECT_EQ(module.session, &record);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(IsBackwardInitialized());
}

// --- testing a server ------------------------------------------------------------------------------------

TEST_F(IsAlive, LiveServer_WritesTheLocalAddressWithItsTopByteFirst)
{
    std::strcpy(record.szServerHost, "server");
    record.iServerPort = 4711;
    EXPECT_EQ(manager.IsAlive(&record), 0);
    EXPECT_EQ(module.host, "server");
    EXPECT_EQ(module.port, 4711);
    EXPECT_STREQ(record.szLocalAddress, "10.20.30.200");
}

TEST_F(IsAlive, LongestAddress_Fits)
{
    module.localAddress = 0xFFFFFFFF;
    manager.IsAlive(&record);
    EXPECT_STREQ(record.szLocalAddress, "255.255.255.255");
}

TEST_F(IsAlive, DeadServer_GivesMinus2005AndKeepsTheRecord_ButAsksForTheAddressAllTheSame)
{
    record = RecordFullOf('r');
    module.results["IsAliveEntry"] = 5;
    EXPECT_EQ(manager.IsAlive(&record), -2005);
    EXPECT_THAT(record, IsRecord(RecordFullOf('r')));
    EXPECT_THAT(module.calls, ElementsAre("IsAliveEntry", "GetLocalAddressEntry"));
}

TEST_F(IsAlive, IsServerOnline_SaysTheSame)
{
    EXPECT_TRUE(manager.IsServerOnline(&record));
    module.results["IsAliveEntry"] = 5;
    EXPECT_FALSE(manager.IsServerOnline(&record));
}

// --- containers ------------------------------------------------------------------------------------------

TEST_F(Containers, OfTheImplicitSession_IsKept)
{
    module.container = fake.Access();
    EXPECT_EQ(manager.GetClientContainer(), fake.Access());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Containers, NullForTheImplicitSession_KeepsTheOldOne)
{
    LogIn();
    module.container = nullptr;
    EXPECT_EQ(manager.GetClientContainer(), nullptr);
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Containers, OfTheBackwardSession_IsNotKept)
{
    LogIn();
    ContainerFake other;
    manager.LoginBackward(&record);
    module.container = other.Access();
    EXPECT_EQ(manager.GetBackwardContainer(), other.Access());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Containers, OfAGivenRecord_IsNotKept)
{
    LogIn();
    ContainerFake other;
    module.container = other.Access();
    EXPECT_EQ(manager.GetHandleToClientContainer(&record), other.Access());
    EXPECT_TRUE(FakeIsTheContainer());
}
