// Logging in, testing a server, getting containers.
#include "comgui/session/ComGUIManager.h"

#include "comgui/foundation/stracpy.h"
#include "tests/session/FakeModule.h"
#include <cstdlib>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAre;

namespace
{
class Login : public WithManager
{
protected:
    Login() { module.calls.clear(); }  // of Open

    bool IsLoggedIn()
    {
        int value = 0;
        return manager.GetParameter(fake.Access(), 0, 0, "Key", PARAM_INT, &value, -1) != -1;
    }

    // The container that the session forms use; only to be asked when there is one.
    bool FakeIsTheContainer()
    {
        int value = 0;
        fake.calls.clear();
        manager.GetSystemTicketParamForKey("Key", PARAM_INT, &value, -1);
        return fake.calls.size() == 1;
    }

    TLogin record = {};
};

using IsAlive = Login;
using Containers = Login;
}  // namespace

TEST_F(Login, ByTexts_FillsTheRecordLogsInAndFetchesTheContainer)
{
    module.onLogin = [this](TLogin& login) { login.hSession = this; };
    module.container = fake.Access();
    EXPECT_EQ(manager.Login("user", "secret", "host", 4711), 0);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry", "GetClientContainerEntry"));
    EXPECT_STREQ(module.copy.szUser, "user");
    EXPECT_STREQ(module.copy.szPassword, "secret");
    EXPECT_STREQ(module.copy.szServerHost, "host");
    EXPECT_EQ(module.copy.iServerPort, 4711);
    EXPECT_EQ(module.session, this);
    EXPECT_TRUE(IsLoggedIn());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Login, ByNullTextsAndMinus1_UsesWhatTheRecordHolds)
{
    manager.Initialize("user", "secret", "host", 4711);
    EXPECT_EQ(manager.Login(nullptr, nullptr, nullptr, -1), 0);
    EXPECT_STREQ(module.copy.szUser, "user");
    EXPECT_STREQ(module.copy.szPassword, "secret");
    EXPECT_STREQ(module.copy.szServerHost, "host");
    EXPECT_EQ(module.copy.iServerPort, 4711);
}

TEST_F(Login, ByTexts_KeepsTextsOf127BytesAndCutsLongerOnes)
{
    manager.Login(std::string(127, 'a').c_str(), std::string(128, 'b').c_str(), "h", 1);
    EXPECT_EQ(module.copy.szUser, std::string(127, 'a'));
    EXPECT_EQ(module.copy.szPassword, std::string(127, 'b'));
}

TEST_F(Login, WithoutInitialize_IsPossible)
{
    EXPECT_EQ(manager.Login("u", "p", "h", 1), 0);
    EXPECT_TRUE(IsLoggedIn());
}

TEST_F(Login, ByTexts_Failing_PassesTheCodeOnAndFetchesNothing)
{
    module.results["LoginEntry"] = 31;
    EXPECT_EQ(manager.Login("u", "p", "h", 1), 31);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry"));
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(Login, ByTexts_FailingWhileLoggedIn_ClearsTheFlagAndKeepsTheContainer)
{
    LogIn();
    module.results["LoginEntry"] = 31;
    manager.Login("u", "p", "h", 1);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Login, MacLogin_TouchesNoFlag_ByDesign)
{
    module.container = fake.Access();
    EXPECT_EQ(manager.MacLogin(), 0);
    EXPECT_FALSE(IsLoggedIn());
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Login, MacLogin_StoresTheContainerAlsoIfItIsNull)
{
    LogIn();
    module.container = nullptr;
    EXPECT_EQ(manager.MacLogin(), 0);
    int value = 0;
    EXPECT_DEATH(manager.GetSystemTicketParamForKey("Key", PARAM_INT, &value, -1), "");
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

TEST_F(Login, ByRecord_ReadsTheCopyOfTheTable)
{
    module.table.LoginEntry = LiveLogin;
    liveEntryCalled = false;
    manager.Login(NewRecord());
    manager.LoginBackward(&record);
    EXPECT_FALSE(liveEntryCalled);
}

TEST_F(Containers, AreFetchedThroughTheCopyOfTheTable)
{
    module.table.GetClientContainerEntry = LiveContainer;
    liveEntryCalled = false;
    manager.GetClientContainer();
    EXPECT_FALSE(liveEntryCalled);
}

TEST_F(Login, ByRecord_MakesItTheImplicitOneAlsoWhenTheLoginFails)
{
    manager.MacLogin();
    TLogin* const first = module.login;
    TLogin* const login = NewRecord();
    stracpy(login->szUser, "mine", sizeof login->szUser);
    module.results["LoginEntry"] = 32;
    EXPECT_EQ(manager.Login(login), 32);
    EXPECT_EQ(module.login, login);
    EXPECT_EQ(manager.GetCurrentlyLoggedUser(), "mine");
    EXPECT_FALSE(IsLoggedIn());
    std::free(first);  // the manager's first record stays allocated
}

TEST_F(Login, ByRecord_SetsTheFlagAndFetchesNoContainer)
{
    manager.MacLogin();
    TLogin* const first = module.login;
    module.calls.clear();
    EXPECT_EQ(manager.Login(NewRecord()), 0);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry"));
    EXPECT_TRUE(IsLoggedIn());
    std::free(first);
}

TEST_F(Login, Backward_TouchesNothingOfTheImplicitSession)
{
    EXPECT_EQ(manager.LoginBackward(&record), 0);
    EXPECT_EQ(module.login, &record);
    EXPECT_THAT(module.calls, ElementsAre("LoginEntry"));
    EXPECT_FALSE(IsLoggedIn());
}

TEST_F(Login, Backward_Failing_LeavesTheImplicitSessionLoggedIn)
{
    LogIn();
    module.results["LoginEntry"] = 33;
    EXPECT_EQ(manager.LoginBackward(&record), 33);
    EXPECT_TRUE(IsLoggedIn());
}

TEST_F(IsAlive, LiveServer_WritesTheLocalAddressWithItsTopByteFirst)
{
    std::strcpy(record.szServerHost, "server");
    record.iServerPort = 4711;
    EXPECT_EQ(manager.IsAlive(&record), 0);
    EXPECT_THAT(module.calls, ElementsAre("IsAliveEntry", "GetLocalAddressEntry"));
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

TEST_F(IsAlive, DeadServer_GivesMinus2005AndKeepsTheAddress_ButAsksForItAllTheSame)
{
    std::strcpy(record.szLocalAddress, "1.2.3.4");
    module.results["IsAliveEntry"] = 5;
    EXPECT_EQ(manager.IsAlive(&record), -2005);
    EXPECT_STREQ(record.szLocalAddress, "1.2.3.4");
    EXPECT_THAT(module.calls, ElementsAre("IsAliveEntry", "GetLocalAddressEntry"));
}

TEST_F(IsAlive, IsServerOnline_SaysTheSame)
{
    EXPECT_TRUE(manager.IsServerOnline(&record));
    module.results["IsAliveEntry"] = 5;
    EXPECT_FALSE(manager.IsServerOnline(&record));
}

TEST_F(Containers, OfTheImplicitSession_IsKept)
{
    module.onLogin = [this](TLogin& login) { login.hSession = this; };
    manager.MacLogin();
    module.session = nullptr;
    module.container = fake.Access();
    EXPECT_EQ(manager.GetClientContainer(), fake.Access());
    EXPECT_EQ(module.session, this);
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
    record.hSession = &record;
    manager.LoginBackward(&record);
    module.container = other.Access();
    EXPECT_EQ(manager.GetBackwardContainer(), other.Access());
    EXPECT_EQ(module.session, &record);
    EXPECT_TRUE(FakeIsTheContainer());
}

TEST_F(Containers, OfAGivenRecord_IsNotKept)
{
    LogIn();
    ContainerFake other;
    record.hSession = &record;
    module.container = other.Access();
    EXPECT_EQ(manager.GetHandleToClientContainer(&record), other.Access());
    EXPECT_EQ(module.session, &record);
    EXPECT_TRUE(FakeIsTheContainer());
}
