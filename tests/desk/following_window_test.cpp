// The whole window while tickets, jobs and the server change.
#include "tests/desk/WindowOfTheDesk.h"

#include "desk/view/InkBars.h"
#include "desk/view/JobsPane.h"
#include <wx/infobar.h>
#include <wx/textdlg.h>

using namespace desk;

using TheDeskFollows = WindowOfTheDesk;

TEST_F(TheDeskFollows, TheNamesOfQueues_BeforeAnybodyLooksAtThem)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Identification/Name", "poster.pdf"));
    ShowJob(job);
    ASSERT_TRUE(Await([&] { return shown.RowOf(1, "poster.pdf").has_value(); }));  // read behind the queues
    std::vector<JobQueue> const queues = Find<JobsPane>("jobs pane")->queues();
    ASSERT_FALSE(queues.empty());
    for (JobQueue const& queue : queues)
        EXPECT_EQ(queue.name,
                  tickets.ReadAs<std::string>({comgui::QueueTickets, queue.id}, "Queue/Name").ValueOr("?"));
}

TEST_F(TheDeskFollows, AJobThatChangesAsAWhole)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Identification/Name", "poster.pdf"));
    ASSERT_TRUE(tickets.Write(job, "Job/State", 0));
    ASSERT_TRUE(Await([this] { return jobs.RowOf(2, "Waiting").has_value(); }));
    std::vector<comgui::KeyValue> values;
    for (int i = 0; i < 2001; ++i)
        values.push_back({"Key/" + std::to_string(i), i});
    values.push_back({"Job/State", 2});
    (void)tickets.WriteAll(job, values);
    EXPECT_TRUE(Await([this] { return jobs.RowOf(2, "Arrived").has_value(); }));
}

TEST_F(TheDeskFollows, NoInksOfAnotherTicketAreShown)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    comgui::TicketAddress const other = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/InkCoverage", comgui::MakeList<double>({0.25, 0.5, 0.5, 0.5})));
    ASSERT_TRUE(
        tickets.Write(job, "Job/Separations", comgui::MakeList<std::string>({"Cyan", "Gold", "a/b"})));
    auto* const inks = Find<InkBars>("inks");
    ASSERT_NE(inks, nullptr);
    ShowJob(job);
    ASSERT_TRUE(Await([inks] { return inks->IsShown(); }));
    ASSERT_TRUE(Choose(shown, 0, "3/" + std::to_string(other.id)));
    EXPECT_FALSE(inks->IsShown());  // at once, however long the other one takes to read
    ShowJob(job);
    ASSERT_TRUE(Await([inks] { return inks->IsShown(); }));
    Menu(MenuOf("Server", "Log out"));
    EXPECT_FALSE(inks->IsShown());
}

TEST_F(TheDeskFollows, NoTicketToBeginWith_IfTheTextIsNone)
{
    frame->ShowFirst(std::string("job1"));
    EXPECT_EQ(Status(), "job1: This is no ticket: a number, or a type, a slash and a number.");
    Enter();
    EXPECT_TRUE(Find<wxInfoBar>("complaint")->IsShown());
    EXPECT_EQ(heading(), "");
}

TEST_F(TheDeskFollows, NoTicketToBeginWith_ThatComesTooLate)
{
    LogIn();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Copies", 3));
    std::string const late = "3/" + std::to_string(job.id + 1);
    frame->ShowFirst(comgui::TicketAddress{comgui::JobTickets, job.id + 1});
    frame->LogIn(Here(), Admin());
    EXPECT_TRUE(Await([&] { return Status() == late + " is not there."; })) << Status();
    ShowJob(job);
    ASSERT_EQ(NewTicket().id, job.id + 1);
    ASSERT_TRUE(Await([&] { return shown.RowOf(0, late).has_value() && keys.Count() == 1; }));
    Menu(MenuOf("View", "Read all anew"));
    Type("Copies", "4");  // behind it
    ASSERT_TRUE(Await([this] { return Status().find("is written") != std::string::npos; })) << Status();
    EXPECT_EQ(heading(), "Jobs 3/" + std::to_string(job.id));
}

TEST_F(TheDeskFollows, TheLossOfTheServer_WhateverElseIsWrong)
{
    TROUBLE& trouble = BeginTrouble();
    Enter();
    ShowJob(NewTicket());
    auto* const loss = Find<wxInfoBar>("info");
    auto* const complaint = Find<wxInfoBar>("complaint");
    ASSERT_TRUE(loss && complaint);
    trouble.serverIsAway = true;
    ASSERT_TRUE(Await([loss] { return loss->IsShown(); }));
    {
        DialogUser const user(
            [](wxDialog& dialog)
            {
                dynamic_cast<wxTextEntryDialog&>(dialog).SetValue("no ticket");
                Press(dialog, wxID_OK);
            });
        Menu(MenuOf("Ticket", "Compare with ..."));
    }
    EXPECT_TRUE(complaint->IsShown());
    EXPECT_TRUE(loss->IsShown());
    trouble.serverIsAway = false;
    EXPECT_TRUE(Await([loss] { return !loss->IsShown(); }));
    EXPECT_TRUE(complaint->IsShown());
}
