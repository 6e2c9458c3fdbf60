// Files and jobs through the table of the bundle: what arrives, what is told, and what is refused.
#include "tests/module/NotificationListener.h"

#include "comgui/foundation/stracpy.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "standin/module/ModuleCodes.h"
#include <cstring>
#include <fstream>
#include <gmock/gmock.h>
#include <sstream>
#include <sys/resource.h>

using namespace standin;
namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
std::string ContentOf(fs::path const& file)
{
    std::ifstream stream(file, std::ios::binary);
    std::stringstream content;
    content << stream.rdbuf();
    return content.str();
}

std::vector<std::string> NamesIn(fs::path const& folder)
{
    std::vector<std::string> names;
    for (auto const& entry : std::filesystem::directory_iterator(folder))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

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

    std::string const file = folder.Write("file.pdf", "%PDF-1.4 content").string();
    mutable std::string stderrText;
};

using PutFile = TransferTest;
using GetFile = TransferTest;
using SendJob = TransferTest;
using PrepareJob = TransferTest;
using BeginTransfer = TransferTest;
using RemoteCommands = TransferTest;

TEST_F(PutFile, File_LiesInTheVariablesFolder)
{
    EXPECT_EQ(Put(file, "$(TEMP)/a.pdf"), MODULE_DONE);
    EXPECT_EQ(ContentOf(Site() / "temp" / "a.pdf"), "%PDF-1.4 content");
    EXPECT_THAT(NamesIn(Site() / "temp"), ElementsAre("a.pdf"));
    EXPECT_EQ(stderrText, "");
}

TEST_F(GetFile, File_ComesBackAsItWas)
{
    ASSERT_EQ(Put(file, "$(TEMP)/a.pdf"), MODULE_DONE);
    fs::path const back = folder.Path() / "back.pdf";
    EXPECT_EQ(Get("$(TEMP)/a.pdf", back.string()), MODULE_DONE);
    EXPECT_EQ(ContentOf(back), "%PDF-1.4 content");
}

TEST_F(SendJob, PreparedJob_GetsItsFileAndItsTicket)
{
    int const id = Prepare("file.pdf");
    ASSERT_GT(id, 2);
    EXPECT_EQ(admin.Read(3, id, "Job/State"), 0);
    EXPECT_EQ(Text(id, "Job/Identification/Name"), "file.pdf");
    EXPECT_EQ(Text(id, "Job/Identification/User"), "operator");
    EXPECT_EQ(Text(id, "Job/Identification/RemoteEndpoint"), "127.0.0.1:50106");

    EXPECT_EQ(Send(file, "file.pdf"), MODULE_DONE) << stderrText;
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

TEST_F(SendJob, WithoutPrepare_MakesTheTicketItself)
{
    EXPECT_EQ(Send(file, "other name.pdf"), MODULE_DONE);
    EXPECT_THAT(Jobs(), ElementsAre(1, 2, 3));
    EXPECT_EQ(Text(3, "Job/Identification/Name"), "other name.pdf");
    EXPECT_EQ(admin.Read(3, 3, "Job/State"), 1);
}

TEST_F(BeginTransfer, End_IsToldToWhoAsked)
{
    LISTENER listener;
    other.Register(listener);
    EXPECT_EQ(Call(module->PutFileEntry, file, "$(TEMP)/a.pdf"), MODULE_DONE);
    EXPECT_THAT(listener.Wait(1), ElementsAre("ended 0/0 Transfer/Source@-1='" + file +
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
