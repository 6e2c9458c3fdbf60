// Removing what is in a folder, whatever somebody puts there.
#include "standin/server/files/RemoveTree.h"

#include "standin/server/files/Descriptor.h"
#include "tests/server/DeletedNames.h"
#include "tests/server/MemoryFolder.h"
#include "tests/support/Files.h"
#include <gmock/gmock.h>
#include <sys/fsuid.h>
#include <sys/stat.h>

using namespace standin;
namespace fs = std::filesystem;
using testing::IsEmpty;
using testing::UnorderedElementsAre;

namespace
{
class RemovedTree : public testing::Test
{
protected:
    RemovedTree()
    {
        fs::create_directories(Victim());
        WriteFile(Victim() / "precious", "content");
        fs::create_directories(Tree());
    }

    fs::path Tree() const { return folder / "tree"; }
    fs::path Victim() const { return folder / "victim"; }
    Descriptor Opened() const { return Descriptor(open(Tree().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)); }

    MemoryFolder folder;
};
}  // namespace

TEST_F(RemovedTree, OfAllKinds_IsEmptyAndItsFolderStays)
{
    fs::create_directories(Tree() / "a/b/c");
    WriteFile(Tree() / "a/b/file", "content");
    WriteFile(Tree() / ".hidden", "content");
    mkfifo((Tree() / "pipe").c_str(), 0600);
    EXPECT_TRUE(RemoveContent(Opened().Number()));
    EXPECT_THAT(NamesIn(Tree()), IsEmpty());
}

TEST_F(RemovedTree, WithLinks_LeavesWhatTheyLeadTo)
{
    fs::create_directory_symlink(Victim(), Tree() / "folder");
    fs::create_symlink(Victim() / "precious", Tree() / "file");
    fs::create_directories(Tree() / "a");
    fs::create_directory_symlink(Victim(), Tree() / "a/folder");
    EXPECT_TRUE(RemoveContent(Opened().Number()));
    EXPECT_THAT(NamesIn(Tree()), IsEmpty());
    EXPECT_EQ(ContentOf(Victim() / "precious"), "content");
}

// Between the look at the folder and the removing.
TEST_F(RemovedTree, WhoseNameIsALinkByNow_IsRemovedAllTheSame)
{
    WriteFile(Tree() / "file", "content");
    Descriptor const opened = Opened();
    fs::rename(Tree(), folder / "elsewhere");
    fs::create_directory_symlink(Victim(), Tree());
    EXPECT_TRUE(RemoveContent(opened.Number()));
    EXPECT_THAT(NamesIn(folder / "elsewhere"), IsEmpty());
    EXPECT_EQ(ContentOf(Victim() / "precious"), "content");
}

TEST_F(RemovedTree, WhatIsToGoLast_GoesBehindAllOthers)
{
    for (int i = 0; i < 20; ++i)
        WriteFile(Tree() / std::to_string(i), "content");
    fs::create_directories(Tree() / "folder");
    DeletedNames deleted(Tree());
    EXPECT_TRUE(RemoveContent(Opened().Number(), [](std::string const& name) { return name == "7"; }));
    auto const removed = deleted.SoFar();
    ASSERT_EQ(removed.size(), 21u);
    EXPECT_EQ(removed.back(), "7");
}

TEST_F(RemovedTree, WithSomethingThatCannotGo_LosesAllTheRestButWhatIsToGoLast)
{
    fs::permissions(Tree(), fs::perms::all);
    for (int i = 0; i < 20; ++i)
        WriteFile(Tree() / std::to_string(i), "content");
    fs::create_directories(Tree() / "foreign");
    WriteFile(Tree() / "foreign" / "file", "content");
    fs::permissions(Tree() / "foreign", fs::perms::owner_write, fs::perm_options::remove);
    Descriptor const opened = Opened();
    if (geteuid() == 0)
        setfsuid(65534);  // an administrator may remove everything
    bool const isGone = RemoveContent(opened.Number(), [](std::string const& name) { return name == "7"; });
    int const reason = errno;
    setfsuid(geteuid());
    fs::permissions(Tree() / "foreign", fs::perms::owner_write, fs::perm_options::add);
    EXPECT_FALSE(isGone);
    EXPECT_EQ(reason, EACCES);
    EXPECT_THAT(NamesIn(Tree()), UnorderedElementsAre("7", "foreign"));
}

TEST_F(RemovedTree, OfNoFolder_IsAFailure)
{
    EXPECT_FALSE(RemoveContent(-1));
    EXPECT_EQ(errno, EBADF);
}

TEST_F(RemovedTree, Names_AreThoseOfAllEntriesEachTime)
{
    WriteFile(Tree() / "a", "");
    fs::create_directories(Tree() / "b");
    Descriptor const opened = Opened();
    EXPECT_THAT(standin::NamesIn(opened.Number()), UnorderedElementsAre("a", "b"));
    EXPECT_THAT(standin::NamesIn(opened.Number()), UnorderedElementsAre("a", "b"));
}
