// Logging in and out.
#include "tests/client/Client.h"
#include "tests/support/Threads.h"

#include <chrono>
#include <gmock/gmock.h>
#include <thread>

using namespace comgui;
using testing::HasSubstr;

namespace
{
using ConnectionOfAClient = Client;
}  // namespace

TEST_F(ConnectionOfAClient, LogsIn_AndKnowsItsUser)
{
    auto const user = connection.LogIn(Here(), Admin());
    ASSERT_TRUE(user) << user.GetError().Text();
    EXPECT_EQ(user->name, "admin");
    EXPECT_EQ(user->ticket, (TicketAddress{UserTickets, 1}));
    EXPECT_TRUE(user->isAdministrator);
    EXPECT_TRUE(connection.IsLoggedIn());
    EXPECT_TRUE(connection.IsServerThere());
    EXPECT_FALSE(connection.LogIn(Here(), Operator())->isAdministrator);
}

TEST_F(ConnectionOfAClient, Test_NeedsNoSession)
{
    EXPECT_TRUE(connection.Test(Here()));
    EXPECT_EQ(CodeOf(connection.Test({"localhost", 4711})), ServerAway);
    EXPECT_EQ(CodeOf(connection.Test({"elsewhere.invalid", 50000})), ServerAway);
    EXPECT_FALSE(connection.IsLoggedIn());
}

TEST_F(ConnectionOfAClient, NonsenseOfAUser_IsRefusedBeforeThePlugInSeesIt)
{
    EXPECT_EQ(CodeOf(connection.Test({"", 50000})), BadServer);
    EXPECT_EQ(CodeOf(connection.Test({"localhost", 0})), BadServer);
    EXPECT_EQ(CodeOf(connection.Test({"localhost", 65536})), BadServer);
    EXPECT_EQ(CodeOf(connection.Test({std::string(128, 'h'), 1})), TooLong);
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), {std::string(128, 'u'), ""})), TooLong);
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), {"", std::string(128, 'p')})), TooLong);
}

TEST_F(ConnectionOfAClient, RefusedLogin_KeepsThePortForTheNextOne)
{
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), {"admin", "wrong"})), 107);
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), {"nobody", "admin"})), 107);
    EXPECT_FALSE(connection.IsLoggedIn());
    EXPECT_EQ(connection.LocalEndPoint(), "");
    LogIn();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
    EXPECT_TRUE(connection.LogOut());
    LogIn();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
}

TEST_F(ConnectionOfAClient, Refusal_NamesTheUser)
{
    EXPECT_EQ(connection.LogIn(Here(), {"nobody", "x"}).GetError().Text(), "nobody: wrong user or password");
}

TEST_F(ConnectionOfAClient, LoggedOut_AnswersNotLoggedIn)
{
    LogIn();
    ASSERT_TRUE(connection.LogOut());
    EXPECT_EQ(CodeOf(connection.LogOut()), NotLoggedIn);
    EXPECT_EQ(CodeOf(tickets.List(0)), NotLoggedIn);
    EXPECT_EQ(CodeOf(tickets.ReadAs<int>(System, "System/MasterSOAPPort")), NotLoggedIn);
    EXPECT_EQ(CodeOf(tickets.Write(System, "System/Name", "x")), NotLoggedIn);
    EXPECT_EQ(CodeOf(connection.GetTransfers().Put("/etc/hostname", "$(TEMP)/x").Wait()), NotLoggedIn);
}

TEST_F(ConnectionOfAClient, SeveralAtOnce_DoNotAffectEachOther)
{
    Connection second;
    LogIn();
    ASSERT_TRUE(second.LogIn(Here(), Operator()));
    EXPECT_TRUE(connection.LogOut());
    EXPECT_TRUE(second.IsLoggedIn());
    EXPECT_EQ(*second.GetTickets().ReadAs<int>(System, "System/MasterSOAPPort"), 50000);
}

TEST_F(ConnectionOfAClient, End_LeavesNoThread_PrintsNothing_AndTakesNoFourSeconds)
{
    LogIn();
    EXPECT_TRUE(connection.LogOut());
    auto const before = Threads();
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    auto const start = std::chrono::steady_clock::now();
    {
        Connection other;
        TaskQueue queue;
        ASSERT_TRUE(other.LogIn(Here(), Admin()));
        auto const subscription =
            other.Subscribe(Interest::InTypes({0}), queue.GetExecutor(), [](Event const&) {});
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(4));
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(ThreadsOnceThereAre(before), before);
}

TEST_F(ConnectionOfAClient, Tickets_OutliveIt)
{
    auto other = std::make_unique<Connection>();
    ASSERT_TRUE(other->LogIn(Here(), Admin()));
    Tickets const left = other->GetTickets();
    other.reset();
    EXPECT_EQ(CodeOf(left.List(0)), NotLoggedIn);
}

TEST_F(ConnectionOfAClient, SiteThatCannotBeOpened_GivesThePlugInsReason)
{
    setenv("COMGUI_SITE", folder.Write("file", "no folder").c_str(), 1);
    testing::internal::CaptureStderr();
    auto const tested = connection.Test(Here());
    std::string line = testing::internal::GetCapturedStderr();
    ASSERT_EQ(CodeOf(tested), ServerAway);
    EXPECT_THAT(line, HasSubstr("file"));
    EXPECT_NE(tested.GetError().reason, "");
    EXPECT_THAT(line, HasSubstr(tested.GetError().reason));
}

TEST_F(ConnectionOfAClient, LoginsAndLogouts_MayComeFromManyThreads)
{
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back(
            [this, i]
            {
                for (int n = 0; n < 20; ++n)
                    if (i % 4 == 0)
                        (void)connection.LogOut();
                    else
                        EXPECT_TRUE(connection.LogIn(Here(), Admin()));
            });
    for (std::thread& thread : threads)
        thread.join();
    (void)connection.LogOut();
    LogIn();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
}

TEST_F(ConnectionOfAClient, Operations_MayComeFromManyThreads)
{
    LogIn();
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "A", 1));
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(
            [&, i]
            {
                std::string const key = "Key/" + std::to_string(i);
                for (int n = 0; n < 50; ++n)
                {
                    EXPECT_TRUE(tickets.Write(ticket, key, n));
                    EXPECT_EQ(*tickets.ReadAs<int>(ticket, key), n);
                    EXPECT_TRUE(connection.Test(Here()));
                    EXPECT_TRUE(connection.IsLoggedIn());
                }
            });
    for (std::thread& thread : threads)
        thread.join();
}
