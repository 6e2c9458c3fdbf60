// The whole window at a server: a login, tickets and their keys, events, jobs, the loss of the server.
#include "tests/desk/WindowOfTheDesk.h"

#include "desk/view/JobsPane.h"
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <wx/button.h>
#include <wx/infobar.h>
#include <wx/srchctrl.h>

using namespace desk;
using testing::Contains;
using testing::HasSubstr;

TEST_F(WindowOfTheDesk, AsksUntilTheLoginSucceeds)
{
    std::string told;
    int step = 0;
    wxTimer user;
    user.Bind(wxEVT_TIMER,
              [&](auto&)
              {
                  auto* const password = Find<wxTextCtrl>("password");
                  auto* const message = Find<wxWindow>("message");
                  if (!password || !password->IsEnabled())
                      return;
                  auto const press = []
                  {
                      auto* const button = wxWindow::FindWindowById(wxID_OK, Find<wxWindow>("login"));
                      wxCommandEvent click(wxEVT_BUTTON, wxID_OK);
                      button->GetEventHandler()->ProcessEvent(click);
                  };
                  if (step == 0)
                  {
                      Find<wxTextCtrl>("user")->SetValue("admin");
                      password->SetValue("wrong");
                      press();
                      step = 1;
                  }
                  else if (step == 1)
                  {
                      told = comgui::ToUtf8(message->GetLabel());
                      password->SetValue("admin");
                      press();
                      step = 2;
                  }
              });
    user.Start(20);
    frame->AskForLogin();
    user.Stop();
    EXPECT_THAT(told, HasSubstr("wrong"));
    EXPECT_TRUE(Await([this] { return types.Count() > 0; }));
    EXPECT_THAT(comgui::ToUtf8(frame->GetTitle()), HasSubstr("admin @ localhost"));
}

TEST_F(WindowOfTheDesk, ShowsTypesWithTheirCounts_AndTheirTickets)
{
    Enter();
    EXPECT_THAT(types.Column(0), Contains("System"));
    auto const row = types.RowOf(0, "Jobs");
    ASSERT_TRUE(row);
    EXPECT_EQ(types.Cell(*row, 1), std::to_string(tickets.List(comgui::JobTickets)->size()));
    types.Select(*row);
    EXPECT_TRUE(Await([this] { return shown.Count() == tickets.List(comgui::JobTickets)->size(); }));
}

TEST_F(WindowOfTheDesk, ShowsWhatOthersDo)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 3));
    ShowJob(job);
    keys.List()->SetFocus();
    ASSERT_TRUE(Await([this] { return ValueOf("Copies") == "3"; }));
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 4));
    EXPECT_TRUE(Await([this] { return ValueOf("Copies") == "4"; }));
    EXPECT_TRUE(Await([this] { return events.RowOf(4, "4").has_value(); }));
    EXPECT_THAT(events.Column(3), Contains("Job/Copies"));
    ASSERT_TRUE(tickets.Delete(job));
    EXPECT_TRUE(Await([this] { return keys.Count() == 0; }));
}

TEST_F(WindowOfTheDesk, ShowsWhatTicketsAreCalled)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Identification/Name", "poster.pdf"));
    ShowJob(job);
    EXPECT_TRUE(Await([this] { return shown.RowOf(1, "poster.pdf").has_value(); }));
}

TEST_F(WindowOfTheDesk, OpensTheBranchesOfASmallTicket)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 3));
    ShowJob(job);
    EXPECT_TRUE(Await([this] { return ValueOf("Copies") == "3"; }));
}

TEST_F(WindowOfTheDesk, WritesWhatIsTyped_AndUndoesIt)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Copies", 3));
    ShowJob(job);
    ASSERT_TRUE(Await([this] { return keys.Count() == 1; }));
    Type("Copies", "17");
    EXPECT_TRUE(Await([&] { return tickets.ReadAs<int>(job, "Copies").ValueOr(0) == 17; }));
    EXPECT_TRUE(Await([this] { return frame->GetMenuBar()->IsEnabled(wxID_UNDO); }));
    Menu(wxID_UNDO);
    EXPECT_TRUE(Await([this] { return ValueOf("Copies") == "3"; }));
    Menu(wxID_REDO);
    EXPECT_TRUE(Await([this] { return ValueOf("Copies") == "17"; }));
}

TEST_F(WindowOfTheDesk, SaysWhyAValueIsRefused)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Copies", 3));
    ShowJob(job);
    ASSERT_TRUE(Await([this] { return keys.Count() == 1; }));
    Type("Copies", "many");
    EXPECT_TRUE(Await([this] { return Status().find("not a number") != std::string::npos; })) << Status();
    EXPECT_EQ(ValueOf("Copies"), "3");
}

TEST_F(WindowOfTheDesk, ShowsTheTicketThatItWasBegunWith)
{
    frame->ShowFirst(System);
    frame->LogIn(Here(), Admin());
    EXPECT_TRUE(Await([this] { return heading() == "System 0/0" && keys.Count() > 0; }));
}

TEST_F(WindowOfTheDesk, FindsTickets)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Note", "a needle"));
    ASSERT_TRUE(Await([&] { return events.RowOf(3, "Note").has_value(); }));
    auto* const search = Find<wxWindow>("search");
    dynamic_cast<wxTextEntry*>(search)->SetValue("needle");
    wxCommandEvent enter(wxEVT_SEARCH, search->GetId());
    search->GetEventHandler()->ProcessEvent(enter);
    EXPECT_TRUE(
        Await([&] { return shown.Count() == 1 && shown.Cell(0, 0) == "3/" + std::to_string(job.id); }));
}

TEST_F(WindowOfTheDesk, SendsAJob_AndCancelsAnother)
{
    Enter();
    std::string const small = folder.Write("small.pdf", std::string(1000, 'x')).string();
    {
        std::ofstream large(folder / "large", std::ios::binary);
        for (int megabytes = 0; megabytes < 300; ++megabytes)
            large << std::string(1 << 20, 'x');
    }
    auto* const pane = dynamic_cast<JobsPane*>(Find<wxWindow>("jobs")->GetParent());
    ASSERT_NE(pane, nullptr);
    pane->askOptions = [](auto const&) { return comgui::JobOptions(); };
    pane->Send({small});
    EXPECT_TRUE(Await([this] { return jobs.RowOf(2, "Arrived").has_value(); }));
    for (int tries = 0; tries < 20 && !jobs.RowOf(2, "Cancelled"); ++tries)  // some may be faster
    {
        std::string const name = "large" + std::to_string(tries) + ".pdf";
        std::filesystem::create_hard_link(folder / "large", folder / name);
        pane->Send({(folder / name).string()});
        ASSERT_TRUE(Await([&] { return Choose(jobs, 0, name); }));
        pane->Cancel();
        auto const isOver = [&]
        {
            std::string const state = jobs.Cell(*jobs.RowOf(0, name), 2);
            return state == "Cancelled" || state == "Arrived";
        };
        ASSERT_TRUE(Await(isOver));
    }
    EXPECT_TRUE(jobs.RowOf(2, "Cancelled")) << testing::PrintToString(jobs.Column(2));
}

TEST_F(WindowOfTheDesk, ForgetsTheJobsThatAreOver)
{
    Enter();
    auto* const pane = dynamic_cast<JobsPane*>(Find<wxWindow>("jobs")->GetParent());
    ASSERT_NE(pane, nullptr);
    pane->askOptions = [](auto const&) { return comgui::JobOptions(); };
    pane->Send({folder.Write("small.pdf", std::string(1000, 'x')).string()});
    // For a moment the job's ticket may have a row of its own, which is over before the transfer is.
    ASSERT_TRUE(Await([this] { return jobs.Count() == 1 && jobs.RowOf(2, "Arrived").has_value(); }));
    Menu(MenuOf("View", "Forget the jobs that are over"));
    EXPECT_TRUE(Await([this] { return jobs.Count() == 0; }));
}

TEST_F(WindowOfTheDesk, Pauses_AndShowsAfterwardsWhatItHasMissed)
{
    Enter();
    Menu(MenuOf("View", "Pause events"));
    comgui::TicketAddress const job = NewTicket();
    EXPECT_TRUE(Await([] { return Find<wxWindow>("pause")->GetLabel().Contains("(1)"); }));
    EXPECT_EQ(events.RowOf(2, "3/" + std::to_string(job.id)), std::nullopt);
    Menu(MenuOf("View", "Pause events"));
    EXPECT_TRUE(Await([&] { return events.RowOf(2, "3/" + std::to_string(job.id)).has_value(); }));
}

TEST_F(WindowOfTheDesk, AfterTheLogout_ShowsNothing)
{
    Enter();
    Menu(MenuOf("Server", "Log out"));
    EXPECT_TRUE(Await([this] { return types.Count() == 0 && shown.Count() == 0 && keys.Count() == 0; }));
    EXPECT_EQ(frame->GetTitle(), "Ticket desk");
}

TEST_F(WindowOfTheDesk, ShowsThatTheServerIsLost_AndBack)
{
    TROUBLE& trouble = BeginTrouble();
    Enter();
    auto* const info = Find<wxInfoBar>("info");
    trouble.serverIsAway = true;
    EXPECT_TRUE(Await([info] { return info->IsShown(); }));
    EXPECT_TRUE(Await([this] { return events.RowOf(1, "server lost").has_value(); }));
    trouble.serverIsAway = false;
    EXPECT_TRUE(Await([this] { return events.RowOf(1, "server back").has_value(); }));
    EXPECT_TRUE(Await([info] { return !info->IsShown(); }));
}

TEST_F(WindowOfTheDesk, ScrollsThroughAHundredThousandKeys)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    std::vector<comgui::KeyValue> values;
    for (int i = 0; i < 100'000; ++i)
        values.push_back({"Key/" + std::to_string(1'000'000 + i), i});
    (void)tickets.WriteAll(job, values);
    ShowJob(job);
    ASSERT_TRUE(Await([this] { return keys.Count() == 1; }));
    Menu(MenuOf("View", "Open all branches"));
    ASSERT_EQ(keys.Count(), 100'001u);
    EXPECT_EQ(keys.Cell(100'000, 2), "99999");
    keys.List()->ShowRow(100'000);
    RunEvents();
    ASSERT_TRUE(tickets.Write(job, "Key/1099999", -1));
    EXPECT_TRUE(Await([this] { return keys.Cell(100'000, 2) == "-1"; }));
}
