#include "standin/server/store/sqlite/SharedPage.h"

#include "tests/server/MemoryFolder.h"
#include "tests/store/SqliteSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include <csignal>
#include <fstream>
#include <future>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <thread>
#include <unistd.h>

using namespace standin;
using namespace std::chrono_literals;

namespace
{
class LockFileTest : public testing::Test
{
protected:
    using Hold = LockFile::Hold;
    MemoryFolder folder;
};

class SharedPageTest : public LockFileTest
{
protected:
    SharedPageTest() { page.Reset(7, false); }

    LockFile file{folder.Path()};
    LockFile otherFile{folder.Path()};
    SharedPage page{file};
    SharedPage other{otherFile};  // the same page, as another program sees it
};
}  // namespace

TEST_F(LockFileTest, ExclusiveLock_KeepsOthersOutUntilItEnds)
{
    LockFile file(folder.Path());
    LockFile other(folder.Path());
    EXPECT_FALSE(other.IsLockedElsewhere(LockFile::Site));
    EXPECT_TRUE(file.TryLock(LockFile::Site, Hold::Exclusive));
    EXPECT_TRUE(other.IsLockedElsewhere(LockFile::Site));
    EXPECT_FALSE(file.IsLockedElsewhere(LockFile::Site));  // one's own is none
    EXPECT_FALSE(other.TryLock(LockFile::Site, Hold::Exclusive));
    EXPECT_FALSE(other.TryLock(LockFile::Site, Hold::Shared));
    EXPECT_TRUE(other.TryLock(LockFile::Opening, Hold::Exclusive));
    file.Unlock(LockFile::Site);
    EXPECT_TRUE(other.TryLock(LockFile::Site, Hold::Exclusive));
}

TEST_F(LockFileTest, SharedLock_IsSharedAndTurnsExclusiveForTheLast)
{
    LockFile file(folder.Path());
    LockFile other(folder.Path());
    EXPECT_TRUE(file.TryLock(LockFile::Site, Hold::Shared));
    EXPECT_TRUE(other.TryLock(LockFile::Site, Hold::Shared));
    EXPECT_FALSE(file.TryLock(LockFile::Site, Hold::Exclusive));
    other.Close();
    EXPECT_TRUE(file.TryLock(LockFile::Site, Hold::Exclusive));
    EXPECT_TRUE(file.TryLock(LockFile::Site, Hold::Shared));
}

TEST_F(LockFileTest, LocksOfProgramsAreApart)
{
    LockFile file(folder.Path());
    LockFile other(folder.Path());
    EXPECT_TRUE(file.TryLock(LockFile::Life(1), Hold::Exclusive));
    EXPECT_TRUE(other.TryLock(LockFile::Life(2), Hold::Exclusive));
    EXPECT_TRUE(other.TryLock(LockFile::Burial(1), Hold::Exclusive));
    EXPECT_FALSE(other.TryLock(LockFile::Life(1), Hold::Exclusive));
    EXPECT_TRUE(file.TryLock(LockFile::Life(1'000'000'000'000), Hold::Exclusive));
}

TEST_F(LockFileTest, LockWithin_WaitsForItsEndOrTheLimit)
{
    LockFile file(folder.Path());
    LockFile other(folder.Path());
    ASSERT_TRUE(file.TryLock(LockFile::Opening, Hold::Exclusive));
    EXPECT_FALSE(other.LockWithin(LockFile::Opening, Hold::Exclusive, 10ms));
    auto waiting = std::async(std::launch::async,
                              [&] { return other.LockWithin(LockFile::Opening, Hold::Exclusive, 60s); });
    file.Unlock(LockFile::Opening);
    EXPECT_TRUE(waiting.get());
}

TEST_F(LockFileTest, LocksEndWithTheProcess)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            LockFile file(folder.Path());
            report(file.TryLock(LockFile::Life(1), Hold::Exclusive));
            pause();
        });
    ASSERT_EQ(child.Next(), 1);
    LockFile file(folder.Path());
    EXPECT_TRUE(file.IsLockedElsewhere(LockFile::Life(1)));
    child.Kill();
    EXPECT_FALSE(file.IsLockedElsewhere(LockFile::Life(1)));
}

// Neither the locks nor what keeps the page mapped outlive the object in a child.
TEST_F(LockFileTest, LocksEndWithTheObject_WhileAChildLives)
{
    auto file = std::make_unique<LockFile>(folder.Path());
    auto page = std::make_unique<SharedPage>(*file);
    ASSERT_TRUE(file->TryLock(LockFile::Life(1), Hold::Exclusive));
    file->HoldFolder();
    ChildProcess child(
        [&file](ChildProcess::Report const& report)
        {
            report(file->IsForeign());
            pause();
        });
    EXPECT_EQ(child.Next(), 1);
    EXPECT_FALSE(file->IsForeign());
    page.reset();
    file.reset();
    LockFile other(folder.Path());
    EXPECT_FALSE(other.IsLockedElsewhere(LockFile::Life(1)));
    EXPECT_FALSE(other.IsFolderHeldElsewhere());
}

TEST_F(LockFileTest, FolderIsHeldByAll)
{
    LockFile file(folder.Path());
    LockFile other(folder.Path());
    EXPECT_FALSE(other.IsFolderHeldElsewhere());
    other.HoldFolder();
    file.HoldFolder();
    EXPECT_TRUE(other.IsFolderHeldElsewhere());
    file.Close();
    EXPECT_FALSE(other.IsFolderHeldElsewhere());
}

// As by a program that dies: its locks on the file have gone by then.
TEST_F(LockFileTest, FolderThatIsLetGoOfAtOnce_IsNotHeld)
{
    LockFile file(folder.Path());
    LockFile other(folder.Path());
    file.HoldFolder();
    std::thread dying(
        [&file]
        {
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
            file.Close();
        });
    EXPECT_FALSE(other.IsFolderHeldElsewhere());
    dying.join();
}

TEST_F(LockFileTest, FileThatIsRemovedOrReplaced_IsNoMoreAtItsPath)
{
    LockFile file(folder.Path());
    EXPECT_TRUE(file.IsAtItsPath());
    std::filesystem::remove(file.Path());
    EXPECT_FALSE(file.IsAtItsPath());
    LockFile const other(folder.Path());
    EXPECT_FALSE(file.IsAtItsPath());
    EXPECT_TRUE(other.IsAtItsPath());
    EXPECT_NE(file.Inode(), other.Inode());
    EXPECT_THROW(SharedPage{file}, StoreError);
}

TEST_F(SharedPageTest, Numbers_AreSharedAndNeverFall)
{
    EXPECT_EQ(other.Committed(), 7u);
    EXPECT_EQ(other.Flushed(), 7u);
    page.RaiseCommitted(9);
    other.RaiseCommitted(8);
    EXPECT_EQ(page.Committed(), 9u);
    EXPECT_EQ(other.Committed(), 9u);
    other.RaiseFlushed(8);
    page.RaiseFlushed(6);
    EXPECT_EQ(page.Flushed(), 8u);
}

TEST_F(SharedPageTest, PageOfAnotherKind_IsRefused)
{
    EXPECT_NO_THROW(other.Check());
    std::string const sound = ContentOf(file.Path());
    for (std::size_t const place : {0u, 30u, 32u, 36u, 40u})  // mark, version, sizes
    {
        std::string spoilt = sound;
        spoilt[place] = static_cast<char>(spoilt[place] + 1);
        std::ofstream(file.Path(), std::ios::binary | std::ios::in) << spoilt;
        EXPECT_THROW(other.Check(), StoreError) << place;
        EXPECT_FALSE(other.TakeNote()) << place;
    }
}

TEST_F(SharedPageTest, Note_IsTakenOnce)
{
    EXPECT_FALSE(other.TakeNote());
    SharedPage::ClosingNote const note{1, 2, 3};
    page.LeaveNote(note);
    EXPECT_EQ(other.TakeNote(), note);
    EXPECT_FALSE(other.TakeNote());
    page.LeaveNote(note);
    page.Reset(9, false);
    EXPECT_FALSE(other.TakeNote());
    EXPECT_EQ(other.Committed(), 9u);
}

TEST_F(SharedPageTest, Tidiness_LastsAsTheNoteDoes)
{
    EXPECT_FALSE(page.IsTidy());
    other.NoteTidy();
    EXPECT_TRUE(page.IsTidy());
    page.LeaveNote({1, 2, 3});
    EXPECT_TRUE(SharedPage(otherFile).IsTidy());
    other.TakeNote();
    EXPECT_TRUE(page.IsTidy());
    page.Reset(7, true);
    EXPECT_TRUE(other.IsTidy());
    page.Reset(7, false);
    EXPECT_FALSE(other.IsTidy());
}

TEST_F(SharedPageTest, AfterDamage_NoNoteIsLeft)
{
    other.NoteDamage();
    page.LeaveNote({1, 2, 3});
    EXPECT_FALSE(page.TakeNote());
    page.Reset(7, false);
    page.LeaveNote({1, 2, 3});
    EXPECT_TRUE(page.TakeNote());
}

TEST_F(SharedPageTest, Ring_WakesWhoWaits)
{
    std::uint32_t const bell = other.Bell();
    auto waiting =
        std::async(std::launch::async,
                   [&]
                   {
                       auto const start = std::chrono::steady_clock::now();
                       while (other.Bell() == bell && std::chrono::steady_clock::now() - start < 50s)
                           other.Wait(bell, 60s);
                       return std::chrono::steady_clock::now() - start;
                   });
    page.Ring(SharedPage::For::Others);
    EXPECT_LT(waiting.get(), 50s);
}

TEST_F(SharedPageTest, Wait_BehindARing_DoesNotSleep)
{
    std::uint32_t const bell = other.Bell();
    page.Ring(SharedPage::For::Others);
    auto const start = std::chrono::steady_clock::now();
    other.Wait(bell, 60s);
    EXPECT_LT(std::chrono::steady_clock::now() - start, 50s);
}

// A waiter of the ringer's own that comes and goes must not be taken for the other one, nor hide it.
TEST_F(SharedPageTest, RingForOthers_WakesThemWhateverTheOwnOnesDo)
{
    std::atomic<bool> isOver{false};
    std::atomic<std::uint32_t> heard{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 3; ++i)
        threads.emplace_back(
            [&]
            {
                while (!isOver)
                    page.Wait(page.Bell(), 1ns);
            });
    threads.emplace_back(
        [&]
        {
            while (!isOver)
            {
                std::uint32_t const bell = other.Bell();
                heard = bell;
                other.Wait(bell, 10s);
            }
        });
    bool isHeard = true;
    for (int i = 0; i < 2000 && isHeard; ++i)
    {
        std::this_thread::sleep_for(20us);  // until the other one is asleep
        page.Ring(SharedPage::For::Others);
        auto const limit = std::chrono::steady_clock::now() + 3s;
        while (heard != page.Bell() && isHeard)
            isHeard = std::chrono::steady_clock::now() < limit;
    }
    EXPECT_TRUE(isHeard);
    isOver = true;
    page.Ring(SharedPage::For::All);
    for (std::thread& thread : threads)
        thread.join();
}

TEST_F(SharedPageTest, Turn_IsOnesAlone)
{
    auto turn = std::make_unique<SharedPage::Turn>(page, 1s);
    EXPECT_FALSE(turn->IsAfterFailure());
    auto const tryIt = [this]
    {
        try
        {
            SharedPage::Turn next(other, 20ms);
            next.End();
            return true;
        }
        catch (StoreError const&)
        {
            return false;
        }
    };
    EXPECT_FALSE(std::async(std::launch::async, tryIt).get());
    turn->End();
    turn.reset();
    EXPECT_TRUE(std::async(std::launch::async, tryIt).get());
}

TEST_F(SharedPageTest, TurnWithoutEnd_IsAFailureForTheNextAlone)
{
    {
        SharedPage::Turn const failed(page, 1s);
    }
    {
        SharedPage::Turn next(other, 1s);
        EXPECT_TRUE(next.IsAfterFailure());
        next.End();
    }
    SharedPage::Turn last(page, 1s);
    EXPECT_FALSE(last.IsAfterFailure());
    last.End();
}

// Somebody passes the turn on again and again; who waits is patient beyond the limit.
// Who passes the turn on and takes it again at once may keep it for longer than the limit.
TEST_F(SharedPageTest, TurnThatMoves_IsWaitedFor)
{
    std::promise<void> begun;
    auto const busy = std::async(std::launch::async,
                                 [&]
                                 {
                                     for (int i = 0; i < 25; ++i)
                                     {
                                         SharedPage::Turn turn(page, 10s);
                                         if (i == 0)
                                             begun.set_value();
                                         std::this_thread::sleep_for(20ms);
                                         turn.End();
                                     }
                                 });
    begun.get_future().wait();
    EXPECT_EQ(ReasonOf([&] { SharedPage::Turn(other, 250ms).End(); }), "");
}

TEST(SharedPageOfAProcess, ThatDiesInItsTurn_PassesItOn)
{
    MemoryFolder const folder;
    {
        LockFile file(folder.Path());
        SharedPage(file).Reset(7, false);
    }
    ChildProcess child(
        [&folder](ChildProcess::Report const& report)
        {
            LockFile file(folder.Path());
            SharedPage page(file);
            SharedPage::Turn const turn(page, 1s);
            report(1);
            pause();
        });
    ASSERT_TRUE(child.Next());
    LockFile file(folder.Path());
    SharedPage page(file);
    EXPECT_THROW(SharedPage::Turn(page, 20ms), StoreError);
    child.Kill();
    for (bool const isAfterDeath : {true, false})
    {
        SharedPage::Turn turn(page, 10s);
        EXPECT_EQ(turn.IsAfterFailure(), isAfterDeath);
        turn.End();
    }
}
