// The folders of a site when it is opened: what the system ticket has of them, and the jobs of a database
// that is gone.
#include "standin/server/site/SiteFolders.h"

#include "standin/server/jobs/JobFolder.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/OpenedSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include <algorithm>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <thread>

using namespace standin;
using testing::AllOf;
using testing::HasSubstr;

namespace
{
constexpr std::size_t Temp = 1;

class FoldersOfASite : public testing::Test
{
protected:
    std::filesystem::path Folder() const { return folder / "site"; }

    // Writes past the server, as a seed or an older program may have done.
    template <typename... Changes>
    void PutAll(Changes... changes)
    {
        std::vector<ParameterChange> list;
        (list.push_back(std::move(changes)), ...);
        OpenedSite(Folder(), COMGUI_TEST_SEED).PutPastTheServer(std::move(list));
    }
    static ParameterChange Text(std::string const& key, std::string_view text)
    {
        return {key, -1, TicketValue::String(text)};
    }

    // Opens the site, keeps what it says, and gives the folders as they are then.
    FolderSettings Opened()
    {
        testing::internal::CaptureStderr();
        OpenedSite site(Folder(), COMGUI_TEST_SEED);
        said = testing::internal::GetCapturedStderr();
        return site.Server().Tickets().Folders();
    }

    MemoryFolder folder;
    std::string said;
};
}  // namespace

TEST_F(FoldersOfASite, ShippedOnes_CanBeRead)
{
    FolderSettings const settings = Opened();
    EXPECT_EQ(said, "");
    EXPECT_TRUE(settings.CanBeRead());
    for (FolderRow const row : FolderRows)
        EXPECT_TRUE(FolderTable(settings.values).FolderOf(row.variable)) << row.variable;
}

TEST_F(FoldersOfASite, UnresolvableOne_IsToldAndSwitchedOff)
{
    PutAll(Text("System/Folders/Temp", "$(JOB)/temp"));
    FolderSettings const settings = Opened();
    EXPECT_THAT(said,
                AllOf(HasSubstr("System/Folders/Temp"), HasSubstr("$(JOB)/temp"), HasSubstr("give it")));
    EXPECT_EQ(std::count(said.begin(), said.end(), '\n'), 1);
    EXPECT_EQ(settings.values[Temp], "");
    EXPECT_TRUE(settings.CanBeRead());
    Opened();
    EXPECT_EQ(said, "");  // once is enough
}

TEST_F(FoldersOfASite, WhatLeansOnAnUnresolvableOne_GoesWithIt)
{
    PutAll(Text("System/Folders/Temp", "$(NOPE)"), Text("System/Folders/Print", "$(TEMP)/print"));
    FolderSettings const settings = Opened();
    EXPECT_EQ(std::count(said.begin(), said.end(), '\n'), 2) << said;
    EXPECT_TRUE(settings.CanBeRead());
    EXPECT_EQ(settings.values[3], "");
}

TEST_F(FoldersOfASite, UseWithoutResolving_IsToldAndSwitchedOff)
{
    PutAll(ParameterChange{"System/UseFolderVariables", -1, TicketValue::Int(2)});
    FolderSettings const settings = Opened();
    EXPECT_THAT(said, AllOf(HasSubstr("System/UseFolderVariables is 2"), HasSubstr("set it to 3")));
    EXPECT_EQ(settings.use, 0);
    EXPECT_EQ(settings.values[Temp], "$(INSTALL)/temp");  // the folders stay
}

TEST_F(FoldersOfASite, Seed_KeepsTheOriginal)
{
    Opened();
    std::string seed = ContentOf(Folder() / "seed.xml");
    std::string const before = "$(INSTALL)/temp";
    seed.replace(seed.find(before), before.size(), "$(JOB)/temp");
    WriteFile(Folder() / "seed.xml", seed);
    std::filesystem::remove(Folder() / "site.db");
    EXPECT_EQ(Opened().values[Temp], "");
    EXPECT_THAT(said, HasSubstr("System/Folders/Temp"));
    EXPECT_EQ(ContentOf(Folder() / "seed.xml"), seed);
}

// The copy knows of a job of a dead program, and of the place where the original has its folder.
TEST_F(FoldersOfASite, OfTheOriginal_StayWhenItsCopyIsOpened)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            OpenedSite site(Folder(), COMGUI_TEST_SEED);
            auto const session = site.Server().Login("operator", "operator");
            int id = -1;
            site.Server().Jobs().Prepare(*session, {"job.pdf"}, id);
            std::filesystem::create_directories(Folder() / "job" / std::to_string(id));
            WriteFile(Folder() / "job" / std::to_string(id) /
                          (".job-" + site.Text({standin::JobTicketType, id}, JobMarkKey)),
                      "");
            report(id);
            for (;;)
                pause();
        });
    auto const id = child.Next();
    child.Kill();
    ASSERT_TRUE(id);
    std::string const job = std::to_string(*id);
    ASSERT_TRUE(std::filesystem::exists(Folder() / "job" / job));
    std::filesystem::path const copy = folder / "copy";
    std::filesystem::copy(Folder(), copy, std::filesystem::copy_options::recursive);
    testing::internal::CaptureStderr();
    Site site({copy}, COMGUI_TEST_SEED);
    {
        Server server(site.store(), copy);
        std::this_thread::sleep_for(
            std::chrono::milliseconds(300));  // for a caretaker that must not work yet
        site.PutInOrder(server);
    }
    site.Leave();
    testing::internal::GetCapturedStderr();
    EXPECT_FALSE(std::filesystem::exists(copy / "job" / job)) << "the dead program's";
    EXPECT_TRUE(std::filesystem::exists(Folder() / "job" / job));
}

TEST_F(FoldersOfASite, JobsOfADatabaseThatIsMadeAnew_AreSetAside)
{
    Opened();
    std::filesystem::create_directories(Folder() / "job/1");
    WriteFile(Folder() / "job/1/precious.pdf", "content");
    std::filesystem::remove(Folder() / "site.db");
    Opened();
    EXPECT_THAT(said, HasSubstr("set aside as 1.damaged-"));
    Opened();
    auto const names = NamesIn(Folder() / "job");
    ASSERT_EQ(names.size(), 1u);
    EXPECT_EQ(ContentOf(Folder() / "job" / names[0] / "precious.pdf"), "content");
}
