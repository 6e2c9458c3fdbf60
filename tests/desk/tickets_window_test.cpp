// Tickets and keys that are made, deleted and compared through the menu.
#include "tests/desk/WindowOfTheDesk.h"

#include "desk/view/CompareFrame.h"
#include <gmock/gmock.h>
#include <wx/checkbox.h>
#include <wx/choice.h>
#include <wx/numdlg.h>
#include <wx/spinctrl.h>
#include <wx/textdlg.h>

using namespace desk;
using testing::ElementsAre;

namespace
{
class TicketsOfTheDesk : public WindowOfTheDesk
{
protected:
    comgui::TicketAddress ShownJob()
    {
        Enter();
        comgui::TicketAddress const job = NewTicket();
        (void)tickets.WriteAll(job, {{"Copies", 3}, {"Note", "text"}});
        ShowJob(job);
        EXPECT_TRUE(Await([this] { return keys.Count() == 2; }));
        return job;
    }
    void AddKey(std::string const& key, int type, std::string const& text)
    {
        DialogUser const user(
            [&](wxDialog& dialog)
            {
                Find<wxTextCtrl>("key")->SetValue(comgui::ToWx(key));
                dynamic_cast<wxChoice*>(wxWindow::FindWindowByName("type", &dialog))->SetSelection(type);
                Find<wxTextCtrl>("value")->SetValue(comgui::ToWx(text));
                Press(dialog, wxID_OK);
                told = comgui::ToUtf8(wxWindow::FindWindowByName("message", &dialog)->GetLabel());
                if (dialog.IsModal())
                    Press(dialog, wxID_CANCEL);
            });
        Menu(MenuOf("Edit", "New key ..."));
    }
    // The window beside this one that compares what is shown with that ticket.
    CompareFrame* CompareWith(std::string const& ticket)
    {
        DialogUser const user(
            [&](wxDialog& dialog)
            {
                dynamic_cast<wxTextEntryDialog&>(dialog).SetValue(comgui::ToWx(ticket));
                dialog.EndModal(wxID_OK);
            });
        Menu(MenuOf("Ticket", "Compare with ..."));
        return Find<CompareFrame>("compare");
    }
    std::string told;
};
}  // namespace

TEST_F(TicketsOfTheDesk, NewOne_IsOfTheTypeThatWasChosen_AndShown)
{
    Enter();
    auto const before = tickets.List(comgui::PaperTickets)->size();
    DialogUser const user(
        [](wxDialog& dialog)
        {
            for (wxWindow* const child : dialog.GetChildren())
                if (auto* const number = dynamic_cast<wxSpinCtrl*>(child))
                    number->SetValue(comgui::PaperTickets);
            Press(dialog, wxID_OK);
        });
    Menu(MenuOf("Ticket", "New ticket ..."));
    ASSERT_TRUE(Await([&] { return tickets.List(comgui::PaperTickets)->size() == before + 1; }));
    std::string const id = std::to_string(tickets.List(comgui::PaperTickets)->back().id);
    EXPECT_TRUE(Await([&] { return heading().ends_with("12/" + id); })) << heading();
}

TEST_F(TicketsOfTheDesk, AreDeletedOnlyIfTheUserSaysYes)
{
    comgui::TicketAddress const job = ShownJob();
    for (int const answer : {wxID_NO, wxID_YES})
    {
        Answers const user(answer);
        Menu(MenuOf("Ticket", "Delete the ticket"));
        EXPECT_EQ(user.Asked(), 1);
        bool const isDeleted = answer == wxID_YES;
        EXPECT_TRUE(Await([&] { return !isDeleted || !tickets.ReadAll(job); }));
        EXPECT_EQ(!tickets.ReadAll(job), isDeleted);
    }
    EXPECT_TRUE(Await([this] { return keys.Count() == 0; }));
}

TEST_F(TicketsOfTheDesk, NewKeys_HaveTheTypeThatWasChosen)
{
    comgui::TicketAddress const job = ShownJob();
    AddKey("New/Text", 0, "17");
    AddKey("New/Int", 1, "17");
    AddKey("New/Double", 2, "17");
    ASSERT_TRUE(Await([&] { return tickets.Read(job, "New/Double").operator bool(); }));
    EXPECT_EQ(*tickets.Read(job, "New/Text"), comgui::Value("17"));
    EXPECT_EQ(*tickets.Read(job, "New/Int"), comgui::Value(17));
    EXPECT_EQ(*tickets.Read(job, "New/Double"), comgui::Value(17.0));
}

TEST_F(TicketsOfTheDesk, NewKeysThatCannotBe_AreExplained)
{
    comgui::TicketAddress const job = ShownJob();
    AddKey("", 0, "text");
    EXPECT_EQ(told, "A key has a name.");
    AddKey("Number", 1, "many");
    EXPECT_NE(told, "");
    EXPECT_FALSE(tickets.Read(job, "Number"));
}

TEST_F(TicketsOfTheDesk, KeyThatIsDeleted_ComesBackByUndo)
{
    comgui::TicketAddress const job = ShownJob();
    keys.List()->SetFocus();
    keys.Select(*keys.RowOf(0, "Note"));
    Menu(MenuOf("Edit", "Delete the key"));
    ASSERT_TRUE(Await([&] { return !tickets.Read(job, "Note"); }));
    ASSERT_TRUE(Await([this] { return keys.Count() == 1; }));
    Menu(wxID_UNDO);
    EXPECT_TRUE(Await([&] { return tickets.ReadAs<std::string>(job, "Note").ValueOr("") == "text"; }));
    EXPECT_TRUE(Await([this] { return keys.Count() == 2; }));
}

TEST_F(TicketsOfTheDesk, TwoOfThem_AreCompared_AndFollowed)
{
    ShownJob();
    comgui::TicketAddress const other = NewTicket();
    (void)tickets.WriteAll(other, {{"Copies", 4}, {"Note", "text"}, {"More", 1}});
    ASSERT_NE(CompareWith("3/" + std::to_string(other.id)), nullptr);
    Rows const compared("compared keys");
    EXPECT_TRUE(Await([&] { return compared.Count() == 2; }));
    EXPECT_THAT(compared.Column(0), ElementsAre("Copies", "More"));
    EXPECT_THAT(compared.Column(1), ElementsAre("3", ""));
    EXPECT_THAT(compared.Column(2), ElementsAre("4", "1"));
    ASSERT_TRUE(tickets.Write(other, "Copies", 3));
    EXPECT_TRUE(Await([&] { return compared.Count() == 1; }));
    auto* const onlyDifferences = Find<wxCheckBox>("only differences");
    onlyDifferences->SetValue(false);
    wxCommandEvent click(wxEVT_CHECKBOX, onlyDifferences->GetId());
    click.SetInt(0);
    onlyDifferences->GetEventHandler()->ProcessEvent(click);
    EXPECT_THAT(compared.Column(0), ElementsAre("Copies", "More", "Note"));
}

TEST_F(TicketsOfTheDesk, TextThatIsNoTicket_IsNotComparedWith)
{
    ShownJob();
    EXPECT_EQ(CompareWith("nonsense"), nullptr);
    EXPECT_NE(Status(), "");
}

// Who types in a field means the field.
TEST_F(TicketsOfTheDesk, UndoInAField_LeavesTheTicket)
{
    comgui::TicketAddress const job = ShownJob();
    Type("Copies", "17");
    ASSERT_TRUE(Await([&] { return tickets.ReadAs<int>(job, "Copies").ValueOr(0) == 17; }));
    ASSERT_TRUE(Await([this] { return frame->GetMenuBar()->IsEnabled(wxID_UNDO); }));
    Menu(MenuOf("Edit", "Search tickets"));
    ASSERT_TRUE(Await([] { return dynamic_cast<wxTextEntry*>(wxWindow::FindFocus()) != nullptr; }));
    Menu(wxID_UNDO);
    Menu(MenuOf("Edit", "Delete the key"));
    ASSERT_TRUE(tickets.Write(job, "Note", "behind"));
    ASSERT_TRUE(Await([this] { return ValueOf("Note") == "behind"; }));
    EXPECT_EQ(tickets.ReadAs<int>(job, "Copies").ValueOr(0), 17);
    keys.List()->SetFocus();
    Menu(wxID_UNDO);
    EXPECT_TRUE(Await([&] { return tickets.ReadAs<int>(job, "Copies").ValueOr(0) == 3; }));
}
