// The window's sessions: logins that are given up or refused, and what a session leaves behind.
#include "comgui/comgui.h"
#include "desk/view/CompareFrame.h"
#include "tests/client/TroubledPlugIn.h"
#include "tests/desk/WindowOfTheDesk.h"
#include "tests/support/BundleOnDisk.h"
#include <algorithm>
#include <dlfcn.h>
#include <functional>
#include <future>
#include <gmock/gmock.h>
#include <wx/srchctrl.h>
#include <wx/textdlg.h>
#include <wx/timer.h>

using namespace desk;
using namespace std::chrono_literals;
using testing::HasSubstr;

namespace
{
// What the user does beside a dialog, whose loop runs until it is closed.
class User
{
public:
    explicit User(std::function<void()> acts)
    {
        m_timer.Bind(wxEVT_TIMER, [acts = std::move(acts)](auto&) { acts(); });
        m_timer.Start(20);
    }

private:
    wxTimer m_timer;
};

class SessionsOfTheWindow : public WindowOfTheDesk
{
protected:
    SessionsOfTheWindow() : bundle(folder.Path())
    {
        bundle.LinkExecutable(COMGUI_TROUBLED_PLUGIN);
        bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, "11111111-2222-3333-4444-555555555555",
                          "TroubledPlugInFactory");
        UtilityObjects::SetPlugInsFolder(folder.Path().native());
    }

    static void Press(int id)
    {
        wxCommandEvent click(wxEVT_BUTTON, id);
        wxWindow::FindWindowById(id, Find<wxWindow>("login"))->GetEventHandler()->ProcessEvent(click);
    }
    // In the dialog, while it takes something.
    static bool Enter(std::string const& password)
    {
        auto* const field = Find<wxTextCtrl>("password");
        if (!field || !field->IsEnabled())
            return false;
        Find<wxTextCtrl>("user")->SetValue("admin");
        field->SetValue(comgui::ToWx(password));
        Press(wxID_OK);
        return true;
    }
    void FailToLogIn_AndGiveUp()
    {
        bool isTried = false;
        User const user(
            [&]
            {
                auto* const message = Find<wxWindow>("message");
                if (isTried && message && message->GetLabel().Contains("wrong"))
                    Press(wxID_CANCEL);
                isTried = isTried || Enter("wrong");
            });
        frame->AskForLogin();
    }
    void BeginALogin_AndGiveItUp()
    {
        bool isBegun = false;
        int const before = trouble.tries;
        User const user(
            [&]
            {
                isBegun = isBegun || Enter("admin");
                if (trouble.tries > before)
                    Press(wxID_CANCEL);
            });
        frame->AskForLogin();
    }
    void CompareWith(std::string const& ticket)
    {
        User const user(
            [&ticket]
            {
                for (wxWindow* const window : wxTopLevelWindows)
                    if (auto* const dialog = dynamic_cast<wxTextEntryDialog*>(window);
                        dialog && dialog->IsModal())
                    {
                        dialog->SetValue(ticket);
                        dialog->EndModal(wxID_OK);
                    }
            });
        Menu(MenuOf("Ticket", "Compare with ..."));
    }
    static void Search(std::string const& text)
    {
        auto* const search = Find<wxWindow>("search");
        dynamic_cast<wxTextEntry*>(search)->SetValue(comgui::ToWx(text));
        wxCommandEvent enter(wxEVT_SEARCH, search->GetId());
        search->GetEventHandler()->ProcessEvent(enter);
    }
    static std::string Note() { return comgui::ToUtf8(Find<wxWindow>("search note")->GetLabel()); }
    static void RunFor(std::chrono::milliseconds time)
    {
        for (auto const end = std::chrono::steady_clock::now() + time;
             std::chrono::steady_clock::now() < end;)
            RunEvents();
    }

    BundleOnDisk bundle;
    TROUBLE& trouble = *static_cast<TROUBLE*>(
        dlsym(dlopen(COMGUI_TROUBLED_PLUGIN, RTLD_NOW | RTLD_LOCAL), "TroubledPlugInOrders"));
};
}  // namespace

TEST_F(SessionsOfTheWindow, LoginThatIsGivenUp_IsUndoneWithoutBlockingTheWindow)
{
    trouble.loginTakes = 300;
    trouble.logoutTakes = 3000;
    BeginALogin_AndGiveItUp();
    auto longest = 0ms;
    auto last = std::chrono::steady_clock::now();
    EXPECT_TRUE(Await(
        [&]
        {
            auto const now = std::chrono::steady_clock::now();
            longest = std::max(longest, std::chrono::duration_cast<std::chrono::milliseconds>(now - last));
            last = now;
            return trouble.logouts == 1;
        }));
    EXPECT_LT(longest, 2000ms);
}

TEST_F(SessionsOfTheWindow, LoginThatIsGivenUp_DoesNotEndTheNext)
{
    trouble.loginTakes = 500;
    BeginALogin_AndGiveItUp();
    frame->LogIn(Here(), Admin());
    ASSERT_TRUE(Await([this] { return types.Count() > 0; }));
    RunFor(500ms);
    EXPECT_EQ(trouble.logins, 2);
    EXPECT_EQ(trouble.logouts, 1);
    ShowJob({comgui::JobTickets, 1});
    EXPECT_TRUE(Await([this] { return keys.Count() > 0; }));
}

// The kit ends the session before it begins another.
TEST_F(SessionsOfTheWindow, LoginThatIsRefused_LeavesNothingOfTheSessionBefore)
{
    WindowOfTheDesk::Enter();
    ASSERT_THAT(comgui::ToUtf8(frame->GetTitle()), HasSubstr("admin"));
    FailToLogIn_AndGiveUp();
    EXPECT_TRUE(Await([this] { return types.Count() == 0 && shown.Count() == 0; }));
    EXPECT_EQ(frame->GetTitle(), "Ticket desk");
    EXPECT_EQ(Status(), "Logged out");
}

TEST_F(SessionsOfTheWindow, LoginThatIsGivenUp_LeavesNothingOfTheSessionBefore)
{
    WindowOfTheDesk::Enter();
    trouble.loginTakes = 500;
    BeginALogin_AndGiveItUp();
    EXPECT_TRUE(Await([this] { return types.Count() == 0 && shown.Count() == 0; }));
    EXPECT_EQ(frame->GetTitle(), "Ticket desk");
}

TEST_F(SessionsOfTheWindow, ComparisonsEndWithTheirSession)
{
    WindowOfTheDesk::Enter();
    ShowJob({comgui::JobTickets, 1});
    CompareWith("3/2");
    CompareWith("3/3");
    ASSERT_NE(Find<CompareFrame>("compare"), nullptr);
    Menu(MenuOf("Server", "Log out"));
    EXPECT_TRUE(Await([] { return Find<CompareFrame>("compare") == nullptr; }));
}

TEST_F(SessionsOfTheWindow, SearchThatIsInterrupted_SaysSo_AndGoesOn)
{
    WindowOfTheDesk::Enter();
    ASSERT_TRUE(tickets.Write({comgui::JobTickets, 1}, "Note", "a needle"));
    trouble.serverIsAway = true;
    trouble.tickets.sessionIsOver = true;
    ASSERT_TRUE(Await([this] { return events.RowOf(1, "server lost").has_value(); }));
    Search("needle");
    EXPECT_TRUE(Await([] { return Note().find("Interrupted: no server answers") != std::string::npos; }))
        << Note();
    trouble.tickets.sessionIsOver = false;
    trouble.serverIsAway = false;
    EXPECT_TRUE(Await([this] { return shown.Count() == 1; }));
    EXPECT_TRUE(Await([] { return Note().find("Interrupted") == std::string::npos; })) << Note();
}

TEST_F(SessionsOfTheWindow, SearchSaysHowManyTicketsItCouldNotRead)
{
    WindowOfTheDesk::Enter();
    trouble.tickets.refusedWalks = 2;
    Search("needle");
    EXPECT_TRUE(Await([] { return Note().find("2 tickets cannot be read") != std::string::npos; })) << Note();
}

TEST_F(SessionsOfTheWindow, SearchEndsWhereTheUserChoosesAType)
{
    WindowOfTheDesk::Enter();
    ASSERT_TRUE(tickets.Write({comgui::JobTickets, 1}, "Note", "a needle"));
    std::promise<void> gate;
    std::promise<void> reached;
    trouble.tickets.afterOpening = [&, open = gate.get_future().share()]
    {
        reached.set_value();
        open.wait_for(20s);
    };
    Search("needle");
    ASSERT_EQ(reached.get_future().wait_for(20s), std::future_status::ready);
    ASSERT_TRUE(Choose(types, 0, "Users"));
    gate.set_value();
    RunFor(300ms);
    EXPECT_EQ(shown.Count(), tickets.List(comgui::UserTickets)->size());
    EXPECT_EQ(Note(), "");
}

TEST_F(SessionsOfTheWindow, SearchKeepsTheChosenTicketChosen)
{
    WindowOfTheDesk::Enter();
    ShowJob({comgui::JobTickets, 2});
    ASSERT_TRUE(tickets.Write({comgui::JobTickets, 1}, "Note", "a needle"));
    ASSERT_TRUE(tickets.Write({comgui::JobTickets, 2}, "Note", "a needle"));
    Search("needle");
    ASSERT_TRUE(Await([this] { return shown.Count() == 2; }));
    EXPECT_EQ(shown.List()->Selected(), shown.RowOf(0, "3/2"));
}
