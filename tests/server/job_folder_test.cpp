// The folders of jobs, while several programs make and remove them.
#include "standin/server/jobs/JobFolder.h"

#include "standin/server/transfer/TransferError.h"
#include "tests/server/DeletedNames.h"
#include "tests/server/MemoryFolder.h"
#include "tests/support/Files.h"
#include <array>
#include <chrono>
#include <gmock/gmock.h>
#include <mutex>
#include <sys/fsuid.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

using namespace standin;
using testing::ElementsAre;
using testing::IsEmpty;
namespace fs = std::filesystem;

namespace
{
constexpr char Apart[] = ".removed-9-0123456789abcdef";

FolderTable TableFor(fs::path const& jobs)
{
    std::array<std::string, FolderRows.size()> values;
    for (std::size_t row = 0; row < std::size(FolderRows); ++row)
        if (FolderRows[row].variable == std::string_view("JOB"))
            values[row] = jobs.string();
    return FolderTable(values);
}

class JobFolders : public testing::Test
{
protected:
    // One with a file in it.
    std::string MakeJob(int id) const
    {
        std::string mark = NewJobMark();
        MakeJobFolder(table, id, mark);
        WriteFile(folder / std::to_string(id) / "job.pdf", "content");
        return mark;
    }
    std::vector<std::string> NamesOf(std::string const& name) const { return NamesIn(folder / name); }

    // meanwhile: what another program does when it turns out that there is no such job. It tells the mark of
    // the job that it makes, if any.
    void Sweep(std::function<std::string()> const& meanwhile = [] { return ""; }) const
    {
        std::string living;
        SweepJobFolders(folder.Path(), {[&](int)
                                        {
                                            living = meanwhile();
                                            return false;
                                        },
                                        [&](int, std::string_view mark) { return mark == living; }});
    }

    static bool Comes(std::function<bool()> const& what)
    {
        auto const end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
        while (std::chrono::steady_clock::now() < end)
        {
            if (what())  // for a moment, perhaps
                return true;
            std::this_thread::yield();
        }
        return false;
    }

    MemoryFolder folder;
    FolderTable const table = TableFor(folder.Path());
};

using SweptJobFolder = JobFolders;
}  // namespace

TEST_F(SweptJobFolder, WithoutAJob_Goes)
{
    MakeJob(9);
    fs::create_directory(folder / "10");
    Sweep();
    EXPECT_THAT(NamesIn(folder.Path()), IsEmpty());
}

// Also one in a folder where only its owner may remove it, or on which something is mounted.
TEST_F(JobFolders, EmptyOneThatCannotGo_IsNotFree)
{
    fs::create_directory(folder / "8");
    fs::create_directory(folder / "9");
    EXPECT_TRUE(IsJobFolderFree(table, 8));
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("9")) << "who makes a job's folder may find it gone";
    EXPECT_TRUE(IsJobFolderFree(table, 8));
    fs::permissions(folder.Path(), fs::perms::owner_write, fs::perm_options::remove);
    if (geteuid() == 0)
        setfsuid(65534);
    bool const isFree = IsJobFolderFree(table, 9);
    setfsuid(geteuid());
    fs::permissions(folder.Path(), fs::perms::owner_write, fs::perm_options::add);
    EXPECT_FALSE(isFree);
    WriteFile(folder / "10", "content");
    EXPECT_FALSE(IsJobFolderFree(table, 10));
}

// As long as anything is left, the mark tells whose that was. Folders are listed in the order of their
// making, backwards, or in none.
TEST_F(SweptJobFolder, LosesItsMarkLast)
{
    for (bool const isMarkNewest : {false, true})
    {
        std::string const name = ".job-" + MakeJob(9);
        for (int i = 0; i < 20; ++i)
            WriteFile(folder / "9" / std::to_string(i), "content");
        if (isMarkNewest)
        {
            fs::rename(folder / "9" / name, folder / "mark");
            fs::rename(folder / "mark", folder / "9" / name);
        }
        DeletedNames deleted(folder / "9");
        Sweep();
        auto const names = deleted.SoFar();
        ASSERT_EQ(names.size(), 22u);
        EXPECT_EQ(names.back(), name);
    }
}

TEST_F(SweptJobFolder, OfTheNextJobOfThatId_StaysWheneverThatIsMade)
{
    MakeJob(9);
    std::string mark;
    Sweep(
        [&]
        {
            fs::remove_all(folder / "9");  // as by the program that has deleted the old job
            return mark = MakeJob(9);
        });
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("9"));
    EXPECT_THAT(NamesOf("9"), ElementsAre(".job-" + mark, "job.pdf"));
}

// Its program looked for the folder while that was away.
TEST_F(SweptJobFolder, OfTheNextJobOfThatId_GoesIfThatIsDeletedMeanwhile)
{
    MakeJob(9);
    Sweep(
        [&]
        {
            fs::remove_all(folder / "9");
            MakeJob(9);
            return "";
        });
    EXPECT_THAT(NamesIn(folder.Path()), IsEmpty());
}

TEST_F(SweptJobFolder, OfAJobThatFindsAnEmptyOne_Stays)
{
    fs::create_directory(folder / "9");
    std::string mark;
    Sweep([&] { return mark = MakeJob(9); });
    EXPECT_THAT(NamesOf("9"), ElementsAre(".job-" + mark, "job.pdf"));
}

TEST_F(SweptJobFolder, ThatIsGivenBack_TakesNoOthersPlace)
{
    std::string const mark = MakeJob(9);
    fs::rename(folder / "9", folder / Apart);
    fs::create_directory(folder / "9");  // another program is about to mark it
    SweepJobFolders(folder.Path(),
                    {[](int) { return true; }, [&](int, std::string_view asked) { return asked == mark; }});
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre(Apart, "9"));
    EXPECT_THAT(NamesOf("9"), IsEmpty());
}

// Its remover was killed after it had seen that it was the wrong one.
TEST_F(SweptJobFolder, OfAJobThatLives_GoesBackToItsPlace)
{
    std::string const mark = MakeJob(9);
    fs::rename(folder / "9", folder / Apart);
    SweepJobFolders(folder.Path(), {[](int) { return true; }, [&](int id, std::string_view asked)
                                    { return id == 9 && asked == mark; }});
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("9"));
    EXPECT_THAT(NamesOf("9"), ElementsAre(".job-" + mark, "job.pdf"));
}

TEST_F(SweptJobFolder, OfAnotherProgram_GoesBackToItsPlace)
{
    fs::create_directory(folder / Apart);
    WriteFile(folder / Apart / "another program's", "content");
    Sweep();
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("9"));
    EXPECT_THAT(NamesOf("9"), ElementsAre("another program's"));
}

TEST_F(SweptJobFolder, ThatWasBeingRemoved_Goes)
{
    MakeJob(9);
    fs::rename(folder / "9", folder / Apart);
    fs::create_directory(folder / ".removed-10-0123456789abcdef");
    Sweep();
    EXPECT_THAT(NamesIn(folder.Path()), IsEmpty());
}

// Nobody can tell whose it is.
TEST_F(SweptJobFolder, ThatCanBeListedAndNotLookedInto_Stays)
{
    MakeJob(9);
    chmod((folder / "9").c_str(), 0444);
    chmod(folder.Path().c_str(), 0777);
    if (geteuid() == 0)
        setfsuid(65534);  // an administrator may look into everything
    Sweep();
    setfsuid(geteuid());
    chmod((folder / "9").c_str(), 0700);
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("9"));
}

// A maker whose jobs come and go under one id, and a sweeper that is always a bit behind.
TEST_F(SweptJobFolder, OfALivingJob_IsNeverTakenForADeadOnes)
{
    std::mutex lock;
    std::string living;  // the mark of the job that there is
    auto const has = [&](std::string_view mark)
    {
        std::lock_guard const guard(lock);
        return mark.empty() ? !living.empty() : living == mark;
    };
    auto const set = [&](std::string const& mark)
    {
        std::lock_guard const guard(lock);
        living = mark;
    };
    std::jthread sweeper(
        [&](std::stop_token const& end)
        {
            while (!end.stop_requested())
                SweepJobFolders(folder.Path(), {[&](int) { return has(""); },
                                                [&](int, std::string_view mark) { return has(mark); }});
        });
    int lost = 0;
    for (int round = 0; round < 500; ++round)
    {
        std::string const mark = NewJobMark();
        set(mark);
        MakeJobFolder(table, 9, mark);
        // It may be away for a moment, until the sweeper has seen whose it is.
        lost += Comes([&] { return fs::exists(folder / "9" / (".job-" + mark)); }) ? 0 : 1;
        set("");
        if (round % 2 == 0)
            RemoveJobFolder(table, 9, mark);
        ASSERT_TRUE(Comes([&] { return !fs::exists(folder / "9"); }));
    }
    sweeper.request_stop();
    sweeper.join();
    EXPECT_EQ(lost, 0);
    Sweep();
    EXPECT_THAT(NamesIn(folder.Path()), IsEmpty());
}
