#include "tools/comgui_site/check.h"

#include "comgui/testing/TemporaryFolder.h"
#include "tests/tools/SiteTest.h"

using comgui::test::TemporaryFolder;

using namespace comgui_site;
using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
class SiteCheck : public SiteTest
{
protected:
    SiteCheck()
    {
        Put({0, 0}, "System/UseFolderVariables", Integer(PARAM_INT, 3));
        Put({0, 0}, "System/Folders/Job", Bytes(PARAM_STRING, "$(INSTALL)/job"));
        Put({0, 0}, "System/InstallFolder", Bytes(PARAM_STRING, "/where/it/was"));
    }

    // A job of five bytes that has arrived; its file is for the test to write.
    void AddJob(std::string_view file = "$(JOB)/4/a.pdf")
    {
        Put({3, 4}, "Job/State", Integer(PARAM_INT, 1));
        Put({3, 4}, "Job/File", Bytes(PARAM_STRING, file));
        Put({3, 4}, "Job/Size", Integer(PARAM_INT64, 5));
        Put({3, 4}, "Job/FolderMark", Bytes(PARAM_STRING, "mark"));
    }

    std::vector<std::string> Problems()
    {
        return ProblemsOf(store, folder.Path(), [](long long, long long) {});
    }

    TemporaryFolder const folder;
};
}  // namespace

TEST_F(SiteCheck, SoundSite_HasNoProblems)
{
    AddJob();
    folder.Write("job/4/a.pdf", "12345");
    EXPECT_THAT(Problems(), IsEmpty());
}

TEST_F(SiteCheck, JobWithoutItsFile)
{
    AddJob();
    EXPECT_THAT(Problems(), ElementsAre("ticket 3/4: the job's file $(JOB)/4/a.pdf is missing: " +
                                        (folder / "job/4/a.pdf").string()));
}

TEST_F(SiteCheck, JobWithAFolderInPlaceOfItsFile)
{
    AddJob();
    folder.Write("job/4/a.pdf/x", "");
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("a.pdf is missing")));
}

TEST_F(SiteCheck, JobWithACutFile)
{
    AddJob();
    folder.Write("job/4/a.pdf", "1234");
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("a.pdf has 4 bytes instead of 5")));
}

TEST_F(SiteCheck, JobInAFolderThatNobodyKnows)
{
    AddJob("$(NOWHERE)/4/a.pdf\x1B");
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("$(NOWHERE)/4/a.pdf\\x1b is in no folder")));
}

TEST_F(SiteCheck, JobWithAFolderThatNamesNoFile)
{
    Put({3, 4}, "Job/State", Integer(PARAM_INT, 1));
    EXPECT_THAT(Problems(), IsEmpty());  // a sample, as a seed has them
    Put({3, 4}, "Job/FolderMark", Bytes(PARAM_STRING, "mark"));
    EXPECT_THAT(Problems(), ElementsAre("ticket 3/4: the job has arrived, but its ticket names no file"));
}

TEST_F(SiteCheck, JobThatHasNotArrived_NeedsNoFile)
{
    AddJob();
    Put({3, 4}, "Job/State", Integer(PARAM_INT, 0));
    EXPECT_THAT(Problems(), IsEmpty());
}

TEST_F(SiteCheck, UserWithoutATicket)
{
    site->PutUser({"anna", "$y$", 1, 30});
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("user \"anna\": the ticket 17/30 is missing")));
}

TEST_F(SiteCheck, UserWithoutAPassword)
{
    site->PutUser({"operator", "", 1, 2});
    EXPECT_THAT(Problems(), ElementsAre("user \"operator\": no password fits; set one with passwd"));
}

TEST_F(SiteCheck, UserWithAControlCharacter)
{
    HaveUser("a\nb", 1, 5);
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("user \"a\\x0ab\": the name")));
}

TEST_F(SiteCheck, NoAdministrator)
{
    site->PutUser({"admin", "$y$", 17, 1});
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("no user is an administrator")));
}

TEST_F(SiteCheck, NoSystemTicket)
{
    TicketCommits(store).Delete({0, 0});
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("ticket 0/0: is missing")));
}

TEST_F(SiteCheck, FoldersThatClientsCannotRead)
{
    Put({0, 0}, "System/Folders/Temp", Bytes(PARAM_STRING, "$(NOWHERE)/temp"));
    EXPECT_THAT(Problems(), ElementsAre("ticket 0/0: clients cannot read the folders: System/Folders/Temp"));
}

TEST_F(SiteCheck, TicketThatCannotBeRead_IsAProblemAndNotTheEnd)
{
    AddJob();
    folder.Write("job/4/a.pdf", "12345");
    site->FailOperation(3);  // the folders, the listing, the first ticket
    EXPECT_THAT(Problems(), ElementsAre(HasSubstr("ticket 0/0: cannot be read: ")));
    EXPECT_TRUE(site->HasFailed());
}

TEST_F(SiteCheck, Progress_CountsEachTicket)
{
    long long last = -1;
    long long total = 0;
    ProblemsOf(store, folder.Path(),
               [&](long long done, long long of)
               {
                   EXPECT_EQ(done, last + 1);
                   last = done;
                   total = of;
               });
    EXPECT_EQ(total, 3);
    EXPECT_EQ(last, 2);
}
