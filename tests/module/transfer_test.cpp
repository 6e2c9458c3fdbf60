// Files and jobs through the table of the bundle: what arrives, what is told, and what is refused.
#include "tests/module/NotificationListener.h"

#include "comgui/foundation/stracpy.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "standin/module/ModuleCodes.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include "tests/support/FullDisk.h"
#include "tests/support/TestSite.h"
#include <cstring>
#include <fcntl.h>
#include <gmock/gmock.h>

using namespace standin;
namespace fs = std::filesystem;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
struct COMMAND_RECORD : TCommandRecord
{
    explicit COMMAND_RECORD(std::string const& text2 = {}) : TCommandRecord{}
    {
        nMagic = 0x49494949;
        nSize = sizeof(TCommandRecord);
        iResult = -7;
        std::memcpy(szText2, text2.data(), std::min(text2.size(), sizeof szText2));
    }
};
}  // namespace

class TransferTest : public ClientTest
{
protected:
    ~TransferTest() override
    {
        admin.Logout();
        other.Logout();
    }

    fs::path Site() const { return folder.Path() / "site"; }

    using ENTRY = int (*)(void*, void*, char*, char*);
    int Call(ENTRY entry, std::string source, std::string target) const
    {
        testing::internal::CaptureStderr();
        int const code = entry(module.Instance(), other.Session(), source.data(), target.data());
        stderrText = testing::internal::GetCapturedStderr();
        return code;
    }
    int Put(std::string const& source, std::string const& target) const
    {
        return Call(module->PutFileSyncEntry, source, target);
    }
    int Get(std::string const& source, std::string const& target) const
    {
        return Call(module->GetFileSyncEntry, source, target);
    }
    int Send(std::string path, std::string name, TJobIdentification* record = nullptr) const
    {
        char upload[] = "$(UPLOADJOB)";
        TJobIdentification own{};
        own.nSize = sizeof own;
        own.pszUploadFolder = upload;
        testing::internal::CaptureStderr();
        int const code = module->SendJobEntry(module.Instance(), other.Session(), record ? record : &own,
                                              path.data(), name.data());
        stderrText = testing::internal::GetCapturedStderr();
        return code;
    }
    int Command(char const* command, int size, void* data) const
    {
        testing::internal::CaptureStderr();
        int const code = module->SendCommandEntry(module.Instance(), other.Session(), command, size, data);
        stderrText = testing::internal::GetCapturedStderr();
        return code;
    }
    int Prepare(TCommandRecord& record) const
    {
        return Command("remote.job.prepare", sizeof record, &record);
    }
    int Prepare(std::string const& name) const  // the id
    {
        COMMAND_RECORD record("$(JOB)/" + name);
        EXPECT_EQ(Prepare(record), MODULE_DONE);
        return record.iResult;
    }
    std::string Text(int id, char const* key) const
    {
        char const* text = nullptr;
        admin.Access()->MGETPARAMETER(admin.Access()->Instance, 3, id, key, PARAM_STRING, &text, -1);
        return text ? text : "";
    }
    long long Int64(int id, char const* key) const
    {
        long long value = -1;
        admin.Access()->MGETPARAMETER(admin.Access()->Instance, 3, id, key, PARAM_INT64, &value, -1);
        return value;
    }
    std::vector<int> Jobs() const
    {
        std::vector<int> ids;
        auto const add = [](void* context, int, int id, STICKET_ACCESS const*)
        {
            static_cast<std::vector<int>*>(context)->push_back(id);
            return true;
        };
        admin.Access()->MWALKTICKETS(admin.Access()->Instance, add, &ids, 3);
        return ids;
    }

    std::string const local = folder.Write("file.pdf", "%PDF-1.4 content").string();
    mutable std::string stderrText;
};

using PuttingFiles = TransferTest;
using GettingFiles = TransferTest;
using SendingJobs = TransferTest;
using PreparingJobs = TransferTest;
using BeginTransfer = TransferTest;
using RemoteCommands = TransferTest;

TEST_F(PuttingFiles, File_LiesInTheVariablesFolder)
{
    EXPECT_EQ(Put(local, "$(TEMP)/a.pdf"), MODULE_DONE);
    EXPECT_EQ(ContentOf(Site() / "temp" / "a.pdf"), "%PDF-1.4 content");
    EXPECT_THAT(NamesIn(Site() / "temp"), ElementsAre("a.pdf"));
    EXPECT_EQ(stderrText, "");
}

TEST_F(GettingFiles, File_ComesBackAsItWas)
{
    ASSERT_EQ(Put(local, "$(TEMP)/a.pdf"), MODULE_DONE);
    fs::path const back = folder.Path() / "back.pdf";
    EXPECT_EQ(Get("$(TEMP)/a.pdf", back.string()), MODULE_DONE);
    EXPECT_EQ(ContentOf(back), "%PDF-1.4 content");
}

TEST_F(SendingJobs, PreparedJob_GetsItsFileAndItsTicket)
{
    int const id = Prepare("file.pdf");
    ASSERT_GT(id, 2);
    EXPECT_EQ(admin.Read(3, id, "Job/State"), 0);
    EXPECT_EQ(Text(id, "Job/Identification/Name"), "file.pdf");
    EXPECT_EQ(Text(id, "Job/Identification/User"), "operator");
    EXPECT_EQ(Text(id, "Job/Identification/RemoteEndpoint"), "127.0.0.1:50106");

    EXPECT_EQ(Send(local, "file.pdf"), MODULE_DONE) << stderrText;
    EXPECT_THAT(Jobs(), ElementsAre(1, 2, id));
    std::string const folderText = "$(JOB)/" + std::to_string(id);
    EXPECT_EQ(Text(id, "Job/File"), folderText + "/file.pdf");
    EXPECT_EQ(Text(id, "Job/Folder"), folderText);
    EXPECT_EQ(Int64(id, "Job/Size"), 16);
    EXPECT_EQ(admin.Read(3, id, "Job/State"), 1);
    EXPECT_EQ(admin.Read(3, id, "Job/Progress"), 100);
    EXPECT_EQ(admin.Read(3, id, "Job/Prepared"), -1);
    EXPECT_EQ(ContentOf(Site() / "job" / std::to_string(id) / "file.pdf"), "%PDF-1.4 content");
}

TEST_F(SendingJobs, WithoutPrepare_MakesTheTicketItself)
{
    EXPECT_EQ(Send(local, "other name.pdf"), MODULE_DONE);
    EXPECT_THAT(Jobs(), ElementsAre(1, 2, 3));
    EXPECT_EQ(Text(3, "Job/Identification/Name"), "other name.pdf");
    EXPECT_EQ(admin.Read(3, 3, "Job/State"), 1);
}

TEST_F(BeginTransfer, End_IsToldToWhoAsked)
{
    LISTENER listener;
    other.Register(listener);
    EXPECT_EQ(Call(module->PutFileEntry, local, "$(TEMP)/a.pdf"), MODULE_DONE);
    EXPECT_THAT(listener.Wait(1), ElementsAre("ended 0/0 Transfer/Source@-1='" + local +
                                              "' Transfer/Target@-1='$(TEMP)/a.pdf' Transfer/Code@-1=0 "
                                              "Transfer/Size@-1=16ll"));
    EXPECT_EQ(ContentOf(Site() / "temp" / "a.pdf"), "%PDF-1.4 content");
    other.Logout();
}

TEST_F(RemoteCommands, IsAlive_ClearsTheResult)
{
    COMMAND_RECORD record;
    EXPECT_EQ(Command("remote.system.isalive", sizeof record, &record), MODULE_DONE);
    EXPECT_EQ(record.iResult, 0);
}

TEST_F(BeginTransfer, PathsThatNoServerTakes_AreRefusedAtOnce)
{
    EXPECT_EQ(Call(module->PutFileEntry, local, "/etc/passwd"), MODULE_PATH_REFUSED);
    EXPECT_EQ(Call(module->GetFileEntry, "$(NOPE)/a", local), MODULE_PATH_REFUSED);
    EXPECT_EQ(module->PutFileEntry(module.Instance(), other.Session(), nullptr, nullptr),
              MODULE_INVALID_ARGUMENT);
}

TEST_F(BeginTransfer, GetFile_ArrivesAndIsTold)
{
    LISTENER listener;
    other.Register(listener);
    ASSERT_EQ(Put(local, "$(TEMP)/a.pdf"), MODULE_DONE);
    fs::path const back = folder.Path() / "back.pdf";
    EXPECT_EQ(Call(module->GetFileEntry, "$(TEMP)/a.pdf", back.string()), MODULE_DONE);
    EXPECT_EQ(listener.Wait(1).size(), 1u);
    EXPECT_EQ(ContentOf(back), "%PDF-1.4 content");
    other.Logout();
}

TEST_F(BeginTransfer, Failure_IsToldWithItsCode)
{
    LISTENER listener;
    other.Register(listener);
    testing::internal::CaptureStderr();
    std::string missing = (folder.Path() / "missing").string();
    char target[] = "$(TEMP)/a.pdf";
    EXPECT_EQ(module->PutFileEntry(module.Instance(), other.Session(), missing.data(), target), MODULE_DONE);
    EXPECT_THAT(listener.Wait(1),
                ElementsAre(AllOf(HasSubstr("ended 0/113"), HasSubstr("Transfer/Code@-1=113"),
                                  HasSubstr("Transfer/Size@-1=0ll"))));
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr(missing));
    other.Logout();
}

TEST_F(PuttingFiles, EndedSessionsAndNullPointers_AreRefused)
{
    char text[] = "$(TEMP)/a";
    for (ENTRY const entry :
         {module->PutFileEntry, module->GetFileEntry, module->PutFileSyncEntry, module->GetFileSyncEntry})
    {
        EXPECT_EQ(entry(module.Instance(), other.Session(), nullptr, text), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(entry(module.Instance(), other.Session(), text, nullptr), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(entry(module.Instance(), nullptr, text, text), MODULE_UNKNOWN_SESSION);
    }
}

TEST_F(PuttingFiles, BadInput_HasItsCodeAndOneLineAndLeavesNothing)
{
    fs::path const& mine = folder.Path();
    std::string const longName(300, 'n');
    std::vector<std::tuple<std::string, std::string, int>> const facts{
        {(mine / "missing").string(), "$(TEMP)/a", MODULE_SOURCE_UNREADABLE},
        {mine.string(), "$(TEMP)/a", MODULE_NOT_A_FILE},
        {local, "$(TEMP)/" + longName, MODULE_PATH_REFUSED},
        {local, "$(TEMP)/a\nb", MODULE_PATH_REFUSED},
        {local, "$(TEMP)/../a", MODULE_PATH_REFUSED},
        {local, "$(INSTALL)/site.db", MODULE_PATH_REFUSED},
        {local, "$(JOB)/1/a", MODULE_PATH_REFUSED},
        {local, "$(TEMP)/no folder/a", MODULE_TARGET_UNWRITABLE}};
    for (auto const& [source, target, code] : facts)
    {
        EXPECT_EQ(Put(source, target), code) << target;
        EXPECT_EQ(std::count(stderrText.begin(), stderrText.end(), '\n'), 1) << stderrText;
    }
    EXPECT_THAT(NamesIn(Site() / "temp"), IsEmpty());
}

TEST_F(PuttingFiles, SitesOwnFolder_IsOutOfReachEvenIfTheAdministratorNamesIt)
{
    std::string const site = Site().string();
    auto const set = [&](char const* key, char const* value)
    { return admin.Access()->MSETPARAMETER(admin.Access()->Instance, 0, 0, key, PARAM_STRING, value, -1); };
    ASSERT_EQ(set("System/InstallFolder", folder.Path().c_str()), 1);
    ASSERT_EQ(set("System/Folders/Temp", site.c_str()), 1);
    EXPECT_EQ(Get("$(TEMP)/site.db", (folder.Path() / "stolen").string()), MODULE_PATH_REFUSED);
    EXPECT_EQ(Put(local, "$(TEMP)/site.db"), MODULE_PATH_REFUSED);
    EXPECT_FALSE(fs::exists(folder.Path() / "stolen"));
}

TEST_F(PuttingFiles, EmptyFile_Arrives)
{
    EXPECT_EQ(Put(folder.Write("empty", "").string(), "$(TEMP)/"), MODULE_DONE);
    EXPECT_THAT(NamesIn(Site() / "temp"), ElementsAre("empty"));
}

TEST_F(PuttingFiles, TwoGiBOfHoles_Arrive)
{
    std::string const sparse = folder.Write("sparse", "begin").string();
    fs::resize_file(sparse, std::uintmax_t{2} << 30);
    EXPECT_EQ(Put(sparse, "$(TEMP)/"), MODULE_DONE);
    EXPECT_EQ(fs::file_size(Site() / "temp" / "sparse"), std::uintmax_t{2} << 30);
    EXPECT_EQ(Send(sparse, "sparse"), MODULE_DONE);
    EXPECT_EQ(Int64(3, "Job/Size"), 1LL << 31);
}

TEST_F(SendingJobs, FullDisk_LeavesNeitherFileNorTicket)
{
    std::string const big = folder.Write("big", std::string(300000, 'x')).string();
    int const id = Prepare("big");
    int const code = [&]
    {
        FullDisk const full(200000);
        return Send(big, "big");
    }();
    EXPECT_EQ(code, MODULE_TARGET_UNWRITABLE);
    EXPECT_EQ(std::count(stderrText.begin(), stderrText.end(), '\n'), 1) << stderrText;
    EXPECT_EQ(admin.Read(3, id, "Job/State"), -1);
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));
    EXPECT_THAT(NamesIn(Site() / "job"), IsEmpty());
}

TEST_F(SendingJobs, BadRecords_AreRefused)
{
    char upload[] = "$(UPLOADJOB)";
    char elsewhere[] = "$(TEMP)";
    TJobIdentification record{};
    record.nSize = sizeof record - 1;
    record.pszUploadFolder = upload;
    EXPECT_EQ(Send(local, "a", &record), MODULE_INVALID_ARGUMENT);
    record.nSize = sizeof record;
    record.pszUploadFolder = nullptr;
    EXPECT_EQ(Send(local, "a", &record), MODULE_INVALID_ARGUMENT);
    record.pszUploadFolder = elsewhere;
    EXPECT_EQ(Send(local, "a", &record), MODULE_PATH_REFUSED);
    record.pszUploadFolder = upload;
    char text[] = "a";
    EXPECT_EQ(module->SendJobEntry(module.Instance(), other.Session(), nullptr, text, text),
              MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(module->SendJobEntry(module.Instance(), other.Session(), &record, nullptr, text),
              MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(module->SendJobEntry(module.Instance(), other.Session(), &record, text, nullptr),
              MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(module->SendJobEntry(module.Instance(), nullptr, &record, text, text), MODULE_UNKNOWN_SESSION);
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));
}

TEST_F(SendingJobs, EmptyFile_IsRefused)
{
    EXPECT_EQ(Send(folder.Write("empty", "").string(), "empty"), MODULE_EMPTY_JOB);
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));
}

TEST_F(PreparingJobs, QueueAndCopies_AreTheFirstAndThirdArgument)
{
    COMMAND_RECORD record("$(JOB)/a.pdf");
    record.iArgA = 2;
    record.iArgB = 5;
    record.iArgC = 250;
    ASSERT_EQ(Prepare(record), MODULE_DONE);
    EXPECT_EQ(admin.Read(3, record.iResult, "Job/Queue"), 2);
    EXPECT_EQ(admin.Read(3, record.iResult, "Job/Copies"), 250);
}

TEST_F(PreparingJobs, TextThatFillsItsField_IsReadToItsEndAndNoFurther)
{
    COMMAND_RECORD record("$(JOB)/" + std::string(255, 'n'));
    ASSERT_EQ(Prepare(record), MODULE_DONE);
    EXPECT_EQ(Text(record.iResult, "Job/Identification/Name"), std::string(251, 'n'));
    EXPECT_EQ(Send(local, std::string(255, 'n')), MODULE_DONE);
    EXPECT_THAT(Jobs(), ElementsAre(1, 2, record.iResult));
    EXPECT_EQ(Text(record.iResult, "Job/Identification/Name"), std::string(255, 'n'));
}

TEST_F(PreparingJobs, WhatIsNoNameInTheJobsFolder_IsRefused)
{
    for (std::string const text :
         {"", "a", "$(JOB)", "$(JOB)/", "$(JOB)/..", "$(JOB)/a/b", "$(JOB)/a\\b", "$(JOB)/a\nb", "$(TEMP)/a"})
    {
        COMMAND_RECORD record(text);
        EXPECT_EQ(Prepare(record), MODULE_PATH_REFUSED) << text;
        EXPECT_LT(record.iResult, 0) << text;
        EXPECT_EQ(std::count(stderrText.begin(), stderrText.end(), '\n'), 1) << stderrText;
    }
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));
}

TEST_F(PreparingJobs, Logout_TakesThemBack)
{
    int const id = Prepare("a.pdf");
    EXPECT_THAT(Jobs(), ElementsAre(1, 2, id));
    other.Logout();
    EXPECT_THAT(Jobs(), ElementsAre(1, 2));
}

TEST_F(RemoteCommands, RecordThatIsNone_IsRefused)
{
    for (char const* const command : {"remote.system.isalive", "remote.job.prepare"})
    {
        COMMAND_RECORD record("$(JOB)/a");
        EXPECT_EQ(Command(command, sizeof record, nullptr), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(Command(command, sizeof record - 1, &record), MODULE_INVALID_ARGUMENT);
        record.nSize = 0;
        EXPECT_EQ(Command(command, sizeof record, &record), MODULE_INVALID_ARGUMENT);
        record.nSize = sizeof record;
        record.nMagic = 0;
        EXPECT_EQ(Command(command, sizeof record, &record), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(record.iResult, -7);
    }
}

TEST_F(RemoteCommands, ClientFolders_MustBeThere)
{
    for (char const* const command : {"local.set.previewfolder", "local.set.thumbnailfolder"})
    {
        auto const set = [&](std::string text, int size)
        { return Command(command, size, text.empty() ? nullptr : text.data()); };
        std::string const good = folder.Path().string();
        int const length = static_cast<int>(good.size());
        EXPECT_EQ(set(good, length), MODULE_DONE);
        EXPECT_EQ(set(good + "not part of it", length), MODULE_DONE);
        EXPECT_EQ(set(good, 0), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(set(good, -1), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(set("", 5), MODULE_INVALID_ARGUMENT);
        EXPECT_EQ(set("relative", 8), MODULE_PATH_REFUSED);
        EXPECT_EQ(set("/a\nb", 4), MODULE_PATH_REFUSED);
        EXPECT_EQ(set(local, static_cast<int>(local.size())), MODULE_NOT_A_FILE);
        EXPECT_EQ(set(good + "/missing", length + 8), MODULE_NOT_A_FILE);
    }
}

TEST_F(SendingJobs, Changes_ReachWhoHasSwitchedThemOn)
{
    LISTENER listener;
    admin.Enable(3, TICKET_ID_ALL, admin.Register(listener),
                 {"Job/State", "Job/Identification/RemoteEndpoint"});
    int const id = Prepare("a.pdf");
    EXPECT_EQ(Send(local, "a.pdf"), MODULE_DONE);
    std::string const job = "3/" + std::to_string(id);
    EXPECT_THAT(
        listener.Wait(3),
        ElementsAre(
            "created " + job,
            "changed " + job + " Job/State@-1=0 Job/Identification/RemoteEndpoint@-1='127.0.0.1:50106'",
            "changed " + job + " Job/Identification/RemoteEndpoint@-1='127.0.0.1:50106' Job/State@-1=1"));
    admin.Logout();
}

// --- the site's own files

namespace
{
// Whether this process has locks on both of a database's files, as another one sees it.
bool HasLocks(fs::path const& database)
{
    ChildProcess other(
        [&](ChildProcess::Report const& report)
        {
            for (char const* const suffix : {"", "-shm"})
            {
                int const file = open((database.string() + suffix).c_str(), O_RDWR | O_CLOEXEC);
                struct flock lock = {};
                lock.l_type = F_WRLCK;
                lock.l_whence = SEEK_SET;  // the whole file
                report(file >= 0 && fcntl(file, F_GETLK, &lock) == 0 && lock.l_type != F_UNLCK ? 1 : 0);
            }
        });
    bool const hasFirst = other.Next() == 1;
    return other.Next() == 1 && hasFirst;
}
}  // namespace

class SitesOwnFiles : public TransferTest
{
protected:
    void SetUp() override { COMGUI_SKIP_IN_DATABASE("its folder has no database"); }

    // By their names, and by others that a client may give them.
    std::vector<fs::path> Names() const
    {
        std::vector<fs::path> names;
        for (char const* const name : {"site.db", "site.db-wal", "site.db-shm", "site.lock"})
        {
            names.push_back(Site() / name);
            fs::path const link = folder.Path() / (std::string("link to ") + name);
            fs::path const twin = folder.Path() / (std::string("twin of ") + name);
            fs::create_symlink(Site() / name, link);
            fs::create_hard_link(Site() / name, twin);
            names.insert(names.end(), {link, twin});
        }
        return names;
    }

    void ExpectUntouched() const
    {
        EXPECT_TRUE(HasLocks(Site() / "site.db"));
        int const value = 7;
        EXPECT_TRUE(
            admin.Access()->MSETPARAMETER(admin.Access()->Instance, 3, 1, "K", PARAM_INT, &value, -1));
    }
};

TEST_F(SitesOwnFiles, HaveLocksThatAnyDescriptorTakesAlong)
{
    ExpectUntouched();
    close(open((Site() / "site.db").c_str(), O_RDONLY | O_CLOEXEC));
    EXPECT_FALSE(HasLocks(Site() / "site.db")) << "or the tests below show nothing";
}

TEST_F(SitesOwnFiles, AreNoSource)
{
    for (fs::path const& name : Names())
    {
        EXPECT_EQ(Put(name.string(), "$(TEMP)/stolen"), MODULE_PATH_REFUSED) << name;
        EXPECT_THAT(stderrText, HasSubstr("belongs to the database"));
        EXPECT_EQ(Send(name.string(), "job.pdf"), MODULE_PATH_REFUSED) << name;
    }
    ExpectUntouched();
}

TEST_F(SitesOwnFiles, AreNoTarget)
{
    fs::path const source = folder.Write("a", "content");
    ASSERT_EQ(Put(source.string(), "$(TEMP)/a"), MODULE_DONE);
    for (fs::path const& name : Names())
    {
        EXPECT_EQ(Get("$(TEMP)/a", name.string()), MODULE_PATH_REFUSED) << name;
        EXPECT_THAT(stderrText, HasSubstr("belongs to the database"));
    }
    ExpectUntouched();
}

// The same from the server's side: an administrator may have made a link in a folder of a variable.
TEST_F(SitesOwnFiles, AreNoFilesOfTheServersFolders)
{
    fs::path const source = folder.Write("a", "content");
    ASSERT_EQ(Put(source.string(), "$(TEMP)/a"), MODULE_DONE);
    fs::path const temp = Site() / "temp";
    ASSERT_TRUE(fs::exists(temp / "a"));
    fs::create_hard_link(Site() / "site.db", temp / "b");
    EXPECT_EQ(Get("$(TEMP)/b", (folder.Path() / "c").string()), MODULE_PATH_REFUSED);
    EXPECT_EQ(Put(source.string(), "$(TEMP)/b"), MODULE_PATH_REFUSED);
    ExpectUntouched();
}

TEST_F(SitesOwnFiles, AreNoTickets)
{
    for (fs::path const& name : Names())
    {
        testing::internal::CaptureStderr();
        EXPECT_FALSE(module->STicketFactory->CreateTicket(name.c_str())) << name;
        EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("belongs to the database"));
    }
    ExpectUntouched();
}

// Nor are they replaced by one that was opened under the name before.
TEST_F(SitesOwnFiles, AreReplacedByNoTicket)
{
    for (char const* const name : {"site.db", "site.lock"})
    {
        fs::path const file = folder.Write("ticket.xml", "<ticket version='1'/>");
        STICKET_ACCESS const* ticket = module->STicketFactory->CreateTicket(file.c_str());
        ASSERT_TRUE(ticket);
        int const value = 7;
        EXPECT_TRUE(ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_INT, &value, -1));
        fs::remove(file);
        fs::create_symlink(Site() / name, file);
        testing::internal::CaptureStderr();
        module->STicketFactory->DestroyTicket(&ticket);
        EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("belongs to the database"));
        fs::remove(file);
    }
    ExpectUntouched();
}
