// Undo and redo of the user's own edits. Writes are told as "key=value", "!" before one that would undo
// somebody else's work.
#include "desk/model/EditHistory.h"

#include <gtest/gtest.h>

using namespace desk;
using comgui::Value;

namespace
{
constexpr comgui::TicketAddress Job{comgui::JobTickets, 1};
constexpr comgui::TicketAddress Queue{comgui::QueueTickets, 1};

using Texts = std::vector<std::string>;

// A server with one ticket, and a user whose edits are recorded.
class History : public testing::Test
{
protected:
    void Edit(std::string const& key, Value value)
    {
        history.Record(Job, key, present[key], value);
        present[key] = std::move(value);
    }

    Texts Undo() { return Told(history.Undo(Present())); }
    Texts Redo() { return Told(history.Redo(Present())); }
    void Confirm()
    {
        for (EditWrite const& write : writes)
            present[write.key] = write.value;
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
    Texts Told(std::vector<EditWrite> given)
    {
        writes = std::move(given);
        Texts told;
        for (EditWrite const& write : writes)
            told.push_back((write.isForeign ? "!" : "") + write.key + "=" +
                           (write.value.IsNone() ? "absent" : ToText(write.value)));
        return told;
    }

    EditHistory history;
    std::map<std::string, Value> present;
    std::vector<EditWrite> writes;
};

struct SmallHistory : History
{
    SmallHistory() { history = EditHistory({3, 1000}); }
};
}  // namespace

TEST_F(History, HasNothingAtFirst)
{
    EXPECT_FALSE(history.CanUndo() || history.CanRedo());
    EXPECT_EQ(Undo(), Texts{});
    EXPECT_EQ(Redo(), Texts{});
    EXPECT_FALSE(history.IsUnsettled());
    EXPECT_EQ(history.NextUndo(), nullptr);
}

TEST_F(History, UndoWritesWhatWasBefore)
{
    Edit("a", 1);
    Edit("a", 2);
    EXPECT_EQ(Undo(), Texts{"a=1"});
    Confirm();
    EXPECT_EQ(Undo(), Texts{"a=absent"});
    Confirm();
    EXPECT_FALSE(history.CanUndo());
}

TEST_F(History, RedoWritesWhatWasAfter)
{
    Edit("a", 1);
    Edit("a", {});
    UndoAndConfirm();
    UndoAndConfirm();
    EXPECT_EQ(Redo(), Texts{"a=1"});
    Confirm();
    EXPECT_EQ(Redo(), Texts{"a=absent"});
    Confirm();
    EXPECT_FALSE(history.CanRedo());
    EXPECT_EQ(Undo(), Texts{"a=1"});
}

TEST_F(History, NextStepIsTold)
{
    Edit("a", 1);
    ASSERT_TRUE(history.NextUndo());
    EXPECT_EQ(history.NextUndo()->front().key, "a");
    UndoAndConfirm();
    ASSERT_TRUE(history.NextRedo());
    EXPECT_EQ(history.NextRedo()->front().key, "a");
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
    EXPECT_EQ(Undo(), Texts{"b=absent"});
}

TEST_F(History, RejectedUndoStays)
{
    Edit("a", 1);
    Undo();
    history.Reject();
    EXPECT_FALSE(history.CanRedo());
    EXPECT_EQ(Undo(), Texts{"a=absent"});
}

TEST_F(History, RejectedRedoStays)
{
    Edit("a", 1);
    UndoAndConfirm();
    Redo();
    history.Reject();
    EXPECT_FALSE(history.CanUndo());
    EXPECT_EQ(Redo(), Texts{"a=1"});
}

TEST_F(History, UnsettledStepIsTheOnlyOne)
{
    Edit("a", 1);
    Edit("b", 2);
    Undo();
    EXPECT_TRUE(history.IsUnsettled());
    EXPECT_FALSE(history.CanUndo() || history.CanRedo());
    EXPECT_EQ(Undo(), Texts{});
    EXPECT_EQ(Redo(), Texts{});
}

TEST_F(History, SettlingNothingDoesNothing)
{
    Edit("a", 1);
    history.Confirm();
    history.Reject();
    EXPECT_EQ(Undo(), Texts{"a=absent"});
}

TEST_F(History, ForeignWorkIsTold)
{
    Edit("a", 1);
    present["a"] = 5;
    EXPECT_EQ(Undo(), Texts{"!a=absent"});
    EXPECT_EQ(writes[0].present, Value(5));
}

TEST_F(History, ForeignWorkIsToldByRedo)
{
    Edit("a", 1);
    UndoAndConfirm();
    present["a"] = "x";
    EXPECT_EQ(Redo(), Texts{"!a=1"});
}

TEST_F(History, SomebodyElsesUndoIsNoLoss)
{
    Edit("a", 1);
    present["a"] = {};
    EXPECT_EQ(Undo(), Texts{"a=absent"});
}

TEST_F(History, GroupIsOneStep)
{
    history.BeginGroup();
    Edit("a", 1);
    Edit("b", 2);
    history.EndGroup();
    EXPECT_EQ(Undo(), (Texts{"a=absent", "b=absent"}));
    Confirm();
    EXPECT_EQ(Redo(), (Texts{"a=1", "b=2"}));
}

TEST_F(History, GroupWithinAGroupIsItsPart)
{
    history.BeginGroup();
    Edit("a", 1);
    history.BeginGroup();
    Edit("b", 2);
    history.EndGroup();
    Edit("c", 3);
    history.EndGroup();
    Edit("d", 4);
    UndoAndConfirm();
    EXPECT_EQ(Undo().size(), 3U);
}

TEST_F(History, EmptyGroupIsNoStep)
{
    history.BeginGroup();
    history.EndGroup();
    history.EndGroup();
    EXPECT_FALSE(history.CanUndo());
    Edit("a", 1);
    Edit("b", 1);
    EXPECT_EQ(Undo(), Texts{"b=absent"});
}

TEST_F(History, KeyEditedTwiceInAGroupGoesBackToTheFirst)
{
    history.BeginGroup();
    Edit("a", 1);
    Edit("a", 2);
    history.Record(Queue, "a", 7, 8);
    history.EndGroup();
    EXPECT_EQ(Undo(), (Texts{"a=absent", "!a=7"}));
}

TEST_F(History, PartOfAGroupMayBeRefused)
{
    history.BeginGroup();
    Edit("a", 1);
    Edit("b", 2);
    Edit("c", 3);
    history.EndGroup();
    Undo();
    history.Settle({true, false});
    EXPECT_EQ(history.NextUndo()->size(), 2U);
    EXPECT_EQ(history.NextRedo()->size(), 1U);
    EXPECT_EQ(Undo(), (Texts{"b=absent", "c=absent"}));
}

TEST_F(History, MoreOutcomesThanWritesAreIgnored)
{
    Edit("a", 1);
    Undo();
    history.Settle({true, true, false});
    EXPECT_FALSE(history.CanUndo());
    EXPECT_TRUE(history.CanRedo());
}

TEST_F(History, UndoRejectedAfterANewEditLiesBelowIt)
{
    Edit("a", 1);
    Undo();
    Edit("b", 2);
    history.Reject();
    EXPECT_EQ(Undo(), Texts{"b=absent"});
    Confirm();
    EXPECT_EQ(Undo(), Texts{"a=absent"});
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
    EXPECT_EQ(Undo(), Texts{"k4=absent"});
    Confirm();
    UndoAndConfirm();
    EXPECT_EQ(Undo(), Texts{"k2=absent"});
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
    EXPECT_EQ(Undo(), Texts{"b=absent"});
    Confirm();
    EXPECT_EQ(Redo().size(), 1U);
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
    EXPECT_EQ(Undo(), Texts{"c=absent"});
}

TEST_F(History, GroupOfManyKeysIsUndone)
{
    history.BeginGroup();
    for (int twice = 1; twice <= 2; ++twice)
        for (int i = 0; i < 100'000; ++i)
            Edit("Key" + std::to_string(i), twice);
    history.EndGroup();
    EXPECT_EQ(Undo().size(), 100'000U);
    EXPECT_FALSE(writes.back().isForeign);
    Confirm();
    EXPECT_FALSE(history.CanUndo());
    EXPECT_EQ(Redo().size(), 100'000U);
}
