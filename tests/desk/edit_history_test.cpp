// Undo and redo of the user's own edits. Writes are told as "key=value", "!" before one that would undo
// somebody else's work.
#include "desk/model/EditHistory.h"

#include <gtest/gtest.h>

using namespace desk;
using comgui::Value;

namespace
{
constexpr comgui::TicketAddress Job{comgui::JobTickets, 1};

// A server with one ticket, and a user whose edits are recorded.
class History : public testing::Test
{
protected:
    void Edit(std::string const& key, Value value)
    {
        history.Record(Job, key, present[key], value);
        present[key] = std::move(value);
    }

    std::string Undo() { return Told(history.Undo(Present())); }
    std::string Redo() { return Told(history.Redo(Present())); }
    void Confirm()
    {
        if (write)
            present[write->key] = write->value;
        history.Confirm();
    }
    void UndoAndConfirm()
    {
        Undo();
        Confirm();
    }

    EditHistory::Present Present()
    {
        return [this](comgui::TicketAddress, std::string const& key) { return present[key]; };
    }
    std::string Told(std::optional<EditWrite> given)
    {
        write = std::move(given);
        if (!write)
            return "";
        return (write->isForeign ? "!" : "") + write->key + "=" +
               (write->value.IsNone() ? "absent" : ToText(write->value));
    }

    EditHistory history;
    std::map<std::string, Value> present;
    std::optional<EditWrite> write;
};

struct SmallHistory : History
{
    SmallHistory() { history = EditHistory({3, 1000}); }
};
}  // namespace

TEST_F(History, HasNothingAtFirst)
{
    EXPECT_FALSE(history.CanUndo() || history.CanRedo());
    EXPECT_EQ(Undo(), "");
    EXPECT_EQ(Redo(), "");
    EXPECT_FALSE(history.IsUnsettled());
    EXPECT_EQ(history.NextUndo(), nullptr);
}

TEST_F(History, UndoWritesWhatWasBefore)
{
    Edit("a", 1);
    Edit("a", 2);
    EXPECT_EQ(Undo(), "a=1");
    Confirm();
    EXPECT_EQ(Undo(), "a=absent");
    Confirm();
    EXPECT_FALSE(history.CanUndo());
}

TEST_F(History, RedoWritesWhatWasAfter)
{
    Edit("a", 1);
    Edit("a", {});
    UndoAndConfirm();
    UndoAndConfirm();
    EXPECT_EQ(Redo(), "a=1");
    Confirm();
    EXPECT_EQ(Redo(), "a=absent");
    Confirm();
    EXPECT_FALSE(history.CanRedo());
    EXPECT_EQ(Undo(), "a=1");
}

TEST_F(History, NextStepIsTold)
{
    Edit("a", 1);
    ASSERT_TRUE(history.NextUndo());
    EXPECT_EQ(history.NextUndo()->key, "a");
    UndoAndConfirm();
    ASSERT_TRUE(history.NextRedo());
    EXPECT_EQ(history.NextRedo()->key, "a");
}

TEST_F(History, EditWithoutEffectIsNone)
{
    history.Record(Job, "a", 1, 1);
    EXPECT_FALSE(history.CanUndo());
}

TEST_F(History, NewEditEndsRedo)
{
    Edit("a", 1);
    UndoAndConfirm();
    Edit("b", 2);
    EXPECT_FALSE(history.CanRedo());
    EXPECT_EQ(Undo(), "b=absent");
}

TEST_F(History, RejectedUndoStays)
{
    Edit("a", 1);
    Undo();
    history.Reject();
    EXPECT_FALSE(history.CanRedo());
    EXPECT_EQ(Undo(), "a=absent");
}

TEST_F(History, RejectedRedoStays)
{
    Edit("a", 1);
    UndoAndConfirm();
    Redo();
    history.Reject();
    EXPECT_FALSE(history.CanUndo());
    EXPECT_EQ(Redo(), "a=1");
}

TEST_F(History, UnsettledStepIsTheOnlyOne)
{
    Edit("a", 1);
    Edit("b", 2);
    Undo();
    EXPECT_TRUE(history.IsUnsettled());
    EXPECT_FALSE(history.CanUndo() || history.CanRedo());
    EXPECT_EQ(Undo(), "");
    EXPECT_EQ(Redo(), "");
}

TEST_F(History, SettlingNothingDoesNothing)
{
    Edit("a", 1);
    history.Confirm();
    history.Reject();
    EXPECT_EQ(Undo(), "a=absent");
}

TEST_F(History, ForeignWorkIsTold)
{
    Edit("a", 1);
    present["a"] = 5;
    EXPECT_EQ(Undo(), "!a=absent");
    EXPECT_EQ(write->present, Value(5));
}

TEST_F(History, ForeignWorkIsToldByRedo)
{
    Edit("a", 1);
    UndoAndConfirm();
    present["a"] = "x";
    EXPECT_EQ(Redo(), "!a=1");
}

TEST_F(History, SomebodyElsesUndoIsNoLoss)
{
    Edit("a", 1);
    present["a"] = {};
    EXPECT_EQ(Undo(), "a=absent");
}

TEST_F(History, UndoRejectedAfterANewEditLiesBelowIt)
{
    Edit("a", 1);
    Undo();
    Edit("b", 2);
    history.Reject();
    EXPECT_EQ(Undo(), "b=absent");
    Confirm();
    EXPECT_EQ(Undo(), "a=absent");
}

TEST_F(History, UndoConfirmedAfterANewEditIsNotRedone)
{
    Edit("a", 1);
    Undo();
    Edit("b", 2);
    history.Confirm();
    EXPECT_FALSE(history.CanRedo());
}

TEST_F(History, ClearedOneHasNothing)
{
    Edit("a", 1);
    Edit("b", 1);
    Undo();
    history.Clear();
    EXPECT_FALSE(history.IsUnsettled() || history.CanUndo() || history.CanRedo());
}

TEST_F(SmallHistory, ForgetsTheOldestSteps)
{
    for (int i = 0; i < 5; ++i)
        Edit("k" + std::to_string(i), i);
    EXPECT_EQ(Undo(), "k4=absent");
    Confirm();
    UndoAndConfirm();
    EXPECT_EQ(Undo(), "k2=absent");
    Confirm();
    EXPECT_FALSE(history.CanUndo());
}

TEST_F(SmallHistory, ForgetsWhatTakesTooMuchMemory)
{
    Edit("a", std::string(500, 'x'));
    Edit("b", comgui::Bytes{std::string(500, 'x')});
    UndoAndConfirm();
    EXPECT_FALSE(history.CanUndo());
}

TEST_F(SmallHistory, LastStepStaysWhateverItTakes)
{
    Edit("a", 1);
    Edit("b", std::string(1'000'000, 'x'));
    EXPECT_EQ(Undo(), "b=absent");
    Confirm();
    EXPECT_EQ(Redo(), "b=" + std::string(1'000'000, 'x'));
    Confirm();
    EXPECT_TRUE(history.CanUndo());
}

TEST_F(SmallHistory, PlaceOfAnUnsettledStepMovesWithTheOldest)
{
    Edit("a", 1);
    Edit("b", 1);
    Edit("c", 1);
    Undo();
    for (std::string const key : {"d", "e"})
        Edit(key, 1);
    history.Reject();
    UndoAndConfirm();
    UndoAndConfirm();
    EXPECT_EQ(Undo(), "c=absent");
}
