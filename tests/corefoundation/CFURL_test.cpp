#include "comgui/testing/TemporaryFolder.h"
#include "tests/corefoundation/Held.h"
#include "tests/support/BundleOnDisk.h"

#include <gtest/gtest.h>

using comgui::test::TemporaryFolder;

namespace
{
TEST(CFURLCreateWithFileSystemPathOfStandIn, NullPath_EndsTheProgram)
{
    EXPECT_DEATH(CFURLCreateWithFileSystemPath(kCFAllocatorDefault, nullptr, kCFURLPOSIXPathStyle, true),
                 "CFURLCreateWithFileSystemPath of a null path");
}

TEST(CFURLCreateWithFileSystemPath, EmptyPath_IsNull) { EXPECT_FALSE(MakeURL("")); }

TEST(CFURLCreateWithFileSystemPathOfStandIn, OtherPathStyle_IsNull)
{
    CFURLPathStyle const windows = 2;
    auto const path = MakeString("/tmp");
    EXPECT_EQ(CFURLCreateWithFileSystemPath(kCFAllocatorDefault, path.get(), windows, true), nullptr);
}

TEST(CFURLCreateWithFileSystemPath, PathThatDoesNotExist_IsAnURL) { EXPECT_TRUE(MakeURL("/no/such/place")); }

TEST(CFURLCreateWithFileSystemPath, RelativePath_IsTakenFromTheFolderCurrentThen)
{
    TemporaryFolder const folder;
    BundleOnDisk const bundle(folder.Path());
    std::filesystem::current_path(folder.Path());
    auto const url = MakeURL("ComGUI.Bundle");
    std::filesystem::current_path("/");
    EXPECT_TRUE(Held<CFPlugInRef>(CFPlugInCreate(kCFAllocatorDefault, url.get())));
}
}  // namespace
