// What the kit makes of a plug-in and a server that do not do as they should.
#include "tests/client/TroubledClient.h"

#include <algorithm>
#include <chrono>
#include <gmock/gmock.h>
#include <memory>
#include <thread>

using namespace comgui;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

TEST_F(TroubledClient, ServerThatIsLost_AndBack_IsAnEvent)
{
    LogIn();
    auto const subscription = Listen();
    trouble.serverIsAway = true;
    EXPECT_THAT(Hear(1), ElementsAre("lost: localhost:50000: no server answers"));
    EXPECT_FALSE(connection.IsServerThere());
    EXPECT_TRUE(connection.IsLoggedIn());
    trouble.serverIsAway = false;
    EXPECT_EQ(Hear(2).back(), "back");
    EXPECT_TRUE(connection.IsServerThere());
}

// As docs/client-kit.md shows it.
TEST_F(TroubledClient, SnippetOfTheLossOfAServer_ShowsIt)
{
    std::vector<std::string> shown;
    auto const Show = [&shown](std::string const& text) { shown.push_back(text); };
    auto const readAnew = [&Show] { Show("read anew"); };
    // [server-lost]
    auto const subscription =
        connection.Subscribe({}, queue.GetExecutor(),
                             [&](Event const& event)
                             {
                                 if (auto const* const lost = std::get_if<ServerLost>(&event))
                                     Show(lost->error.Text());  // "localhost:50000: no server answers"
                                 else if (auto const* const back = std::get_if<ServerBack>(&event))
                                 {
                                     Show("The server is back");
                                     if (back->isNewSession)
                                         readAnew();
                                 }
                             });
    // [/server-lost]
    LogIn();
    auto const hear = [&](std::size_t count)
    {
        for (auto const end = Clock::now() + 20s; shown.size() < count && Clock::now() < end;)
            queue.RunFor(5ms);
    };
    trouble.serverIsAway = true;
    hear(1);
    trouble.serverIsAway = false;
    hear(2);
    EXPECT_THAT(shown, ElementsAre("localhost:50000: no server answers", "The server is back"));
    trouble.sessionIsGone = true;
    hear(5);
    EXPECT_EQ(shown.back(), "read anew");
}

TEST_F(TroubledClient, SessionThatIsGone_IsReplaced_AndSubscriptionsGoOn)
{
    LogIn();
    auto const subscription = Listen();
    trouble.sessionIsGone = true;
    EXPECT_THAT(Hear(2), ElementsAre(HasSubstr("lost"), "back anew"));
    int changes = 0;
    TicketAddress const job = NewTicket();
    auto const hears = connection.Subscribe(
        Interest::InTickets({job}), queue.GetExecutor(),
        [&](Event const& event) { changes += std::holds_alternative<TicketChanged>(event) ? 1 : 0; });
    ASSERT_TRUE(tickets.Write(job, "A", 1));
    for (auto const end = Clock::now() + 20s; changes == 0 && Clock::now() < end;)
        queue.RunFor(5ms);
    EXPECT_EQ(changes, 1);
    EXPECT_TRUE(connection.LogOut());
}

TEST_F(TroubledClient, EventsOfTheServer_OutliveTheSessionThatTheyCameIn)
{
    LogIn();
    bool isFirst = true;
    auto const subscription =
        connection.Subscribe({}, queue.GetExecutor(),
                             [&](Event const& event)
                             {
                                 heard.push_back(std::holds_alternative<ServerLost>(event) ? "lost" : "back");
                                 if (!std::exchange(isFirst, false))
                                     return;
                                 trouble.sessionIsGone = true;
                                 Await([this] { return trouble.logins >= 3; });
                             });
    trouble.sessionIsGone = true;
    Await([this] { return trouble.logins >= 2; });
    std::this_thread::sleep_for(100ms);  // loss and return wait together
    EXPECT_THAT(Hear(4), ElementsAre("lost", "back", "lost", "back"));
}

TEST_F(TroubledClient, LogoutWhileTheSessionIsReplaced_LeavesNone)
{
    LogIn();
    auto const subscription = Listen();
    trouble.loginTakes = 500;
    trouble.sessionIsGone = true;
    ASSERT_THAT(Hear(1), ElementsAre(HasSubstr("lost")));  // the new login is under way
    ASSERT_TRUE(connection.LogOut());
    EXPECT_FALSE(connection.IsLoggedIn());
    EXPECT_EQ(CodeOf(tickets.List(SystemTickets)), NotLoggedIn);
    trouble.loginTakes = 0;
}

TEST_F(TroubledClient, SessionThatCannotBeReplaced_IsLost_WithTheReason_UntilItCan)
{
    LogIn();
    auto const subscription = Listen();
    trouble.loginTakes = 500;  // else both may be merged
    trouble.loginsAreRefused = true;
    trouble.sessionIsGone = true;
    auto const lost = ElementsAre("lost: localhost:50000: the session has ended",
                                  "lost: admin: the server refuses, with code 42");
    EXPECT_THAT(Hear(2), lost);
    trouble.loginTakes = 0;
    queue.RunFor(1500ms);
    EXPECT_THAT(heard, lost);  // once
    trouble.loginsAreRefused = false;
    EXPECT_EQ(Hear(3).back(), "back anew");
}

// After a second, after two more, after four more.
TEST_F(TroubledClient, SessionThatCannotBeReplaced_IsTriedMoreAndMoreSeldom)
{
    LogIn();
    int const before = trouble.tries;
    trouble.loginsAreRefused = true;
    trouble.sessionIsGone = true;
    Await([&] { return trouble.tries > before; });
    auto const first = Clock::now();
    Await([&] { return trouble.tries >= before + 4; });
    EXPECT_GE(Clock::now() - first, 5s);
}

TEST_F(TroubledClient, LoginWithoutAServer_IsAFailure_AndALaterOneWorks)
{
    trouble.serverIsAway = true;
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), Admin())), ServerAway);
    trouble.serverIsAway = false;
    LogIn();
}

TEST_F(TroubledClient, SessionWithoutTickets_IsAFailure_AndLeavesNoSession)
{
    trouble.hasNoContainer = true;
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), Admin())), NoContainer);
    EXPECT_FALSE(connection.IsLoggedIn());
    trouble.hasNoContainer = false;
    LogIn();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
}

TEST_F(TroubledClient, CallbackThatIsRefused_IsAFailure)
{
    trouble.refusesCallbacks = true;
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), Admin())), CallbackRefused);
    EXPECT_FALSE(connection.IsLoggedIn());
}

TEST_F(TroubledClient, CodeOfAForeignPlugIn_HasAText)
{
    trouble.loginsAreRefused = true;
    trouble.knowsNoNewCommands = true;
    EXPECT_EQ(connection.LogIn(Here(), Admin()).GetError().Text(), "admin: the server refuses, with code 42");
}

TEST_F(TroubledClient, PlugInWithoutProgress_StillCarriesFiles)
{
    trouble.knowsNoNewCommands = true;
    LogIn();
    auto const transfer = connection.GetTransfers().Put(folder.Write("a", "four").string(), "$(TEMP)/a");
    EXPECT_TRUE(transfer.Wait());
    EXPECT_EQ(transfer.Progress().done, 4);
}

TEST_F(TroubledClient, PlugInThatIsNotThere_IsAFailure_UntilItIs)
{
    UtilityObjects::SetPlugInsFolder((folder / "nowhere").native());
    testing::internal::CaptureStderr();
    Outcome const missing = connection.FindPlugIn();
    testing::internal::GetCapturedStderr();
    ASSERT_EQ(CodeOf(missing), NoPlugIn);
    EXPECT_THAT(missing.GetError().about, HasSubstr("nowhere/ComGUI.Bundle"));
    testing::internal::CaptureStderr();
    EXPECT_EQ(CodeOf(connection.LogIn(Here(), Admin())), NoPlugIn);
    testing::internal::GetCapturedStderr();
    UtilityObjects::SetPlugInsFolder(folder.Path().native());
    EXPECT_TRUE(connection.FindPlugIn());
    LogIn();
}

TEST_F(TroubledClient, LossInAnOldSession_IsNotHeardInTheNextOne)
{
    LogIn();
    auto const subscription = Listen();
    trouble.serverIsAway = true;
    Await([this] { return !connection.IsServerThere(); });
    ASSERT_TRUE(connection.LogOut());
    trouble.serverIsAway = false;
    LogIn();
    queue.RunFor(100ms);
    EXPECT_THAT(heard, IsEmpty());
}

// Some plug-ins have one on its way when the logout returns.
TEST_F(TroubledClient, CallbackOfAnOldSession_IsNotHeardInTheNextOne)
{
    LogIn();
    TicketAddress const job = NewTicket();
    ASSERT_TRUE(connection.LogOut());
    LogIn();
    std::vector<TicketAddress> deleted;
    auto const subscription =
        connection.Subscribe(Interest::InTypes({JobTickets}), queue.GetExecutor(),
                             [&](Event const& event)
                             {
                                 if (auto const* const what = std::get_if<TicketDeleted>(&event))
                                     deleted.push_back(what->ticket);
                             });
    constexpr int Deleted = 5;
    trouble.callback.load()(trouble.callbackUser, Deleted, job.id, 1, JobTickets, nullptr);
    queue.RunFor(100ms);
    EXPECT_THAT(deleted, IsEmpty());
    ASSERT_TRUE(tickets.Delete(job));
    for (auto const end = Clock::now() + 20s; deleted.empty() && Clock::now() < end;)
        queue.RunFor(5ms);
    EXPECT_THAT(deleted, ElementsAre(job));
}

// The cut of a transfer takes longer than the transfer itself.
TEST_F(TroubledClient, CancelOfOneTransfer_LeavesTheOthersAlone)
{
    LogIn();
    trouble.putTakes = 50;
    trouble.logoutTakes = 100;
    std::vector<Transfer> all;
    for (int i = 0; i < 16; ++i)
        all.push_back(connection.GetTransfers().Put(folder.Write(std::to_string(i), "content").string(),
                                                    "$(TEMP)/" + std::to_string(i)));
    Await([this] { return trouble.puts >= 4; });
    all[0].Cancel();
    all[1].Cancel();
    for (std::size_t i = 2; i < all.size(); ++i)
        EXPECT_TRUE(all[i].Wait()) << i << ": " << all[i].Wait().GetError().Text();
}

TEST_F(TroubledClient, Logout_CancelsTheTransferThatIsUnderWay)
{
    LogIn();
    trouble.putTakes = 30000;
    auto const put = connection.GetTransfers().Put(folder.Write("a", "content").string(), "$(TEMP)/a");
    Await([this] { return trouble.puts > 0; });
    ASSERT_TRUE(connection.LogOut());
    EXPECT_EQ(CodeOf(put.Wait()), Cancelled);
}

TEST_F(TroubledClient, CancelWhileATransferLogsIn_CarriesNothing)
{
    LogIn();
    int const before = trouble.tries;
    trouble.loginTakes = 300;
    trouble.putTakes = 30000;
    auto put = connection.GetTransfers().Put(folder.Write("a", "content").string(), "$(TEMP)/a");
    Await([&] { return trouble.tries > before; });
    put.Cancel();
    EXPECT_EQ(CodeOf(put.Wait()), Cancelled);
    EXPECT_EQ(trouble.puts, 0);
}

TEST_F(TroubledClient, CancelOfATransfer_WaitsForNoQuestionAboutProgress)
{
    LogIn();
    trouble.putTakes = 10000;
    trouble.progressTakes = 2000;
    auto put = connection.GetTransfers().Put(folder.Write("a", "content").string(), "$(TEMP)/a");
    Await([this] { return trouble.progress > 0; });
    put.Cancel();
    auto const outcome = put.WaitFor(1s);  // a tenth of a second on a machine that is not busy
    ASSERT_TRUE(outcome);
    EXPECT_EQ(CodeOf(*outcome), Cancelled);
    trouble.progressTakes = 0;
}

TEST_F(TroubledClient, EverySession_EndsOnce_AlsoOneThatIsReplaced)
{
    LogIn();
    auto const subscription = Listen();
    trouble.sessionIsGone = true;
    ASSERT_THAT(Hear(2), ElementsAre(HasSubstr("lost"), "back anew"));
    ASSERT_TRUE(connection.LogOut());
    EXPECT_EQ(trouble.logins, 2);
    EXPECT_EQ(trouble.logouts, 2);
    LogIn();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
}

TEST_F(TroubledClient, SessionThatIsReplacedByOneWithoutTickets_EndsOnce)
{
    LogIn();
    auto const subscription = Listen();
    trouble.hasNoContainer = true;
    trouble.sessionIsGone = true;
    Await([this] { return trouble.logins == 2; });
    ASSERT_TRUE(connection.LogOut());
    EXPECT_EQ(trouble.logins, trouble.logouts);
    trouble.hasNoContainer = false;
    LogIn();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
}

// The watch asks once a second. What it does when its question is answered is not waited for.
TEST_F(TroubledClient, EndOfASession_WaitsForOneCallOfTheWatchAtMost)
{
    LogIn();
    trouble.questionTakes = 500;
    trouble.loginTakes = 5000;
    trouble.sessionIsGone = true;
    Await([this] { return trouble.questions > 0; });
    auto const start = Clock::now();
    ASSERT_TRUE(connection.LogOut());
    EXPECT_LT(Clock::now() - start, 3s);
    EXPECT_EQ(trouble.logins, 1);
    trouble.loginTakes = 0;
}

TEST_F(TroubledClient, SlowTicketAsXml_HoldsNothingUp)
{
    LogIn();
    auto const subscription = Listen();
    trouble.ticketDataTakes = 4000;
    std::thread asks([this] { (void)tickets.ToXml(System); });
    Await([this] { return trouble.ticketData > 0; });
    auto const start = Clock::now();
    EXPECT_EQ(connection.LocalEndPoint(), "127.0.0.1:50106");
    trouble.serverIsAway = true;
    EXPECT_THAT(Hear(1), ElementsAre(HasSubstr("lost")));
    EXPECT_TRUE(connection.LogOut());
    EXPECT_LT(Clock::now() - start, 3s);
    trouble.ticketDataTakes = 0;
    asks.join();
}

TEST_F(TroubledClient, Password_IsForgotten_AfterARefusalAndALogout)
{
    trouble.loginsAreRefused = true;
    ASSERT_FALSE(connection.LogIn(Here(), Admin()));
    EXPECT_STREQ(trouble.newest.load()->szPassword, "");
    trouble.loginsAreRefused = false;
    LogIn();
    TLogin const* const session = trouble.newest;
    EXPECT_STREQ(session->szPassword, "admin");  // to log in again after a loss
    ASSERT_TRUE(connection.GetTransfers().Put(folder.Write("a", "b").string(), "$(TEMP)/a").Wait());
    ASSERT_NE(trouble.newest, session);
    ASSERT_TRUE(connection.LogOut());
    EXPECT_STREQ(session->szPassword, "");
    EXPECT_STREQ(trouble.newest.load()->szPassword, "");
}

TEST_F(TroubledClient, Progress_HasRateAndRest_AndNoneComesAfterTheEnd)
{
    LogIn();
    std::vector<std::string> events;
    auto const subscription = connection.Subscribe(
        Interest::InTransfers(), queue.GetExecutor(),
        [&events](Event const& event)
        { events.push_back(std::holds_alternative<TransferEnded>(event) ? "end" : "progress"); },
        0ms);
    trouble.putTakes = 10000;
    trouble.progressGrows = 1000;
    auto put = connection.GetTransfers().Put(folder.Write("a", "content").string(), "$(TEMP)/a");
    Await([&put] { return put.Progress().rest.has_value(); });
    queue.RunFor(50ms);
    TransferProgress const progress = put.Progress();
    EXPECT_GT(progress.rate, 100);
    EXPECT_LT(progress.rate, 20000);  // ten questions a second
    auto const left = static_cast<double>(1000000 - progress.done);
    EXPECT_NEAR(static_cast<double>(progress.rest->count()), left / progress.rate, 1);
    put.Cancel();
    (void)put.Wait();
    queue.RunFor(300ms);
    ASSERT_GE(events.size(), 2u);
    EXPECT_EQ(std::count(events.begin(), events.end(), "end"), 1);
    EXPECT_EQ(events.back(), "end");
}

TEST_F(TroubledClient, SessionThatIsLostAgain_IsReplacedAsSoonAsTheFirstTime)
{
    LogIn();
    auto const subscription = Listen();
    trouble.loginsAreRefused = true;
    trouble.sessionIsGone = true;
    Await([this] { return trouble.tries == 4; });  // with growing pauses
    ASSERT_TRUE(connection.LogOut());
    trouble.loginsAreRefused = false;
    LogIn();
    heard.clear();
    trouble.loginsAreRefused = true;
    trouble.sessionIsGone = true;
    Await([this] { return trouble.tries == 6; });
    trouble.loginsAreRefused = false;
    auto const start = Clock::now();
    for (heard.clear(); heard.empty() || heard.back() != "back anew";)
        ASSERT_FALSE(Hear(heard.size() + 1).empty());
    EXPECT_LT(Clock::now() - start, 6s);
}
