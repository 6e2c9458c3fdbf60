// Finding, opening and asking the plug-in, and what a manager without one is good for.
#include "comgui/session/ComGUIManager.h"

#include "comgui/session/ComGUIGlobals.h"
#include "tests/session/FakeModule.h"
#include "tests/session/Faults.h"
#include "tests/session/Sleep.h"
#include "tests/session/WatchedCoreFoundation.h"
#include <cstdlib>
#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>

using comgui::test::TemporaryFolder;

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

using LoadingDeathTest = Loading;

class FailingOpen : public WithModule
{
protected:
    FailingOpen() { module.results["Open"] = 7; }
    ~FailingOpen() override { insteadOfSleeping = nullptr; }

    // Calls entries of a new manager from all over the table.
    void UseManager()
    {
        testing::internal::CaptureStderr();
        ComGUIManager manager;
        testing::internal::GetCapturedStderr();
        FakeModule::SpoilTheLiveTable();
        insteadOfSleeping = [](int) {};
        TLogin login = {};
        manager.Initialize(&login, 0);
        manager.Logout(&login);
        manager.GetTicketData(&login, 0, 0, 0, nullptr, nullptr);
        manager.UninitializeAsync(&login);
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

TEST_F(Loading, GoodBundle_CallsOpenAloneAndReleasesTheFactorysInstanceOnceItHasBeenAsked)
{
    StderrOfAManager();
    EXPECT_THAT(module.calls, ElementsAre("Open"));
    EXPECT_THAT(module.instanceCalls, ElementsAre("QueryInterface", "Release"));
}

TEST_F(Loading, BundlesPath_GoesOutInUtf8AsAPosixPathOfAFolder)
{
    std::filesystem::path const plugIns = empty.Path() / "Pl\xC3\xBCg-Ins";
    std::filesystem::create_directory(plugIns);
    EmptyBundle(plugIns).AddFactory(COMGUI_PLUGIN_TYPE_UUID, FirstUUID, "FirstFactory");
    LookIn(plugIns);
    EXPECT_EQ(StderrOfAManager(), "");
    EXPECT_EQ(coreFoundationURL.path, (plugIns / "ComGUI.Bundle").string());
    EXPECT_EQ(coreFoundationURL.encoding, kCFStringEncodingUTF8);
    EXPECT_EQ(coreFoundationURL.style, kCFURLPOSIXPathStyle);
    EXPECT_TRUE(coreFoundationURL.isDirectory);
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
    BundleOnDisk bundle = EmptyBundle(other.Path());
    bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, SecondUUID, "SecondFactory");
    bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, FirstUUID, "FirstFactory");
    LookIn(other.Path());
    EXPECT_EQ(StderrOfAManager(), "");
    EXPECT_THAT(module.factories, ElementsAre("SecondFactory"));
}

TEST_F(Loading, FirstFactoryWithoutAFunction_TheNextServes)
{
    TemporaryFolder const other;
    BundleOnDisk bundle = EmptyBundle(other.Path());
    bundle.ListFactory(COMGUI_PLUGIN_TYPE_UUID, FirstUUID);
    bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, SecondUUID, "SecondFactory");
    LookIn(other.Path());
    EXPECT_EQ(StderrOfAManager(), "");
    EXPECT_THAT(module.factories, ElementsAre("SecondFactory"));
}

TEST_F(Loading, BundleWithoutAFactoryOfTheType_PrintsOneLine)
{
    TemporaryFolder const other;
    EmptyBundle(other.Path());
    LookIn(other.Path());
    EXPECT_EQ(StderrOfAManager(), NoInterface);
}

TEST_F(Loading, FolderWithoutInfoPlist_IsOpenedAndHasNoFactory)
{
    TemporaryFolder const other;
    BundleOnDisk const bundle = EmptyBundle(other.Path());
    std::filesystem::remove(bundle.InfoFile());
    LookIn(other.Path());
    EXPECT_THAT(StderrOfAManager(),
                testing::MatchesRegex("CoreFoundation: .*: cannot read its Info.plist[^\n]*\n" +
                                      std::string(NoInterface)));
}

TEST_F(Loading, NoInterface_IsAFailedLoadAndTheInstanceIsReleasedAllTheSame)
{
    module.givesInterface = false;
    EXPECT_EQ(StderrOfAManager(), NoInterface);
    EXPECT_THAT(module.instanceCalls, ElementsAre("QueryInterface", "Release"));
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_EQ(hSTicketInstance, nullptr);
}

TEST_F(Loading, FailingOpen_PrintsBothLinesAndPublishesNothing)
{
    module.results["Open"] = 7;
    EXPECT_EQ(StderrOfAManager(), std::string(NotReleased) + NoInterface);
    EXPECT_EQ(hSTicketInstance, nullptr);
}

TEST_F(FailingOpen, LeavesTheWholeTableCopied)
{
    UseManager();
    EXPECT_THAT(module.calls, ElementsAre("Open", "InitializeEntry", "LogoutEntry", "GetTicketDataEntry",
                                          "UninitializeAsyncEntry"));
}

// The fake fails a call with any other handle than the one that Open left.
TEST_F(FailingOpen, ThatLeavesNoHandle_LetsEntriesBeCalledWithNull)
{
    module.setsHandle = false;
    UseManager();
    EXPECT_EQ(module.calls.size(), 5u);
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
        module.instanceCalls.clear();
    }
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(module.instanceCalls, IsEmpty());
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

TEST_F(LoadingDeathTest, GetInstance_AfterAFailedLoad_GivesTheSameManagerAndTriesNoMore)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");  // in a new process, where there is no manager yet
    LoseTheBundle();
    EXPECT_EXIT(
        {
            ComGUIManager* const first = ComGUIManager::GetInstance();
            LookIn(folder.Path());  // where there would be a bundle now
            bool const same = first && ComGUIManager::GetInstance() == first;
            std::quick_exit(same && module.factories.empty() ? 0 : 1);
        },
        testing::ExitedWithCode(0), testing::StrEq(std::string(NoBundle) + NoInterface));
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
    EXPECT_EXIT(manager->Initialize(&login, 0), Faults, "");
    EXPECT_EXIT(manager->Initialize("u", "p", "h", 1), Faults, "");
    EXPECT_EXIT(manager->InitializeBackward(&login, 0), Faults, "");
    EXPECT_EXIT(manager->IsAlive(&login), Faults, "");
    EXPECT_EXIT(manager->Login(&login), Faults, "");
    EXPECT_EXIT(manager->Logout(), Faults, "");
    EXPECT_EXIT(manager->Uninitialize(), Faults, "");
    EXPECT_EXIT(manager->GetClientContainer(), Faults, "");
    EXPECT_EXIT(manager->GetTicketData(0, 0, 0, nullptr, nullptr), Faults, "");
}

TEST_F(FailedManagerDeathTest, LoginByTexts_GoesThroughTheMissingLiveTable_ByDesign)
{
    EXPECT_EXIT(manager->Login("u", "p", "h", 1), Faults, "");
    EXPECT_EXIT(manager->MacLogin(), Faults, "");
}
