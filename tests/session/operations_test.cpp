// What holds for every operation that is little more than a call of an entry: which table it reads, which
// entries it calls, whose record it hands over, and that nothing else in a record changes.
#include "comgui/session/ComGUIManager.h"

#include "comgui/foundation/stracpy.h"
#include "tests/session/FakeModule.h"
#include "tests/session/Records.h"
#include "tests/session/Sleep.h"
#include <cstdlib>
#include <functional>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAreArray;

namespace
{
using TEXTS = std::vector<std::string>;

struct OPERATION
{
    char const* name;
    void (*call)(ComGUIManager& manager, TLogin* given);
    TEXTS entries;
    bool usesGiven;  // its record or session is the given one, not the manager's
    std::function<void(TLogin& record)> change = [](TLogin&) {};  // what becomes of that record
};

class Operation : public WithManager, public testing::WithParamInterface<OPERATION>
{
protected:
    Operation()
    {
        insteadOfSleeping = [](int) {};
        *own = RecordFullOf('o');
        own->hSession = &ownSession;
        *given = RecordFullOf('g');
        given->hSession = &givenSession;
    }

    ~Operation() override
    {
        insteadOfSleeping = nullptr;
        manager.Login(own);  // may have another one now
        std::free(given);
    }

    void Call() { GetParam().call(manager, given); }

    char ownSession = 0;
    char givenSession = 0;
    TLogin* const given = NewRecord();
};

std::vector<OPERATION> Operations()
{
    auto const preparedByRecord = [](TLogin& record)
    {
        record.iClientStamp = 99;
        record.iLocalPort = 50106;
    };
    auto const preparedBackward = [](TLogin& record)
    {
        record.iClientStamp = 99;
        record.iLocalPort = 50005;
    };
    auto const addressed = [](TLogin& record)
    { stracpy(record.szLocalAddress, "10.20.30.200", sizeof record.szLocalAddress); };

    TEXTS const initialize{"InitializeEntry"};
    TEXTS const login{"LoginEntry"};
    TEXTS const logout{"LogoutEntry"};
    TEXTS const uninitialize{"UninitializeEntry"};
    TEXTS const uninitializeAsync{"UninitializeAsyncEntry"};
    TEXTS const isAlive{"IsAliveEntry", "GetLocalAddressEntry"};
    TEXTS const container{"GetClientContainerEntry"};
    TEXTS const ticketData{"GetTicketDataEntry"};
    TEXTS const command{"SendCommandEntry"};
    TEXTS const putFile{"PutFileEntry"};
    TEXTS const getFile{"GetFileEntry"};
    TEXTS const sendJob{"SendJobEntry"};
    static char text[] = "text";
    using M = ComGUIManager;
    using R = TLogin*;
    return {
        {"InitializeByRecord", [](M& m, R r) { m.Initialize(r, 99); }, initialize, true, preparedByRecord},
        {"InitializeBackward", [](M& m, R r) { m.InitializeBackward(r, 99); }, initialize, true,
         preparedBackward},
        {"LoginByRecord", [](M& m, R r) { m.Login(r); }, login, true},
        {"LoginBackward", [](M& m, R r) { m.LoginBackward(r); }, login, true},
        {"Logout", [](M& m, R) { m.Logout(); }, logout, false},
        {"LogoutByRecord", [](M& m, R r) { m.Logout(r); }, logout, true},
        {"LogoutBackward", [](M& m, R r) { m.LogoutBackward(r); }, logout, true},
        {"Uninitialize", [](M& m, R) { m.Uninitialize(); }, uninitialize, false},
        {"UninitializeByRecord", [](M& m, R r) { m.Uninitialize(r); }, uninitialize, true},
        {"UninitializeAsync", [](M& m, R) { m.UninitializeAsync(); }, uninitializeAsync, false},
        {"UninitializeAsyncByRecord", [](M& m, R r) { m.UninitializeAsync(r); }, uninitializeAsync, true},
        {"IsAlive", [](M& m, R r) { m.IsAlive(r); }, isAlive, true, addressed},
        {"IsServerOnline", [](M& m, R r) { m.IsServerOnline(r); }, isAlive, true, addressed},
        {"GetClientContainer", [](M& m, R) { m.GetClientContainer(); }, container, false},
        {"GetHandleToClientContainer", [](M& m, R r) { m.GetHandleToClientContainer(r); }, container, true},
        {"GetBackwardContainer",
         [](M& m, R r)
         {
             m.LoginBackward(r);
             m.GetBackwardContainer();
         },
         {"LoginEntry", "GetClientContainerEntry"},
         true},
        {"GetTicketData", [](M& m, R) { m.GetTicketData(0, 0, 0, nullptr, nullptr); }, ticketData, false},
        {"GetTicketDataByRecord", [](M& m, R r) { m.GetTicketData(r, 0, 0, 0, nullptr, nullptr); },
         ticketData, true},
        {"SendCommand", [](M& m, R) { m.SendCommand(text, 0, nullptr); }, command, false},
        {"SendCommandByRecord", [](M& m, R r) { m.SendCommand(r, text, 0, nullptr); }, command, true},
        {"SendCommandByNull", [](M& m, R) { m.SendCommand(nullptr, text, 0, nullptr); }, command, false},
        {"IsAliveByCommand", [](M& m, R) { m.IsAlive(text, 0); }, command, false},
        {"IsServerOnlineByCommand", [](M& m, R) { m.IsServerOnline(); }, command, false},
        {"PutFile", [](M& m, R) { m.PutFile(text, text); }, putFile, false},
        {"PutFileByRecord", [](M& m, R r) { m.PutFile(r, text, text); }, putFile, true},
        {"PutFileSync", [](M& m, R) { m.PutFileSync(text, text); }, {"PutFileSyncEntry"}, false},
        {"GetFile", [](M& m, R) { m.GetFile(text, text); }, getFile, false},
        {"GetFileByRecord", [](M& m, R r) { m.GetFile(r, text, text); }, getFile, true},
        {"GetFileSync", [](M& m, R) { m.GetFileSync(text, text); }, {"GetFileSyncEntry"}, false},
        {"SendJob", [](M& m, R) { m.SendJob(nullptr, text, text); }, sendJob, false},
        {"SendJobByRecord", [](M& m, R r) { m.SendJob(r, nullptr, text, text); }, sendJob, true},
        {"PrepareJob", [](M& m, R) { m.PrepareJob("a", 0, 0, 0, 0, 0); }, command, false},
        {"UploadJob", [](M& m, R) { m.UploadJob("a", 0, 0, 0, 0); }, sendJob, false},
    };
}
}  // namespace

TEST_P(Operation, ReadsTheCopyOfTheTable)
{
    FakeModule::SpoilTheLiveTable();
    Call();
    EXPECT_THAT(module.calls, ElementsAreArray(GetParam().entries));
}

TEST_P(Operation, HandsOverItsRecordOrSession)
{
    Call();
    EXPECT_TRUE(module.login || module.session || !module.host.empty());
    EXPECT_TRUE(!module.login || module.login == (GetParam().usesGiven ? given : own));
    EXPECT_TRUE(!module.session || module.session == (GetParam().usesGiven ? &givenSession : &ownSession));
    EXPECT_TRUE(module.host.empty() || module.host == given->szServerHost);
}

TEST_P(Operation, ChangesNothingElseInARecord)
{
    TLogin expectedOwn = *own;
    TLogin expectedGiven = *given;
    GetParam().change(GetParam().usesGiven ? expectedGiven : expectedOwn);
    Call();
    EXPECT_THAT(*own, IsRecord(expectedOwn));
    EXPECT_THAT(*given, IsRecord(expectedGiven));
}

INSTANTIATE_TEST_SUITE_P(All, Operation, testing::ValuesIn(Operations()),
                         [](auto const& operation) { return std::string(operation.param.name); });

// --- and those that fill in the manager's record from texts --------------------------------------------

namespace
{
class FromTexts : public WithManager
{
protected:
    FromTexts() { *own = RecordFullOf('o'); }

    // What the record holds once these texts have been filled in.
    static TLogin Expected(char const* user, char const* password, char const* host, int port)
    {
        TLogin record = RecordFullOf('o');
        stracpy(record.szUser, user, sizeof record.szUser);
        stracpy(record.szPassword, password, sizeof record.szPassword);
        stracpy(record.szServerHost, host, sizeof record.szServerHost);
        record.iServerPort = port;
        return record;
    }

    std::string const fits = std::string(127, 'f');
    std::string const tooLong = std::string(128, 'f');
};

using InitializeFromTexts = FromTexts;
using LoginFromTexts = FromTexts;
}  // namespace

TEST_F(InitializeFromTexts, FillsInTheRecordAndNothingElse)
{
    EXPECT_EQ(manager.Initialize("user", "secret", "host", 4711), 0);
    TLogin expected = Expected("user", "secret", "host", 4711);
    expected.iLocalPort = own->iLocalPort;  // of a counter that all tests of a process share
    expected.iClientStamp = 30312656;
    EXPECT_THAT(module.copy, IsRecord(expected));
    EXPECT_THAT(*own, IsRecord(expected));
    EXPECT_EQ(module.login, own);
    EXPECT_EQ(module.stamp, 30312656);
}

TEST_F(InitializeFromTexts, ReadsTheCopyOfTheTable)
{
    FakeModule::SpoilTheLiveTable();
    manager.Initialize("user", "secret", "host", 4711);
    EXPECT_THAT(module.calls, testing::ElementsAre("InitializeEntry"));
}

TEST_F(InitializeFromTexts, KeepsTextsOf127BytesAndCutsLongerOnes)
{
    manager.Initialize(fits.c_str(), tooLong.c_str(), tooLong.c_str(), 1);
    EXPECT_EQ(module.copy.szUser, fits);
    EXPECT_EQ(module.copy.szPassword, fits);
    EXPECT_EQ(module.copy.szServerHost, fits);
}

TEST_F(InitializeFromTexts, NullText_CountsAsEmpty)
{
    manager.Initialize(nullptr, nullptr, nullptr, 1);
    EXPECT_STREQ(module.copy.szUser, "");
    EXPECT_STREQ(module.copy.szPassword, "");
    EXPECT_STREQ(module.copy.szServerHost, "");
}

TEST_F(InitializeFromTexts, Twice_Gives0AndDoesNothing)
{
    manager.Initialize("user", "secret", "host", 4711);
    unsigned int const port = own->iLocalPort;
    *own = RecordFullOf('p');  // as a plug-in may have left it: the stamp is another one, too
    EXPECT_EQ(manager.Initialize("other", "other", "other", 1), 0);
    EXPECT_THAT(*own, IsRecord(RecordFullOf('p')));
    EXPECT_THAT(module.calls, testing::ElementsAre("InitializeEntry"));
    manager.Logout();
    manager.Initialize("user", "secret", "host", 4711);
    EXPECT_EQ(own->iLocalPort, port + 1);  // no port was taken in between
}

TEST_F(LoginFromTexts, FillsInTheRecordAndNothingElse)
{
    EXPECT_EQ(manager.Login("user", "secret", "host", 4711), 0);
    TLogin const expected = Expected("user", "secret", "host", 4711);
    EXPECT_THAT(module.copy, IsRecord(expected));
    EXPECT_THAT(*own, IsRecord(expected));
    EXPECT_EQ(module.login, own);
}

TEST_F(LoginFromTexts, NullTextsAndMinus1_KeepWhatTheRecordHolds)
{
    EXPECT_EQ(manager.Login(nullptr, nullptr, nullptr, -1), 0);
    EXPECT_THAT(module.copy, IsRecord(RecordFullOf('o')));
}

TEST_F(LoginFromTexts, EmptyTextsAndPort0_ReplaceWhatTheRecordHolds)
{
    manager.Login("", "", "", 0);
    EXPECT_THAT(module.copy, IsRecord(Expected("", "", "", 0)));
}

TEST_F(LoginFromTexts, KeepsTextsOf127BytesAndCutsLongerOnes)
{
    manager.Login(fits.c_str(), tooLong.c_str(), tooLong.c_str(), 1);
    EXPECT_EQ(module.copy.szUser, fits);
    EXPECT_EQ(module.copy.szPassword, fits);
    EXPECT_EQ(module.copy.szServerHost, fits);
}
