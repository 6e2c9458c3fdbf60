// The whole window while somebody edits a ticket and others change it.
#include "tests/desk/WindowOfTheDesk.h"

#include <wx/srchctrl.h>

using namespace desk;
using namespace std::chrono_literals;

namespace
{
class EditingInTheDesk : public WindowOfTheDesk
{
protected:
    static wxTextCtrl* Editor()
    {
        auto* const editor = Find<wxTextCtrl>("value editor");
        return editor && editor->IsShown() ? editor : nullptr;
    }

    void Show(comgui::TicketAddress job, std::string const& key)
    {
        ShowJob(job);
        ASSERT_TRUE(Await([&] { return keys.RowOf(0, key).has_value(); }));
    }
    void Choose(std::string const& key) const { ASSERT_TRUE(WindowOfTheDesk::Choose(keys, 0, key)); }
    void BeginEdit(std::string const& key) const
    {
        Choose(key);
        Menu(MenuOf("Edit", "Edit the value"));
        ASSERT_TRUE(Await([] { return Editor() != nullptr; }));
    }
    static void Enter()
    {
        wxCommandEvent enter(wxEVT_TEXT_ENTER, Editor()->GetId());
        enter.SetEventObject(Editor());
        Editor()->GetEventHandler()->ProcessEvent(enter);
    }
    static void RunFor(std::chrono::milliseconds time)
    {
        for (auto const end = std::chrono::steady_clock::now() + time;
             std::chrono::steady_clock::now() < end;)
            RunEvents();
    }
    int NumberIn(comgui::TicketAddress job, std::string const& key) const
    {
        return tickets.ReadAs<int>(job, key).ValueOr(-1);
    }
    // Whatever was to be written before this is written then.
    void WriteAnother(comgui::TicketAddress job, std::string const& text) const
    {
        ASSERT_TRUE(Await([] { return !Find<wxTextCtrl>("value editor"); }));
        Type("Other", text);
        ASSERT_TRUE(Await([&] { return std::to_string(NumberIn(job, "Other")) == text; }));
    }
    // A job that is shown, with "Copies" 3 and "Other" 1.
    comgui::TicketAddress ShownJob()
    {
        WindowOfTheDesk::Enter();
        comgui::TicketAddress const job = NewTicket();
        EXPECT_TRUE(tickets.Write(job, "Copies", 3));
        EXPECT_TRUE(tickets.Write(job, "Other", 1));
        Show(job, "Other");
        return job;
    }
    std::string Chosen() const
    {
        auto const row = keys.List()->Selected();
        return row ? comgui::ToUtf8(comgui::ToWx(keys.Cell(*row, 0)).substr(2)) : "none";
    }
};
}  // namespace

TEST_F(EditingInTheDesk, GoesOn_WhenAnotherKeyChanges)
{
    comgui::TicketAddress const job = ShownJob();
    BeginEdit("Copies");
    Editor()->SetValue("17");
    ASSERT_TRUE(tickets.Write(job, "Other", 2));
    EXPECT_TRUE(Await([this] { return ValueOf("Other") == "2"; }));
    RunFor(1500ms);  // as long as the change flashes
    ASSERT_NE(Editor(), nullptr);
    EXPECT_EQ(Editor()->GetValue(), "17");
    Enter();
    EXPECT_TRUE(Await([&] { return NumberIn(job, "Copies") == 17; }));
    EXPECT_TRUE(Await([this] { return ValueOf("Copies") == "17"; }));
}

TEST_F(EditingInTheDesk, GoesOn_WhenKeysComeAndGo)
{
    comgui::TicketAddress const job = ShownJob();
    BeginEdit("Other");
    Editor()->SetValue("17");
    ASSERT_TRUE(tickets.Write(job, "Another", 5));
    ASSERT_TRUE(tickets.Write(job, "Copies", {}));
    ASSERT_TRUE(Await([this] { return events.RowOf(1, "key deleted").has_value(); }));
    RunFor(300ms);
    ASSERT_NE(Editor(), nullptr);
    Enter();
    EXPECT_TRUE(Await([&] { return NumberIn(job, "Other") == 17; }));
    EXPECT_TRUE(Await([this] { return ValueOf("Another") == "5" && ValueOf("Copies") == "none"; }));
    EXPECT_EQ(Chosen(), "Other");
}

TEST_F(EditingInTheDesk, WithoutTyping_WritesNothing)
{
    comgui::TicketAddress const job = ShownJob();
    BeginEdit("Copies");
    ASSERT_TRUE(tickets.Write(job, "Copies", 17));
    ASSERT_TRUE(Await([this] { return ValueOf("Copies") == "17"; }));
    ASSERT_NE(Editor(), nullptr);
    Enter();
    WriteAnother(job, "2");
    EXPECT_EQ(NumberIn(job, "Copies"), 17);
}

TEST_F(EditingInTheDesk, AsksBeforeItOverwritesWhatAnotherHasWritten)
{
    comgui::TicketAddress const job = ShownJob();
    auto const edit = [&](int before, int answer)
    {
        BeginEdit("Copies");
        Editor()->SetValue("99");
        ASSERT_TRUE(tickets.Write(job, "Copies", before));
        ASSERT_TRUE(Await([&] { return ValueOf("Copies") == std::to_string(before); }));
        Answers const user(answer);
        Enter();
        EXPECT_TRUE(Await([&] { return user.Asked() == 1; }));
        WriteAnother(job, std::to_string(before));
    };
    edit(17, wxID_NO);
    EXPECT_EQ(NumberIn(job, "Copies"), 17);
    edit(18, wxID_YES);
    EXPECT_EQ(NumberIn(job, "Copies"), 99);
}

TEST_F(EditingInTheDesk, RefusesATextThatTheEditorWouldCut)
{
    comgui::TicketAddress const job = ShownJob();
    std::string const text(100'000, 'x');
    ASSERT_TRUE(tickets.Write(job, "Long", text));
    ASSERT_TRUE(Await([this] { return keys.RowOf(0, "Long").has_value(); }));
    Choose("Long");
    Menu(MenuOf("Edit", "Edit the value"));
    RunFor(300ms);
    EXPECT_EQ(Editor(), nullptr);
    if (Editor())
        Enter();
    WriteAnother(job, "2");
    EXPECT_TRUE(tickets.ReadAs<std::string>(job, "Long").ValueOr("") == text);
}

TEST_F(EditingInTheDesk, LeavesArrowsToTheEditor)
{
    WindowOfTheDesk::Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 3));
    Show(job, "Copies");
    auto const isTaken = [this](int key)
    {
        wxKeyEvent event(wxEVT_CHAR_HOOK);
        event.m_keyCode = key;
        return keys.List()->HandleWindowEvent(event);
    };
    BeginEdit("Copies");
    EXPECT_FALSE(isTaken(WXK_LEFT));
    EXPECT_FALSE(isTaken(WXK_RIGHT));
    EXPECT_EQ(Chosen(), "Copies");
    Enter();
    EXPECT_TRUE(isTaken(WXK_LEFT));
    EXPECT_EQ(Chosen(), "Job");
}

TEST_F(EditingInTheDesk, TheChosenKeyStaysChosen_WhereverItsRowIs)
{
    WindowOfTheDesk::Enter();
    comgui::TicketAddress const job = NewTicket();
    std::vector<comgui::KeyValue> values{{"B", 1}, {"C", 1}};
    for (int i = 0; i < 120; ++i)
        values.push_back({"A/" + std::to_string(i), i});
    (void)tickets.WriteAll(job, values);
    Show(job, "B");
    Choose("B");
    Menu(MenuOf("View", "Open all branches"));
    ASSERT_EQ(keys.Count(), 123u);
    EXPECT_EQ(Chosen(), "B");
    Menu(MenuOf("View", "Close all branches"));
    EXPECT_EQ(Chosen(), "B");
    Choose("C");
    Find<wxSearchCtrl>("filter of keys")->SetValue("C");
    ASSERT_EQ(keys.Count(), 1u);
    EXPECT_EQ(Chosen(), "C");
    Find<wxSearchCtrl>("filter of keys")->SetValue("B");
    EXPECT_EQ(Chosen(), "none");
}

TEST_F(EditingInTheDesk, TheChosenEventStaysChosen_WhateverTheFilterHides)
{
    comgui::TicketAddress const job = ShownJob();
    ASSERT_TRUE(tickets.Write(job, "Note", "a"));
    ASSERT_TRUE(tickets.Write(job, "Last", "a"));
    ASSERT_TRUE(Await([this] { return events.RowOf(3, "Last").has_value(); }));
    auto const chosen = [this]
    {
        auto const row = events.List()->Selected();
        return row ? events.Cell(*row, 3) : "none";
    };
    ASSERT_TRUE(WindowOfTheDesk::Choose(events, 3, "Note"));
    ASSERT_GT(events.List()->Selected(), 0u);
    Find<wxSearchCtrl>("filter of events")->SetValue("Note");
    ASSERT_EQ(events.Count(), 1u);
    EXPECT_EQ(chosen(), "Note");
    Find<wxSearchCtrl>("filter of events")->SetValue("Last");
    EXPECT_EQ(chosen(), "none");
    Find<wxSearchCtrl>("filter of events")->SetValue("");
    EXPECT_EQ(chosen(), "none");
}

TEST_F(EditingInTheDesk, ANewKeyBelongsToTheTicketThatItWasMadeFor)
{
    comgui::TicketAddress const job = ShownJob();
    comgui::TicketAddress const other = NewTicket();
    DialogUser const user(
        [&](wxDialog& dialog)
        {
            Find<wxTextCtrl>("key")->SetValue("Note");
            Find<wxTextCtrl>("value")->SetValue("mine");
            ShowJob(other);
            Press(dialog, wxID_OK);
        });
    Menu(MenuOf("Edit", "New key ..."));
    EXPECT_TRUE(Await([&] { return tickets.ReadAs<std::string>(job, "Note").ValueOr("") == "mine"; }));
    EXPECT_FALSE(tickets.Read(other, "Note"));
}

TEST_F(EditingInTheDesk, AKeyThatIsThereIsNotMadeAnew)
{
    comgui::TicketAddress const job = ShownJob();
    std::string told;
    DialogUser const user(
        [&](wxDialog& dialog)
        {
            Find<wxTextCtrl>("key")->SetValue("Copies");
            Find<wxTextCtrl>("value")->SetValue("mine");
            Press(dialog, wxID_OK);
            told = comgui::ToUtf8(wxWindow::FindWindowByName("message", &dialog)->GetLabel());
            if (dialog.IsModal())
                Press(dialog, wxID_CANCEL);
        });
    Menu(MenuOf("Edit", "New key ..."));
    EXPECT_EQ(told, "The ticket has this key already: edit its value.");
    WriteAnother(job, "2");
    EXPECT_EQ(NumberIn(job, "Copies"), 3);
}
