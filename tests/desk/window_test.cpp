// The whole window at a server, driven as a user would, on a display that nobody sees. Controls are found by
// their accessible names.
#include "desk/view/MainFrame.h"

#include "comgui/comgui.h"
#include "desk/view/JobsPane.h"
#include "desk/view/VirtualList.h"
#include "tests/client/Client.h"
#include "tests/client/TroubledPlugIn.h"
#include "tests/support/BundleOnDisk.h"
#include <algorithm>
#include <chrono>
#include <dlfcn.h>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <wx/app.h>
#include <wx/button.h>
#include <wx/combobox.h>
#include <wx/evtloop.h>
#include <wx/fileconf.h>
#include <wx/infobar.h>
#include <wx/menu.h>
#include <wx/srchctrl.h>
#include <wx/textctrl.h>

using namespace desk;
using namespace std::chrono_literals;
using testing::AllOf;
using testing::Contains;
using testing::HasSubstr;
using testing::Not;

namespace
{
// Also for dialogs, which run a loop of their own.
void RunEvents()
{
    wxTheApp->ProcessPendingEvents();
    wxEventLoopBase::GetActive()->YieldFor(wxEVT_CATEGORY_ALL);
    wxMilliSleep(5);
}

template <typename Condition>
bool Await(Condition condition)
{
    for (auto const end = std::chrono::steady_clock::now() + 20s;
         !condition() && std::chrono::steady_clock::now() < end;)
        RunEvents();
    return condition();
}

template <typename T>
T* Find(wxString const& name)
{
    return dynamic_cast<T*>(wxWindow::FindWindowByName(name));
}

class Rows
{
public:
    explicit Rows(wxString const& list) : m_list(Find<VirtualList>(list)) {}

    unsigned Count() const { return Model().GetCount(); }
    std::string Cell(unsigned row, unsigned column) const
    {
        wxVariant value;
        Model().GetValueByRow(value, row, column);
        return comgui::ToUtf8(value.GetString());
    }
    std::vector<std::string> Column(unsigned column) const
    {
        std::vector<std::string> cells;
        for (unsigned row = 0; row < Count(); ++row)
            cells.push_back(Cell(row, column));
        return cells;
    }
    std::optional<unsigned> RowOf(unsigned column, std::string const& text) const
    {
        for (unsigned row = 0; row < Count(); ++row)
            if (Cell(row, column).ends_with(text))
                return row;
        return std::nullopt;
    }
    void Select(unsigned row) const
    {
        m_list->SelectRow(row);
        wxDataViewEvent event(wxEVT_DATAVIEW_SELECTION_CHANGED, m_list, Model().GetItem(row));
        m_list->ProcessWindowEvent(event);
    }
    VirtualList* List() const { return m_list; }

private:
    wxDataViewVirtualListModel& Model() const
    {
        return *static_cast<wxDataViewVirtualListModel*>(m_list->GetModel());
    }
    VirtualList* m_list;
};

class WindowOfTheDesk : public Client
{
protected:
    WindowOfTheDesk()
    {
        delete wxConfigBase::Set(new wxFileConfig("desk", {}, (folder / "desk.conf").string()));
        frame->Show();
    }
    ~WindowOfTheDesk() override
    {
        frame->Close(true);
        RunEvents();
        delete wxConfigBase::Set(nullptr);
    }

    // The desk, and the other client that changes things.
    void Enter()
    {
        frame->LogIn(Here(), Admin());
        ASSERT_TRUE(Await([this] { return types.Count() > 0; }));
        LogIn();
    }
    void ShowJob(comgui::TicketAddress job)
    {
        ASSERT_TRUE(Await([&] { return Choose(types, 0, "Jobs"); }));
        std::string const name = "3/" + std::to_string(job.id);
        ASSERT_TRUE(Await([&] { return Choose(shown, 0, name); }));
        ASSERT_TRUE(Await([&] { return heading() == "Jobs " + name; }));
    }
    static bool Choose(Rows const& rows, unsigned column, std::string const& text)
    {
        auto const row = rows.RowOf(column, text);
        if (row)
            rows.Select(*row);
        return row.has_value();
    }
    std::string ValueOf(std::string const& key) const
    {
        auto const row = keys.RowOf(0, key);
        return row ? keys.Cell(*row, 2) : "none";
    }
    void Menu(int id) const
    {
        wxCommandEvent event(wxEVT_MENU, id);
        frame->ProcessWindowEvent(event);
    }
    int MenuOf(wxString const& menu, wxString const& text) const
    {
        return frame->GetMenuBar()->FindMenuItem(menu, text);
    }
    // As an edit in the cell ends.
    void Type(std::string const& key, std::string const& text) const
    {
        auto const row = keys.RowOf(0, key);
        ASSERT_TRUE(row);
        keys.List()->StartEditing(*row, 2);
        ASSERT_TRUE(Await([] { return Find<wxTextCtrl>("value editor") != nullptr; }));
        auto* const editor = Find<wxTextCtrl>("value editor");
        editor->SetValue(comgui::ToWx(text));
        wxCommandEvent enter(wxEVT_TEXT_ENTER, editor->GetId());
        enter.SetEventObject(editor);
        editor->GetEventHandler()->ProcessEvent(enter);
    }
    std::string Status() const { return comgui::ToUtf8(frame->GetStatusBar()->GetStatusText()); }

    std::function<std::string()> const heading = []
    { return comgui::ToUtf8(Find<wxWindow>("heading")->GetLabel()); };
    MainFrame* const frame = new MainFrame;
    Rows const types{"types"};
    Rows const shown{"tickets"};
    Rows const keys{"keys"};
    Rows const events{"events"};
    Rows const jobs{"jobs"};
};
}  // namespace

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
    BundleOnDisk bundle(folder.Path());
    bundle.LinkExecutable(COMGUI_TROUBLED_PLUGIN);
    bundle.AddFactory(COMGUI_PLUGIN_TYPE_UUID, "11111111-2222-3333-4444-555555555555",
                      "TroubledPlugInFactory");
    UtilityObjects::SetPlugInsFolder(folder.Path().native());
    auto& trouble = *static_cast<TROUBLE*>(
        dlsym(dlopen(COMGUI_TROUBLED_PLUGIN, RTLD_NOW | RTLD_LOCAL), "TroubledPlugInOrders"));
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
