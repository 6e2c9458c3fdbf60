#include "tools/comgui_site/TicketCommits.h"

#include "tests/tools/SiteTest.h"

using namespace comgui_site;
using namespace standin;
using testing::HasSubstr;
using Done = TicketCommits::Done;
using Mode = TicketCommits::Mode;

namespace
{
class SiteCommits : public SiteTest
{
protected:
    SiteCommits()
    {
        Put({3, 1}, "Copies", Integer(PARAM_INT, 2));
        Put({3, 1}, "Inks", Bytes(PARAM_STRING, "Cyan"), 0);
        Put({3, 1}, "Inks", Bytes(PARAM_STRING, "Black"), 1);
        wanted.Put("Copies", 0, Integer(PARAM_INT, 3));
        begin = store.Committed();
    }

    // The parameters of the changes from now on, as they are in the journal.
    std::string Changes()
    {
        std::string text;
        store.ChangesSince(begin,
                           [&](CommittedChange&& change)
                           {
                               for (ParameterChange const& one : change.change.parameters)
                                   text += one.key + "[" + std::to_string(one.pos) +
                                           "]=" + ShownValue(one.value.ToStored()) + " ";
                           });
        return text;
    }

    TicketXml wanted;
    TicketCommits commits{store};
    Sequence begin = 0;
};
}  // namespace

TEST_F(SiteCommits, Bring_OfAMissingTicket_CreatesIt)
{
    Done const done = commits.Bring({3, 5}, wanted, Mode::Merge);
    EXPECT_EQ(done.kind, Done::Created);
    EXPECT_EQ(done.values, 1u);
    EXPECT_EQ(Ticket({3, 5}), "Copies[0]=3");
}

TEST_F(SiteCommits, Bring_OfAnEmptyTicket_CreatesIt)
{
    EXPECT_EQ(commits.Bring({3, 5}, {}, Mode::Merge).kind, Done::Created);
    EXPECT_EQ(Ticket({3, 5}), "");
}

TEST_F(SiteCommits, Bring_Merge_LeavesOtherKeys)
{
    EXPECT_EQ(commits.Bring({3, 1}, wanted, Mode::Merge).kind, Done::Changed);
    EXPECT_EQ(Ticket({3, 1}), "Copies[0]=3 Inks[0]=\"Cyan\" Inks[1]=\"Black\"");
    EXPECT_EQ(Changes(), "Copies[0]=3 ");
}

TEST_F(SiteCommits, Bring_Replace_DeletesOtherKeys)
{
    EXPECT_EQ(commits.Bring({3, 1}, wanted, Mode::Replace).values, 2u);
    EXPECT_EQ(Ticket({3, 1}), "Copies[0]=3");
    EXPECT_EQ(Changes(), "Inks[-1]=none Copies[0]=3 ");
}

TEST_F(SiteCommits, Bring_OfWhatIsThere_CommitsNothing)
{
    wanted.Put("Copies", 0, Integer(PARAM_INT, 2));
    EXPECT_EQ(commits.Bring({3, 1}, wanted, Mode::Merge).kind, Done::Unchanged);
    EXPECT_EQ(store.Committed(), begin);
}

TEST_F(SiteCommits, Bring_OfAnotherType_IsAChange)
{
    wanted.Put("Copies", 0, Integer(PARAM_INT64, 2));
    EXPECT_EQ(commits.Bring({3, 1}, wanted, Mode::Merge).kind, Done::Changed);
}

TEST_F(SiteCommits, Bring_OfAListInPlaceOfAValue_HasExactlyItsPositions)
{
    wanted = {};
    wanted.Put("Inks", 1, Bytes(PARAM_STRING, "Red"));
    wanted.Put("Inks", 4, Bytes(PARAM_STRING, "Green"));
    commits.Bring({3, 1}, wanted, Mode::Merge);
    EXPECT_EQ(Ticket({3, 1}), "Copies[0]=2 Inks[1]=\"Red\" Inks[4]=\"Green\"");
    EXPECT_EQ(Changes(), "Inks[0]=none Inks[1]=\"Red\" Inks[4]=\"Green\" ");
}

TEST_F(SiteCommits, Bring_OfAValueInPlaceOfAList_BeginsTheKeyAnew)
{
    wanted = {};
    wanted.Put("Inks", 0, Bytes(PARAM_STRING, "Cyan"));
    commits.Bring({3, 1}, wanted, Mode::Merge);
    EXPECT_EQ(Ticket({3, 1}), "Copies[0]=2 Inks[0]=\"Cyan\"");
    EXPECT_EQ(Changes(), "Inks[-1]=\"Cyan\" ");
}

TEST_F(SiteCommits, Bring_WhenAnotherProgramIsFaster_PlansAnew)
{
    MemoryStore other(site, "other");
    site->Interject(
        [&]
        {
            TicketXml theirs;
            theirs.Put("Pages", 0, Integer(PARAM_INT, 7));
            TicketCommits(other).Bring({3, 1}, theirs, Mode::Replace);
        });
    commits.Bring({3, 1}, wanted, Mode::Replace);
    EXPECT_EQ(Ticket({3, 1}), "Copies[0]=3");
    EXPECT_EQ(store.Committed(), begin + 2);
}

TEST_F(SiteCommits, Bring_WhenTheOutcomeIsNotKnown_HappensOnce)
{
    for (bool const wasCommitted : {true, false})
    {
        site->AnswerUnknownOnce(wasCommitted);
        Sequence const before = store.Committed();
        wanted.Put("Copies", 0, Integer(PARAM_INT, wasCommitted ? 10 : 20));
        EXPECT_EQ(commits.Bring({3, 1}, wanted, Mode::Merge).kind, Done::Changed);
        EXPECT_TRUE(site->HasFailed());
        EXPECT_EQ(store.Committed(), before + 1);
    }
    EXPECT_THAT(Ticket({3, 1}), HasSubstr("Copies[0]=20"));
}

TEST_F(SiteCommits, Bring_WhenTheStoreFails_ChangesNothing)
{
    std::string const before = Ticket({3, 1});
    for (int operation = 1; operation <= 2; ++operation)
    {
        site->FailOperation(operation);
        EXPECT_THROW(commits.Bring({3, 1}, wanted, Mode::Merge), StoreError);
        EXPECT_TRUE(site->HasFailed());
        EXPECT_EQ(Ticket({3, 1}), before);
    }
}

TEST_F(SiteCommits, Bring_OfTheSystemTicket_KeepsItsInstallFolder)
{
    Put({0, 0}, "System/InstallFolder", Bytes(PARAM_STRING, "/here"));
    wanted = {};
    wanted.Put("System/InstallFolder", 0, Bytes(PARAM_STRING, "/there"));
    wanted.Put("System/Name", 0, Bytes(PARAM_STRING, "Press"));
    commits.Bring({0, 0}, wanted, Mode::Replace);
    EXPECT_EQ(Ticket({0, 0}), "System/InstallFolder[0]=\"/here\" System/Name[0]=\"Press\"");
}

TEST_F(SiteCommits, Bring_OfFoldersThatClientsCannotRead_IsRefused)
{
    wanted = {};
    wanted.Put("System/UseFolderVariables", 0, Integer(PARAM_INT, 3));
    wanted.Put("System/Folders/Temp", 0, Bytes(PARAM_STRING, "$(NOWHERE)/temp"));
    EXPECT_THAT(TroubleOf(
                    [&] {
                        commits.Bring({0, 0}, wanted, Mode::Merge);
                    }),
                HasSubstr("System/Folders/Temp begins with a variable that is not resolved"));
    EXPECT_EQ(Ticket({0, 0}), "");
}

TEST_F(SiteCommits, Bring_OfFoldersThatLeanOnWhatGoes_IsRefused)
{
    Put({0, 0}, "System/UseFolderVariables", Integer(PARAM_INT, 3));
    Put({0, 0}, "System/Folders/Temp", Bytes(PARAM_STRING, "/temp"));
    wanted = {};
    wanted.Put("System/UseFolderVariables", 0, Integer(PARAM_INT, 3));
    wanted.Put("System/Folders/Thumbnail", 0, Bytes(PARAM_STRING, "$(TEMP)/small"));
    EXPECT_EQ(TroubleOf([&] { commits.Bring({0, 0}, wanted, Mode::Merge); }), "");
    EXPECT_THAT(TroubleOf([&] { commits.Bring({0, 0}, wanted, Mode::Replace); }), HasSubstr("Thumbnail"));
}

TEST_F(SiteCommits, CreateNext_TakesTheIdAboveTheLargest)
{
    EXPECT_EQ(commits.CreateNext(3, wanted), (TicketAddress{3, 2}));
    EXPECT_EQ(Ticket({3, 2}), "Copies[0]=3");
}

TEST_F(SiteCommits, Delete_OfAMissingTicket_IsFalse)
{
    EXPECT_TRUE(commits.Delete({3, 1}));
    EXPECT_EQ(Ticket({3, 1}), "none");
    EXPECT_FALSE(commits.Delete({3, 1}));
}
