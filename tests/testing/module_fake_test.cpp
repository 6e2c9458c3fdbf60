// The plug-in in the process, as the library and the client kit see it.
#include "comgui/client.h"
#include "comgui/comgui.h"
#include "comgui/testing.h"
#include "tests/testing/HeardKeys.h"
#include <gmock/gmock.h>

using comgui::test::Address;
using comgui::test::ModuleFake;
using comgui::test::Value;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

namespace
{
class FakedServer : public testing::Test
{
protected:
    FakedServer()
    {
        module.Use();
        EXPECT_TRUE(connection.LogIn({"anywhere", 4711}, {"anna", "any password"}));
    }

    ModuleFake module;
    comgui::Connection connection;
    comgui::Tickets const tickets = connection.GetTickets();
};

// The library's own manager, in a session at whatever fake there is.
ComGUIManager& LoggedIn()
{
    ComGUIManager& manager = *ComGUIManager::GetInstance();
    EXPECT_EQ(manager.Initialize("anna", "secret", "localhost", 50000), 0);
    EXPECT_EQ(manager.Login("anna", "secret", "localhost", 50000), 0);
    return manager;
}

std::vector<std::string> SlotCalls(ModuleFake const& module)
{
    std::vector<std::string> calls;
    for (std::string const& call : module.Calls())
        if (call.find("MGET") == 0 || call.find("MSET") == 0)
            calls.push_back(call);
    return calls;
}
}  // namespace

TEST_F(FakedServer, LogsAnybodyIn_AndWritesItDown)
{
    EXPECT_THAT(module.Calls(), Contains("IsAliveEntry anywhere:4711"));
    EXPECT_THAT(module.Calls(), Contains("LoginEntry anna"));
    EXPECT_THAT(module.Calls(), Contains("SendCommandEntry local.set.callback"));
    EXPECT_TRUE(connection.LogOut());
    EXPECT_THAT(module.Calls(), Contains("LogoutEntry"));
}

TEST_F(FakedServer, ClientAndTest_SeeTheSameTickets)
{
    Address const job = module.Create(3, {{"Job/Copies", 2}, {"Job/Name", std::string("page.pdf")}});
    EXPECT_EQ(*tickets.ReadAs<int>({3, job.id}, "Job/Copies"), 2);
    EXPECT_EQ(*tickets.ReadAs<std::string>({3, job.id}, "Job/Name"), "page.pdf");
    EXPECT_TRUE(tickets.Write({3, job.id}, "Job/Copies", 3));
    EXPECT_EQ(module.Read(job, "Job/Copies"), Value(3));
    EXPECT_TRUE(tickets.Delete({3, job.id}));
    EXPECT_FALSE(module.Exists(job));
}

TEST_F(FakedServer, CallsOfSlots_HaveTicketKeyAndValue)
{
    Address const job = module.Create(3);
    module.ForgetCalls();
    EXPECT_TRUE(tickets.Write({3, job.id}, "Job/Copies", 3));
    EXPECT_THAT(SlotCalls(module), Contains("MSETMULTIPAR 3/1 Job/Copies[-1]=int 3"));
    EXPECT_TRUE(tickets.Write({3, job.id}, "Job/Name", "page.pdf"));
    EXPECT_THAT(SlotCalls(module), Contains("MSETMULTIPAR 3/1 Job/Name[-1]=text 'page.pdf'"));
    EXPECT_TRUE(tickets.Read({3, job.id}, "Job/Copies"));
    EXPECT_THAT(SlotCalls(module), Contains("MGETPARAMETER 3/1 Job/Copies[-1]"));
}

TEST_F(FakedServer, WhatTheTestDoes_IsNoCall)
{
    Address const job = module.Create(3);
    module.ForgetCalls();
    module.Put(job, "A", 1);
    EXPECT_EQ(module.Read(job, "A"), Value(1));
    EXPECT_EQ(module.Read(job, "B"), Value());
    module.Delete(job);
    EXPECT_THAT(SlotCalls(module), IsEmpty());
}

TEST_F(FakedServer, WhatTheTestDoes_IsHeardOf)
{
    Address const job = module.Create(3);
    auto const heard = KeysHeardOf(connection, [&] { module.Put(job, "Job/State", 1); });
    EXPECT_THAT(heard, ElementsAre("Job/State"));
}

TEST_F(FakedServer, TicketThatTheTestCreatesAndDeletes_IsHeardOf)
{
    comgui::TaskQueue queue;
    std::vector<std::string> heard;
    auto const subscription =
        connection.Subscribe(comgui::Interest::InTypes({3}), queue.GetExecutor(),
                             [&](comgui::Event const& event)
                             {
                                 if (std::holds_alternative<comgui::TicketCreated>(event))
                                     heard.emplace_back("created");
                                 if (std::holds_alternative<comgui::TicketDeleted>(event))
                                     heard.emplace_back("deleted");
                             });
    auto const hear = [&](std::size_t count)
    {
        using namespace std::chrono_literals;
        for (auto const end = std::chrono::steady_clock::now() + 20s;
             heard.size() < count && std::chrono::steady_clock::now() < end;)
            queue.RunFor(5ms);
    };
    Address const job = module.Create(3);
    hear(1);
    module.Delete(job);
    hear(2);
    EXPECT_THAT(heard, ElementsAre("created", "deleted"));
}

TEST_F(FakedServer, IdOfATicketThatIsGone_IsNotGivenAgain)
{
    EXPECT_EQ(module.Create(3).id, 1);
    Address const second = module.Create(3);
    module.Delete(second);
    EXPECT_EQ(module.Create(3).id, 3);
}

TEST_F(FakedServer, WhatCannotBeDone_Throws)
{
    EXPECT_THROW(module.Put({3, 99}, "A", 1), std::runtime_error);
    EXPECT_THROW(module.Put({0, 0}, "", 1), std::runtime_error);
    EXPECT_THROW(module.Delete({3, 99}), std::runtime_error);
    EXPECT_THROW(module.Delete({0, 0}), std::runtime_error);
    EXPECT_THROW(module.Create(100), std::runtime_error);
}

TEST_F(FakedServer, Answers_AsItIsTold)
{
    Address const job = module.Create(3, {{"A", 1}});
    module.Answer("MSETMULTIPAR", 1);
    EXPECT_EQ(tickets.Write({3, job.id}, "A", 2).GetError().code, comgui::WriteRefused);
    EXPECT_EQ(module.Read(job, "A"), Value(1));
    module.Answer("MSETMULTIPAR", 0);
    EXPECT_TRUE(tickets.Write({3, job.id}, "A", 2));

    auto const transfers = connection.GetTransfers();
    std::string const here = TESTING_FILE;
    EXPECT_TRUE(transfers.Put(here, "$(TEMP)/a").Wait());
    EXPECT_THAT(module.Calls(), Contains(HasSubstr("PutFileSyncEntry " + here + " $(TEMP)/a")));
    module.Answer("PutFileSyncEntry", 116);
    EXPECT_EQ(transfers.Put(here, "$(TEMP)/a").Wait().GetError().code, 116);

    module.Answer("LoginEntry", 4711);
    EXPECT_EQ(connection.LogIn({"x", 1}, {"a", "b"}).GetError().code, 4711);
}

TEST_F(FakedServer, Commands_AnswerByTheirOwnNames)
{
    module.Answer("remote.job.prepare", 4711);
    EXPECT_EQ(
        connection.GetTransfers().SendJob(TESTING_FILE, {"name", std::nullopt, 2}).Wait().GetError().code,
        4711);
    EXPECT_TRUE(connection.IsServerThere());
}

TEST_F(FakedServer, OnCall_IsCalledBeforeTheCall)
{
    Address const job = module.Create(3, {{"A", 1}});
    module.OnCall(
        [&](std::string const& call)
        {
            if (call.find("MGET") == 0 && call.find(" A[-1]") != std::string::npos)
                module.Put(job, "A", 7);
        });
    EXPECT_EQ(*tickets.ReadAs<int>({3, job.id}, "A"), 7);
    module.OnCall(nullptr);
    module.Put(job, "A", 8);
    EXPECT_EQ(*tickets.ReadAs<int>({3, job.id}, "A"), 8);
}

TEST_F(FakedServer, Answers_ForACommandAndForAllOfThem)
{
    auto const prepare = [&] {
        return connection.GetTransfers()
            .SendJob(TESTING_FILE, {"name", std::nullopt, 2})
            .Wait()
            .GetError()
            .code;
    };
    module.Answer("SendCommandEntry", 5);
    module.Answer("remote.job.prepare", 7);
    EXPECT_EQ(prepare(), 7);
    module.Answer("remote.job.prepare", 0);
    EXPECT_EQ(prepare(), 5);
}

TEST_F(FakedServer, AnswersForNoOtherNames)
{
    EXPECT_THROW(module.Answer("SGETPARAMETER", 1), std::invalid_argument);
    EXPECT_THROW(module.Answer("LoginEntri", 1), std::invalid_argument);
    module.Answer("remote.anything", 1);
}

// Whatever is called, and whatever for.
TEST(ModuleFakeOfTheManager, EverySlot_IsWrittenDownAndCanFail)
{
    ModuleFake module;
    module.Use();
    ComGUIManager& manager = LoggedIn();
    MTICKET_ACCESS const* const all = manager.GetClientContainer();
    module.Create(3, {{"A", 1}});
    int value = 0;
    int id = 0;
    GETMULTIPAR reads[2]{};
    reads[0].key = "A";
    reads[0].type = PARAM_INT;
    reads[0].value = &value;
    reads[0].pos = -1;
    SETMULTIPAR writes[2]{};
    writes[0].key = "A";
    writes[0].type = PARAM_INT;
    writes[0].value = &value;
    writes[0].pos = -1;
    char const* const keys[] = {nullptr};
    auto const nothing = [](void*, int, int, STICKET_ACCESS const*) { return true; };
    struct
    {
        char const* line;
        std::function<int()> call;
    } const slots[] = {
        {"MGETPARAMETER 3/1 A[-1]",
         [&] { return all->MGETPARAMETER(all->Instance, 3, 1, "A", PARAM_INT, &value, -1); }},
        {"MGETMULTIPAR 3/1 A[-1]", [&] { return all->MGETMULTIPAR(all->Instance, 3, 1, reads); }},
        {"MSETPARAMETER 3/1 A[-1]=int 1",
         [&] { return all->MSETPARAMETER(all->Instance, 3, 1, "A", PARAM_INT, &value, -1); }},
        {"MSETMULTIPAR 3/1 A[-1]=int 1", [&] { return all->MSETMULTIPAR(all->Instance, 3, 1, writes); }},
        {"MWALKTICKETS 3", [&] { return all->MWALKTICKETS(all->Instance, nothing, nullptr, 3); }},
        {"MOPERATION 3/-4 create",
         [&] { return all->MOPERATION(all->Instance, 3, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &id); }},
        {"MCREATETICKET 3/9", [&] { return all->MCREATETICKET(all->Instance, 3, 9, keys) != nullptr; }},
        {"MOPERATION 3/9 delete",
         [&] { return all->MOPERATION(all->Instance, 3, 9, MTICKET_OP_DELETE, nullptr); }},
    };
    for (auto const& slot : slots)
    {
        std::string const line = slot.line;
        SCOPED_TRACE(line);
        std::string const name = line.substr(0, line.find(' '));
        module.Answer(name, 1);
        EXPECT_EQ(slot.call(), 0);
        module.Answer(name, 0);
        module.ForgetCalls();
        EXPECT_EQ(slot.call(), 1);
        EXPECT_THAT(module.Calls(), ElementsAre(line));
    }
    module.ForgetCalls();
    EXPECT_EQ(all->MGETPARAMETER(all->Instance, 3, 99, "A", PARAM_INT, &value, -1), 0);
    EXPECT_THAT(module.Calls(), ElementsAre("MGETPARAMETER 3/99 A[-1]"));
    manager.Logout();
}

TEST(ModuleFakeOfTheManager, NextId_IsAboveAllThatWereGiven)
{
    ModuleFake module;
    module.Use();
    ComGUIManager& manager = LoggedIn();
    MTICKET_ACCESS const* const all = manager.GetClientContainer();
    char const* const keys[] = {nullptr};
    ASSERT_TRUE(all->MCREATETICKET(all->Instance, 3, 9, keys));
    ASSERT_TRUE(all->MCREATETICKET(all->Instance, 3, 2, keys));
    EXPECT_EQ(module.Create(3).id, 10);
    manager.Logout();
}

TEST(ModuleFakeOfTheManager, AfterItsEnd_SessionsThatAreLoggedInFail_AndNoWorkIsCalled)
{
    comgui::Connection connection;
    auto const tickets = connection.GetTickets();
    {
        ModuleFake module;
        module.Use();
        ASSERT_TRUE(connection.LogIn({"x", 1}, {"a", "b"}));
        auto calls = std::make_unique<int>(0);
        module.OnCall([&calls](std::string const&) { ++*calls; });
        EXPECT_TRUE(tickets.Read({0, 0}, "System/Name"));
        EXPECT_GT(*calls, 0);
    }
    EXPECT_FALSE(tickets.Read({0, 0}, "System/Name"));
    EXPECT_FALSE(tickets.Write({0, 0}, "A", 1));
    EXPECT_FALSE(tickets.Create(3));
}

TEST(ModuleFakeOfTheManager, IsFoundLikeAnyPlugIn)
{
    ModuleFake module;
    module.Use();
    ComGUIManager& manager = LoggedIn();
    MTICKET_ACCESS const* const all = manager.GetClientContainer();
    ASSERT_TRUE(all);
    char const* name = nullptr;
    EXPECT_EQ(all->MGETPARAMETER(all->Instance, 0, 0, "System/Name", PARAM_STRING, &name, -1), 1);
    EXPECT_STREQ(name, "a fake");
    manager.Logout();
    EXPECT_THAT(module.Calls(), ElementsAre("InitializeEntry", "LoginEntry anna",
                                            "MGETPARAMETER 0/0 System/Name[-1]", "LogoutEntry"));
}

TEST(ModuleFakeOfTheManager, AfterItsEnd_EveryCallFails_AndTheNextOneBeginsAnew)
{
    comgui::Connection connection;
    {
        ModuleFake module;
        module.Use();
        EXPECT_TRUE(connection.LogIn({"x", 1}, {"a", "b"}));
        module.Create(3);
        EXPECT_TRUE(connection.LogOut());
    }
    EXPECT_FALSE(connection.LogIn({"x", 1}, {"a", "b"}));
    ModuleFake next;
    EXPECT_TRUE(connection.LogIn({"x", 1}, {"a", "b"}));
    EXPECT_FALSE(next.Exists({3, 1}));
    EXPECT_THAT(next.Calls(), Not(IsEmpty()));
}
