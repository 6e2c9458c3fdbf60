// Finding, opening and asking the plug-in, and what a manager without one is good for.
#include "comgui/session/ComGUIManager.h"

#include "comgui/session/ComGUIGlobals.h"
#include "tests/session/FailingCoreFoundation.h"
#include "tests/session/FakeModule.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char const NoBundle[] = "RegisterPlugIn: CFPlugInCreate() failed\n";
char const NoString[] = "CFStringCreateWithCString failed\n";
char const NoURL[] = "RegisterPlugIn: CFURLCreateWithFileSystemPath() failed\n";
char const NotReleased[] = "@TODO: Bundle should be released here\n";
char const NoInterface[] = "Could not get Interface pointer and Intialize the bundle\n";

class Loading : public WithModule
{
protected:
    ~Loading() override { coreFoundationFailures = {}; }

    // What a new manager writes to stderr.
    static std::string StderrOfAManager()
    {
        testing::internal::CaptureStderr();
        {
            ComGUIManager const manager;
        }
        return testing::internal::GetCapturedStderr();
    }
};

class FailedManager : public WithModule
{
protected:
    FailedManager()
    {
        LoseTheBundle();
        testing::internal::CaptureStderr();
        manager = std::make_unique<ComGUIManager>();
        testing::internal::GetCapturedStderr();
    }

    std::unique_ptr<ComGUIManager> manager;
};
}  // namespace

TEST_F(Loading, GoodBundle_SaysNothingAndPublishesTheFactory)
{
    EXPECT_EQ(StderrOfAManager(), "");
    EXPECT_EQ(hSTicketInstance, &module.factory);
}

TEST_F(Loading, GoodBundle_IsAskedWithTheTwoUUIDs)
{
    StderrOfAManager();
    EXPECT_EQ(module.typeUUID, "5CDEF0B86CFC11D8A365003065B1346E");
    EXPECT_EQ(module.interfaceUUID, "33FC3B146CFF11D8AB09003065B1346E");
}

TEST_F(Loading, GoodBundle_CallsOpenAloneAndReleasesTheFactorysInstance)
{
    StderrOfAManager();
    EXPECT_THAT(module.calls, ElementsAre("Open"));
    EXPECT_EQ(module.released, 1);
}

TEST_F(Loading, MissingBundle_PrintsTwoLines)
{
    LoseTheBundle();
    EXPECT_EQ(StderrOfAManager(), std::string(NoBundle) + NoInterface);
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Loading, TwoFactories_TheFirstOfTheListServes)
{
    TemporaryFolder const other;
    BundleOnDisk bundle = EmptyBundle(other);
    bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, SecondUUID, "SecondFactory");
    bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, FirstUUID, "FirstFactory");
    LookIn(other);
    EXPECT_EQ(StderrOfAManager(), "");
    EXPECT_THAT(module.factories, ElementsAre("SecondFactory"));
}

TEST_F(Loading, BundleWithoutAFactoryOfTheType_PrintsOneLine)
{
    TemporaryFolder const other;
    EmptyBundle(other);
    LookIn(other);
    EXPECT_EQ(StderrOfAManager(), NoInterface);
}

TEST_F(Loading, NoInterface_IsAFailedLoadAndTheInstanceIsReleasedAllTheSame)
{
    module.givesInterface = false;
    EXPECT_EQ(StderrOfAManager(), NoInterface);
    EXPECT_EQ(module.released, 1);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_EQ(hSTicketInstance, nullptr);
}

TEST_F(Loading, FailingOpen_PrintsBothLinesAndPublishesNothing)
{
    module.results["Open"] = 7;
    EXPECT_EQ(StderrOfAManager(), std::string(NotReleased) + NoInterface);
    EXPECT_EQ(hSTicketInstance, nullptr);
}

TEST_F(Loading, FailingOpen_LeavesTheTableCopiedAndTheHandleAsOpenLeftIt)
{
    module.results["Open"] = 7;
    testing::internal::CaptureStderr();
    ComGUIManager manager;
    testing::internal::GetCapturedStderr();
    TLogin login = {};
    EXPECT_EQ(manager.IsAlive(&login), 0);  // the fake fails a call with any other handle than Open's
    EXPECT_THAT(module.calls, ElementsAre("Open", "IsAliveEntry", "GetLocalAddressEntry"));
}

TEST_F(Loading, PathThatMakesNoString_PrintsTwoLines)
{
    coreFoundationFailures.strings = 1;
    EXPECT_EQ(StderrOfAManager(), std::string(NoString) + NoInterface);
}

TEST_F(Loading, PathThatMakesNoURL_PrintsTwoLines)
{
    coreFoundationFailures.urls = 1;
    EXPECT_EQ(StderrOfAManager(), std::string(NoURL) + NoInterface);
}

TEST_F(Loading, RegisterPlugIn_GivesTheBundleAnd0)
{
    ComGUIManager manager;
    __CFBundle* plugIn = nullptr;
    EXPECT_EQ(manager.RegisterPlugIn(&plugIn), 0);
    EXPECT_NE(plugIn, nullptr);
}

TEST_F(Loading, RegisterPlugIn_WithoutABundle_StoresNullToo)
{
    ComGUIManager manager;
    LoseTheBundle();
    auto* plugIn = reinterpret_cast<__CFBundle*>(this);
    testing::internal::CaptureStderr();
    EXPECT_EQ(manager.RegisterPlugIn(&plugIn), -1);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), NoBundle);
    EXPECT_EQ(plugIn, nullptr);
}

TEST_F(Loading, RegisterPlugIn_PathThatMakesNoString_GivesMinus1AndItsLine)
{
    ComGUIManager manager;
    coreFoundationFailures.strings = 1;
    __CFBundle* plugIn = nullptr;
    testing::internal::CaptureStderr();
    EXPECT_EQ(manager.RegisterPlugIn(&plugIn), -1);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), NoString);
    EXPECT_EQ(plugIn, nullptr);
}

TEST_F(Loading, RegisterPlugIn_PathThatMakesNoURL_GivesMinus1AndItsLine)
{
    ComGUIManager manager;
    coreFoundationFailures.urls = 1;
    __CFBundle* plugIn = nullptr;
    testing::internal::CaptureStderr();
    EXPECT_EQ(manager.RegisterPlugIn(&plugIn), -1);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), NoURL);
    EXPECT_EQ(plugIn, nullptr);
}

TEST_F(Loading, CreateComGUIModuleInterface_GivesTheInterfaceAnd0)
{
    ComGUIManager manager;
    __CFBundle* plugIn = nullptr;
    manager.RegisterPlugIn(&plugIn);
    ComGUIModuleInterface** interface = nullptr;
    EXPECT_EQ(manager.CreateComGUIModuleInterface(plugIn, &interface), 0);
    ASSERT_NE(interface, nullptr);
    EXPECT_EQ(*interface, &module.table);
}

TEST_F(Loading, CreateComGUIModuleInterface_WithoutAPlugIn_GivesMinus1)
{
    ComGUIManager manager;
    ComGUIModuleInterface** interface = nullptr;
    EXPECT_EQ(manager.CreateComGUIModuleInterface(nullptr, &interface), -1);
    EXPECT_EQ(interface, nullptr);
}

TEST_F(Loading, ManagersEnd_CallsNoEntryAndLeavesTheFactory)
{
    {
        ComGUIManager const manager;
        module.calls.clear();
        module.released = 0;
    }
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_EQ(module.released, 0);
    EXPECT_EQ(hSTicketInstance, &module.factory);
}

TEST_F(Loading, LaterManagerThatFails_LeavesTheFactoryOfTheFirst)
{
    StderrOfAManager();
    LoseTheBundle();
    StderrOfAManager();
    EXPECT_EQ(hSTicketInstance, &module.factory);
}

TEST_F(Loading, GetInstance_GivesOneManagerAndOpensThePlugInOnce)
{
    ComGUIManager* const first = ComGUIManager::GetInstance();
    ASSERT_NE(first, nullptr);
    module.calls.clear();
    testing::internal::CaptureStderr();
    EXPECT_EQ(ComGUIManager::GetInstance(), first);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Loading, FreeDll_DoesNothingHoweverOften_ByDesign)
{
    ComGUIManager manager;
    module.calls.clear();
    for (int i = 0; i < 3; ++i)
        manager.FreeDll();
    EXPECT_THAT(module.calls, IsEmpty());
    TLogin login = {};
    EXPECT_EQ(manager.IsAlive(&login), 0);
}

TEST_F(FailedManager, GuardedOperations_GiveMinus1OrNothing)
{
    char key[] = "Key";
    int value = 5;
    EXPECT_EQ(manager->GetParameter(0, 0, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(manager->SetParameter(0, 0, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(value, 5);
    EXPECT_TRUE(manager->GetIntArray(0, 0, key).empty());
    EXPECT_TRUE(manager->GetStringArray(0, 0, key).empty());
}

TEST_F(FailedManager, Questions_AreAnswered)
{
    EXPECT_EQ(manager->GetEndian(), 0x49494949);
    EXPECT_EQ(manager->GetServerName(), "");
    EXPECT_EQ(manager->GetCurrentlyLoggedUser(), "");
    EXPECT_EQ(manager->GetUserLockInfo(), "http://:0");
    EXPECT_FALSE(manager->IsTernServerLocal());
    EXPECT_TRUE(manager->IsServerLocal());  // both texts are still empty, and so equal
}

TEST_F(FailedManager, hSTicketInstance_StaysNull) { EXPECT_EQ(hSTicketInstance, nullptr); }

using FailedManagerDeathTest = FailedManager;

TEST_F(FailedManagerDeathTest, Entries_AreCalledThroughNull_ByDesign)
{
    TLogin login = {};
    EXPECT_DEATH(manager->Initialize(&login, 0), "");
    EXPECT_DEATH(manager->Initialize("u", "p", "h", 1), "");
    EXPECT_DEATH(manager->IsAlive(&login), "");
    EXPECT_DEATH(manager->Login(&login), "");
    EXPECT_DEATH(manager->Logout(), "");
    EXPECT_DEATH(manager->Uninitialize(), "");
    EXPECT_DEATH(manager->GetClientContainer(), "");
    EXPECT_DEATH(manager->GetTicketData(0, 0, 0, nullptr, nullptr), "");
}

TEST_F(FailedManagerDeathTest, LoginByTexts_GoesThroughTheMissingLiveTable_ByDesign)
{
    EXPECT_DEATH(manager->Login("u", "p", "h", 1), "");
    EXPECT_DEATH(manager->MacLogin(), "");
}
