// How jobs come in, and what is left of those that do not.
#include "standin/server/jobs/JobIntake.h"

#include "standin/server/site/Site.h"
#include "standin/server/transfer/TransferService.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/ServerTest.h"
#include "tests/server/StoredValues.h"
#include "tests/support/ChildProcess.h"
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
        storage.Put(SystemTicket, "System/Folders/Job", 0, Bytes(PARAM_STRING, jobs));
        storage.tickets[{7, 2}];
        As("operator").SetEndPoint("127.0.0.1:50106");
    }
    ~Jobs() override { server.reset(); }

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
        for (int id = Server().NextTicket(3, -1); id >= 0; id = Server().NextTicket(3, id))
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
                             for (SETMULTIPAR const* record = told.records; record && record->key; ++record)
                                 text += std::string(" ") + record->key;
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

    MemoryFolder folder;
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
    int const before = storage.transactions;
    Prepare({"file.pdf"});
    EXPECT_EQ(storage.transactions, before + 1);
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

TEST_F(PreparedJob, StorageThatFails_IsToldAndLeavesNoTicket)
{
    As("operator");
    storage.fail = true;
    int id = -1;
    testing::internal::CaptureStderr();
    EXPECT_EQ(Intake().Prepare(As("operator"), {"file.pdf"}, id), TargetUnwritable);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("site.db"));
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
    int const before = storage.transactions;
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    EXPECT_EQ(storage.transactions, before + 1);
    EXPECT_EQ(Int({3, id}, "Job/State"), 1);
    EXPECT_EQ(Int({3, id}, "Job/Progress"), 100);
    EXPECT_EQ(Int({3, id}, "Job/Prepared"), std::nullopt);
    EXPECT_EQ(Int({3, id}, "Job/Copies"), 3);
    EXPECT_EQ(TextOf(id, "Job/File"), "$(JOB)/2/file.pdf");
    EXPECT_EQ(TextOf(id, "Job/Folder"), "$(JOB)/2");
    EXPECT_EQ(TextOf(id, "Job/Identification/Name"), "file.pdf");
    long long size = 0;
    EXPECT_TRUE(Server().Get(As("admin"), {3, id}, "Job/Size", PARAM_INT64, &size, -1));
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
    int const before = storage.transactions;
    auto const begin = std::chrono::steady_clock::now();
    EXPECT_EQ(Send(Write("long", std::string(4000, 'x')), "file.pdf"), Transferred);
    auto const tenths = (std::chrono::steady_clock::now() - begin) / std::chrono::milliseconds(100);
    EXPECT_GE(storage.transactions - before, 2);  // 400 ms at the least, so some progress and the end
    EXPECT_LE(storage.transactions - before, tenths + 1);  // and the end
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
    EXPECT_TRUE(Server().Delete(As("guest"), {3, 2}));
    EXPECT_THAT(NamesIn(folder / "job"), IsEmpty());
}

TEST_F(SentJob, WhenItsTicketIsDeleted_FolderThatIsNoJobsStays)
{
    Server();
    fs::create_directory(InJob(2));
    WriteFile(InJob(2, "another program's"), "content");
    EXPECT_EQ(Send(file, "file.pdf"), TargetUnwritable);  // nor is anything added to it
    EXPECT_THAT(said, HasSubstr(InJob(2).parent_path().string()));
    EXPECT_THAT(Ids(), ElementsAre(1));
    EXPECT_TRUE(Server().Create(As("guest"), {3, 2}));
    EXPECT_TRUE(Server().Delete(As("guest"), {3, 2}));
    EXPECT_THAT(NamesIn(InJob(2)), ElementsAre("another program's"));
}

TEST_F(SentJob, WhenItsTicketIsDeleted_FolderOfItsNumberInANewPlaceStays)
{
    EXPECT_EQ(Send(file, "file.pdf"), Transferred);
    fs::create_directories(folder / "new/2");
    WriteFile(folder / "new/2/another program's", "content");
    std::string const place = folder / "new";
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Job", place.c_str()));
    EXPECT_TRUE(Server().Delete(As("guest"), {3, 2}));
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
        EXPECT_TRUE(Server().Delete(As("admin"), {3, 1}));
        EXPECT_THAT(NamesIn(InJob(1)), ElementsAre(".job-", "another program's")) << mark;
        EXPECT_TRUE(Server().Create(As("admin"), {3, 1}));
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

TEST_F(SentJob, WithoutSystemTicket_IsRefused)
{
    storage.tickets[SystemTicket].clear();
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
                                  EXPECT_TRUE(Server().Delete(As("admin"), {3, 2}));
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

TEST_F(FailedJob, DatabaseThatFailsAtTheEnd_LeavesTheTicketUnsent)
{
    Prepare({"file.pdf"});
    Server().Transfers().Set({1, [this] { storage.fail = true; }});
    As("operator");
    testing::internal::CaptureStderr();
    EXPECT_EQ(Intake().Send(As("operator"), file, "file.pdf"), TargetUnwritable);
    testing::internal::GetCapturedStderr();
    storage.fail = false;
    Restart();
    EXPECT_EQ(Int({3, 2}, "Job/State"), 0);
    EXPECT_EQ(Int({3, 2}, "Job/Prepared"), 1);  // so it goes when the site is opened
}

// What processes that were killed have left, when the next one opens the site.
class LeftByTheDead : public testing::Test
{
protected:
    LeftByTheDead() { Site::Open(Folder(), COMGUI_TEST_SEED); }

    fs::path Folder() const { return folder / "site"; }
    void Make(std::string const& name) const
    {
        fs::create_directories((Folder() / name).parent_path());
        WriteFile(Folder() / name, "content");
    }
    bool Has(std::string const& name) const { return fs::exists(Folder() / name); }
    std::string Open() const
    {
        testing::internal::CaptureStderr();
        Site::Open(Folder(), COMGUI_TEST_SEED);
        return testing::internal::GetCapturedStderr();
    }
    void PutText(TicketAddress ticket, std::string_view key, std::string const& text) const
    {
        Site::Open(Folder(), COMGUI_TEST_SEED)
            .storage()
            .Apply({{Change::PutValue, ticket, key, 0, Bytes(PARAM_STRING, text)}});
    }
    void MakePreparedJob(std::string_view file = {}) const
    {
        StoredValue const mark = Bytes(PARAM_STRING, std::string_view(Mark).substr(5));
        std::vector<Change> changes{{Change::CreateTicket, {3, 9}},
                                    {Change::PutValue, {3, 9}, "Job/Prepared", 0, Integer(PARAM_INT, 1)},
                                    {Change::PutValue, {3, 9}, "Job/FolderMark", 0, mark}};
        if (!file.empty())
            changes.push_back({Change::PutValue, {3, 9}, "Job/File", 0, Bytes(PARAM_STRING, file)});
        Site::Open(Folder(), COMGUI_TEST_SEED).storage().Apply(changes);
    }
    std::vector<int> Jobs() const
    {
        Site site = Site::Open(Folder(), COMGUI_TEST_SEED);
        std::vector<int> ids;
        for (TicketAddress const ticket : site.storage().Tickets())
            if (ticket.type == 3)
                ids.push_back(ticket.id);
        return ids;
    }

    std::string const Mark = ".job-0123456789abcdef";
    MemoryFolder folder;
};

TEST_F(LeftByTheDead, PreparedJob_GoesWithItsFolder)
{
    MakePreparedJob();
    Make("job/9/" + Mark);
    Make("job/9/whole.pdf");
    EXPECT_EQ(Open(), "");
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));  // 3/2 has state 0, and nobody has prepared it
    EXPECT_FALSE(Has("job/9"));
}

TEST_F(LeftByTheDead, PreparedJob_FolderThatIsNotItsOwnStays)
{
    fs::create_directories(folder / "elsewhere/9");
    WriteFile(folder / "elsewhere/9/another program's", "content");
    PutText(SystemTicket, "System/Folders/Job", folder / "elsewhere");
    MakePreparedJob();
    EXPECT_EQ(Open(), "");
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));
    EXPECT_TRUE(fs::exists(folder / "elsewhere/9/another program's"));
}

TEST_F(LeftByTheDead, JobThatHasItsFile_StaysWhateverAClientHasWrittenIntoIt)
{
    MakePreparedJob("$(JOB)/9/whole.pdf");
    Make("job/9/" + Mark);
    Make("job/9/whole.pdf");
    EXPECT_EQ(Open(), "");
    EXPECT_THAT(Jobs(), ElementsAre(1, 2, 9));
    EXPECT_TRUE(Has("job/9/whole.pdf"));
}

TEST_F(LeftByTheDead, JobFolderWithoutATicket_Goes_AndOthersStay)
{
    for (std::string const name :
         {"job/2/", "job/77/", "job/077/", "job/78x/", "job/notes/", "job/16777216/", "temp/77/"})
    {
        Make(name + Mark);
        Make(name + "a");
    }
    Make("job/81/no job's");
    Make("job/79");  // a file
    fs::create_directory(Folder() / "job/82");
    fs::create_directory_symlink(Folder() / "temp", Folder() / "job/80");
    EXPECT_EQ(Open(), "");
    EXPECT_FALSE(Has("job/77"));
    EXPECT_FALSE(Has("job/82"));  // empty: killed before it was marked
    for (char const* const name : {"job/2/a", "job/077/a", "job/78x/a", "job/notes/a", "job/16777216/a",
                                   "temp/77/a", "job/79", "job/80", "job/81/no job's"})
        EXPECT_TRUE(Has(name)) << name;
}

TEST_F(LeftByTheDead, JobFolderElsewhere_IsNotTouched)
{
    fs::create_directories(folder / "elsewhere/77");
    PutText(SystemTicket, "System/Folders/Job", folder / "elsewhere");
    Open();
    EXPECT_TRUE(fs::exists(folder / "elsewhere/77"));
}

TEST_F(LeftByTheDead, BeginningsOfFiles_Go)
{
    std::string const dead = ".transfer." + NumberOfADeadProcess() + "-3.tmp";
    std::string const alive = ".transfer." + std::to_string(getpid()) + "-99.tmp";
    for (std::string const name : {"temp/", "job/2/", "profiles/paper/deep/er/"})
    {
        Make(name + dead);
        Make(name + alive);  // the number may have been given again, but the site is ours
    }
    for (char const* const name : {"temp/.transfer.x-1.tmp", "temp/.transfer.1-1", "temp/transfer.1-1.tmp"})
        Make(name);
    EXPECT_EQ(Open(), "");
    for (std::string const name : {"temp/", "job/2/", "profiles/paper/deep/er/"})
    {
        EXPECT_FALSE(Has(name + dead)) << name;
        EXPECT_FALSE(Has(name + alive)) << name;
    }
    EXPECT_THAT(NamesIn(Folder() / "temp"),
                ElementsAre(".transfer.1-1", ".transfer.x-1.tmp", "transfer.1-1.tmp"));
}

TEST_F(LeftByTheDead, BeginningsOfFiles_ElsewhereGoIfTheirProcessIsDead)
{
    std::string const dead = ".transfer." + NumberOfADeadProcess() + "-3.tmp";
    std::string const alive = ".transfer." + std::to_string(getpid()) + "-99.tmp";
    fs::create_directory(folder / "elsewhere");
    WriteFile(folder / ("elsewhere/" + dead), "content");
    WriteFile(folder / ("elsewhere/" + alive), "content");
    PutText(SystemTicket, "System/Folders/Temp", folder / "elsewhere");
    Open();
    EXPECT_THAT(NamesIn(folder / "elsewhere"), ElementsAre(alive));
}

TEST_F(LeftByTheDead, BeginningsOfFiles_BehindALinkOutOfTheSiteGoIfTheirProcessIsDead)
{
    std::string const dead = ".transfer." + NumberOfADeadProcess() + "-3.tmp";
    std::string const alive = ".transfer." + std::to_string(getpid()) + "-99.tmp";
    fs::create_directories(folder / "elsewhere/below");
    for (std::string const& name : {dead, alive, "below/" + dead})
        WriteFile(folder / ("elsewhere/" + name), "content");
    fs::remove(Folder() / "temp");
    fs::create_directory_symlink(folder / "elsewhere", Folder() / "temp");
    Open();
    EXPECT_THAT(NamesIn(folder / "elsewhere"), ElementsAre(alive, "below"));
    EXPECT_THAT(NamesIn(folder / "elsewhere/below"), ElementsAre(dead));
}

TEST_F(LeftByTheDead, JobsOfADatabaseThatIsMadeAnew_AreSetAside)
{
    Make("job/1/precious.pdf");
    fs::remove(Folder() / "site.db");
    EXPECT_THAT(Open(), HasSubstr("set aside as 1.damaged-"));
    Open();
    auto const names = NamesIn(Folder() / "job");
    ASSERT_EQ(names.size(), 1u);
    EXPECT_EQ(ContentOf(Folder() / "job" / names[0] / "precious.pdf"), "content");
}
