// The window without a mouse: keys as the system sends them.
#include "tests/desk/WindowOfTheDesk.h"

#include <wx/notebook.h>
#include <wx/tglbtn.h>
#include <wx/uiaction.h>

using namespace desk;

namespace
{
class KeysOfTheDesk : public WindowOfTheDesk
{
protected:
    KeysOfTheDesk()
    {
        frame->Raise();
        RunFor(20);
    }
    static void RunFor(int rounds)
    {
        for (int i = 0; i < rounds; ++i)
            RunEvents();
    }
    void PressKey(int key, int modifiers = wxMOD_NONE)
    {
        m_user.Char(key, modifiers);
        RunFor(10);
    }
    static std::string Focus()
    {
        auto const* const focus = wxWindow::FindFocus();
        return focus ? comgui::ToUtf8(focus->GetName()) : "nothing";
    }
    // What dialog the key opens, and cancels.
    std::string DialogOf(int key)
    {
        std::string title = "none";
        DialogUser const user(
            [&](wxDialog& dialog)
            {
                title = comgui::ToUtf8(dialog.GetTitle());
                dialog.EndModal(wxID_CANCEL);
            });
        PressKey(key, wxMOD_CONTROL);
        return title;
    }

    void PressKeys(std::string const& text)
    {
        m_user.Text(text.c_str());
        RunFor(10);
    }

private:
    wxUIActionSimulator m_user;
};
}  // namespace

TEST_F(KeysOfTheDesk, OfTheMenu_WorkInEveryPane)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Copies", 3));
    ShowJob(job);
    ASSERT_TRUE(Await([this] { return keys.Count() == 1; }));
    for (char const* const pane : {"types", "tickets", "keys", "events"})
    {
        auto const start = [pane]
        {
            Find<wxWindow>(pane)->SetFocus();
            RunFor(5);
        };
        start();
        ASSERT_EQ(Focus(), pane);
        EXPECT_EQ(DialogOf('N'), "New key") << pane;
        start();
        EXPECT_EQ(DialogOf('T'), "New ticket") << pane;
        start();
        EXPECT_EQ(DialogOf('D'), "Compare 3/" + std::to_string(job.id)) << pane;
        start();
        PressKey('F', wxMOD_CONTROL);
        EXPECT_EQ(Focus(), "search") << pane;
        start();
        PressKey('K', wxMOD_CONTROL);
        EXPECT_EQ(Focus(), "filter of keys") << pane;
    }
}

TEST_F(KeysOfTheDesk, EditAValue_AndUndoIt)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Copies", 3));
    ShowJob(job);
    ASSERT_TRUE(Await([this] { return keys.Count() == 1; }));
    keys.List()->SetFocus();
    keys.Select(0);
    PressKey(WXK_F2);
    ASSERT_TRUE(Await([] { return Focus() == "value editor"; })) << Focus();
    PressKey('A', wxMOD_CONTROL);
    PressKeys("17");
    PressKey(WXK_RETURN);
    EXPECT_TRUE(Await([&] { return tickets.ReadAs<int>(job, "Copies").ValueOr(0) == 17; }));
    ASSERT_TRUE(Await([this] { return frame->GetMenuBar()->IsEnabled(wxID_UNDO); }));
    keys.List()->SetFocus();
    PressKey('Z', wxMOD_CONTROL);
    EXPECT_TRUE(Await([&] { return tickets.ReadAs<int>(job, "Copies").ValueOr(0) == 3; }));
}

TEST_F(KeysOfTheDesk, MoveThroughThePanes)
{
    Enter();
    Find<wxWindow>("types")->SetFocus();
    RunFor(5);
    wxWindow* const panes[] = {Find<wxWindow>("keys")->GetParent(),
                               Find<wxWindow>("events")->GetParent()->GetParent(),  // the notebook of it
                               Find<wxWindow>("tickets")->GetParent()};
    for (wxWindow const* const pane : panes)
    {
        PressKey(WXK_F6);
        EXPECT_TRUE(pane->IsDescendant(wxWindow::FindFocus())) << Focus();
    }
}
