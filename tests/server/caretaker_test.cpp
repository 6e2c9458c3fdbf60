// What programs that died have left on a site, and what of it those that live take away.
#include "standin/server/site/Caretaker.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/jobs/JobFolder.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/Program.h"
#include "tests/server/StoredValues.h"
#include "tests/support/Files.h"
#include <algorithm>
#include <atomic>
#include <future>
#include <gmock/gmock.h>
#include <thread>

using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
namespace fs = std::filesystem;

namespace
{
class LeftByTheDead : public testing::Test
{
protected:
    LeftByTheDead()
    {
        for (char const* const name : {"tickets", "temp", "job"})
            fs::create_directory(folder / name);
        site->Put(SystemTicket, "System/Folders/Job", 0, Bytes(PARAM_STRING, (folder / "job").string()));
        site->AddTicket({JobTicketType, 1});
        living = std::make_unique<Program>(site, folder.Path());
        dying = std::make_unique<Program>(site, folder.Path());
    }

    void Make(std::string const& name) const
    {
        fs::create_directories((folder / name).parent_path());
        WriteFile(folder / name, "content");
    }
    bool Has(std::string const& name) const { return fs::exists(folder / name); }

    int Prepare()
    {
        int id = -1;
        EXPECT_EQ(dying->server.Jobs().Prepare(dying->session, {"job.pdf"}, id), Transferred);
        return id;
    }
    // The name of the file by which the folder of a job is known.
    std::string MarkOf(int id) { return ".job-" + living->Text({JobTicketType, id}, JobMarkKey); }

    // Ends the one and has the other clear up after it, once, here and now: its threads rest.
    void Kill()
    {
        living->server.Stop(std::chrono::minutes(1));
        testing::internal::CaptureStderr();
        dying->store.Die();
        dying.reset();
        testing::internal::GetCapturedStderr();  // its threads have noticed
        living->server.Tidy();
        EXPECT_EQ(living->store.Programs().size(), 1u);
    }

    std::vector<int> Jobs()
    {
        std::vector<int> ids;
        for (int id = living->Tickets().NextTicket(JobTicketType, -1); id >= 0;
             id = living->Tickets().NextTicket(JobTicketType, id))
            ids.push_back(id);
        return ids;
    }

    std::string const OtherMark = ".job-0123456789abcdef";
    MemoryFolder folder;
    std::shared_ptr<MemorySite> site = std::make_shared<MemorySite>();
    std::unique_ptr<Program> living;
    std::unique_ptr<Program> dying;
};

// The living one does not hear what is committed, as one whose bell is out of order.
class UnheardByTheLiving : public LeftByTheDead
{
protected:
    UnheardByTheLiving()
    {
        living->server.Stop(std::chrono::minutes(1));
        living->Tickets().Folders();  // known before
        testing::internal::CaptureStderr();
        site->Fail("ChangesSince", true);
    }
    ~UnheardByTheLiving() override { testing::internal::GetCapturedStderr(); }

    void End()
    {
        dying->store.Die();
        dying.reset();
        living->server.Tidy();
    }
};
}  // namespace

TEST_F(LeftByTheDead, PreparedJob_GoesWithItsFolder)
{
    int const id = Prepare();
    std::string const jobs = "job/" + std::to_string(id) + "/";
    Make(jobs + MarkOf(id));
    Make(jobs + "whole.pdf");
    Kill();
    EXPECT_THAT(Jobs(), ElementsAre(1));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

TEST_F(LeftByTheDead, PreparedJob_FolderThatIsNotItsOwnStays)
{
    fs::create_directories(folder / "elsewhere/9");
    WriteFile(folder / "elsewhere/9/another program's", "content");
    int const id = Prepare();
    EXPECT_TRUE(living->Set(SystemTicket, "System/Folders/Job", (folder / "elsewhere").string()));
    fs::rename(folder / "elsewhere/9", folder / "elsewhere" / std::to_string(id));
    Kill();
    EXPECT_THAT(Jobs(), ElementsAre(1));
    EXPECT_TRUE(Has("elsewhere/" + std::to_string(id) + "/another program's"));
}

TEST_F(LeftByTheDead, JobThatHasItsFile_StaysWhateverAClientHasWrittenIntoIt)
{
    int const id = Prepare();
    Make("job.pdf");
    EXPECT_EQ(dying->server.Jobs().Send(dying->session, folder / "job.pdf", "job.pdf"), Transferred);
    EXPECT_TRUE(dying->Set({JobTicketType, id}, JobPreparedKey, 1));
    EXPECT_TRUE(dying->Set({JobTicketType, id}, "Job/State", 0));
    Kill();
    EXPECT_THAT(Jobs(), ElementsAre(1, id));
    EXPECT_TRUE(Has("job/" + std::to_string(id) + "/job.pdf"));
}

TEST_F(LeftByTheDead, PreparedJobOfALivingProgram_Stays)
{
    int id = -1;
    EXPECT_EQ(living->server.Jobs().Prepare(living->session, {"job.pdf"}, id), Transferred);
    Kill();
    EXPECT_THAT(Jobs(), ElementsAre(1, id));
}

// By its own program, which was away only, and has come back in the middle of the burial.
TEST_F(LeftByTheDead, PreparedJobThatIsSentDuringTheBurial_StaysWithItsFolder)
{
    Prepare();
    int const sent = Prepare();
    Make("job/" + std::to_string(sent) + "/whole.pdf");
    living->server.Stop(std::chrono::minutes(1));
    testing::internal::CaptureStderr();
    dying->store.Die();
    dying.reset();
    MemoryStore sender(site);
    site->Interject(
        [&]
        {
            TicketChange sending;
            sending.address = {JobTicketType, sent};
            auto const loaded = sender.Load(sending.address, [](auto, int, auto const&) {});
            sending.incarnation = loaded->state.incarnation;
            sending.revision = loaded->state.revision;
            sending.owner = TicketChange::Owner::Nobody;
            EXPECT_EQ(sender.Commit(sending, 1).kind, CommitOutcome::Committed);
        });
    living->server.Tidy();
    EXPECT_EQ(living->store.Programs().size(), 3u);
    living->server.Tidy();
    EXPECT_EQ(living->store.Programs().size(), 2u);
    testing::internal::GetCapturedStderr();
    EXPECT_THAT(Jobs(), ElementsAre(1, sent));
    EXPECT_TRUE(Has("job/" + std::to_string(sent) + "/whole.pdf"));
}

TEST_F(LeftByTheDead, JobFolderWithoutATicket_Goes_AndOthersStay)
{
    for (std::string const name :
         {"job/1/", "job/77/", "job/077/", "job/78x/", "job/notes/", "job/16777216/", "temp/77/"})
    {
        Make(name + OtherMark);
        Make(name + "a");
    }
    Make("job/81/no job's");
    Make("job/79");  // a file
    fs::create_directory(folder / "job/82");
    fs::create_directory_symlink(folder / "temp", folder / "job/80");
    Make("job/.removed-77-0123456789abcdef/" + OtherMark);  // a removal that was broken off
    Make("job/.removed-77-0123456789abcdef/a");
    Make("job/.removed-x/a");
    Kill();
    EXPECT_FALSE(Has("job/77"));
    EXPECT_FALSE(Has("job/82"));  // empty: killed before it was marked
    EXPECT_FALSE(Has("job/.removed-77-0123456789abcdef"));
    for (char const* const name : {"job/1/a", "job/077/a", "job/78x/a", "job/notes/a", "job/16777216/a",
                                   "temp/77/a", "job/79", "job/80", "job/81/no job's", "job/.removed-x/a"})
        EXPECT_TRUE(Has(name)) << name;
}

TEST_F(LeftByTheDead, JobFolderElsewhere_IsNotTouched)
{
    fs::create_directories(folder / "elsewhere/77");
    EXPECT_TRUE(living->Set(SystemTicket, "System/Folders/Job", (folder / "elsewhere").string()));
    Kill();
    EXPECT_TRUE(Has("elsewhere/77"));
}

TEST_F(LeftByTheDead, BeginningsOfFilesThatItHadNotedGo_WhereverTheyAre)
{
    MemoryFolder client;
    WriteFile(client / ".transfer.0000000000000001.tmp", "half");
    Make("temp/.transfer.0000000000000002.tmp");
    Make("temp/.transfer.0000000000000003.tmp");
    Make("temp/whole.pdf");
    dying->store.AddPartFile((client / ".transfer.0000000000000001.tmp").string());
    dying->store.AddPartFile((folder / "temp/.transfer.0000000000000002.tmp").string());
    dying->store.AddPartFile((folder / "temp/whole.pdf").string());  // no name of a beginning
    living->store.AddPartFile((folder / "temp/.transfer.0000000000000003.tmp").string());
    Kill();
    EXPECT_THAT(NamesIn(client.Path()), IsEmpty());
    EXPECT_THAT(NamesIn(folder / "temp"), ElementsAre(".transfer.0000000000000003.tmp", "whole.pdf"));
}

TEST_F(LeftByTheDead, ATransferThatIsCarriedOut_IsNotedWhileItLastsAndForgotten)
{
    EXPECT_TRUE(living->Set(SystemTicket, "System/Folders/Temp", (folder / "temp").string()));
    Make("a");
    std::vector<std::string> during;
    dying->server.Transfers().Set({1, [&] { during = NamesIn(folder / "temp"); }});
    EXPECT_EQ(dying->server.Transfers().Carry(
                  dying->session, {TransferService::Request::ToServer, folder / "a", "$(TEMP)/a"}),
              Transferred);
    ASSERT_EQ(during.size(), 1u);
    Make("temp/" + during[0]);  // nobody's any more
    Kill();
    EXPECT_THAT(NamesIn(folder / "temp"), ElementsAre(during[0], "a"));
}

TEST_F(LeftByTheDead, TransferInTheMiddle_GoesWithItsProgram)
{
    EXPECT_TRUE(living->Set(SystemTicket, "System/Folders/Temp", (folder / "temp").string()));
    Make("a");
    living->server.Stop(std::chrono::minutes(1));  // it must not clear up before there is something
    std::string part;
    dying->server.Transfers().Set({4, [&]
                                   {
                                       part = NamesIn(folder / "temp").at(0);
                                       dying->store.Die();  // from here on it can clear up nothing itself
                                   }});
    testing::internal::CaptureStderr();
    dying->server.Transfers().Carry(dying->session,
                                    {TransferService::Request::ToServer, folder / "a", "$(TEMP)/a"});
    testing::internal::GetCapturedStderr();
    Make("temp/" + part);
    Kill();
    EXPECT_FALSE(Has("temp/" + part));
}

// The store is lost when the living one deletes a job, and does not come back before its end.
TEST_F(LeftByTheDead, PreparedJob_WhoseDeletionIsInDoubt_HoldsUpNoEnd)
{
    Prepare();
    testing::internal::CaptureStderr();
    site->Fail("FindCommit", true);
    site->AnswerUnknownOnce(false);
    dying->store.Die();
    while (!site->HasFailed())
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    auto end = std::async(std::launch::async, [&] { living->server.Stop(std::chrono::minutes(1)); });
    EXPECT_EQ(end.wait_for(std::chrono::seconds(10)), std::future_status::ready);
    site->Fail("FindCommit", false);
    end.get();
    testing::internal::GetCapturedStderr();
}

TEST_F(UnheardByTheLiving, JobOfAnother_KeepsItsFolder)
{
    MemoryStore sender(site);
    for (int const id : {77, 78})
    {
        TicketChange creation;
        creation.kind = TicketChange::Create;
        creation.address = {JobTicketType, id};
        creation.parameters.push_back({JobMarkKey, -1, TicketValue::String("0123456789abcdef"), false});
        ASSERT_EQ(sender.Commit(creation, static_cast<std::uint64_t>(id)).kind, CommitOutcome::Committed);
    }
    Make("job/77/" + OtherMark);
    Make("job/.removed-78-0123456789abcdef/" + OtherMark);
    Make("job/79/" + OtherMark);
    sender.Leave();
    End();
    EXPECT_EQ(living->store.Programs().size(), 1u);
    EXPECT_THAT(NamesIn(folder / "job"), ElementsAre("77", "78"));
}

TEST_F(UnheardByTheLiving, PreparedJobOfTheDead_GoesWhenItIsHeardOf)
{
    Prepare();
    End();
    EXPECT_EQ(living->store.Programs().size(), 2u);
    site->Fail("ChangesSince", false);
    living->server.Tidy();
    EXPECT_EQ(living->store.Programs().size(), 1u);
    EXPECT_THAT(Jobs(), ElementsAre(1));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

// The disk may be full by what is to be cleared up.
TEST_F(LeftByTheDead, GoesInTheSameRoundInWhichMaintenanceFails)
{
    int const id = Prepare();
    Make("job/" + std::to_string(id) + "/" + MarkOf(id));
    Make("temp/.transfer.0000000000000001.tmp");
    dying->store.AddPartFile((folder / "temp/.transfer.0000000000000001.tmp").string());
    living->server.Stop(std::chrono::minutes(1));
    testing::internal::CaptureStderr();
    dying->store.Die();
    dying.reset();
    site->FailOperation(1);
    living->server.Tidy();
    EXPECT_TRUE(site->HasFailed());
    testing::internal::GetCapturedStderr();
    EXPECT_THAT(Jobs(), ElementsAre(1));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
    EXPECT_THAT(NamesIn(folder / "temp"), IsEmpty());
}

// The end of the process does not wait for long.
TEST_F(LeftByTheDead, TransferThatGoesOnWhileItsProgramLeavesInOrder_GoesWithIt)
{
    EXPECT_TRUE(living->Set(SystemTicket, "System/Folders/Temp", (folder / "temp").string()));
    Make("a");
    std::atomic<bool> isHeld{false};
    std::atomic<bool> goOn{false};
    dying->server.Transfers().Set({4, [&]
                                   {
                                       isHeld = true;
                                       while (!goOn)
                                           std::this_thread::yield();
                                   }});
    std::thread transfer(
        [&]
        {
            dying->server.Transfers().Carry(dying->session,
                                            {TransferService::Request::ToServer, folder / "a", "$(TEMP)/a"});
        });
    while (!isHeld)
        std::this_thread::yield();
    testing::internal::CaptureStderr();
    living->server.Stop(std::chrono::minutes(1));
    dying->server.Stop(std::chrono::milliseconds(1));
    dying->store.Leave();
    EXPECT_EQ(NamesIn(folder / "temp").size(), 1u);
    living->server.Tidy();
    EXPECT_THAT(NamesIn(folder / "temp"), IsEmpty());
    EXPECT_EQ(living->store.Programs().size(), 1u);
    goOn = true;
    transfer.join();
    testing::internal::GetCapturedStderr();
}

TEST_F(LeftByTheDead, CopyOfTheSystemTicket_IsWrittenAnew)
{
    EXPECT_TRUE(dying->Set(SystemTicket, "TheKey", 1));
    fs::remove(folder / "tickets/SYS_0000.xml");
    Kill();
    EXPECT_THAT(ContentOf(folder / "tickets/SYS_0000.xml"), testing::HasSubstr("TheKey"));
}

TEST_F(LeftByTheDead, EverySingleFailureOnTheWay_IsMadeGoodByTheNextRound)
{
    living->server.Stop(std::chrono::minutes(1));
    testing::internal::CaptureStderr();
    bool hasFailed = true;
    int which = 0;
    while (hasFailed && which < 100)
    {
        int const id = Prepare();
        std::string const part = ".transfer." + RandomName() + ".tmp";
        Make("temp/" + part);
        Make("job/" + std::to_string(id) + "/" + MarkOf(id));
        dying->store.AddPartFile((folder / "temp" / part).string());
        dying->store.Die();
        dying->server.Stop(std::chrono::minutes(1));
        site->FailOperation(++which);
        living->server.Tidy();
        hasFailed = site->HasFailed();
        site->FailOperation(0);
        living->server.Tidy();
        EXPECT_THAT(Jobs(), ElementsAre(1)) << which;
        EXPECT_THAT(NamesIn(folder / "job"), IsEmpty()) << which;
        EXPECT_THAT(NamesIn(folder / "temp"), IsEmpty()) << which;
        EXPECT_EQ(living->store.Programs().size(), 1u) << which;
        dying = std::make_unique<Program>(site, folder.Path());
    }
    testing::internal::GetCapturedStderr();
    EXPECT_GT(which, 4);
    EXPECT_FALSE(hasFailed);
}

TEST_F(LeftByTheDead, WhatCannotBeDeleted_IsToldOnce)
{
    int const id = Prepare();
    living->server.Stop(std::chrono::minutes(1));
    testing::internal::CaptureStderr();
    dying->store.Die();
    dying.reset();
    testing::internal::GetCapturedStderr();
    testing::internal::CaptureStderr();
    site->Fail("Commit", true);
    for (int round = 0; round < 5; ++round)
        living->server.Tidy();
    EXPECT_TRUE(living->Exists({JobTicketType, id}));
    std::string const told = testing::internal::GetCapturedStderr();
    EXPECT_EQ(std::count(told.begin(), told.end(), '\n'), 1) << told;
    EXPECT_THAT(told, HasSubstr("Commit was told to fail"));
    site->Fail("Commit", false);
    living->server.Tidy();
    EXPECT_FALSE(living->Exists({JobTicketType, id}));
}

TEST_F(LeftByTheDead, IsClearedUpWithoutAnybodysAsking)
{
    int const id = Prepare();
    testing::internal::CaptureStderr();
    dying->store.Die();
    auto const end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
    while (living->Exists({JobTicketType, id}) && std::chrono::steady_clock::now() < end)
        std::this_thread::yield();
    dying.reset();
    testing::internal::GetCapturedStderr();
    EXPECT_FALSE(living->Exists({JobTicketType, id}));
}
