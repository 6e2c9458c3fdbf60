// The model of the disk itself: what each kind of power cut may leave, and what none may.
#include "tests/powercut/ForgetfulDisk.h"
#include "tests/server/MemoryFolder.h"
#include "tests/support/Files.h"
#include <gtest/gtest.h>
#include <set>

namespace fs = std::filesystem;

namespace
{
class ForgetfulDiskTest : public testing::Test
{
protected:
    enum : std::uint64_t
    {
        A = 1000001,
        B,
        Folder,
    };

    ForgetfulDiskTest() { fs::create_directory(root); }

    void Begin() { disk.emplace(root); }

    void Make(std::string const& name, std::uint64_t file, DiskCall call = DiskCall::MakeFile)
    {
        Replay(call, file, 0, root / name);
    }
    void Write(std::uint64_t file, std::int64_t offset, std::string const& data)
    {
        Replay(DiskCall::Write, file, offset, {}, {}, data);
    }
    void Resize(std::uint64_t file, std::int64_t size) { Replay(DiskCall::Resize, file, size); }
    void Rename(std::string const& from, std::string const& to)
    {
        Replay(DiskCall::Rename, 0, 0, root / from, root / to);
    }
    void Remove(std::string const& name) { Replay(DiskCall::Remove, 0, 0, root / name); }
    void Flush(std::uint64_t file)
    {
        Replay(DiskCall::BeginFlush, file, 1);
        Replay(DiskCall::Flush, file, 1);
    }
    void FlushRoot()
    {
        struct stat found = {};
        stat(root.c_str(), &found);
        Flush(found.st_ino);
    }

    void Replay(DiskCall call, std::uint64_t file = 0, std::int64_t offset = 0, fs::path const& path = {},
                fs::path const& other = {}, std::string const& data = {})
    {
        DiskRecord record;
        record.head.call = call;
        record.head.file = file;
        record.head.offset = offset;
        record.path = path;
        record.other = other;
        record.data = data;
        disk->Replay(record);
    }

    // Every file with its content, as "name:content", one of the states that may be left.
    std::set<std::string> Left(Survivors survivors)
    {
        fs::path const cut = folder / "cut";
        disk->Restore(cut, survivors, random);
        std::set<std::string> left;
        for (auto const& entry : fs::recursive_directory_iterator(cut))
        {
            std::string const name = fs::relative(entry.path(), cut).string();
            left.insert(entry.is_directory() ? name + "/" : name + ":" + ContentOf(entry.path()));
        }
        return left;
    }

    // All that many power cuts of that kind leave.
    std::set<std::set<std::string>> AllLeft(Survivors survivors)
    {
        std::set<std::set<std::string>> all;
        for (int i = 0; i < 300; ++i)
            all.insert(Left(survivors));
        return all;
    }

    using State = std::set<std::string>;
    using States = std::set<State>;

    MemoryFolder folder;
    fs::path const root = folder / "root";
    std::optional<ForgetfulDisk> disk;
    ForgetfulDisk::Random random{1};
};
}  // namespace

TEST_F(ForgetfulDiskTest, WhatWasThereBefore_IsOnTheDisk)
{
    fs::create_directory(root / "sub");
    WriteFile(root / "sub" / "old", "content");
    Begin();
    for (Survivors const survivors : AllSurvivors)
        EXPECT_EQ(Left(survivors), (State{"sub/", "sub/old:content"})) << NameOf(survivors);
}

TEST_F(ForgetfulDiskTest, FlushedFileInAFolderThatWasNot_MayHaveNoName)
{
    Begin();
    Make("a", A);
    Write(A, 0, "text");
    Flush(A);
    EXPECT_EQ(Left(Survivors::Nothing), State{});
    EXPECT_EQ(Left(Survivors::NamesAlone), State{"a:text"});
    FlushRoot();
    EXPECT_EQ(Left(Survivors::Nothing), State{"a:text"});
}

TEST_F(ForgetfulDiskTest, FlushedNameOfAFileThatWasNot_MayBeEmpty)
{
    Begin();
    Make("a", A);
    Write(A, 0, "text");
    FlushRoot();
    EXPECT_EQ(Left(Survivors::Nothing), State{"a:"});
    EXPECT_EQ(Left(Survivors::Everything), State{"a:text"});
    EXPECT_EQ(AllLeft(Survivors::AnySubset), (States{{"a:"}, {"a:text"}}));
}

TEST_F(ForgetfulDiskTest, FlushOfAFolder_DoesNotFlushThoseInIt)
{
    Begin();
    Make("sub", Folder, DiskCall::MakeFolder);
    FlushRoot();
    Make("sub/a", A);
    FlushRoot();
    EXPECT_EQ(Left(Survivors::Nothing), State{"sub/"});
    Flush(Folder);
    EXPECT_EQ(Left(Survivors::Nothing), (State{"sub/", "sub/a:"}));
}

TEST_F(ForgetfulDiskTest, Rename_IsDoneOrNotButNeverHalf)
{
    WriteFile(root / "name", "old");
    Begin();
    Make("new", A);
    Write(A, 0, "new");
    Flush(A);
    FlushRoot();
    Rename("new", "name");
    States const both{{"name:old", "new:new"}, {"name:new"}};
    EXPECT_EQ(AllLeft(Survivors::InOrder), both);
    EXPECT_EQ(AllLeft(Survivors::AnySubset), both);
    EXPECT_EQ(Left(Survivors::Nothing), (State{"name:old", "new:new"}));
    EXPECT_EQ(disk->ContentsOf("name"), (std::set<std::string>{"old", "new"}));
}

TEST_F(ForgetfulDiskTest, NamesInOrder_AreThereUpToAMoment)
{
    Begin();
    Make("a", A);
    Make("b", B);
    EXPECT_EQ(AllLeft(Survivors::InOrder), (States{{}, {"a:"}, {"a:", "b:"}}));
    EXPECT_EQ(AllLeft(Survivors::AnySubset), (States{{}, {"a:"}, {"b:"}, {"a:", "b:"}}));
}

TEST_F(ForgetfulDiskTest, RemovedName_MayComeBack)
{
    WriteFile(root / "old", "content");
    Begin();
    Remove("old");
    EXPECT_EQ(AllLeft(Survivors::AnySubset), (States{{}, {"old:content"}}));
    FlushRoot();
    EXPECT_EQ(Left(Survivors::Nothing), State{});
}

TEST_F(ForgetfulDiskTest, UnflushedWrite_IsTornBetweenSectorsOnly)
{
    WriteFile(root / "file", std::string(8192, '-'));
    Begin();
    struct stat found = {};
    stat((root / "file").c_str(), &found);
    Write(found.st_ino, 500, std::string(6000, 'x'));
    bool hasHole = false;
    for (State const& left : AllLeft(Survivors::AnySubset))
    {
        std::string const content = left.begin()->substr(5);
        EXPECT_EQ(content.substr(0, 500) + content.substr(6500), std::string(500 + 1692, '-'));
        for (std::size_t i = 501; i < 6500; ++i)
            ASSERT_TRUE(content[i] == content[i - 1] || i % 512 == 0) << i;
        hasHole = hasHole || content.find("x-", 500) < content.rfind("-x", 6400);
    }
    EXPECT_TRUE(hasHole);
}

TEST_F(ForgetfulDiskTest, Resize_WaitsForAFlushLikeAWrite)
{
    WriteFile(root / "file", "content");
    Begin();
    struct stat found = {};
    stat((root / "file").c_str(), &found);
    Resize(found.st_ino, 2);
    EXPECT_EQ(Left(Survivors::Nothing), State{"file:content"});
    EXPECT_EQ(AllLeft(Survivors::AnySubset), (States{{"file:content"}, {"file:co"}}));
    Replay(DiskCall::Grow, found.st_ino, 1);
    Flush(found.st_ino);
    EXPECT_EQ(Left(Survivors::Nothing), State{"file:co"});
}

TEST_F(ForgetfulDiskTest, WhatIsWrittenDuringAFlush_IsNoPartOfIt)
{
    Begin();
    Make("a", A);
    FlushRoot();
    Write(A, 0, "first");
    Replay(DiskCall::BeginFlush, A, 7);
    Write(A, 5, " second");
    EXPECT_EQ(Left(Survivors::Nothing), State{"a:"});
    Replay(DiskCall::Flush, A, 7);
    EXPECT_EQ(Left(Survivors::Nothing), State{"a:first"});
    EXPECT_EQ(Left(Survivors::Everything), State{"a:first second"});
}

TEST_F(ForgetfulDiskTest, FlushThatEndsBehindALaterOne_TakesNothingBack)
{
    Begin();
    Make("a", A);
    FlushRoot();
    Write(A, 0, "first");
    Replay(DiskCall::BeginFlush, A, 7);
    Write(A, 5, " second");
    Flush(A);
    Replay(DiskCall::Flush, A, 7);
    EXPECT_EQ(Left(Survivors::Nothing), State{"a:first second"});
}

TEST_F(ForgetfulDiskTest, CallThatNobodyCanDescribe_Throws)
{
    Begin();
    EXPECT_THROW(Replay(DiskCall::Unknown), std::runtime_error);
    EXPECT_THROW(Write(A, 0, "text"), std::runtime_error);
    EXPECT_THROW(Remove("nothing"), std::runtime_error);
    EXPECT_THROW(Replay(DiskCall::Flush, 0, 7), std::runtime_error);
}
