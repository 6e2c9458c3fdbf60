// Edits at a server, and their way back.
#include "desk/model/TicketEditor.h"

#include "tests/client/TroubledClient.h"
#include <gmock/gmock.h>

using namespace desk;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
class EditorOfTickets : public TroubledClient
{
protected:
    EditorOfTickets()
    {
        editor->onRefused = [this](comgui::TicketAddress, std::string const& key, comgui::Error const& error)
        { heard.push_back(key + " refused " + std::to_string(error.code)); };
        editor->onWritten = [this](comgui::TicketAddress, std::string const& key)
        { heard.push_back(key + " written"); };
        editor->onForeign = [this](EditWrite const& foreign)
        {
            heard.push_back("foreign " + foreign.key);
            return isForeignOverwritten;
        };
    }

    void Await(std::size_t count)
    {
        for (auto const end = std::chrono::steady_clock::now() + 20s;
             heard.size() < count && std::chrono::steady_clock::now() < end;)
            queue.RunFor(2ms);
        queue.RunFor(20ms);
    }
    int Copies() const { return tickets.ReadAs<int>(job, "Copies").ValueOr(0); }

    comgui::Worker const worker{queue.GetExecutor()};
    std::optional<TicketEditor> editor{std::in_place, tickets, worker};
    bool isForeignOverwritten = false;
    comgui::TicketAddress const job = (LogIn(), NewTicket());
};
}  // namespace

TEST_F(EditorOfTickets, WritesByTheTypeOfTheKey)
{
    ASSERT_TRUE(tickets.Write(job, "Copies", 1));
    editor->WriteText(job, "Copies", "7");
    Await(1);
    EXPECT_THAT(heard, ElementsAre("Copies written"));
    EXPECT_EQ(Copies(), 7);
}

TEST_F(EditorOfTickets, TellsWhatIsRefused_AndHasNothingToUndo)
{
    ASSERT_TRUE(tickets.Write(job, "Copies", 1));
    editor->WriteText(job, "Copies", "many");
    Await(1);
    EXPECT_THAT(heard, ElementsAre("Copies refused " + std::to_string(comgui::NotANumber)));
    EXPECT_FALSE(editor->CanUndo());
}

TEST_F(EditorOfTickets, UndoesAndRedoes)
{
    editor->Write(job, "Copies", 1);
    editor->WriteText(job, "Copies", "2");
    Await(2);
    editor->Undo();
    Await(3);
    EXPECT_EQ(Copies(), 1);
    editor->Undo();
    Await(4);
    EXPECT_EQ(CodeOf(tickets.Read(job, "Copies")), comgui::NoSuchKey);
    EXPECT_FALSE(editor->CanUndo());
    EXPECT_TRUE(editor->CanRedo());
    editor->Redo();
    Await(5);
    editor->Redo();
    Await(6);
    EXPECT_EQ(Copies(), 2);
    EXPECT_FALSE(editor->CanRedo());
}

TEST_F(EditorOfTickets, AsksBeforeItUndoesWhatOthersHaveChanged)
{
    editor->Write(job, "Copies", 1);
    Await(1);
    ASSERT_TRUE(tickets.Write(job, "Copies", 50));
    editor->Undo();
    Await(2);
    EXPECT_THAT(heard, ElementsAre("Copies written", "foreign Copies"));
    EXPECT_EQ(Copies(), 50);
    EXPECT_TRUE(editor->CanUndo());
    isForeignOverwritten = true;
    editor->Undo();
    Await(4);
    EXPECT_EQ(CodeOf(tickets.Read(job, "Copies")), comgui::NoSuchKey);
}

TEST_F(EditorOfTickets, UndoesAnEditThatIsStillBeingWritten)
{
    ASSERT_TRUE(tickets.Write(job, "Copies", 1));
    editor->Write(job, "Pages", 1);
    Await(1);
    editor->Write(job, "Copies", 2);
    editor->Undo();
    Await(3);
    EXPECT_THAT(heard, ElementsAre("Pages written", "Copies written", "Copies written"));
    EXPECT_EQ(Copies(), 1);
    EXPECT_EQ(tickets.ReadAs<int>(job, "Pages").ValueOr(0), 1);
}

TEST_F(EditorOfTickets, BehindAnEditThatIsStillBeingWritten_AsksAboutWhatOthersMakeOfIt)
{
    editor->Write(job, "Pages", 1);
    Await(1);
    editor->Write(job, "Copies", 2);
    worker.Do([this] { return tickets.Write(job, "Copies", 50); }, [](auto const&) {});
    editor->Undo();
    Await(3);
    EXPECT_THAT(heard, ElementsAre("Pages written", "Copies written", "foreign Copies"));
    EXPECT_EQ(Copies(), 50);
}

TEST_F(EditorOfTickets, WithNothingLeftToRedoBehindAnEdit_RedoesNothing)
{
    editor->Write(job, "Copies", 1);
    Await(1);
    editor->Undo();
    Await(2);
    editor->Write(job, "Pages", 1);
    editor->Redo();
    Await(3);
    EXPECT_THAT(heard, ElementsAre("Copies written", "Copies written", "Pages written"));
    EXPECT_EQ(CodeOf(tickets.Read(job, "Copies")), comgui::NoSuchKey);
    EXPECT_TRUE(editor->CanUndo());
}

TEST_F(EditorOfTickets, WhoseUndoIsRefused_KeepsIt)
{
    editor->Write(job, "Copies", 1);
    Await(1);
    isForeignOverwritten = true;
    ASSERT_TRUE(tickets.Delete(job));
    editor->Undo();
    Await(2);
    EXPECT_TRUE(editor->CanUndo()) << heard.back();
}

// Of lists, so that a read is a walk, which the plug-in refuses by order.
TEST_F(EditorOfTickets, WithoutKnowingWhatTheKeyHolds_DoesNotWrite)
{
    comgui::Value const before = comgui::MakeList<int>({1, 2});
    ASSERT_TRUE(tickets.Write(job, "Pages", before));
    trouble.tickets.refusedWalks = 1;
    editor->Write(job, "Pages", 3);
    Await(1);
    EXPECT_THAT(heard, ElementsAre("Pages refused " + std::to_string(comgui::BadAnswer)));
    EXPECT_EQ(*tickets.Read(job, "Pages"), before);
    EXPECT_FALSE(editor->CanUndo());
}

TEST_F(EditorOfTickets, WithoutKnowingWhatTheKeyHolds_DoesNotUndo_AndKeepsTheStep)
{
    comgui::Value const after = comgui::MakeList<int>({1, 2});
    isForeignOverwritten = true;
    editor->Write(job, "Pages", after);
    Await(1);
    trouble.tickets.refusedWalks = 1;
    editor->Undo();
    Await(2);
    EXPECT_THAT(heard, ElementsAre("Pages written", "Pages refused " + std::to_string(comgui::BadAnswer)));
    EXPECT_EQ(*tickets.Read(job, "Pages"), after);
    editor->Undo();
    Await(3);
    EXPECT_EQ(CodeOf(tickets.Read(job, "Pages")), comgui::NoSuchKey);
}

TEST_F(EditorOfTickets, WithoutKnowingWhatTheKeyHasBecome_HasNothingToUndo)
{
    ASSERT_TRUE(tickets.Write(job, "Pages", 1));
    trouble.tickets.refusedWalks = 1;
    editor->Write(job, "Pages", comgui::MakeList<int>({1, 2}));
    Await(1);
    EXPECT_THAT(heard, ElementsAre("Pages written"));
    EXPECT_FALSE(editor->CanUndo());
}

TEST_F(EditorOfTickets, WithNothingToUndo_DoesNothing)
{
    editor->Undo();
    editor->Redo();
    queue.RunFor(20ms);
    EXPECT_THAT(heard, IsEmpty());
}

TEST_F(EditorOfTickets, AtItsEnd_CallsBackNoMore)
{
    editor->Write(job, "Copies", 3);
    editor.reset();
    queue.RunFor(200ms);
    EXPECT_THAT(heard, IsEmpty());
    EXPECT_EQ(Copies(), 3);
}
