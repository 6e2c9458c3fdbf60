#include "desk/model/SavedFile.h"

#include "comgui/testing/TemporaryFolder.h"
#include "tests/desk/FileFacts.h"
#include "tests/support/Files.h"
#include "tests/support/FullDisk.h"
#include <filesystem>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

using comgui::test::TemporaryFolder;

using namespace desk;
namespace fs = std::filesystem;

namespace
{
class SavedFiles : public testing::Test
{
protected:
    std::vector<std::string> Names() const { return NamesIn(folder.Path()); }

    TemporaryFolder folder;
    fs::path const file = folder / "job.xml";
};

using Names = std::vector<std::string>;
std::string const Large(1 << 20, 'x');
}  // namespace

TEST_F(SavedFiles, ANewFile_HasTheContentAndIsAlone)
{
    EXPECT_FALSE(SaveFile(file.string(), "content"));
    EXPECT_EQ(ContentOf(file), "content");
    EXPECT_EQ(Names(), ::Names{"job.xml"});
}

TEST_F(SavedFiles, AnOldFile_IsReplaced)
{
    WriteFile(file, "a longer content");
    EXPECT_FALSE(SaveFile(file.string(), "new"));
    EXPECT_EQ(ContentOf(file), "new");
}

TEST_F(SavedFiles, NoBytes_AreAFileToo)
{
    EXPECT_FALSE(SaveFile(file.string(), ""));
    EXPECT_EQ(ContentOf(file), "");
}

TEST_F(SavedFiles, OnAFullDisk_TheOldContentStaysAlone)
{
    WriteFile(file, "old");
    std::optional<FileFault> fault;
    {
        FullDisk const disk(4096);
        fault = SaveFile(file.string(), Large);
    }
    ASSERT_TRUE(fault);
    EXPECT_EQ(fault->trouble, FileTrouble::CannotWrite);
    EXPECT_EQ(fault->file, file.string());
    EXPECT_FALSE(fault->detail.empty());
    EXPECT_EQ(ContentOf(file), "old");
    EXPECT_EQ(Names(), ::Names{"job.xml"});
}

TEST_F(SavedFiles, OnAFullDisk_NoNewFileAppears)
{
    {
        FullDisk const disk(4096);
        EXPECT_TRUE(SaveFile(file.string(), Large));
    }
    EXPECT_TRUE(Names().empty());
}

TEST_F(SavedFiles, Permissions_Stay)
{
    WriteFile(file, "old");
    fs::permissions(file, fs::perms::owner_read | fs::perms::owner_write);
    EXPECT_FALSE(SaveFile(file.string(), "new"));
    EXPECT_EQ(fs::status(file).permissions(), fs::perms::owner_read | fs::perms::owner_write);
}

TEST_F(SavedFiles, ALink_StaysAndItsFileIsReplaced)
{
    fs::path const link = folder / "link.xml";
    WriteFile(file, "old");
    fs::create_symlink(file, link);
    EXPECT_FALSE(SaveFile(link.string(), "new"));
    EXPECT_TRUE(fs::is_symlink(link));
    EXPECT_EQ(ContentOf(file), "new");
}

TEST_F(SavedFiles, ALongestName_IsWritten)
{
    fs::path const longest = folder / std::string(255, 'n');
    EXPECT_FALSE(SaveFile(longest.string(), "content"));
    EXPECT_EQ(ContentOf(longest), "content");
}

TEST_F(SavedFiles, WhereNoFileCanBe_NothingAppears)
{
    EXPECT_EQ(SaveFile((folder / std::string(256, 'n')).string(), "x")->trouble, FileTrouble::CannotWrite);
    EXPECT_EQ(SaveFile((folder / "absent/job.xml").string(), "x")->trouble, FileTrouble::CannotWrite);
    EXPECT_EQ(SaveFile(folder.Path().string(), "x")->trouble, FileTrouble::NotAFile);
    EXPECT_EQ(SaveFile("/dev/null", "x")->trouble, FileTrouble::NotAFile);
    EXPECT_EQ(SaveFile("", "x")->trouble, FileTrouble::CannotWrite);
    EXPECT_TRUE(Names().empty());
}

TEST_F(SavedFiles, ALoadedFile_HasAllBytesUpToTheLimit)
{
    WriteFile(file, Large);
    EXPECT_EQ(std::get<std::string>(LoadFile(file.string(), Large.size())), Large);
    EXPECT_EQ(TroubleOf(LoadFile(file.string(), Large.size() - 1)), FileTrouble::TooLarge);
}

TEST_F(SavedFiles, APipe_IsRefusedWithoutWaitingForItsOtherEnd)
{
    ASSERT_EQ(mkfifo(file.c_str(), 0600), 0);
    EXPECT_EQ(TroubleOf(LoadFile(file.string(), 100)), FileTrouble::NotAFile);
}

TEST_F(SavedFiles, AFileThatMayNotBeRead_SaysWhy)
{
    if (geteuid() == 0)
        GTEST_SKIP() << "root may read everything";
    WriteFile(file, "secret");
    fs::permissions(file, fs::perms::none);
    EXPECT_EQ(TroubleOf(LoadFile(file.string(), 100)), FileTrouble::CannotRead);
}
