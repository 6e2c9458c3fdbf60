// The translator of folder paths that a container and its tickets hand out.
#include "tests/module/NotificationListener.h"

#include "comgui/access/MTICKET_READ.h"
#include "comgui/access/STICKET_READ.h"
#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include "tests/support/Allocations.h"
#include "tests/support/ChildProcess.h"
#include <new>
#include <thread>

namespace
{
class FolderTranslators : public ClientTest
{
protected:
    static clFOLDER_VARIABLES* OfTheContainer(CLIENT const& client, int type = -1, int id = -1)
    {
        clFOLDER_VARIABLES* folders = nullptr;
        int const answer = client.Operate(type, id, MTICKET_OP_FOLDER_VARIABLES, &folders);
        EXPECT_EQ(answer, folders ? 1 : 0);
        return folders;
    }

    static clFOLDER_VARIABLES* OfTheTicket(STICKET_ACCESS const* ticket)
    {
        clFOLDER_VARIABLES* folders = nullptr;
        int const answer = ticket->SOPTION(ticket->Instance, STICKET_OP_FOLDER_VARIABLES, &folders);
        EXPECT_EQ(answer, folders ? 1 : 0);
        return folders;
    }

    static bool WriteText(CLIENT const& client, int type, int id, char const* key, char const* text)
    {
        return client.Access()->MSETPARAMETER(client.Access()->Instance, type, id, key, PARAM_STRING, text,
                                              -1) != 0;
    }

    std::string SiteFolder() const { return (folder.Path() / "site").string(); }
};

constexpr char TempKey[] = "System/Folders/Temp";
constexpr char UseKey[] = "System/UseFolderVariables";
}  // namespace

TEST_F(FolderTranslators, OfAContainerAndOfItsTickets_AreOne)
{
    clFOLDER_VARIABLES* const folders = OfTheContainer(admin);
    ASSERT_TRUE(folders);
    EXPECT_EQ(OfTheContainer(admin), folders);
    EXPECT_EQ(OfTheTicket(admin.Open(3, 1)), folders);
    EXPECT_EQ(OfTheTicket(admin.Open(0, 0)), folders);
    EXPECT_EQ(OfTheTicket(admin.Create(50, 1)), folders);
}

TEST_F(FolderTranslators, OfATicketThatIsWalkedOver_IsTheContainers)
{
    struct WALK
    {
        FolderTranslators* self;
        clFOLDER_VARIABLES* found;
    } walk{this, nullptr};
    admin.Access()->MWALKTICKETS(
        admin.Access()->Instance,
        [](void* context, int, int, STICKET_ACCESS const* ticket)
        {
            static_cast<WALK*>(context)->found = OfTheTicket(ticket);
            return false;
        },
        &walk, 3);
    EXPECT_TRUE(walk.found);
    EXPECT_EQ(walk.found, OfTheContainer(admin));
}

TEST_F(FolderTranslators, OfTwoSessions_AreTwo) { EXPECT_NE(OfTheContainer(admin), OfTheContainer(other)); }

TEST_F(FolderTranslators, AskedForWithATicketsAddress_AreRefused)
{
    ASSERT_TRUE(OfTheContainer(admin));
    for (auto const& [type, id] : {std::pair(3, 1), std::pair(-1, 0), std::pair(0, -1), std::pair(0, 0)})
        EXPECT_FALSE(OfTheContainer(admin, type, id)) << type << '/' << id;
}

TEST_F(FolderTranslators, WithNowhereToGo_AreRefused)
{
    EXPECT_EQ(admin.Operate(-1, -1, MTICKET_OP_FOLDER_VARIABLES, nullptr), 0);
    auto const* const ticket = admin.Open(3, 1);
    EXPECT_EQ(ticket->SOPTION(ticket->Instance, STICKET_OP_FOLDER_VARIABLES, nullptr), 0);
}

TEST_F(FolderTranslators, OfAClosedOrDeletedTicket_AreRefused)
{
    auto const* const closed = admin.Open(3, 1);
    ASSERT_TRUE(OfTheTicket(closed));
    admin.Close(3, 1);
    EXPECT_FALSE(OfTheTicket(closed));
    auto const* const deleted = admin.Open(3, 2);
    ASSERT_TRUE(OfTheTicket(deleted));
    admin.Operate(3, 2, MTICKET_OP_DELETE);
    EXPECT_FALSE(OfTheTicket(deleted));
}

TEST_F(FolderTranslators, OfAnEndedSession_AreRefusedAndLeaveTheCallersPointer)
{
    auto const* const ticket = admin.Open(3, 1);
    ASSERT_TRUE(OfTheTicket(ticket));
    admin.Logout();
    void* out = this;
    EXPECT_EQ(admin.Operate(-1, -1, MTICKET_OP_FOLDER_VARIABLES, &out), 0);
    EXPECT_EQ(ticket->SOPTION(ticket->Instance, STICKET_OP_FOLDER_VARIABLES, &out), 0);
    EXPECT_EQ(out, this);
}

TEST_F(FolderTranslators, HeldPastTheEndOfTheirSession_StillTranslate)
{
    clFOLDER_VARIABLES* const used = OfTheContainer(admin);
    clFOLDER_VARIABLES* const unused = OfTheContainer(other);
    EXPECT_EQ(used->Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
    admin.Logout();
    other.Logout();
    EXPECT_EQ(used->Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
    EXPECT_EQ(unused->Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
}

TEST_F(FolderTranslators, TranslateByTheSitesFolders)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(other);
    EXPECT_TRUE(folders.IsEnabled());
    EXPECT_EQ(folders.Decode("$(JOB)/4/a.pdf", false), SiteFolder() + "/job/4/a.pdf");
    EXPECT_EQ(folders.Decode("$(NOPE)/x", false), "$(NOPE)/x");
    EXPECT_EQ(folders.Encode(SiteFolder() + "/job/4/a.pdf"), "$(JOB)/4/a.pdf");
    EXPECT_EQ(folders.Encode(TempKey, "x"), "$(TEMP)/x");
    EXPECT_EQ(folders.EncodeV("LOG", "x"), "$(LOG)/x");
}

TEST_F(FolderTranslators, TranslateWholeTables)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(other);
    std::string const path = SiteFolder() + "/temp/x";
    SETMULTIPAR table[2] = {};
    table[0].key = "K";
    table[0].type = PARAM_STRING;
    table[0].value = path.c_str();
    std::unique_ptr<clSETMULTIPAR_FOLDER_VARIABLES> const translated(
        folders.New_clSETMULTIPAR_FOLDER_VARIABLES(&folders, table, true));
    EXPECT_STREQ(static_cast<char const*>(translated->current[0].value), "$(TEMP)/x");
}

TEST_F(FolderTranslators, OfASessionThatSeesLittle_KnowAllFolders)
{
    ASSERT_EQ(other.Limit(0, 0, {"System/Name"}), 1);
    EXPECT_EQ(OfTheContainer(other)->Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
}

TEST_F(FolderTranslators, LeaveNoTicketOpen)
{
    OfTheContainer(admin)->Load();
    EXPECT_EQ(admin.Close(0, 0), 0);
}

TEST_F(FolderTranslators, FollowTheSystemTicket)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(other);
    ASSERT_EQ(folders.Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
    ASSERT_TRUE(WriteText(admin, 0, 0, TempKey, "/elsewhere/"));
    EXPECT_EQ(folders.Decode("$(TEMP)/x", false), "/elsewhere/x");
    EXPECT_EQ(folders.Encode("/elsewhere/x"), "$(TEMP)/x");
    ASSERT_TRUE(admin.Delete(0, 0, TempKey));
    EXPECT_EQ(folders.Decode("$(TEMP)/x", false), "$(TEMP)/x");
    EXPECT_EQ(folders.Encode(TempKey, "x"), "x");
    EXPECT_EQ(folders.EncodeV("TEMP", "x"), "$(TEMP)/x");
}

TEST_F(FolderTranslators, FollowWhatTheSystemTicketSwitchesOff)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(other);
    ASSERT_TRUE(folders.IsEnabled());
    ASSERT_TRUE(admin.Write(0, 0, UseKey, 0));
    EXPECT_FALSE(folders.IsEnabled());
    EXPECT_EQ(folders.Decode("$(TEMP)/x", false), "$(TEMP)/x");
    EXPECT_EQ(OfTheContainer(other), &folders);  // which lets everything pass
    ASSERT_TRUE(admin.Write(0, 0, UseKey, 1));
    EXPECT_TRUE(folders.IsEnabled());
    EXPECT_EQ(folders.EncodeV("TEMP", "x"), "x");
    EXPECT_EQ(folders.Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
}

TEST_F(FolderTranslators, FoldersSetByTheClient_AreGoodUntilTheSystemTicketChanges)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(admin);
    folders.SetFolderVariable("MINE", "/mine");
    ASSERT_TRUE(admin.Write(3, 1, "Test/K", 1));
    EXPECT_EQ(folders.Decode("$(MINE)/x", false), "/mine/x");
    EXPECT_EQ(OfTheContainer(other)->Decode("$(MINE)/x", false), "$(MINE)/x");
    ASSERT_TRUE(admin.Write(0, 0, "System/Test", 1));
    EXPECT_EQ(folders.Decode("$(MINE)/x", false), "$(MINE)/x");
}

TEST_F(FolderTranslators, Load_ForgetsFoldersSetByTheClient)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(admin);
    folders.SetFolderVariable("TEMP", "/mine");
    ASSERT_EQ(folders.Decode("$(TEMP)/x", false), "/mine/x");
    folders.Load();
    EXPECT_EQ(folders.Decode("$(TEMP)/x", false), SiteFolder() + "/temp/x");
}

TEST_F(FolderTranslators, ViewsOfContainerAndTicket_ResolveWhatTheyRead)
{
    ASSERT_TRUE(WriteText(other, 3, 1, "Job/File", "$(JOB)/x"));
    auto const expected = wxString::FromUTF8((SiteFolder() + "/job/x").c_str());
    EXPECT_EQ(MTICKET_READ::Of(other.Access())->GetWxStringParameter(3, 1, -1, "Job/File", wxString()),
              expected);
    EXPECT_EQ(STICKET_READ::Of(other.Open(3, 1))->GetWxStringParameter(-1, "Job/File", wxString()), expected);
}

TEST_F(FolderTranslators, UsedByManyThreadsWhileTheFoldersChange_GiveOldOrNewFolders)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(other);
    std::string const first = folders.Decode("$(TEMP)/x", false);
    std::atomic<bool> stop{false};
    std::vector<std::thread> threads(3);
    for (std::thread& thread : threads)
        thread = std::thread(
            [&]
            {
                while (!stop)
                {
                    std::string const path = folders.Decode("$(TEMP)/x", false);
                    EXPECT_TRUE(path == first || path == "/a/x" || path == "/b/x") << path;
                    EXPECT_EQ(OfTheContainer(other), &folders);
                }
            });
    for (int round = 0; round < 50; ++round)
        EXPECT_TRUE(WriteText(admin, 0, 0, TempKey, round % 2 ? "/a" : "/b"));
    stop = true;
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(folders.Decode("$(TEMP)/x", false), "/a/x");
}

// Without memory a load fails where it stands, and leaves folders out or all of them.
TEST_F(FolderTranslators, LoadedWithoutMemory_LoadOnceMoreAtTheNextOperation)
{
    clFOLDER_VARIABLES& folders = *OfTheContainer(other);
    std::string const expected = folders.Decode("$(TEMP)/x", false);
    ASSERT_EQ(expected, SiteFolder() + "/temp/x");
    testing::internal::CaptureStderr();  // the module tells of each
    bool hasFailed = true;
    for (int n = 0; hasFailed && !HasFailure(); ++n)
    {
        {
            FailingAllocation const failing(n);
            try
            {
                folders.Load();
            }
            catch (std::bad_alloc const&)
            {
            }
            hasFailed = failing.HasHappened();
        }
        EXPECT_EQ(folders.Decode("$(TEMP)/x", false), expected) << n;
    }
    testing::internal::GetCapturedStderr();
}

// Its locks may be those of threads that are not there.
TEST_F(FolderTranslators, InAChildMadeByFork_LeavePathsAsTheyAre)
{
    clFOLDER_VARIABLES* const folders = OfTheContainer(admin);
    ASSERT_TRUE(folders);
    std::string const path = SiteFolder() + "/temp/a";
    EXPECT_EQ(folders->Decode("$(TEMP)/a", false), path);
    ChildProcess child(
        [&](ChildProcess::Report const& report)
        {
            report(folders->Decode("$(TEMP)/a", false) == "$(TEMP)/a" ? 1 : 0);
            report(folders->Encode(path) == path ? 1 : 0);
        });
    EXPECT_EQ(child.Next(), 1);
    EXPECT_EQ(child.Next(), 1);
    EXPECT_EQ(child.Wait(), 0);
}
