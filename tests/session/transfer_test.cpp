// Files and jobs on their way to the plug-in.
#include "comgui/session/ComGUIManager.h"

#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "tests/session/FakeModule.h"
#include "tests/session/Faults.h"
#include "tests/session/ScarceMemory.h"
#include <algorithm>
#include <climits>
#include <cstring>
#include <functional>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
struct TRANSFER
{
    char const* name;
    char const* entry;
    std::function<int(ComGUIManager& manager, TLogin* login, char* first, char* second)> call;
};

class Transfer : public WithManager, public testing::WithParamInterface<TRANSFER>
{
protected:
    int Call() { return GetParam().call(manager, &record, first, second); }

    TLogin record = {};
    char first[2] = "1";
    char second[2] = "2";
};

TJobIdentification job = {};

class PrepareJob : public WithManager
{
protected:
    PrepareJob()
    {
        module.onCommand = [this](char const* name, int length, void* bytes)
        {
            command = name;
            size = length;
            auto& record = *static_cast<TCommandRecord*>(bytes);
            sent = record;
            record.iResult = result;
            return code;
        };
    }

    // The second text that goes with a path, as many bytes of it as there are.
    std::string TextOf(std::string const& path)
    {
        manager.PrepareJob(path, 0, 0, 0, 0, 0);
        return {sent.szText2, strnlen(sent.szText2, sizeof sent.szText2)};
    }

    int result = 0;  // what the server answers
    int code = 0;

    std::string command;  // what it saw
    int size = -1;
    TCommandRecord sent = {};
};

class UploadJob : public WithManager
{
protected:
    UploadJob()
    {
        module.onJob = [this](TJobIdentification& identification, char const* localPath, char const* leaf)
        {
            sent = identification;
            folder.assign(sent.pszUploadFolder, 13);  // with its zero byte
            path = localPath;
            name = leaf;
        };
    }

    TJobIdentification sent = {};
    std::string folder;
    std::string path;
    std::string name;
};

struct LEAF_FACT
{
    char const* name;
    char const* path;
    char const* leaf;
};

class LeafName : public testing::TestWithParam<LEAF_FACT>
{
};
}  // namespace

// --- files and jobs as they stand ------------------------------------------------------------------------

TEST_P(Transfer, HandsOverItsArgumentsInTheirOrder)
{
    Call();
    EXPECT_THAT(module.calls, ElementsAre(GetParam().entry));
    std::vector<void*> expected{first, second};
    if (GetParam().entry == std::string("SendJobEntry"))
        expected.insert(expected.begin(), &job);
    EXPECT_EQ(module.pointers, expected);
}

TEST_P(Transfer, GivesThePlugInsCode)
{
    module.results[GetParam().entry] = -77;
    EXPECT_EQ(Call(), -77);
    module.results[GetParam().entry] = 113;
    EXPECT_EQ(Call(), 113);
    module.results.clear();
    EXPECT_EQ(Call(), 0);
}

TEST_P(Transfer, IsPossibleLoggedInOrNot)
{
    Call();
    LogIn();
    Call();
    manager.Logout();
    Call();
    EXPECT_EQ(std::count(module.calls.begin(), module.calls.end(), GetParam().entry), 3);
}

namespace
{
using M = ComGUIManager;
using R = TLogin*;
}  // namespace

INSTANTIATE_TEST_SUITE_P(
    All, Transfer,
    testing::Values(
        TRANSFER{"PutFile", "PutFileEntry", [](M& m, R, char* a, char* b) { return m.PutFile(a, b); }},
        TRANSFER{"PutFileByRecord", "PutFileEntry",
                 [](M& m, R r, char* a, char* b) { return m.PutFile(r, a, b); }},
        TRANSFER{"PutFileSync", "PutFileSyncEntry",
                 [](M& m, R, char* a, char* b) { return m.PutFileSync(a, b); }},
        TRANSFER{"GetFile", "GetFileEntry", [](M& m, R, char* a, char* b) { return m.GetFile(a, b); }},
        TRANSFER{"GetFileByRecord", "GetFileEntry",
                 [](M& m, R r, char* a, char* b) { return m.GetFile(r, a, b); }},
        TRANSFER{"GetFileSync", "GetFileSyncEntry",
                 [](M& m, R, char* a, char* b) { return m.GetFileSync(a, b); }},
        TRANSFER{"SendJob", "SendJobEntry", [](M& m, R, char* a, char* b) { return m.SendJob(&job, a, b); }},
        TRANSFER{"SendJobByRecord", "SendJobEntry",
                 [](M& m, R r, char* a, char* b) { return m.SendJob(r, &job, a, b); }}),
    [](auto const& fact) { return std::string(fact.param.name); });

// The same without a plug-in.
namespace
{
class TransferDeathTest : public WithModule
{
protected:
    TransferDeathTest()
    {
        LoseTheBundle();
        testing::internal::CaptureStderr();
        manager = std::make_unique<M>();
        testing::internal::GetCapturedStderr();
    }

    std::unique_ptr<M> manager;
    char text[2] = "1";
};
}  // namespace

TEST_F(TransferDeathTest, WithoutAPlugIn_GoesThroughNull_ByDesign)
{
    EXPECT_EXIT(manager->SendCommand(text, 0, nullptr), Faults, "");
    EXPECT_EXIT(manager->IsAlive(nullptr, 0), Faults, "");
    EXPECT_EXIT(manager->PutFile(text, text), Faults, "");
    EXPECT_EXIT(manager->PutFileSync(text, text), Faults, "");
    EXPECT_EXIT(manager->GetFile(text, text), Faults, "");
    EXPECT_EXIT(manager->GetFileSync(text, text), Faults, "");
    EXPECT_EXIT(manager->SendJob(&job, text, text), Faults, "");
    EXPECT_EXIT(manager->PrepareJob("a", 0, 0, 0, 0, 0), Faults, "");
    EXPECT_EXIT(manager->UploadJob("a", 0, 0, 0, 0), Faults, "");
}

// --- leaf names ------------------------------------------------------------------------------------------

TEST_P(LeafName, IsWhatStandsBehindTheLastSeparator)
{
    EXPECT_EQ(ComGUIManager::LeafName(GetParam().path), GetParam().leaf);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, LeafName,
    testing::Values(LEAF_FACT{"WithoutSeparator_IsThePath", "a.pdf", "a.pdf"},
                    LEAF_FACT{"Empty_IsEmpty", "", ""}, LEAF_FACT{"Slashes", "/a/b/c.pdf", "c.pdf"},
                    LEAF_FACT{"Backslashes", "C:\\a\\c.pdf", "c.pdf"},
                    LEAF_FACT{"BothWithTheSlashLater", "a\\b/c.pdf", "c.pdf"},
                    LEAF_FACT{"BothWithTheBackslashLater", "a/b\\c.pdf", "c.pdf"},
                    LEAF_FACT{"EndsInASlash_IsEmpty", "/a/", ""},
                    LEAF_FACT{"EndsInABackslash_IsEmpty", "a\\", ""}, LEAF_FACT{"Root_IsEmpty", "/", ""},
                    LEAF_FACT{"InUtf8", "/Gr\xC3\xBCn/\xE2\x82\xAC.pdf", "\xE2\x82\xAC.pdf"}),
    [](auto const& fact) { return std::string(fact.param.name); });

// --- announcing a job ------------------------------------------------------------------------------------

TEST_F(PrepareJob, FillsTheRecordInAnOrderOfItsOwn_ByDesign)
{
    manager.PrepareJob("/jobs/a.pdf", 1, 2, 3, 4, 5);
    EXPECT_EQ(command, "remote.job.prepare");
    EXPECT_EQ(size, 540);
    TCommandRecord expected = {};
    expected.nMagic = 0x49494949;
    expected.nSize = 540;
    expected.iArgA = 1;
    expected.iArgB = 5;
    expected.iArgC = 4;
    expected.iResult = 2;
    std::strcpy(expected.szText1, "3");
    std::strcpy(expected.szText2, "$(JOB)/a.pdf");
    EXPECT_EQ(std::memcmp(&sent, &expected, sizeof sent), 0);
}

TEST_F(PrepareJob, NegativeC_LeavesTheFirstTextAllZero)
{
    for (int const c : {-1, INT_MIN})
    {
        manager.PrepareJob("a", 0, 0, c, 0, 0);
        char const zero[258] = {};
        EXPECT_EQ(std::memcmp(sent.szText1, zero, sizeof zero), 0);
    }
}

TEST_F(PrepareJob, COf0OrMore_IsDecimalText)
{
    manager.PrepareJob("a", 0, 0, 0, 0, 0);
    EXPECT_STREQ(sent.szText1, "0");
    manager.PrepareJob("a", 0, 0, INT_MAX, 0, 0);
    EXPECT_STREQ(sent.szText1, "2147483647");
}

TEST_F(PrepareJob, Path_GoesWithItsLeafNameAlone)
{
    EXPECT_EQ(TextOf("/a\\b/c.pdf"), "$(JOB)/c.pdf");
    EXPECT_EQ(TextOf("c.pdf"), "$(JOB)/c.pdf");
    EXPECT_EQ(TextOf("/a/"), "$(JOB)/");
    EXPECT_EQ(TextOf(""), "$(JOB)/");
}

TEST_F(PrepareJob, TextOf257Bytes_EndsWithAZeroByte)
{
    std::string const leaf(250, 'n');
    EXPECT_EQ(TextOf("/a/" + leaf), "$(JOB)/" + leaf);
    EXPECT_EQ(sent.szText2[257], '\0');
}

TEST_F(PrepareJob, TextOf258BytesOrMore_FillsTheFieldWithoutAZeroByte_ByDesign)
{
    EXPECT_EQ(TextOf(std::string(251, 'n')), "$(JOB)/" + std::string(251, 'n'));
    EXPECT_EQ(TextOf(std::string(250, 'n') + "xyz"), "$(JOB)/" + std::string(250, 'n') + "x");
    EXPECT_EQ(sent.szText2[257], 'x');
}

TEST_F(PrepareJob, Result_IsTheServersAnswer)
{
    for (int const answer : {4711, 0, -5})
    {
        result = answer;
        EXPECT_EQ(manager.PrepareJob("a", 0, 0, 0, 0, 0), answer);
    }
}

TEST_F(PrepareJob, AnyCode_IsMinus1WhateverTheAnswer)
{
    result = 4711;
    for (int const failure : {115, -7})
    {
        code = failure;
        EXPECT_EQ(manager.PrepareJob("a", 0, 0, 0, 0, 0), -1);
    }
}

TEST_F(PrepareJob, ServerThatLeavesTheRecord_ReturnsB_ByDesign)
{
    module.onCommand = nullptr;
    EXPECT_EQ(manager.PrepareJob("a", 1, 2, 3, 4, 5), 2);
}

// --- sending a job ---------------------------------------------------------------------------------------

TEST_F(UploadJob, FillsTheRecordInAnOrderOfItsOwn_ByDesign)
{
    EXPECT_EQ(manager.UploadJob("/jobs/a.pdf", 1, 2, 3, 4), 1);
    TJobIdentification expected = {};
    expected.nSize = 160;
    expected.iJobArg1 = 4;
    expected.iJobArg2 = 2;
    expected.iJobArg3 = 1;
    expected.iJobArg4 = 3;
    expected.pszUploadFolder = sent.pszUploadFolder;
    EXPECT_EQ(std::memcmp(&sent, &expected, sizeof sent), 0);
    EXPECT_EQ(folder, std::string("$(UPLOADJOB)\0", 13));
}

TEST_F(UploadJob, SendsThePathAndItsLeafName)
{
    manager.UploadJob("/jobs\\Gr\xC3\xBCn.pdf", 0, 0, 0, 0);
    EXPECT_EQ(path, "/jobs\\Gr\xC3\xBCn.pdf");
    EXPECT_EQ(name, "Gr\xC3\xBCn.pdf");
    manager.UploadJob("a.pdf", 0, 0, 0, 0);
    EXPECT_EQ(path, "a.pdf");
    EXPECT_EQ(name, "a.pdf");
    EXPECT_THAT(module.calls, ElementsAre("SendJobEntry", "SendJobEntry"));
}

TEST_F(UploadJob, RefusedJob_Is0WhateverTheCode)
{
    for (int const failure : {1, -1, 113, INT_MIN})
    {
        module.results["SendJobEntry"] = failure;
        EXPECT_EQ(manager.UploadJob("a", 0, 0, 0, 0), 0);
    }
}

TEST_F(UploadJob, WithoutMemoryForTheFolder_Is0AndNothingIsSent)
{
    std::string shortPath = "a.pdf";  // needs no memory of its own
    int result = -1;
    {
        ScarceMemory const scarce(0);
        result = manager.UploadJob(std::move(shortPath), 0, 0, 0, 0);
    }
    EXPECT_EQ(result, 0);
    EXPECT_THAT(module.calls, IsEmpty());
}
