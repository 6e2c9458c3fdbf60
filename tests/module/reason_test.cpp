// local.get.reason: why a call of this thread was refused, in the words of stderr.
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "standin/module/ModuleCodes.h"
#include "tests/module/NotificationListener.h"
#include "tests/module/ValueText.h"
#include <filesystem>
#include <functional>
#include <gmock/gmock.h>
#include <thread>

using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

namespace
{
class Reasons : public ClientTest
{
protected:
    Reasons() { Reason(); }  // another test's

    int Send(void* hSession, char const* command, int size, void const* data) const
    {
        return module->SendCommandEntry(module.Instance(), hSession, command, size, const_cast<void*>(data));
    }
    int Ask(TICKET const& ticket, void* hSession = nullptr) const
    {
        return Send(hSession, "local.get.reason", 0, ticket.Access());
    }
    std::string Reason() const { return TakeReason(module); }
    int PutFile(std::string source) const
    {
        char target[] = "$(TEMP)/a";
        return module->PutFileSyncEntry(module.Instance(), other.Session(), source.data(), target);
    }

    // Leaves a reason that begins with the path.
    void BeRefused(std::string const& path = "/before") const
    {
        ASSERT_EQ(PutFile(path), MODULE_SOURCE_UNREADABLE);
    }

    TICKET_FACTORY const factory{};
};

std::string StderrOf(std::function<void()> const& work)
{
    testing::internal::CaptureStderr();
    work();
    return testing::internal::GetCapturedStderr();
}
}  // namespace

TEST_F(Reasons, OfARefusedCall_IsGivenOnce)
{
    std::string line = StderrOf([&] { BeRefused("/missing"); });
    ASSERT_EQ(line.find('\n'), line.size() - 1);
    line.pop_back();
    TICKET const ticket(factory, nullptr);
    ticket.Set("Reason/Text", "stale");
    ticket.Set("Reason/Text", 7, 1);
    EXPECT_EQ(Ask(ticket), MODULE_DONE);
    EXPECT_THAT(ContentOf(ticket.Access()), ElementsAre("Reason/Text@0='" + line + "'"));
    EXPECT_THAT(line, StartsWith("/missing: cannot be read"));
    EXPECT_EQ(Ask(ticket), MODULE_DONE);
    EXPECT_THAT(ContentOf(ticket.Access()), IsEmpty());
}

TEST_F(Reasons, WithoutARefusedCall_AreNone)
{
    TICKET const ticket(factory, nullptr);
    ticket.Set("Other", 7);
    EXPECT_EQ(Ask(ticket), MODULE_DONE);
    EXPECT_THAT(ContentOf(ticket.Access()), ElementsAre("Other@0=7"));
}

TEST_F(Reasons, NeedNoSessionAndNoSize)
{
    void* const ended = LogIn();
    module->LogoutEntry(module.Instance(), ended);
    TICKET const ticket(factory, nullptr);
    int unknown = 0;
    for (void* const hSession :
         {static_cast<void*>(nullptr), static_cast<void*>(&unknown), ended, admin.Session()})
        for (int const size : {0, -1, 7})
        {
            StderrOf([&] { BeRefused(); });
            EXPECT_EQ(Send(hSession, "local.get.reason", size, ticket.Access()), MODULE_DONE);
            EXPECT_THAT(ticket.Text("Reason/Text"), StartsWith("/before"));
        }
}

TEST_F(Reasons, NeedAnInstanceAndATicketThatTakesThem)
{
    TICKET const ticket(factory, nullptr);
    STICKET_ACCESS const* const others = other.Open(0, 0);
    ASSERT_TRUE(others);
    EXPECT_EQ(Send(nullptr, "local.get.reason", 0, nullptr), MODULE_INVALID_ARGUMENT);
    StderrOf([&] { BeRefused(); });
    EXPECT_EQ(Send(nullptr, "local.get.reason", 0, others), MODULE_INVALID_ARGUMENT);
    EXPECT_EQ(module->SendCommandEntry(nullptr, nullptr, "local.get.reason", 0,
                                       const_cast<STICKET_ACCESS*>(ticket.Access())),
              MODULE_UNKNOWN_INSTANCE);
    EXPECT_EQ(Send(admin.Session(), "local.get.Reason", 0, ticket.Access()), MODULE_NOT_SUPPORTED);
    EXPECT_EQ(Send(admin.Session(), "local.get.reason2", 0, ticket.Access()), MODULE_NOT_SUPPORTED);
    EXPECT_EQ(Send(nullptr, "local.get.Reason", 0, ticket.Access()), MODULE_UNKNOWN_SESSION);
    EXPECT_EQ(Send(nullptr, nullptr, 0, ticket.Access()), MODULE_UNKNOWN_SESSION);
    EXPECT_THAT(ContentOf(ticket.Access()), IsEmpty());
}

// Whatever is refused with one line on stderr has that for its reason.
TEST_F(Reasons, AreTheLinesOfStderr)
{
    char local[] = "/missing";
    char elsewhere[] = "$(TEMP)";
    char escape[] = "$(TEMP)/../a";
    TJobIdentification job{};
    job.nSize = sizeof job;
    job.pszUploadFolder = elsewhere;
    TCommandRecord record{};
    record.nMagic = 0x49494949;
    record.nSize = sizeof record;
    std::string const bad = folder.Write("bad.xml", "<no ticket/>").string();
    std::string const gone = folder.Write("gone/a.xml", EmptyTicket).string();
    STICKET_ACCESS const* unsaved = factory.Create(gone.c_str());
    ASSERT_TRUE(unsaved->SSETPARAMETER(unsaved->Instance, "Key", PARAM_STRING, "value", -1));
    std::filesystem::remove_all(folder.Path() / "gone");
    void* const i = module.Instance();
    void* const session = other.Session();
    std::function<void()> const refusals[] = {
        [&] { module->PutFileSyncEntry(i, session, local, elsewhere); },
        [&] { module->GetFileSyncEntry(i, session, elsewhere, local); },
        [&] { module->PutFileEntry(i, session, local, escape); },
        [&] { module->GetFileEntry(i, session, escape, local); },
        [&] { module->SendJobEntry(i, session, &job, local, local); },
        [&] { Send(session, "remote.job.prepare", sizeof record, &record); },
        [&] { Send(session, "local.set.previewfolder", 8, "relative"); },
        [&] { Send(session, "local.set.thumbnailfolder", 8, "/missing"); },
        [&] { EXPECT_FALSE(factory.Create(bad.c_str())); },
        [&] { factory.Destroy(unsaved); },
    };
    for (auto const& refusal : refusals)
    {
        auto const which = &refusal - refusals;
        std::string const line = StderrOf(refusal);
        EXPECT_NE(line, "") << which;
        EXPECT_EQ(Reason() + "\n", line) << which;
    }
}

TEST_F(Reasons, OfAnUnusableSite_AreThere)
{
    folder.Write("file", "no folder");
    UseSite(folder.Path() / "file" / "site");
    RECORD record;
    void* const i = module.Instance();
    std::function<int()> const calls[] = {
        [&] { return module->IsAliveEntry(i, "localhost", 50000); },
        [&] { return module->InitializeEntry(i, &record, 0); },
        [&] { return module->LoginEntry(i, &record); },
    };
    for (auto const& call : calls)
    {
        std::string const line = StderrOf([&] { EXPECT_EQ(call(), MODULE_SITE_UNAVAILABLE); });
        EXPECT_THAT(line, HasSubstr("file"));
        EXPECT_EQ(Reason() + "\n", line);
    }
}

// On stderr nothing is said of these.
TEST_F(Reasons, OfWritesThatAreRefusedSilently_AreThere)
{
    STICKET_ACCESS const* const system = other.Open(0, 0);
    STICKET_ACCESS const* const deleted = admin.Open(3, 1);
    ASSERT_EQ(admin.Operate(3, 1, MTICKET_OP_DELETE), 1);
    int const value = 7;
    SETMULTIPAR table[2] = {};
    table[0] = {"Key", PARAM_INT, 0, &value, -1, true, {}};
    auto const& access = *other.Access();
    auto const folderWrite = [&]
    {
        return admin.Access()->MSETPARAMETER(admin.Access()->Instance, 0, 0, "System/Folders/Temp",
                                             PARAM_STRING, "$(NOWHERE)/a", -1);
    };
    std::string const system1 = "operator may not write the system's tickets: only administrators may";
    std::string const users = "operator may not write other users' tickets: only administrators may";
    std::tuple<std::function<int()>, std::string> const facts[] = {
        {[&] { return other.Write(0, 0, "Key", 7); }, system1},
        {[&] { return access.MSETMULTIPAR(access.Instance, 0, 0, table); }, system1},
        {[&] { return system->SSETPARAMETER(system->Instance, "Key", PARAM_INT, &value, -1); }, system1},
        {[&] { return system->SSETMULTIPAR(system->Instance, table); }, system1},
        {[&] { return other.Create(0, 7) ? 1 : 0; }, system1},
        {[&] { return other.Write(17, 1, "Key", 7); }, users},
        {[&] { return other.CreateNext(17) > 0 ? 1 : 0; }, users},
        {[&] { return other.Operate(17, 1, MTICKET_OP_DELETE); }, users},
        {[&] { return other.Operate(17, 2, MTICKET_OP_DELETE); },
         "operator may not delete users' tickets: only administrators may"},
        {[&] { return admin.Operate(0, 0, MTICKET_OP_DELETE); }, "the system's tickets are never deleted"},
        {[&] { return other.Write(3, 999, "Key", 7); }, "ticket 3/999 is not there"},
        {[&] { return other.Operate(3, 999, MTICKET_OP_DELETE); }, "ticket 3/999 is not there"},
        {[&] { return deleted->SSETPARAMETER(deleted->Instance, "Key", PARAM_INT, &value, -1); },
         "ticket 3/1 is not there"},
        {folderWrite,
         "System/Folders/Temp: with this value clients could not resolve the folders; let a folder begin "
         "only with the variable of one above it"},
    };
    for (auto const& [refuse, reason] : facts)
    {
        int result = 1;
        EXPECT_EQ(StderrOf([&, &call = refuse] { result = call(); }), "");
        EXPECT_EQ(result, 0) << reason;
        EXPECT_EQ(Reason(), reason);
    }
}

// The code says it all, or the client knows what it did.
TEST_F(Reasons, OfACallThatIsRefusedWithoutOne_AreNoneOfBefore)
{
    RECORD wrongPassword("admin", "wrong");
    RECORD unknownUser("nobody", "admin");
    RECORD elsewhere("admin", "admin", "elsewhere.example");
    void* const i = module.Instance();
    auto const& access = *other.Access();
    int size = 0;
    std::function<bool()> const refusals[] = {
        [&] { return module->LoginEntry(i, &wrongPassword) == MODULE_LOGIN_REFUSED; },
        [&] { return module->LoginEntry(i, &unknownUser) == MODULE_LOGIN_REFUSED; },
        [&] { return module->LoginEntry(i, &elsewhere) == MODULE_NO_SERVER_THERE; },
        [&] { return module->IsAliveEntry(i, nullptr, 0) == MODULE_INVALID_ARGUMENT; },
        [&] { return module->Open(nullptr) == MODULE_INVALID_ARGUMENT; },
        [&] { return module->LogoutEntry(i, nullptr) == MODULE_UNKNOWN_SESSION; },
        [&] { return module->LogoutEntry(nullptr, nullptr) == MODULE_UNKNOWN_INSTANCE; },
        [&] { return !Container(nullptr); },
        [&]
        {
            return module->GetTicketDataEntry(i, other.Session(), 3, 999, 0, &size, nullptr) ==
                   MODULE_UNKNOWN_TICKET;
        },
        [&] { return Send(other.Session(), "unknown", 0, nullptr) == MODULE_NOT_SUPPORTED; },
        [&] { return access.MSETPARAMETER(nullptr, 3, 1, "Key", PARAM_NONE, nullptr, -1) == 0; },
        [&] { return access.MSETPARAMETER(access.Instance, 3, 1, nullptr, PARAM_NONE, nullptr, -1) == 0; },
        [&] { return other.Delete(3, 1, "Key", -2) == 0; },
        [&] { return other.Operate(3, 1, 99) == 0; },
        [&] { return !factory.Create((folder.Path() / "missing.xml").c_str()); },
        [&] { return Send(nullptr, "local.get.reason", 0, nullptr) == MODULE_INVALID_ARGUMENT; },
    };
    for (auto const& isRefused : refusals)
    {
        StderrOf([&] { BeRefused(); });
        EXPECT_EQ(StderrOf([&] { EXPECT_TRUE(isRefused()) << &isRefused - refusals; }), "");
        EXPECT_EQ(Reason(), "none") << &isRefused - refusals;
    }
}

TEST_F(Reasons, StayUntilTheyAreAskedFor_WhateverSucceedsOrIsReadMeanwhile)
{
    StderrOf([&] { BeRefused(); });
    EXPECT_EQ(other.Write(3, 1, "Key", 7), 1);
    EXPECT_EQ(other.Read(3, 1, "Key"), 7);
    EXPECT_EQ(other.Read(3, 1, "no such key"), -1);
    EXPECT_EQ(other.Read(3, 999, "no such ticket"), -1);
    EXPECT_EQ(module->IsAliveEntry(module.Instance(), "localhost", 50000), MODULE_DONE);
    EXPECT_TRUE(LogIn());
    TICKET const ticket(factory, nullptr);
    EXPECT_EQ(ticket.Int("missing"), -1);
    EXPECT_THAT(Reason(), StartsWith("/before"));
}

// Of a record that is refused in a table that is carried out, its ok tells.
TEST_F(Reasons, OfTablesThatAreCarriedOut_AreNone)
{
    SETMULTIPAR table[2] = {};
    table[0] = {"System/Folders/Temp", PARAM_STRING, 0, "$(NOWHERE)/a", -1, true, {}};
    auto const& access = *admin.Access();
    EXPECT_EQ(access.MSETMULTIPAR(access.Instance, 0, 0, table), 1);
    EXPECT_FALSE(table[0].ok);
    EXPECT_EQ(Reason(), "none");
}

TEST_F(Reasons, OfACallWithinAWalk_AreThereAtOnce)
{
    std::function<void()> const within = [&]
    {
        EXPECT_EQ(other.Write(0, 0, "Key", 7), 0);
        EXPECT_THAT(Reason(), StartsWith("operator may not write"));
        EXPECT_EQ(other.Write(3, 999, "Key", 7), 0);
    };
    auto const action = [](void* context, int, int, STICKET_ACCESS const*)
    {
        (*static_cast<std::function<void()> const*>(context))();
        return false;
    };
    auto const& access = *other.Access();
    EXPECT_EQ(access.MWALKTICKETS(access.Instance, action, const_cast<std::function<void()>*>(&within), 3),
              1);
    EXPECT_EQ(Reason(), "ticket 3/999 is not there");
}

// The thread that carries the file is the server's own; the end is told by its notification.
TEST_F(Reasons, OfATransferThatFailsLater_AreNotOfWhoBeganIt)
{
    LISTENER listener;
    other.Register(listener);
    char source[] = "/missing";
    char target[] = "$(TEMP)/a";
    StderrOf(
        [&]
        {
            EXPECT_EQ(module->PutFileEntry(module.Instance(), other.Session(), source, target), MODULE_DONE);
            EXPECT_EQ(listener.Wait(1).size(), 1u);
        });
    EXPECT_EQ(Reason(), "none");
    other.Logout();
}

TEST_F(Reasons, BelongToTheThreadThatWasRefused)
{
    testing::internal::CaptureStderr();
    std::vector<std::thread> threads;
    for (int number = 0; number < 4; ++number)
        threads.emplace_back(
            [this, path = "/missing " + std::to_string(number)]
            {
                EXPECT_EQ(Reason(), "none");
                for (int i = 0; i < 200; ++i)
                {
                    BeRefused(path);
                    EXPECT_EQ(other.Write(3, 1, "Key", i), 1);
                    EXPECT_THAT(Reason(), StartsWith(path + ": "));
                    EXPECT_EQ(Reason(), "none");
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    testing::internal::GetCapturedStderr();
    EXPECT_EQ(Reason(), "none");
}
