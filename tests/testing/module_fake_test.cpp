// The plug-in in the process, as the library and the client kit see it.
#include "comgui/client.h"
#include "comgui/comgui.h"
#include "comgui/testing.h"
#include <chrono>
#include <gmock/gmock.h>
#include <thread>

using namespace std::chrono_literals;
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

std::vector<std::string> SlotCalls(ModuleFake const& module)
{
    std::vector<std::string> calls;
    for (std::string const& call : module.Calls())
        if (call.find("MGETPARAMETER") == 0 || call.find("MSETPARAMETER") == 0)
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
    EXPECT_THAT(SlotCalls(module), Contains("MSETPARAMETER 3/1 Job/Copies[-1]=int 3"));
    EXPECT_TRUE(tickets.Write({3, job.id}, "Job/Name", "page.pdf"));
    EXPECT_THAT(SlotCalls(module), Contains("MSETPARAMETER 3/1 Job/Name[-1]=text 'page.pdf'"));
    EXPECT_TRUE(tickets.Read({3, job.id}, "Job/Copies"));
    EXPECT_THAT(SlotCalls(module), Contains("MGETPARAMETER 3/1 Job/Copies[0]"));
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
    comgui::TaskQueue queue;
    std::vector<std::string> heard;
    auto const subscription =
        connection.Subscribe(comgui::Interest::InTypes({3}), queue.GetExecutor(),
                             [&](comgui::Event const& event)
                             {
                                 if (auto const* const change = std::get_if<comgui::TicketChanged>(&event))
                                     for (comgui::KeyChange const& key : change->keys)
                                         heard.push_back(key.key);
                             });
    module.Put(job, "Job/State", 1);
    for (auto const end = std::chrono::steady_clock::now() + 20s;
         heard.empty() && std::chrono::steady_clock::now() < end;)
        queue.RunFor(5ms);
    EXPECT_THAT(heard, ElementsAre("Job/State"));
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
    module.Answer("MSETPARAMETER", 1);
    EXPECT_EQ(tickets.Write({3, job.id}, "A", 2).GetError().code, comgui::WriteRefused);
    EXPECT_EQ(module.Read(job, "A"), Value(1));
    module.Answer("MSETPARAMETER", 0);
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
            if (call == "MGETPARAMETER 3/1 A[0]")
                module.Put(job, "A", 7);
        });
    EXPECT_EQ(*tickets.ReadAs<int>({3, job.id}, "A"), 7);
    module.OnCall(nullptr);
    module.Put(job, "A", 8);
    EXPECT_EQ(*tickets.ReadAs<int>({3, job.id}, "A"), 8);
}

TEST(ModuleFakeOfTheManager, IsFoundLikeAnyPlugIn)
{
    ModuleFake module;
    module.Use();
    auto& manager = *ComGUIManager::GetInstance();
    ASSERT_EQ(manager.Initialize("anna", "secret", "localhost", 50000), 0);
    ASSERT_EQ(manager.Login("anna", "secret", "localhost", 50000), 0);
    MTICKET_ACCESS const* const all = manager.GetClientContainer();
    ASSERT_TRUE(all);
    char const* name = nullptr;
    EXPECT_EQ(all->MGETPARAMETER(all->Instance, 0, 0, "System/Name", PARAM_STRING, &name, -1), 1);
    EXPECT_STREQ(name, "a fake");
    manager.Logout();
    EXPECT_THAT(module.Calls(), ElementsAre("InitializeEntry", "LoginEntry anna",
                                            "MGETPARAMETER 0/0 System/Name[0]", "LogoutEntry"));
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
