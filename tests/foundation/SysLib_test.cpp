#include "comgui/foundation/SysLib.h"

#include "comgui/testing/TemporaryFolder.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <fstream>
#include <gtest/gtest.h>
#include <iterator>
#include <optional>
#include <string>
#include <thread>
#include <type_traits>
#include <vector>

using comgui::test::TemporaryFolder;

using SysLib::MUTEX_INSTANCE;
using SysLib::MUTEX_LOCK;

namespace
{
// Whether anybody holds the POSIX mutex below. A recursive one would let its holder in.
bool IsLocked(MUTEX_INSTANCE& instance)
{
    int const result = pthread_mutex_trylock(&instance.mutex);
    if (result == 0)
        pthread_mutex_unlock(&instance.mutex);
    return result == EBUSY;
}

// Listed in the order of names, since the system has an order of its own.
std::vector<std::string> Listed(std::filesystem::path const& folder, std::string const& suffix)
{
    std::list<std::string> names;
    SysLib::GetAllFilenames(names, folder.string(), suffix);
    std::vector<std::string> sorted(names.begin(), names.end());
    std::sort(sorted.begin(), sorted.end());
    return sorted;
}

std::string TextOf(std::filesystem::path const& file)
{
    std::ifstream stream(file, std::ios::binary);
    return stream ? std::string(std::istreambuf_iterator<char>(stream), {}) : "no file";
}

using NAMES = std::vector<std::string>;
}  // namespace

TEST(MUTEX_INSTANCE, IsAPlainRecordThatCannotBeCopied)
{
    EXPECT_FALSE(std::is_copy_constructible_v<MUTEX_INSTANCE>);
    EXPECT_FALSE(std::is_copy_assignable_v<MUTEX_INSTANCE>);
    EXPECT_FALSE(std::is_polymorphic_v<MUTEX_INSTANCE>);
    EXPECT_TRUE(std::is_nothrow_destructible_v<MUTEX_INSTANCE>);
    EXPECT_TRUE(std::is_nothrow_destructible_v<MUTEX_LOCK>);
    EXPECT_FALSE((std::is_convertible_v<MUTEX_INSTANCE&, MUTEX_LOCK>));
}

TEST(MUTEX_INSTANCE, EventsHaveTheirNumbers)
{
    EXPECT_EQ(MUTEX_INSTANCE::CREATED, 0);
    EXPECT_EQ(MUTEX_INSTANCE::DESTROYED, 1);
    EXPECT_EQ(MUTEX_INSTANCE::LOCK_WANTED, 2);
    EXPECT_EQ(MUTEX_INSTANCE::LOCK_HELD, 3);
    EXPECT_EQ(MUTEX_INSTANCE::LOCK_RELEASED, 4);
}

TEST(MUTEX_INSTANCE, New_IsHeldByNobody)
{
    MUTEX_INSTANCE instance;
    EXPECT_EQ(MUTEX_INSTANCE::NO_LOCKER(), pthread_t{});
    EXPECT_EQ(instance.locker, MUTEX_INSTANCE::NO_LOCKER());
    EXPECT_EQ(instance.lockCount, 0);
    EXPECT_FALSE(IsLocked(instance));
}

TEST(MUTEX_INSTANCE, Hooks_AreEmpty)
{
    MUTEX_INSTANCE instance;
    MUTEX_LOCK const lock(instance);
    instance.InitID();
    MUTEX_INSTANCE::Logger(instance, MUTEX_INSTANCE::LOCK_RELEASED);
    EXPECT_EQ(instance.locker, pthread_self());
    EXPECT_EQ(instance.lockCount, 1);
}

TEST(MUTEX_LOCK, Scope_HoldsTheInstanceForItsThread)
{
    MUTEX_INSTANCE instance;
    {
        MUTEX_LOCK const lock(instance);
        EXPECT_EQ(instance.locker, pthread_self());
        EXPECT_EQ(instance.lockCount, 1);
        EXPECT_TRUE(IsLocked(instance));
    }
    EXPECT_EQ(instance.locker, MUTEX_INSTANCE::NO_LOCKER());
    EXPECT_EQ(instance.lockCount, 0);
    EXPECT_FALSE(IsLocked(instance));
}

TEST(MUTEX_LOCK, ThreeOfOneThread_NestAndTheThirdToEndReleases)
{
    MUTEX_INSTANCE instance;
    std::optional<MUTEX_LOCK> locks[3];
    for (int count = 1; count <= 3; ++count)
    {
        locks[count - 1].emplace(instance);
        EXPECT_EQ(instance.lockCount, count);
    }
    locks[2].reset();
    locks[1].reset();
    EXPECT_EQ(instance.lockCount, 1);
    EXPECT_EQ(instance.locker, pthread_self());
    EXPECT_TRUE(IsLocked(instance));
    locks[0].reset();
    EXPECT_EQ(instance.lockCount, 0);
    EXPECT_FALSE(IsLocked(instance));
}

TEST(MUTEX_LOCK, ReleasedInstance_CanBeLockedAgain)
{
    MUTEX_INSTANCE instance;
    for (int i = 0; i < 3; ++i)
    {
        MUTEX_LOCK const lock(instance);
        EXPECT_EQ(instance.lockCount, 1);
    }
}

TEST(MUTEX_LOCK, TwoInstances_AreHeldApart)
{
    MUTEX_INSTANCE first;
    MUTEX_INSTANCE second;
    MUTEX_LOCK const lock(first);
    EXPECT_EQ(second.locker, MUTEX_INSTANCE::NO_LOCKER());
    MUTEX_LOCK const other(second);
    EXPECT_EQ(first.lockCount, 1);
    EXPECT_EQ(second.lockCount, 1);
}

// The sum is plain: two threads inside at once lose counts, and the thread sanitizer sees it. It sees too
// whether the look at the holder, which each thread takes without the lock, is ordered with the writes.
TEST(MUTEX_LOCK, ManyThreads_EnterOneByOneAndFindTheirOwnCount)
{
    constexpr int rounds = 5000;
    MUTEX_INSTANCE instance;
    int entered = 0;
    int strange = 0;
    auto const work = [&]
    {
        for (int i = 0; i < rounds; ++i)
        {
            MUTEX_LOCK const outer(instance);
            strange += instance.lockCount != 1;
            MUTEX_LOCK const inner(instance);
            strange += instance.lockCount != 2 || instance.locker != pthread_self();
            ++entered;
        }
    };
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(work);
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(entered, 4 * rounds);
    EXPECT_EQ(strange, 0);
    EXPECT_EQ(instance.locker, MUTEX_INSTANCE::NO_LOCKER());
}

TEST(GetAllFilenames, MissingFolder_EmptiesTheList)
{
    TemporaryFolder folder;
    std::list<std::string> names = {"old"};
    SysLib::GetAllFilenames(names, (folder.Path() / "missing").string(), "");
    EXPECT_TRUE(names.empty());
}

TEST(GetAllFilenames, OldNames_AreReplaced)
{
    TemporaryFolder folder;
    folder.Write("a.xml", "");
    std::list<std::string> names = {"old.xml"};
    SysLib::GetAllFilenames(names, folder.Path().string(), ".xml");
    EXPECT_EQ(names, std::list<std::string>{"a.xml"});
}

TEST(GetAllFilenames, Suffix_TakesNamesThatEndWithItByteForByte)
{
    TemporaryFolder folder;
    for (char const* name : {"a.xml", ".xml", "a.XML", "a.xml.bak", "xml", "a.xmlx", "\xC3\x84.xml"})
        folder.Write(name, "");
    EXPECT_EQ(Listed(folder.Path(), ".xml"), (NAMES{".xml", "a.xml", "\xC3\x84.xml"}));
}

TEST(GetAllFilenames, SuffixLongerThanEveryName_TakesNothing)
{
    TemporaryFolder folder;
    folder.Write("a.xml", "");
    EXPECT_EQ(Listed(folder.Path(), "aa.xml"), NAMES{});
}

TEST(GetAllFilenames, SuffixThatIsTheWholeName_TakesIt)
{
    TemporaryFolder folder;
    folder.Write("a.xml", "");
    EXPECT_EQ(Listed(folder.Path(), "a.xml"), NAMES{"a.xml"});
}

TEST(GetAllFilenames, Suffix_TakesSubfoldersToo)
{
    TemporaryFolder folder;
    folder.Write("sub.xml/inner.xml", "");
    EXPECT_EQ(Listed(folder.Path(), ".xml"), NAMES{"sub.xml"});
}

TEST(GetAllFilenames, EmptySuffix_TakesEverything_ByDesign)
{
    TemporaryFolder folder;
    folder.Write("a.xml", "");
    folder.Write("sub/inner", "");
    EXPECT_EQ(Listed(folder.Path(), ""), (NAMES{".", "..", "a.xml", "sub"}));
}

TEST(GetAllFilenames, SuffixOfADot_TakesTheFolderItself_ByDesign)
{
    TemporaryFolder folder;
    folder.Write("a", "");
    EXPECT_EQ(Listed(folder.Path(), "."), (NAMES{".", ".."}));
}

TEST(GetAllFilenames, FileInsteadOfFolder_GivesNothing)
{
    TemporaryFolder folder;
    EXPECT_EQ(Listed(folder.Write("a.xml", ""), ""), NAMES{});
}

TEST(GetAllFilenames, CalledOften_LeavesNoFolderOpen)
{
    TemporaryFolder folder;
    for (int i = 0; i < 3000; ++i)  // more than a process may have open
        ASSERT_EQ(Listed(folder.Path(), "").size(), 2U) << i;
}

TEST(ForceRename, File_GetsItsNewName)
{
    TemporaryFolder folder;
    std::filesystem::path const from = folder.Write("from", "text");
    EXPECT_EQ(SysLib::ForceRename(from.string(), (folder.Path() / "to").string()), "");
    EXPECT_FALSE(std::filesystem::exists(from));
    EXPECT_EQ(TextOf(folder.Path() / "to"), "text");
}

TEST(ForceRename, ExistingTarget_IsReplaced)
{
    TemporaryFolder folder;
    std::filesystem::path const from = folder.Write("from", "new");
    std::filesystem::path const to = folder.Write("to", "old");
    EXPECT_EQ(SysLib::ForceRename(from.string(), to.string()), "");
    EXPECT_EQ(TextOf(to), "new");
}

TEST(ForceRename, MissingFile_GivesTheEmptyTextToo_ByDesign)
{
    TemporaryFolder folder;
    std::filesystem::path const to = folder.Write("to", "old");
    EXPECT_EQ(SysLib::ForceRename((folder.Path() / "missing").string(), to.string()), "");
    EXPECT_EQ(TextOf(to), "old");
}
