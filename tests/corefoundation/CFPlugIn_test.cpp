#include "comgui/testing/TemporaryFolder.h"
#include "tests/corefoundation/Held.h"
#include "tests/corefoundation/UUIDTexts.h"
#include "tests/support/BundleOnDisk.h"
#include "tests/support/TestPlugIn.h"

#include <cstring>
#include <dlfcn.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <thread>

using comgui::test::TemporaryFolder;
#ifdef COMGUI_LEAK_CHECK
#    include <sanitizer/lsan_interface.h>
#endif

namespace
{
using testing::AllOf;
using testing::HasSubstr;
using testing::IsEmpty;

bool IsLoaded(std::filesystem::path const& sharedObject)
{
    void* const image = dlopen(sharedObject.c_str(), RTLD_NOW | RTLD_NOLOAD);
    if (image != nullptr)
        dlclose(image);
    return image != nullptr;
}

// The executable that made the instance, which is a record inside it.
std::filesystem::path MakerOf(void* instance)
{
    Dl_info image{};
    return dladdr(instance, &image) != 0 ? image.dli_fname : "";
}

class CFPlugIn : public testing::Test
{
protected:
    // A bundle whose executable has the functions of TestPlugIn.cpp, and nothing else as yet.
    BundleOnDisk NewBundle(std::string const& name)
    {
        BundleOnDisk bundle(folder.Path(), name);
        bundle.CopyExecutable(COMGUI_TEST_PLUGIN);
        return bundle;
    }

    BundleOnDisk NewBundleWithFactory1(std::string const& name)
    {
        BundleOnDisk bundle = NewBundle(name);
        bundle.AddFactory(typeA, factory1, "RecordingFactory");
        return bundle;
    }

    // What stderr gets while the factory makes its instance, which it must not do.
    std::string ComplaintOf(std::string const& factory)
    {
        testing::internal::CaptureStderr();
        EXPECT_EQ(MakeInstance(factory, typeA), nullptr);
        return testing::internal::GetCapturedStderr();
    }

    TemporaryFolder const folder;
};

// What only the stand-in promises.
using CFPlugInOfStandIn = CFPlugIn;

TEST_F(CFPlugInOfStandIn, Create_NullURL_EndsTheProgram)
{
    EXPECT_DEATH(CFPlugInCreate(kCFAllocatorDefault, nullptr), "CFPlugInCreate of a null URL");
}

TEST_F(CFPlugIn, Create_PathThatDoesNotExist_IsNull) { EXPECT_FALSE(OpenPlugIn(folder.Path() / "Missing")); }

TEST_F(CFPlugIn, Create_PathOfAFile_IsNull) { EXPECT_FALSE(OpenPlugIn(folder.Write("ComGUI.Bundle", "x"))); }

TEST_F(CFPlugIn, Create_FolderWithoutInfoPlist_IsAPlugInWithoutFactories)
{
    auto const plugIn = OpenPlugIn(folder.Path());
    ASSERT_TRUE(plugIn);
    EXPECT_FALSE(FactoriesOf(plugIn, typeA));
}

TEST_F(CFPlugIn, Create_MissingExecutable_IsAPlugIn)
{
    BundleOnDisk const bundle(folder.Path());
    EXPECT_TRUE(OpenPlugIn(bundle.Path()));
}

TEST_F(CFPlugIn, FindFactories_TypeThatTheBundleDoesNotName_IsNull)
{
    auto const plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    ASSERT_TRUE(FactoriesOf(plugIn, typeA));
    EXPECT_FALSE(FactoriesOf(plugIn, typeB));
}

TEST_F(CFPlugIn, FindFactories_TypeOfAnotherOpenBundle_IsNull)
{
    auto const other = OpenPlugIn(NewBundleWithFactory1("Other").Path());
    auto const plugIn = OpenPlugIn(NewBundle("One").Path());
    ASSERT_TRUE(FactoriesOf(other, typeA));
    EXPECT_FALSE(FactoriesOf(plugIn, typeA));
}

TEST_F(CFPlugIn, FindFactories_UUIDsInOtherLetterCase_AreTheSame)
{
    BundleOnDisk bundle = NewBundle("One");
    bundle.AddFactory("0a0b0c0d-0000-4000-8000-0000000000aA", "f0e0d0c0-1111-4000-8000-000000000001",
                      "RecordingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_TRUE(FactoriesOf(plugIn, typeA));
    EXPECT_NE(MakeInstance(factory1, typeA), nullptr);
}

TEST_F(CFPlugIn, FindFactories_FactoryWithoutAFunction_IsSkipped)
{
    BundleOnDisk bundle = NewBundle("One");
    bundle.ListFactory(typeA, factory2);
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    auto const factories = FactoriesOf(OpenPlugIn(bundle.Path()), typeA);
    ASSERT_TRUE(factories);
    ASSERT_EQ(CFArrayGetCount(factories.get()), 1);
    EXPECT_TRUE(IsUUID(CFArrayGetValueAtIndex(factories.get(), 0), factory1));
}

TEST_F(CFPlugIn, FindFactories_NoFactoryOfTheTypeHasAFunction_IsNull)
{
    BundleOnDisk bundle = NewBundle("One");
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    bundle.ListFactory(typeB, factory2);
    auto const plugIn = OpenPlugIn(bundle.Path());
    ASSERT_TRUE(FactoriesOf(plugIn, typeA));
    EXPECT_FALSE(FactoriesOf(plugIn, typeB));
}

TEST_F(CFPlugIn, FindFactories_NullPlugIn_IsNull)
{
    EXPECT_EQ(CFPlugInFindFactoriesForPlugInTypeInPlugIn(MakeUUID(typeA).get(), nullptr), nullptr);
}

TEST_F(CFPlugInOfStandIn, FindFactories_NullType_EndsTheProgram)
{
    auto const plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    EXPECT_DEATH(CFPlugInFindFactoriesForPlugInTypeInPlugIn(nullptr, plugIn.get()),
                 "CFPlugInFindFactoriesForPlugInTypeInPlugIn of a null type");
}

TEST_F(CFPlugIn, InstanceCreate_CallsTheFactoryWithAllocatorAndType)
{
    auto const plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    int here = 0;
    auto const allocator = reinterpret_cast<CFAllocatorRef>(&here);
    auto const type = MakeUUID(typeA);
    auto* const record = static_cast<FACTORY_CALL const*>(
        CFPlugInInstanceCreate(allocator, MakeUUID(factory1).get(), type.get()));
    ASSERT_NE(record, nullptr);
    EXPECT_EQ(record->calls, 1);
    EXPECT_EQ(record->allocator, allocator);
    CFUUIDBytes const asked = CFUUIDGetUUIDBytes(type.get());
    EXPECT_EQ(std::memcmp(&record->type, &asked, sizeof asked), 0);
}

TEST_F(CFPlugIn, InstanceCreate_EachTime_CallsTheFactoryAgain)
{
    auto const plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    void* const first = MakeInstance(factory1, typeA);
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(MakeInstance(factory1, typeA), first);
    EXPECT_EQ(static_cast<FACTORY_CALL const*>(first)->calls, 2);
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_FirstTime_LoadsTheExecutable)
{
    BundleOnDisk const bundle = NewBundleWithFactory1("One");
    auto const plugIn = OpenPlugIn(bundle.Path());
    ASSERT_TRUE(FactoriesOf(plugIn, typeA));
    EXPECT_FALSE(IsLoaded(bundle.Executable()));
    EXPECT_NE(MakeInstance(factory1, typeA), nullptr);
    EXPECT_TRUE(IsLoaded(bundle.Executable()));
}

TEST_F(CFPlugInOfStandIn, Release_LoadedExecutable_StaysLoaded)
{
    BundleOnDisk const bundle = NewBundleWithFactory1("One");
    auto plugIn = OpenPlugIn(bundle.Path());
    auto* const record = static_cast<FACTORY_CALL const*>(MakeInstance(factory1, typeA));
    ASSERT_NE(record, nullptr);
    plugIn.reset();
    EXPECT_TRUE(IsLoaded(bundle.Executable()));
    EXPECT_EQ(record->calls, 1);
}

TEST_F(CFPlugIn, InstanceCreate_ExecutableOfAnotherName_IsTheOneOfTheInfoPlist)
{
    BundleOnDisk bundle = NewBundleWithFactory1("One");
    bundle.SetExecutableName("Another name");
    bundle.LinkExecutable(COMGUI_TEST_PLUGIN);
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_EQ(MakerOf(MakeInstance(factory1, typeA)), bundle.Executable());
}

struct EXECUTABLE_FACT
{
    char const* name;
    char const* folder;      // of the bundle
    char const* entry;       // CFBundleExecutable and its value in the Info.plist
    char const* executable;  // that is then loaded
};

class CFPlugInWithoutExecutableName : public CFPlugIn, public testing::WithParamInterface<EXECUTABLE_FACT>
{
};

TEST_P(CFPlugInWithoutExecutableName, InstanceCreate_LoadsTheOneNamedLikeTheFolder)
{
    BundleOnDisk bundle(folder.Path(), GetParam().folder);
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    std::string const named = "<key>CFBundleExecutable</key><string>Module</string>";
    std::string text = bundle.Info();
    ASSERT_NE(text.find(named), std::string::npos);
    bundle.SetExecutableName(GetParam().executable);
    bundle.WriteInfo(text.replace(text.find(named), named.size(), GetParam().entry));
    bundle.CopyExecutable(COMGUI_TEST_PLUGIN);
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_EQ(MakerOf(MakeInstance(factory1, typeA)), bundle.Executable());
}

INSTANTIATE_TEST_SUITE_P(
    Facts, CFPlugInWithoutExecutableName,
    testing::Values(
        EXECUTABLE_FACT{"Missing", "One.Bundle", "", "One"},
        EXECUTABLE_FACT{"Empty", "One.Bundle", "<key>CFBundleExecutable</key><string></string>", "One"},
        EXECUTABLE_FACT{"Number", "One.Bundle", "<key>CFBundleExecutable</key><integer>1</integer>", "One"},
        EXECUTABLE_FACT{"TwoDots", "One.2.Bundle", "", "One.2"},
        EXECUTABLE_FACT{"NoExtension", "One", "", "One"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST_F(CFPlugIn, InstanceCreate_PathWithASlashBehind_LoadsTheExecutableNamedLikeTheFolder)
{
    BundleOnDisk bundle(folder.Path(), "One.Bundle");
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    bundle.SetExecutableName("");
    std::string const withoutName = bundle.Info();
    bundle.SetExecutableName("One");
    bundle.CopyExecutable(COMGUI_TEST_PLUGIN);
    bundle.WriteInfo(withoutName);
    auto const plugIn = OpenPlugIn(bundle.Path() / "");
    EXPECT_EQ(MakerOf(MakeInstance(factory1, typeA)).filename(), "One");
}

class CFPlugInWithAPathAsExecutableOfStandIn : public CFPlugIn,
                                               public testing::WithParamInterface<char const*>
{
};

TEST_P(CFPlugInWithAPathAsExecutableOfStandIn, InstanceCreate_NamesBundleAndRemedy)
{
    BundleOnDisk bundle = NewBundleWithFactory1("One");
    bundle.SetExecutableName(GetParam());
    auto const plugIn = OpenPlugIn(bundle.Path());
    ASSERT_TRUE(FactoriesOf(plugIn, typeA));
    EXPECT_THAT(ComplaintOf(factory1), AllOf(HasSubstr(bundle.Path().string() + ": cannot load"),
                                             HasSubstr("CFBundleExecutable"), HasSubstr("; put")));
}

INSTANTIATE_TEST_SUITE_P(Paths, CFPlugInWithAPathAsExecutableOfStandIn,
                         testing::Values("../Linux/Module", "Sub/Module", "/Module", ".", ".."));

TEST_F(CFPlugIn, InstanceCreate_FactoryThatRefuses_IsNullAndSilent)
{
    BundleOnDisk bundle = NewBundle("One");
    bundle.AddFactory(typeA, factory1, "RefusingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_THAT(ComplaintOf(factory1), IsEmpty());
    EXPECT_TRUE(IsLoaded(bundle.Executable()));
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_UnknownFactory_IsNullAndSilent)
{
    auto const plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    EXPECT_THAT(ComplaintOf(factory2), IsEmpty());
}

TEST_F(CFPlugIn, InstanceCreate_TypeThatTheFactoryDoesNotServe_IsNull)
{
    BundleOnDisk bundle = NewBundleWithFactory1("One");
    bundle.AddFactory(typeB, factory2, "RecordingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    ASSERT_NE(MakeInstance(factory1, typeA), nullptr);
    EXPECT_EQ(MakeInstance(factory1, typeB), nullptr);
}

TEST_F(CFPlugIn, InstanceCreate_FactoryOfTwoTypes_ServesBoth)
{
    BundleOnDisk bundle = NewBundleWithFactory1("One");
    bundle.AddFactory(typeB, factory1, "RecordingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_NE(MakeInstance(factory1, typeA), nullptr);
    EXPECT_NE(MakeInstance(factory1, typeB), nullptr);
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_NullFactoryOrType_EndsTheProgram)
{
    auto const plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    auto const factory = MakeUUID(factory1);
    auto const type = MakeUUID(typeA);
    EXPECT_DEATH(CFPlugInInstanceCreate(kCFAllocatorDefault, nullptr, type.get()),
                 "CFPlugInInstanceCreate of a null factory");
    EXPECT_DEATH(CFPlugInInstanceCreate(kCFAllocatorDefault, factory.get(), nullptr),
                 "CFPlugInInstanceCreate of a null type");
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_MissingExecutable_NamesBundleReasonAndRemedy)
{
    BundleOnDisk bundle(folder.Path(), "One");
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_THAT(ComplaintOf(factory1),
                AllOf(HasSubstr(bundle.Path().string() + ": cannot load"), HasSubstr("No such file"),
                      HasSubstr("; put the shared object that CFBundleExecutable")));
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_ExecutablePutInPlaceLater_IsLoadedThen)
{
    BundleOnDisk bundle(folder.Path(), "One");
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_THAT(ComplaintOf(factory1), HasSubstr("cannot load"));
    bundle.CopyExecutable(COMGUI_TEST_PLUGIN);
    EXPECT_NE(MakeInstance(factory1, typeA), nullptr);
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_ExecutableThatIsNoSharedObject_NamesBundleAndReason)
{
    BundleOnDisk bundle(folder.Path(), "One");
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    folder.Write(bundle.Executable().lexically_relative(folder.Path()), "no shared object at all");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_THAT(ComplaintOf(factory1),
                AllOf(HasSubstr(bundle.Path().string() + ": cannot load"), HasSubstr(": file too short")));
}

TEST_F(CFPlugInOfStandIn, InstanceCreate_MissingFunction_NamesBundleFunctionAndRemedy)
{
    BundleOnDisk bundle = NewBundle("One");
    bundle.AddFactory(typeA, factory1, "NoSuchFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    EXPECT_THAT(ComplaintOf(factory1),
                AllOf(HasSubstr(bundle.Path().string() + ": has no factory function"),
                      HasSubstr("undefined symbol: NoSuchFactory"), HasSubstr("; export it with C linkage")));
}

TEST_F(CFPlugInOfStandIn, Complaint_IsOneLine)
{
    BundleOnDisk bundle(folder.Path(), "One");
    bundle.AddFactory(typeA, factory1, "RecordingFactory");
    auto const plugIn = OpenPlugIn(bundle.Path());
    std::string const text = ComplaintOf(factory1);
    ASSERT_FALSE(text.empty());
    EXPECT_EQ(text.find('\n'), text.size() - 1);
}

TEST_F(CFPlugInOfStandIn, TwoBundlesWithOneFactory_TheLastOpenedServes)
{
    BundleOnDisk const one = NewBundleWithFactory1("One");
    BundleOnDisk const two = NewBundleWithFactory1("Two");
    auto const later = OpenPlugIn(two.Path());
    auto const last = OpenPlugIn(one.Path());
    EXPECT_EQ(MakerOf(MakeInstance(factory1, typeA)), one.Executable());
}

TEST_F(CFPlugInOfStandIn, TwoBundlesWithOneFactory_LastClosed_TheEarlierServesAgain)
{
    BundleOnDisk const one = NewBundleWithFactory1("One");
    BundleOnDisk const two = NewBundleWithFactory1("Two");
    auto const first = OpenPlugIn(one.Path());
    auto last = OpenPlugIn(two.Path());
    ASSERT_EQ(MakerOf(MakeInstance(factory1, typeA)), two.Executable());
    last.reset();
    EXPECT_EQ(MakerOf(MakeInstance(factory1, typeA)), one.Executable());
}

TEST_F(CFPlugInOfStandIn, TwoBundlesWithOneFactory_LastWithoutExecutable_TheEarlierDoesNotStepIn)
{
    BundleOnDisk const one = NewBundleWithFactory1("One");
    BundleOnDisk two(folder.Path(), "Two");
    two.AddFactory(typeA, factory1, "RecordingFactory");
    auto const first = OpenPlugIn(one.Path());
    auto const last = OpenPlugIn(two.Path());
    EXPECT_THAT(ComplaintOf(factory1), HasSubstr(two.Path().string()));
}

TEST_F(CFPlugInOfStandIn, ClosedBundle_ServesNoMore)
{
    auto plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    ASSERT_NE(MakeInstance(factory1, typeA), nullptr);
    plugIn.reset();
    EXPECT_EQ(MakeInstance(factory1, typeA), nullptr);
}

TEST_F(CFPlugInOfStandIn, RetainedBundle_ServesUntilTheLastRelease)
{
    auto plugIn = OpenPlugIn(NewBundleWithFactory1("One").Path());
    Held<CFTypeRef> second(CFRetain(plugIn.get()));
    plugIn.reset();
    EXPECT_NE(MakeInstance(factory1, typeA), nullptr);
    second.reset();
    EXPECT_EQ(MakeInstance(factory1, typeA), nullptr);
}

TEST_F(CFPlugInOfStandIn, BundleOpenedTwice_ServesUntilBothAreClosed)
{
    BundleOnDisk const bundle = NewBundleWithFactory1("One");
    auto first = OpenPlugIn(bundle.Path());
    auto second = OpenPlugIn(bundle.Path());
    first.reset();
    EXPECT_NE(MakeInstance(factory1, typeA), nullptr);
    second.reset();
    EXPECT_EQ(MakeInstance(factory1, typeA), nullptr);
}

#ifdef COMGUI_LEAK_CHECK
TEST_F(CFPlugInOfStandIn, NeverClosed_IsNoLeak)
{
    BundleOnDisk bundle = NewBundle("One");
    bundle.AddFactory(typeA, factory3, "RecordingFactory");
    // On a stack of its own, where no forgotten copy of the reference can hide a leak.
    std::thread([&] { OpenPlugIn(bundle.Path()).release(); }).join();
    ASSERT_NE(MakeInstance(factory3, typeA), nullptr);
    EXPECT_EQ(__lsan_do_recoverable_leak_check(), 0);
}
#endif
}  // namespace
