// No exception leaves the plug-in, whatever an author's function throws, and each becomes the failure of that
// call.
#include "comgui/ticket/TICKET_OP.h"
#include "tests/module_kit/FakePlugIn.h"
#include <array>
#include <gmock/gmock.h>
#include <new>
#include <pthread.h>

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
// What a thrown thing is called, and how to throw it.
struct THROWN
{
    char const* name;
    void (*raise)();
    char const* reason;  // as it is reported
};
constexpr THROWN EveryKind[] = {
    {"Exception", [] { throw std::runtime_error("no disk"); }, "no disk"},
    {"OutOfMemory", [] { throw std::bad_alloc(); }, "bad_alloc"},
    {"Number", [] { throw 7; }, ""},
    {"Text", [] { throw "a text"; }, ""},
};

class Thrown : public PlugInTest, public testing::WithParamInterface<THROWN>
{
protected:
    Thrown() : hSession(LogIn()), container(ContainerOf(hSession)), ticket(NewTicket())
    {
        int const seven = 7;
        EXPECT_EQ(container->MSETPARAMETER(container->Instance, 3, ticket.id, "K", PARAM_INT, &seven, -1), 1);
        EXPECT_EQ(container->MOPERATION(container->Instance, 3, ticket.id, MTICKET_OP_OPEN, &opened), 1);
    }

    // From now on that function throws, and no other.
    void ThrowIn(std::string const& function) const
    {
        fake::Trouble::Set(
            [function, raise = GetParam().raise](std::string const& called)
            {
                if (called == function)
                    raise();
            });
    }

    // The reports since the last time; their reason is the one thrown.
    void ExpectReport(char const* from) const
    {
        auto const lines = fake::Log::Take();
        std::string const begin = std::string(from) + ": ";
        EXPECT_THAT(lines,
                    Contains(testing::AllOf(testing::StartsWith(begin), HasSubstr(GetParam().reason))));
        fake::Trouble::Clear();
    }

    void* hSession;
    MTICKET_ACCESS const* container;
    fake::Address ticket;
    STICKET_ACCESS const* opened = nullptr;
    int value = 42;
};
}  // namespace

TEST_P(Thrown, InRead_IsAFailedRead)
{
    ThrowIn("Read");
    EXPECT_EQ(container->MGETPARAMETER(container->Instance, 3, ticket.id, "K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(value, 42);
    ExpectReport("container");
    ThrowIn("Read");
    EXPECT_EQ(opened->SGETPARAMETER(opened->Instance, "K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(value, 42);
    ExpectReport("container");
}

TEST_P(Thrown, InOneRecordOfATable_LeavesTheOthers)
{
    int calls = 0;
    fake::Trouble::Set(
        [&](std::string const& called)
        {
            if (called == "Read" && ++calls == 2)
                GetParam().raise();
        });
    std::array<int, 3> values{};
    GETMULTIPAR records[] = {{"K", PARAM_INT, 0, &values[0], -1, false, {}},
                             {"K", PARAM_INT, 0, &values[1], -1, true, {}},
                             {"K", PARAM_INT, 0, &values[2], -1, false, {}},
                             {}};
    EXPECT_EQ(container->MGETMULTIPAR(container->Instance, 3, ticket.id, records), 1);
    EXPECT_TRUE(records[0].ok && !records[1].ok && records[2].ok);
    EXPECT_THAT(values, ElementsAre(7, 0, 7));
    ExpectReport("container");
}

TEST_P(Thrown, InWrite_IsARefusedWrite)
{
    ThrowIn("Write");
    EXPECT_EQ(container->MSETPARAMETER(container->Instance, 3, ticket.id, "K", PARAM_INT, &value, -1), 0);
    SETMULTIPAR records[] = {{"K", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_EQ(container->MSETMULTIPAR(container->Instance, 3, ticket.id, records), 1);
    EXPECT_FALSE(records[0].ok);
    ExpectReport("container");
}

TEST_P(Thrown, InAnOperation_IsARefusedOperation)
{
    struct FACT
    {
        char const* function;
        TICKET_OP op;
        int id;
    };
    for (FACT const& fact :
         {FACT{"Exists", MTICKET_OP_OPEN, ticket.id}, FACT{"Delete", MTICKET_OP_DELETE, ticket.id},
          FACT{"CreateNext", MTICKET_OP_CREATE_NEXT, -4}, FACT{"Limit", STICKET_OP_SET_PARTIAL, ticket.id},
          FACT{"OtherOperation", static_cast<MTICKET_OP>(105), ticket.id}})
    {
        void* arg = nullptr;
        ThrowIn(fact.function);
        EXPECT_EQ(container->MOPERATION(container->Instance, 3, fact.id, fact.op, &arg), 0) << fact.function;
        ExpectReport("container");
    }
    ThrowIn("Create");
    EXPECT_EQ(container->MCREATETICKET(container->Instance, 3, 12345, nullptr), nullptr);
    ExpectReport("container");
}

TEST_P(Thrown, InAWalk_EndsIt)
{
    auto const count = [](void*, char const*, PARAM_TYPE, void const*, int) { return true; };
    ThrowIn("All");
    EXPECT_EQ(opened->SWALKPARAMETERS(opened->Instance, count, nullptr, "", 8000), 0);
    ExpectReport("container");
    ThrowIn("Ids");
    EXPECT_EQ(
        container->MWALKTICKETS(
            container->Instance, [](void*, int, int, STICKET_ACCESS const*) { return true; }, nullptr, 3),
        0);
    ExpectReport("container");
}

TEST_P(Thrown, ByTheActionOfAWalk_EndsIt)
{
    void (*raise)() = GetParam().raise;
    auto const fail = [](void* context, char const*, PARAM_TYPE, void const*, int)
    {
        (*static_cast<void (**)()>(context))();
        return true;
    };
    EXPECT_EQ(opened->SWALKPARAMETERS(opened->Instance, fail, static_cast<void*>(&raise), "", 8000), 0);
    ExpectReport("container");
}

TEST_P(Thrown, InAnEntry_IsTheCodeOfAFailure)
{
    char text[] = "text";
    TCommandRecord command{};
    command.nMagic = 0x49494949;
    command.nSize = sizeof command;
    TJobIdentification job{};
    job.nSize = sizeof job;
    job.pszUploadFolder = text;
    std::pair<char const*, std::function<int()>> const entries[] = {
        {"Module::IsAlive", [&] { return table.IsAliveEntry(hInstance, "localhost", fake::Port); }},
        {"Initialize", [&] { return table.InitializeEntry(hInstance, &record, 0); }},
        {"LogIn", [&] { return table.LoginEntry(hInstance, &record); }},
        {"TicketData",
         [&] { return table.GetTicketDataEntry(hInstance, hSession, 3, 1, 0, nullptr, nullptr); }},
        {"PutFile", [&] { return table.PutFileEntry(hInstance, hSession, text, text); }},
        {"PutFile", [&] { return table.PutFileSyncEntry(hInstance, hSession, text, text); }},
        {"GetFile", [&] { return table.GetFileEntry(hInstance, hSession, text, text); }},
        {"GetFile", [&] { return table.GetFileSyncEntry(hInstance, hSession, text, text); }},
        {"SendJob", [&] { return table.SendJobEntry(hInstance, hSession, &job, text, text); }},
        {"OtherCommand", [&] { return table.SendCommandEntry(hInstance, hSession, "known", 0, nullptr); }},
        {"IsAlive",
         [&] { return table.SendCommandEntry(hInstance, hSession, "remote.system.isalive", 540, &command); }},
        {"PrepareJob",
         [&] { return table.SendCommandEntry(hInstance, hSession, "remote.job.prepare", 540, &command); }},
        {"SetFolder",
         [&] { return table.SendCommandEntry(hInstance, hSession, "local.set.previewfolder", 4, text); }},
        {"Around", [&] { return table.IsAliveEntry(hInstance, "localhost", fake::Port); }},
        {"End", [&] { return table.LogoutEntry(hInstance, LogIn()); }},
    };
    for (auto const& [function, call] : entries)
    {
        fake::Log::Take();
        EXPECT_EQ(call(), 0) << function;  // it is this function that is under test
        if (std::string(function) == "Initialize")
        {
            EXPECT_EQ(table.UninitializeEntry(hInstance, &record), 0);
        }
        ThrowIn(function);
        if (std::string(function) != "End")
        {
            EXPECT_EQ(call(), comgui::plugin::Failed) << function;
        }
        else
        {
            fake::Trouble::Clear();
            void* const another = LogIn();
            ThrowIn(function);
            EXPECT_EQ(table.LogoutEntry(hInstance, another), comgui::plugin::Failed);
            EXPECT_EQ(table.LogoutEntry(hInstance, another), comgui::plugin::UnknownSession);
        }
        ExpectReport("module");
    }
    EXPECT_EQ(table.InitializeEntry(hInstance, &record, 0), 0);
    ThrowIn("Uninitialize");
    EXPECT_EQ(table.UninitializeEntry(hInstance, &record), comgui::plugin::Failed);
    ExpectReport("module");
}

TEST_P(Thrown, InAnEntryWithoutACode_IsItsNothing)
{
    ThrowIn("GetContainer");
    EXPECT_EQ(ContainerOf(hSession), nullptr);
    ExpectReport("module");
    ThrowIn("LocalAddress");
    EXPECT_EQ(table.GetLocalAddressEntry(hInstance, "localhost", fake::Port), 0x7F000001u);
    ExpectReport("module");
    ThrowIn("MakeTicket");
    EXPECT_EQ(table.STicketFactory->CreateTicket(nullptr), nullptr);
    ExpectReport("module");
    ThrowIn("OpenTicket");
    EXPECT_EQ(table.STicketFactory->CreateTicket("file"), nullptr);
    ExpectReport("module");
    STICKET_ACCESS const* local = table.STicketFactory->CreateTicket(nullptr);
    ThrowIn("CloseTicket");
    table.STicketFactory->DestroyTicket(&local);
    EXPECT_EQ(local, nullptr);
    ExpectReport("module");
}

INSTANTIATE_TEST_SUITE_P(OfAnyKind, Thrown, testing::ValuesIn(EveryKind),
                         [](auto const& kind) { return std::string(kind.param.name); });

using Refusals = PlugInTest;

TEST_F(Refusals, InAnEntry_GiveTheirCodeWithoutAReport)
{
    fake::Trouble::Set(
        [](std::string const& called)
        {
            if (called == "LogIn")
                throw comgui::plugin::Refused(4321);
        });
    EXPECT_EQ(table.LoginEntry(hInstance, &record), 4321);
    EXPECT_EQ(record.hSession, nullptr);
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

TEST_F(Refusals, InAnEntry_NeverSucceed)
{
    fake::Trouble::Set([](std::string const&) { throw comgui::plugin::Refused(0); });
    EXPECT_EQ(table.IsAliveEntry(hInstance, "localhost", fake::Port), comgui::plugin::Failed);
}

TEST_F(Refusals, InASlot_AreFailuresWithoutAReport)
{
    MTICKET_ACCESS const& container = *ContainerOf(LogIn());
    fake::Trouble::Set([](std::string const&) { throw comgui::plugin::Refused(4321); });
    int value = 42;
    EXPECT_EQ(container.MGETPARAMETER(container.Instance, 0, 0, "K", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(container.MSETPARAMETER(container.Instance, 0, 0, "K", PARAM_INT, &value, -1), 0);
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

class Cancellation : public PlugInTest
{
protected:
    void Call() const { table.IsAliveEntry(hInstance, "localhost", fake::Port); }
};

TEST_F(Cancellation, OfAThreadWithinTheAuthorsFunction_TakesPlaceBehindIt)
{
    static std::atomic<bool> isInside{false};
    static std::atomic<bool> hasReturned{false};
    isInside = hasReturned = false;
    fake::Trouble::Set(
        [](std::string const& called)
        {
            if (called != "Module::IsAlive")
                return;
            isInside = true;
            for (int i = 0; i < 100; ++i)
                pthread_testcancel();
            hasReturned = true;
        });
    pthread_t thread{};
    auto const work = [](void* place) -> void*
    {
        for (;;)
        {
            (*static_cast<std::function<void()>*>(place))();
            pthread_testcancel();
        }
    };
    std::function<void()> call = [this] { Call(); };
    ASSERT_EQ(pthread_create(&thread, nullptr, work, &call), 0);
    while (!isInside)
        std::this_thread::yield();
    ASSERT_EQ(pthread_cancel(thread), 0);
    void* result = nullptr;
    ASSERT_EQ(pthread_join(thread, &result), 0);
    EXPECT_EQ(result, PTHREAD_CANCELED);
    EXPECT_TRUE(hasReturned);
}
