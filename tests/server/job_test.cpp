// How jobs come in, and what is left of those that do not.
#include "standin/server/jobs/JobIntake.h"

#include "standin/server/transfer/TransferService.h"
#include "tests/server/ServerTest.h"
#include "tests/server/StoredValues.h"
#include "tests/support/Files.h"
#include <gmock/gmock.h>
#include <thread>

using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
namespace fs = std::filesystem;

class Jobs : public ServerTest
{
protected:
    Jobs()
    {
        fs::create_directory(folder / "job");
        std::string const jobs = folder / "job";
        site->Put(SystemTicket, "System/Folders/Job", 0, Bytes(PARAM_STRING, jobs));
        site->AddTicket({7, 2});
        As("operator").SetEndPoint("127.0.0.1:50106");
    }
    ~Jobs() override { Restart(); }  // ends the threads that use the members below

    JobIntake& Intake() { return Server().Jobs(); }

    int Prepare(JobIntake::Announcement const& announcement, std::string const& user = "operator")
    {
        int id = -1;
        EXPECT_EQ(Intake().Prepare(As(user), announcement, id), Transferred);
        return id;
    }
    TransferResult Send(std::string const& path, std::string const& name,
                        std::string const& user = "operator")
    {
        As(user);
        testing::internal::CaptureStderr();
        TransferResult const result = Intake().Send(As(user), path, name);
        said = testing::internal::GetCapturedStderr();
        bool const isSilent = result == Transferred || result == TransferCut;
        EXPECT_EQ(std::count(said.begin(), said.end(), '\n'), isSilent ? 0 : 1) << said;
        return result;
    }
    std::string Write(std::string const& name, std::string const& content) const
    {
        WriteFile(folder / name, content);
        return folder / name;
    }
    fs::path InJob(int id, std::string const& name = {}) const
    {
        return folder / ("job/" + std::to_string(id) + "/" + name);
    }
    std::vector<int> Ids()
    {
        std::vector<int> ids;
        for (int id = Tickets().NextTicket(3, -1); id >= 0; id = Tickets().NextTicket(3, id))
            ids.push_back(id);
        return ids;
    }
    std::string TextOf(int id, char const* key)
    {
        char const* const text = Text({3, id}, key);
        return text ? text : "";
    }

    // Everything that is told of jobs to the administrator, as "4 3/2" or "1 3/2 Key Key".
    void Listen()
    {
        auto& service = Server().Notifications();
        int const id = service.NewId();
        service.Register(As("admin"), id,
                         [this](Notification const& told)
                         {
                             std::string text =
                                 std::to_string(told.kind) + " 3/" + std::to_string(told.ticket.id);
                             for (ChangedParameter const& change : told.parameters)
                                 text += std::string(" ") + change.key->CStr();
                             std::lock_guard const guard(lock);
                             calls.push_back(text);
                             changed.notify_all();
                         });
        service.Enable(As("admin"), id, {3, -3}, KeyFilter(nullptr));
    }
    std::vector<std::string> Calls(std::size_t count)
    {
        std::unique_lock guard(lock);
        changed.wait_for(guard, std::chrono::minutes(2), [&] { return calls.size() >= count; });
        return calls;
    }

    std::string const file = Write("file.pdf", "content");
    std::string said;
    std::mutex lock;
    std::condition_variable changed;
    std::vector<std::string> calls;
};

using PreparedJob = Jobs;
using SentJob = Jobs;
using FailedJob = Jobs;

TEST_F(PreparedJob, HasATicketThatTellsOfIt)
{
    int const id = Prepare({"file.pdf", false, 2, 250});
    EXPECT_EQ(id, 2);
    EXPECT_EQ(Int({3, id}, "Job/State"), 0);
    EXPECT_EQ(Int({3, id}, "Job/Prepared"), 1);
    EXPECT_EQ(Int({3, id}, "Job/Queue"), 2);
    EXPECT_EQ(Int({3, id}, "Job/Copies"), 250);
    EXPECT_EQ(TextOf(id, "Job/Identification/Name"), "file.pdf");
    EXPECT_EQ(TextOf(id, "Job/Identification/User"), "operator");
    EXPECT_EQ(TextOf(id, "Job/Identification/RemoteEndpoint"), "127.0.0.1:50106");
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

TEST_F(PreparedJob, WithoutSuchAQueueOrCopies_HasNeither)
{
    int const id = Prepare({"file.pdf", false, 9, 0});
    EXPECT_EQ(Int({3, id}, "Job/Queue"), std::nullopt);
    EXPECT_EQ(Int({3, id}, "Job/Copies"), std::nullopt);
}

TEST_F(PreparedJob, IsMadeInOneTransaction)
{
    Server();
    int const before = site->Commits();
    Prepare({"file.pdf"});
    EXPECT_EQ(site->Commits(), before + 1);
}

TEST_F(PreparedJob, NamesThatNoFileCanHave_AreRefusedWithoutATicket)
{
    testing::internal::CaptureStderr();
    int id = -1;
    for (std::string const name : {"", ".", "..", "a/b", "a\\b", "a\nb"})
        EXPECT_EQ(Intake().Prepare(As("operator"), {name}, id), PathRefused) << name;
    EXPECT_EQ(Intake().Prepare(As("operator"), {std::string(300, 'n')}, id), PathRefused);
    testing::internal::GetCapturedStderr();
    EXPECT_EQ(id, -1);
    EXPECT_THAT(Ids(), ElementsAre(1));
}

TEST_F(PreparedJob, StoreThatFails_IsToldAndLeavesNoTicket)
{
    As("operator");
    site->FailAll(true);
    int id = -1;
    testing::internal::CaptureStderr();
    EXPECT_EQ(Intake().Prepare(As("operator"), {"file.pdf"}, id), TargetUnwritable);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("told to fail"));
    EXPECT_EQ(id, -1);
    EXPECT_THAT(Ids(), ElementsAre(1));
}

TEST_F(PreparedJob, GoesWithItsSessionsLogout_AndNoOther)
{
    Listen();
    int const mine = Prepare({"a"});
    int const sent = Prepare({"file.pdf"});
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    int const others = Prepare({"c"}, "guest");
    Server().Logout(As("operator"));
    EXPECT_THAT(Ids(), ElementsAre(1, sent, others));
    EXPECT_THAT(Calls(8), testing::Contains("5 3/" + std::to_string(mine)));
    int id = -1;
    EXPECT_EQ(Intake().Prepare(As("operator"), {"a"}, id), TransferCut);
}

TEST_F(SentJob, FillsItsTicketInOneTransaction)
{
    int const id = Prepare({"file.pdf", false, 2, 3});
    int const before = site->Commits();
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_EQ(site->Commits(), before + 1);
    EXPECT_EQ(Int({3, id}, "Job/State"), 1);
    EXPECT_EQ(Int({3, id}, "Job/Progress"), 100);
    EXPECT_EQ(Int({3, id}, "Job/Prepared"), std::nullopt);
    EXPECT_EQ(Int({3, id}, "Job/Copies"), 3);
    EXPECT_EQ(TextOf(id, "Job/File"), "$(JOB)/2/file.pdf");
    EXPECT_EQ(TextOf(id, "Job/Folder"), "$(JOB)/2");
    EXPECT_EQ(TextOf(id, "Job/Identification/Name"), "file.pdf");
    long long size = 0;
    EXPECT_TRUE(Get(As("admin"), {3, id}, "Job/Size", PARAM_INT64, &size, -1));
    EXPECT_EQ(size, 7);
    EXPECT_EQ(ContentOf(InJob(id, "file.pdf")), "content");
    EXPECT_THAT(NamesIn(InJob(id)), ElementsAre(".job-" + TextOf(id, "Job/FolderMark"), "file.pdf"));
}

TEST_F(SentJob, GoesIntoTheNewestOneOfThatNameOfTheSession)
{
    int const first = Prepare({"file.pdf"});
    int const second = Prepare({"file.pdf"});
    Prepare({"other.pdf"});
    Prepare({"file.pdf"}, "guest");
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_EQ(Int({3, second}, "Job/State"), 1);
    EXPECT_EQ(Int({3, first}, "Job/State"), 0);
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_EQ(Int({3, first}, "Job/State"), 1);
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);  // none is left: one of its own
    EXPECT_THAT(Ids(), ElementsAre(1, 2, 3, 4, 5, 6));
    EXPECT_EQ(Int({3, 5}, "Job/State"), 0);  // the guest's
    EXPECT_EQ(Int({3, 6}, "Job/State"), 1);
}

TEST_F(SentJob, NameThatHadNoRoomWhenAnnounced_IsFoundByItsBeginning)
{
    std::string const name(255, 'n');
    int const id = Prepare({name.substr(0, 251), true});
    EXPECT_EQ(Send(file, name), Transferred);
    EXPECT_THAT(Ids(), ElementsAre(1, id));
    EXPECT_EQ(TextOf(id, "Job/Identification/Name"), name);
}

TEST_F(SentJob, Changes_AreTold)
{
    Listen();
    Prepare({"file.pdf"});
    Send(file, "file.pdf");
    auto const told = Calls(3);
    EXPECT_EQ(told[0], "4 3/2");
    EXPECT_EQ(told[1], "1 3/2 Job/Prepared Job/State Job/Identification/Name Job/Identification/User "
                       "Job/Identification/RemoteEndpoint Job/FolderMark");
    EXPECT_EQ(told[2],
              "1 3/2 Job/Identification/Name Job/Identification/User "
              "Job/Identification/RemoteEndpoint Job/File Job/Folder Job/Size Job/State Job/Progress "
              "Job/Prepared");
}

TEST_F(SentJob, Progress_IsWrittenTenTimesASecondAtMost)
{
    Server().Transfers().Set({10, [] { std::this_thread::sleep_for(std::chrono::milliseconds(1)); }});
    Prepare({"file.pdf"});
    int const before = site->Commits();
    auto const begin = std::chrono::steady_clock::now();
    EXPECT_EQ(Send(Write("long", std::string(4000, 'x')), "file.pdf"), Transferred);
    auto const tenths = (std::chrono::steady_clock::now() - begin) / std::chrono::milliseconds(100);
    EXPECT_GE(site->Commits() - before, 2);           // 400 ms at the least, so some progress and the end
    EXPECT_LE(site->Commits() - before, tenths + 1);  // and the end
}

TEST_F(SentJob, Progress_IsThePercentageOfTheBytes)
{
    std::set<int> seen;
    Server().Transfers().Set({50, [&]
                              {
                                  if (auto const percent = Int({3, 2}, "Job/Progress"))
                                      seen.insert(*percent);
                                  std::this_thread::sleep_for(std::chrono::milliseconds(150));
                              }});
    Prepare({"file.pdf"});
    EXPECT_EQ(Send(Write("long", std::string(100, 'x')), "file.pdf"), Transferred);
    EXPECT_THAT(seen, ElementsAre(50, 100));
}

TEST_F(SentJob, EmptyFolderOfItsNumber_IsTaken)
{
    fs::create_directory(InJob(2));  // as a process leaves it that is killed before it can mark it
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_EQ(ContentOf(InJob(2, "file.pdf")), "content");
}

TEST_F(SentJob, WhenItsTicketIsDeleted_ItsFolderGoesToo)
{
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_TRUE(Tickets().Delete(As("guest"), {3, 2}));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

// A power cut may bring back the ticket as it was some changes ago, and then the file has to be there.
TEST_F(SentJob, WhoseTicketsEndDoesNotReachTheDisk_KeepsItsFolder)
{
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_TRUE(Set(As("admin"), {3, 2}, "Job/File", PARAM_NONE, nullptr, -1));
    site->Fail("Sync", true);
    EXPECT_TRUE(Tickets().Delete(As("guest"), {3, 2}));
    site->Fail("Sync", false);
    EXPECT_THAT(NamesIn(folder / "job"), ElementsAre("2"));
}

TEST_F(SentJob, FolderThatIsNoJobs_IsPassedOverAndStays)
{
    Server();
    fs::create_directory(InJob(2));
    WriteFile(InJob(2, "another program's"), "content");
    WriteFile(InJob(3).parent_path(), "no folder at all");
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);  // under the next id that has its folder's name free
    EXPECT_THAT(Ids(), ElementsAre(1, 4));
    EXPECT_EQ(ContentOf(InJob(4, "file.pdf")), "content");
    EXPECT_TRUE(Tickets().Create(As("guest"), {3, 2}));
    EXPECT_TRUE(Tickets().Delete(As("guest"), {3, 2}));
    EXPECT_THAT(NamesIn(InJob(2)), ElementsAre("another program's"));
}

TEST_F(FailedJob, FolderOfItsNumberThatCameMeanwhile_IsToldAndNotTouched)
{
    int const id = Prepare({"file.pdf"});
    fs::create_directory(InJob(id));
    WriteFile(InJob(id, "another program's"), "content");
    EXPECT_EQ(Send(file, "file.pdf"), TargetUnwritable);
    EXPECT_THAT(said, HasSubstr(InJob(id).parent_path().string()));
    EXPECT_THAT(Ids(), ElementsAre(1));
    EXPECT_THAT(NamesIn(InJob(id)), ElementsAre("another program's"));
}

TEST_F(SentJob, WhenItsTicketIsDeleted_FolderOfItsNumberInANewPlaceStays)
{
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    fs::create_directories(folder / "new/2");
    WriteFile(folder / "new/2/another program's", "content");
    std::string const place = folder / "new";
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Job", place.c_str()));
    EXPECT_TRUE(Tickets().Delete(As("guest"), {3, 2}));
    EXPECT_THAT(NamesIn(folder / "new/2"), ElementsAre("another program's"));
}

TEST_F(SentJob, MarkThatAClientHasChanged_OpensNoFolder)
{
    fs::create_directory(InJob(1));
    WriteFile(InJob(1, "another program's"), "content");
    WriteFile(InJob(1, ".job-"), "");
    for (char const* const mark : {"", "/../another program's", "."})
    {
        Set({3, 1}, "Job/FolderMark", mark);
        EXPECT_TRUE(Tickets().Delete(As("admin"), {3, 1}));
        EXPECT_THAT(NamesIn(InJob(1)), ElementsAre(".job-", "another program's")) << mark;
        EXPECT_TRUE(Tickets().Create(As("admin"), {3, 1}));
    }
}

TEST_F(FailedJob, FolderForJobsChangedMeanwhile_IsToldAndLeavesNothing)
{
    fs::create_directory(folder / "new");
    std::string const place = folder / "new";
    Server().Transfers().Set(
        {4, [&] { EXPECT_TRUE(Set(SystemTicket, "System/Folders/Job", place.c_str())); }});
    As("admin");
    EXPECT_EQ(Send(file, "file.pdf"), TargetUnwritable);
    EXPECT_THAT(said, HasSubstr("send the job anew"));
    EXPECT_THAT(Ids(), ElementsAre(1));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
    EXPECT_THAT(NamesIn(folder / "new"), IsEmpty());
}

TEST_F(FailedJob, FolderForJobsChangedJustBeforeTheJobArrives_IsToldAndLeavesNothing)
{
    fs::create_directory(folder / "new");
    std::string const place = folder / "new";
    As("admin");
    Prepare({"file.pdf"});
    site->Interject([&] { EXPECT_TRUE(Set(SystemTicket, "System/Folders/Job", place.c_str())); });
    EXPECT_EQ(Send(file, "file.pdf"), TargetUnwritable);
    EXPECT_THAT(said, HasSubstr("send the job anew"));
    EXPECT_THAT(Ids(), ElementsAre(1));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

TEST_F(SentJob, WithoutAFolderForJobs_IsRefused)
{
    site->Put(SystemTicket, "System/Folders/Job", -1, {});
    EXPECT_EQ(Send(file, "file.pdf"), TargetUnwritable);
    EXPECT_THAT(said, HasSubstr("System/Folders/Job"));
    EXPECT_THAT(Ids(), ElementsAre(1));
}

struct FAILURE
{
    char const* name;
    char const* file;  // below the test's folder
    std::string jobName;
    TransferResult result;
};
class FailingJob : public Jobs, public testing::WithParamInterface<FAILURE>
{
protected:
    FailingJob()
    {
        Write("empty", "");
        fs::create_directory(folder / "folder");
    }
};

TEST_P(FailingJob, LeavesNeitherFileNorTicket)
{
    Listen();
    EXPECT_EQ(Send(folder / GetParam().file, GetParam().jobName), GetParam().result);
    EXPECT_THAT(Ids(), ElementsAre(1));
    EXPECT_THAT(calls, IsEmpty());  // no ticket for a job that cannot come

    std::string const announced = GetParam().jobName.substr(0, 251);
    if (IsFileName(announced))
    {
        int const id = Prepare({announced, announced.size() == 251});
        EXPECT_EQ(Send(folder / GetParam().file, GetParam().jobName), GetParam().result);
        EXPECT_EQ(Calls(3).back(), "5 3/" + std::to_string(id));
    }
    EXPECT_THAT(Ids(), ElementsAre(1));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Facts, FailingJob,
                         testing::Values(FAILURE{"Missing", "missing", "a", SourceUnreadable},
                                         FAILURE{"Folder", "folder", "a", NotAFile},
                                         FAILURE{"Empty", "empty", "a", EmptyJob},
                                         FAILURE{"Name300", "file.pdf", std::string(300, 'n'), PathRefused},
                                         FAILURE{"NameWithANewline", "file.pdf", "a\nb", PathRefused},
                                         FAILURE{"NameWithASlash", "file.pdf", "a/b", PathRefused},
                                         FAILURE{"NoName", "file.pdf", "", PathRefused}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST_F(FailedJob, CutByLogout_LeavesNothing)
{
    Prepare({"file.pdf"});
    std::string const big = Write("big", std::string(1000000, 'x'));
    std::atomic<bool> begun{false};
    std::atomic<bool> goOn{false};
    Server().Transfers().Set({1, [&]
                              {
                                  begun = true;
                                  while (!goOn)
                                      std::this_thread::yield();
                              }});
    Session& session = As("operator");
    TransferResult result = Transferred;
    std::thread send([&] { result = Send(big, "file.pdf"); });
    while (!begun)
        std::this_thread::yield();
    EXPECT_EQ(NamesIn(InJob(2)).size(), 2u);  // its mark, and it is on its way
    std::thread logout([&] { Server().Logout(session); });
    while (!session.Ended())
        std::this_thread::yield();
    goOn = true;
    logout.join();
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
    EXPECT_THAT(Ids(), ElementsAre(1));
    send.join();
    EXPECT_EQ(result, TransferCut);
}

TEST_F(FailedJob, TicketDeletedMeanwhile_IsToldAndTheNextJobOfThatIdIsSafe)
{
    bool isFirst = true;
    Server().Transfers().Set({4, [&]
                              {
                                  if (!std::exchange(isFirst, false))
                                      return;
                                  EXPECT_TRUE(Tickets().Delete(As("admin"), {3, 2}));
                                  int id = -1;
                                  EXPECT_EQ(Intake().Prepare(As("guest"), {"guest.pdf"}, id), Transferred);
                                  EXPECT_EQ(id, 2);
                                  EXPECT_EQ(Intake().Send(As("guest"), file, "guest.pdf"), Transferred);
                              }});
    As("guest");
    As("admin");
    EXPECT_EQ(Send(file, "file.pdf"), JobGone);
    EXPECT_THAT(Ids(), ElementsAre(1, 2));
    EXPECT_THAT(NamesIn(InJob(2)), ElementsAre(".job-" + TextOf(2, "Job/FolderMark"), "guest.pdf"));
    EXPECT_EQ(Int({3, 2}, "Job/State"), 1);
}

// Such as a full disk, which the job's own file may be what fills.
TEST_F(FailedJob, StoreThatFailsAtTheEnd_LeavesNoFile_AndTheTicketGoesWhenItWorksAgain)
{
    Prepare({"file.pdf"});
    Server().Transfers().Set({1, [this] { site->FailAll(true); }});
    As("operator");
    As("admin");
    testing::internal::CaptureStderr();
    EXPECT_EQ(Intake().Send(As("operator"), file, "file.pdf"), TargetUnwritable);
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
    site->FailAll(false);
    EXPECT_TRUE(TidiesUntil([this] { return Ids() == std::vector{1}; }));
    testing::internal::GetCapturedStderr();
}

TEST_F(FailedJob, StoreThatFailsAtTheEnd_LeavesTheTicketUnsentAndForOthersToClear)
{
    Prepare({"file.pdf"});
    Server().Transfers().Set({1, [this] { site->FailAll(true); }});
    As("operator");
    As("admin");
    testing::internal::CaptureStderr();
    EXPECT_EQ(Intake().Send(As("operator"), file, "file.pdf"), TargetUnwritable);
    Restart();  // it dies before it can
    site->FailAll(false);
    EXPECT_TRUE(TidiesUntil([this] { return Ids() == std::vector{1}; }));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
    testing::internal::GetCapturedStderr();
}

TEST_F(PreparedJob, OfASessionThatEndsWhileTheStoreFails_GoesWhenItWorksAgain)
{
    Prepare({"file.pdf"});
    site->FailAll(true);
    testing::internal::CaptureStderr();
    Server().Logout(As("operator"));
    site->FailAll(false);
    EXPECT_TRUE(TidiesUntil([this] { return Ids() == std::vector{1}; }));
    testing::internal::GetCapturedStderr();
}

TEST_F(SentJob, WhenTheIdsHaveComeToTheirEnd_PassesOverFoldersThatAreNoJobsToo)
{
    site->AddTicket({3, LargestId});
    for (int const id : {0, 2})
    {
        fs::create_directory(InJob(id));
        WriteFile(InJob(id, "another program's"), "content");
    }
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_THAT(Ids(), ElementsAre(1, 3, LargestId));
}

TEST_F(SentJob, WhenAnotherProgramTakesItsId_PassesOverFoldersThatAreNoJobsToo)
{
    fs::create_directory(InJob(3));
    WriteFile(InJob(3, "another program's"), "content");
    As("guest");
    site->Interject([this] { EXPECT_TRUE(Tickets().Create(As("guest"), {3, 2})); });
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_THAT(Ids(), ElementsAre(1, 2, 4));
}
