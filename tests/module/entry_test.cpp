// The entries of the table, each with what it is for and with what it refuses.
#include "tests/module/ModuleUnderTest.h"

#include "standin/module/ModuleCodes.h"
#include "tests/support/ChildProcess.h"
#include <algorithm>
#include <atomic>
#include <cstring>
#include <filesystem>
#include <functional>
#include <pthread.h>
#include <set>
#include <thread>
#include <unistd.h>
#include <vector>

using namespace standin;

namespace
{
void* const NoHandle = reinterpret_cast<void*>(0x123456789A);
}

class Entries : public ModuleTest
{
protected:
    int IsAlive(char const* host, int port) const
    {
        return module->IsAliveEntry(module.Instance(), host, port);
    }
    int Login(RECORD& record) const { return module->LoginEntry(module.Instance(), &record); }
    int TicketData(void* hSession, int type, int id, int format, int* size, void* buffer) const
    {
        return module->GetTicketDataEntry(module.Instance(), hSession, type, id, format, size, buffer);
    }
};

TEST_F(Entries, Codes_KeepClearOfThoseThatTheLibraryGives)
{
    for (int code = MODULE_INVALID_ARGUMENT; code <= MODULE_TRANSFER_CUT; ++code)
        for (int const library : {0, 1, -1, -2005, -9999})
            EXPECT_NE(code, library);
}

TEST_F(Entries, IsAlive_KnowsThisHostByItsNamesAndTheSitesPort)
{
    char own[256] = "";
    ASSERT_EQ(gethostname(own, sizeof own - 1), 0);
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_DONE);
    EXPECT_EQ(IsAlive("LocalHost", 50000), MODULE_DONE);
    EXPECT_EQ(IsAlive("127.0.0.1", 50000), MODULE_DONE);
    EXPECT_EQ(IsAlive(own, 50000), MODULE_DONE);
}

TEST_F(Entries, IsAlive_OtherHostsAndPorts_AreNotThere)
{
    EXPECT_EQ(IsAlive("elsewhere.invalid", 50000), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive("127.0.0.2", 50000), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive("", 50000), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive("localhost", 50001), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive("localhost", 0), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive("localhost", -1), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive(nullptr, 50000), MODULE_INVALID_ARGUMENT);
}

TEST_F(Entries, IsAlive_FollowsAChangeOfTheSitesPort)
{
    auto const* const access = Container(LogIn());
    ASSERT_TRUE(access);
    int const port = 50500;
    EXPECT_TRUE(access->MSETPARAMETER(access->Instance, 0, 0, "System/MasterSOAPPort", PARAM_INT, &port, -1));
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(IsAlive("localhost", 50500), MODULE_DONE);
}

// Nobody can be locked out by the port, not even by who deletes it.
TEST_F(Entries, IsAlive_WithoutAPortThatIsOne_ThePortIsThatOfANewSite)
{
    auto const* const access = Container(LogIn());
    ASSERT_TRUE(access);
    auto const write = [&](PARAM_TYPE type, void const* value)
    { return access->MSETPARAMETER(access->Instance, 0, 0, "System/MasterSOAPPort", type, value, -1); };
    for (int const port : {0, -1, 65536})
    {
        ASSERT_TRUE(write(PARAM_INT, &port));
        EXPECT_EQ(IsAlive("localhost", 50000), MODULE_DONE) << port;
        EXPECT_EQ(IsAlive("localhost", port), MODULE_NO_SERVER_THERE) << port;
    }
    for (int const port : {1, 65535})
    {
        ASSERT_TRUE(write(PARAM_INT, &port));
        EXPECT_EQ(IsAlive("localhost", port), MODULE_DONE);
        EXPECT_EQ(IsAlive("localhost", 50000), MODULE_NO_SERVER_THERE) << port;
    }
    ASSERT_TRUE(write(PARAM_STRING, "50001"));
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_DONE);
    ASSERT_TRUE(write(PARAM_NONE, nullptr));
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_DONE);
    EXPECT_TRUE(Container(LogIn()));
}

// A thread that is cancelled ends behind a call, and leaves nothing locked.
TEST_F(Entries, ThreadThatIsCancelledInACall_EndsBehindIt)
{
    auto const* const access = Container(LogIn());
    ASSERT_TRUE(access);
    for (int round = 0; round < 30; ++round)
    {
        struct Loop
        {
            MTICKET_ACCESS const* access;
            std::atomic<int> calls{0};
        } loop{access};
        auto const work = [](void* context) -> void*
        {
            auto& now = *static_cast<Loop*>(context);
            for (int i = 0;; ++i)
            {
                int read = 0;
                now.access->MSETPARAMETER(now.access->Instance, 3, 1, "Test/Cancelled", PARAM_INT, &i, -1);
                now.access->MGETPARAMETER(now.access->Instance, 2 + i % 2, 1, "Test/Cancelled", PARAM_INT,
                                          &read, -1);
                ++now.calls;
                pthread_testcancel();
            }
        };
        pthread_t thread{};
        ASSERT_EQ(pthread_create(&thread, nullptr, work, &loop), 0);
        while (loop.calls < 3)
            std::this_thread::yield();
        std::this_thread::sleep_for(std::chrono::microseconds(37 * round));
        pthread_cancel(thread);
        void* result = nullptr;
        ASSERT_EQ(pthread_join(thread, &result), 0);
        EXPECT_EQ(result, PTHREAD_CANCELED);
    }
    int const value = 7;
    EXPECT_TRUE(access->MSETPARAMETER(access->Instance, 3, 1, "Test/Cancelled", PARAM_INT, &value, -1));
}

TEST_F(Entries, GetLocalAddress_IsTheLoopbackAddress)
{
    EXPECT_EQ(module->GetLocalAddressEntry(module.Instance(), "localhost", 50000), 0x7F000001u);
    EXPECT_EQ(module->GetLocalAddressEntry(nullptr, nullptr, 0), 0x7F000001u);
}

TEST_F(Entries, Open_DoesNotTouchTheSite)
{
    EXPECT_FALSE(std::filesystem::exists(folder.Path() / "site"));
    IsAlive("localhost", 50000);
    EXPECT_TRUE(std::filesystem::exists(folder.Path() / "site"));
}

TEST_F(Entries, AnUnusableSite_IsToldInOneLineAndTriedAgain)
{
    folder.Write("file", "no folder");
    UseSite(folder.Path() / "file" / "site");
    RECORD record;
    testing::internal::CaptureStderr();
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_SITE_UNAVAILABLE);
    std::string const line = testing::internal::GetCapturedStderr();
    EXPECT_NE(line.find("file"), std::string::npos) << line;
    EXPECT_EQ(std::count(line.begin(), line.end(), '\n'), 1) << line;
    testing::internal::CaptureStderr();
    EXPECT_EQ(Login(record), MODULE_SITE_UNAVAILABLE);
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), MODULE_SITE_UNAVAILABLE);
    testing::internal::GetCapturedStderr();
    EXPECT_EQ(record.hSession, nullptr);

    std::filesystem::remove(folder.Path() / "file");
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_DONE);
}

TEST_F(Entries, Initialize_ChecksTheRecordAndDoesNotLogIn)
{
    RECORD record("nobody", "wrong");
    TLogin const before = record;
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 30312656), MODULE_DONE);
    EXPECT_EQ(std::memcmp(&record, &before, sizeof before), 0);
    EXPECT_EQ(module->InitializeEntry(module.Instance(), nullptr, 0), MODULE_INVALID_ARGUMENT);
    record.nSize = 2631;
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), MODULE_INVALID_ARGUMENT);
}

TEST_F(Entries, Uninitialize_UndoesInitializeOnce)
{
    RECORD record;
    EXPECT_EQ(module->UninitializeEntry(module.Instance(), &record), MODULE_UNKNOWN_RECORD);
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), MODULE_DONE);
    EXPECT_EQ(module->UninitializeEntry(module.Instance(), &record), MODULE_DONE);
    EXPECT_EQ(module->UninitializeEntry(module.Instance(), &record), MODULE_UNKNOWN_RECORD);
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), MODULE_DONE);
    EXPECT_EQ(module->UninitializeAsyncEntry(module.Instance(), &record), MODULE_DONE);
    EXPECT_EQ(module->UninitializeAsyncEntry(module.Instance(), nullptr), MODULE_UNKNOWN_RECORD);
}

TEST_F(Entries, Uninitialize_OfARecordThatAnotherInstanceInitialised_IsRefused)
{
    MODULE const other;
    RECORD record;
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), MODULE_DONE);
    EXPECT_EQ(other->UninitializeEntry(other.Instance(), &record), MODULE_UNKNOWN_RECORD);
    EXPECT_EQ(module->UninitializeEntry(module.Instance(), &record), MODULE_DONE);
}

TEST_F(Entries, Login_FillsInTheSessionsFieldsAndNoOther)
{
    RECORD record("operator", "operator");
    TLogin expected = record;
    EXPECT_EQ(Login(record), MODULE_DONE);
    EXPECT_NE(record.hSession, nullptr);
    expected.hSession = record.hSession;
    expected.iClientStamp = 2;
    expected.iUserRole = 1;
    std::strcpy(expected.szLocalEndPoint, "127.0.0.1:50106");
    EXPECT_EQ(std::memcmp(&record, &expected, sizeof expected), 0);
}

TEST_F(Entries, Login_AnAdministrator_HasRole16)
{
    RECORD record;
    EXPECT_EQ(Login(record), MODULE_DONE);
    EXPECT_EQ(record.iUserRole, 16);
    EXPECT_EQ(record.iClientStamp, 1);
}

TEST_F(Entries, Login_WrongUserOrPassword_IsOneCodeAndLeavesTheRecord)
{
    for (auto const& [user, password] :
         {std::pair{"admin", "wrong"}, {"nobody", "admin"}, {"", ""}, {"Admin", "admin"}})
    {
        RECORD record(user, password);
        TLogin const before = record;
        EXPECT_EQ(Login(record), MODULE_LOGIN_REFUSED) << user;
        EXPECT_EQ(std::memcmp(&record, &before, sizeof before), 0);
    }
}

TEST_F(Entries, Login_ElsewhereOrWithABadRecord_IsRefused)
{
    RECORD host("admin", "admin", "elsewhere.invalid");
    RECORD port("admin", "admin", "localhost", 1);
    RECORD size;
    size.nSize = 0;
    EXPECT_EQ(Login(host), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(Login(port), MODULE_NO_SERVER_THERE);
    EXPECT_EQ(Login(size), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(module->LoginEntry(module.Instance(), nullptr), MODULE_INVALID_ARGUMENT);
}

TEST_F(Entries, Login_TextsWithoutAnEnd_AreReadWithinTheirFields)
{
    RECORD record;
    std::memset(record.szPassword, 'x', sizeof record.szPassword);
    EXPECT_EQ(Login(record), MODULE_LOGIN_REFUSED);
    std::memset(record.szUser, 'x', sizeof record.szUser);
    EXPECT_EQ(Login(record), MODULE_LOGIN_REFUSED);
    std::memset(record.szServerHost, 'x', sizeof record.szServerHost);
    EXPECT_EQ(Login(record), MODULE_NO_SERVER_THERE);
}

TEST_F(Entries, Login_TwiceWithOneUser_GivesTwoSessions)
{
    void* const one = LogIn();
    void* const other = LogIn();
    ASSERT_TRUE(one && other);
    EXPECT_NE(one, other);
    EXPECT_EQ(module->LogoutEntry(module.Instance(), one), MODULE_DONE);
    EXPECT_EQ(Container(one), nullptr);
    EXPECT_NE(Container(other), nullptr);
}

TEST_F(Entries, Logout_AHandleIsNeverUsedAgain)
{
    std::set<void*> handles;
    for (int i = 0; i < 5; ++i)
    {
        void* const hSession = LogIn();
        EXPECT_TRUE(handles.insert(hSession).second);
        EXPECT_EQ(module->LogoutEntry(module.Instance(), hSession), MODULE_DONE);
        EXPECT_EQ(module->LogoutEntry(module.Instance(), hSession), MODULE_UNKNOWN_SESSION);
    }
}

TEST_F(Entries, LoginsInParallel_AllGetTheirOwnSession)
{
    std::vector<std::thread> threads;
    std::vector<void*> handles(4);
    for (void*& handle : handles)
        threads.emplace_back(
            [&]
            {
                handle = LogIn("operator", "operator");
                LogIn("operator", "wrong");
            });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(std::set<void*>(handles.begin(), handles.end()).size(), handles.size());
    EXPECT_EQ(std::count(handles.begin(), handles.end(), nullptr), 0);
}

TEST_F(Entries, UnknownSessions_AreRefusedByEveryEntry)
{
    void* const stale = LogIn();
    EXPECT_EQ(module->LogoutEntry(module.Instance(), stale), MODULE_DONE);
    char text[] = "x";
    int size = 0;
    void* const i = module.Instance();
    for (void* const hSession : {static_cast<void*>(nullptr), stale, NoHandle})
    {
        EXPECT_EQ(module->LogoutEntry(i, hSession), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->GetClientContainerEntry(i, hSession), nullptr);
        EXPECT_EQ(module->GetTicketDataEntry(i, hSession, 0, 0, 0, &size, nullptr), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->SendCommandEntry(i, hSession, "Command", 0, nullptr), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->PutFileEntry(i, hSession, text, text), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->GetFileEntry(i, hSession, text, text), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->PutFileSyncEntry(i, hSession, text, text), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->GetFileSyncEntry(i, hSession, text, text), MODULE_UNKNOWN_SESSION);
        EXPECT_EQ(module->SendJobEntry(i, hSession, nullptr, text, text), MODULE_UNKNOWN_SESSION);
    }
}

TEST_F(Entries, UnknownInstances_AreRefusedByEveryEntry)
{
    void* const hSession = LogIn();
    RECORD record;
    char text[] = "x";
    int size = 0;
    for (void* const i : {static_cast<void*>(nullptr), NoHandle})
    {
        EXPECT_EQ(module->InitializeEntry(i, &record, 0), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->IsAliveEntry(i, "localhost", 50000), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->LoginEntry(i, &record), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->LogoutEntry(i, hSession), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->UninitializeEntry(i, &record), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->UninitializeAsyncEntry(i, &record), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->GetClientContainerEntry(i, hSession), nullptr);
        EXPECT_EQ(module->GetTicketDataEntry(i, hSession, 0, 0, 0, &size, nullptr), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->SendCommandEntry(i, hSession, "Command", 0, nullptr), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->PutFileEntry(i, hSession, text, text), MODULE_UNKNOWN_INSTANCE);
        EXPECT_EQ(module->SendJobEntry(i, hSession, nullptr, text, text), MODULE_UNKNOWN_INSTANCE);
    }
    EXPECT_NE(Container(hSession), nullptr);
}

TEST_F(Entries, UnknownCommand_IsNotSupported)
{
    void* const hSession = LogIn();
    void* const i = module.Instance();
    EXPECT_EQ(module->SendCommandEntry(i, hSession, "Command", 0, nullptr), MODULE_NOT_SUPPORTED);
    EXPECT_EQ(module->SendCommandEntry(i, hSession, nullptr, 0, nullptr), MODULE_INVALID_ARGUMENT);
}

TEST_F(Entries, GetTicketData_GivesTheTicketsXmlOnceTheBufferIsLargeEnough)
{
    void* const hSession = LogIn();
    int size = 0;
    EXPECT_EQ(TicketData(hSession, 0, 0, 0, &size, nullptr), MODULE_BUFFER_TOO_SMALL);
    ASSERT_GT(size, 0);
    int room = size - 1;
    std::string text(static_cast<std::size_t>(size), '?');
    EXPECT_EQ(TicketData(hSession, 0, 0, 0, &room, text.data()), MODULE_BUFFER_TOO_SMALL);
    EXPECT_EQ(room, size);
    EXPECT_EQ(text.find_first_not_of('?'), std::string::npos);
    EXPECT_EQ(TicketData(hSession, 0, 0, 0, &room, text.data()), MODULE_DONE);
    EXPECT_NE(text.find("<ticket version=\"1\" type=\"0\" id=\"0\">"), std::string::npos) << text;
    EXPECT_NE(text.find("System/MasterSOAPPort"), std::string::npos) << text;
}

TEST_F(Entries, GetTicketData_UnknownTicketOrFormatOrNoSize_IsRefused)
{
    void* const hSession = LogIn();
    int size = 42;
    EXPECT_EQ(TicketData(hSession, 3, 999, 0, &size, nullptr), MODULE_UNKNOWN_TICKET);
    EXPECT_EQ(TicketData(hSession, -1, -1, 0, &size, nullptr), MODULE_UNKNOWN_TICKET);
    EXPECT_EQ(TicketData(hSession, 0, 0, 1, &size, nullptr), MODULE_UNKNOWN_FORMAT);
    EXPECT_EQ(TicketData(hSession, 0, 0, 0, nullptr, nullptr), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(size, 42);
}

// It has the parent's handles and none of its threads.
TEST_F(Entries, InAChildMadeByFork_EveryCallFailsAtOnce)
{
    void* const hSession = LogIn();
    auto const* const access = Container(hSession);
    ASSERT_TRUE(access);
    int value = 0;
    ASSERT_TRUE(
        access->MGETPARAMETER(access->Instance, 0, 0, "System/MasterSOAPPort", PARAM_INT, &value, -1));
    STICKET_ACCESS const* const file = module->STicketFactory->CreateTicket(nullptr);
    ASSERT_TRUE(file);
    std::function<bool()> const refused[] = {
        [&] { return IsAlive("localhost", 50000) == MODULE_FAILED; },
        [&] { return !LogIn(); },
        [&] { return module->LogoutEntry(module.Instance(), hSession) == MODULE_FAILED; },
        [&] { return !Container(hSession); },
        [&] {
            return !access->MGETPARAMETER(access->Instance, 0, 0, "System/MasterSOAPPort", PARAM_INT, &value,
                                          -1);
        },
        [&] { return !access->MSETPARAMETER(access->Instance, 3, 1, "K", PARAM_INT, &value, -1); },
        [&] { return !file->SSETPARAMETER(file->Instance, "K", PARAM_INT, &value, -1); },
        [&] { return !module->STicketFactory->CreateTicket(nullptr); },
        [&]
        {
            UseSite((folder.Path() / "another").string());
            return !LogIn();
        },
    };
    ChildProcess child(
        [&](ChildProcess::Report const& report)
        {
            for (auto const& isRefused : refused)
                report(isRefused() ? 1 : 0);
        });
    for (std::size_t call = 0; call < std::size(refused); ++call)
        EXPECT_EQ(child.Next(), 1) << "call " << call;
    EXPECT_EQ(child.Wait(), 0);
    EXPECT_EQ(IsAlive("localhost", 50000), MODULE_DONE) << "the parent is as it was";
    module->STicketFactory->DestroyTicket(const_cast<STICKET_ACCESS const**>(&file));
}
