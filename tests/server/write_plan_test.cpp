// What a table of writes makes different in a ticket, and which of its records can be carried out.
#include "standin/server/tickets/WritePlan.h"

#include "tests/server/EditedTicket.h"
#include <gmock/gmock.h>
#include <random>

using namespace standin;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

namespace
{
std::string Shown(ParameterChange const& change)
{
    std::string const what = change.value.type == PARAM_NONE ? "gone"
                             : change.value.type == PARAM_INT
                                 ? std::to_string(change.value.ToStored().integer)
                                 : change.value.text->bytes;
    return change.key + " " + std::to_string(change.pos) + " " + what + (change.hadOthers ? " +" : "");
}

class WritePlans : public testing::Test
{
protected:
    WritePlans()
    {
        ticket.Make(Putting("Single", 0, TicketValue::Int(1)), Putting("Vector", 0, TicketValue::Int(1)),
                    Putting("Vector", 2, TicketValue::Int(3)), Putting("Far", 4, TicketValue::Int(1)));
    }

    // Adds a record to the table.
    void Put(std::string_view key, int pos, int value)
    {
        table.push_back({key, pos, TicketValue::Int(value)});
    }
    void Drop(std::string_view key, int pos = -1) { table.push_back({key, pos, TicketValue()}); }

    // The changes as "KEY POSITION VALUE", with a plus if the key may have had values elsewhere.
    std::vector<std::string> Plan(KeyFilter const* limit = nullptr)
    {
        WritePlan plan(ticket.Now(), table, limit);
        std::vector<std::string> changes;
        for (ParameterChange const& change : plan.Changes())
            changes.push_back(Shown(change));
        return changes;
    }
    std::vector<bool> Answers() const
    {
        std::vector<bool> answers;
        for (TicketWrite const& write : table)
            answers.push_back(write.ok);
        return answers;
    }

    EditedTicket ticket;
    std::vector<TicketWrite> table;
};
}  // namespace

TEST_F(WritePlans, AnEmptyTable_ChangesNothing) { EXPECT_THAT(Plan(), IsEmpty()); }

TEST_F(WritePlans, Values_AreChangesInTheOrderOfTheTable)
{
    Put("Single", -1, 7);
    Put("New", 3, 8);
    Put("Single", 1, 9);
    EXPECT_THAT(Plan(), ElementsAre("Single -1 7", "New 3 8", "Single 1 9"));
    EXPECT_THAT(Answers(), ElementsAre(true, true, true));
}

TEST_F(WritePlans, HadOthers_IsWhetherTheKeyHadAnythingBut0)
{
    Put("Single", -1, 7);
    Put("Vector", -1, 7);
    Put("Far", -1, 7);
    Put("New", -1, 7);
    EXPECT_THAT(Plan(), ElementsAre("Single -1 7", "Vector -1 7 +", "Far -1 7 +", "New -1 7"));
}

TEST_F(WritePlans, HadOthers_KnowsWhatEarlierRecordsDid)
{
    Put("Single", 1, 7);
    Put("Single", -1, 8);
    Put("Single", -1, 9);
    Drop("Vector");
    Put("Vector", -1, 7);
    Drop("Far", 4);
    Put("Far", -1, 7);
    EXPECT_THAT(Plan(), ElementsAre("Single 1 7", "Single -1 8 +", "Single -1 9", "Vector -1 gone +",
                                    "Vector -1 7", "Far 4 gone +", "Far -1 7"));
}

TEST_F(WritePlans, Appends_HaveThePositionBehindTheLastValue)
{
    Put("Vector", -2, 7);
    Put("Vector", -2, 8);
    Put("New", -2, 9);
    Drop("Far", 4);
    Put("Far", -2, 10);
    EXPECT_THAT(Plan(), ElementsAre("Vector 3 7 +", "Vector 4 8 +", "New 0 9", "Far 4 gone +", "Far 0 10"));
}

TEST_F(WritePlans, AnAppendBehindADroppedLastValue_FillsUpToTheOneBefore)
{
    Drop("Vector", 2);
    Put("Vector", -2, 7);
    EXPECT_THAT(Plan(), ElementsAre("Vector 2 gone +", "Vector 1 7"));
}

TEST_F(WritePlans, ADeletionOfWhatIsNotThere_SucceedsAndIsNoChange)
{
    Drop("Missing");
    Drop("Single", 1);
    Drop("Vector", 1);
    Drop("Far", 0);
    Drop("Single");
    Drop("Single");
    Drop("Single", 0);
    EXPECT_THAT(Plan(), ElementsAre("Single -1 gone"));
    EXPECT_THAT(Answers(), testing::Each(true));
}

TEST_F(WritePlans, AValueThatTheTableItselfPut_CanBeDeleted)
{
    Put("New", 2, 7);
    Drop("New", 2);
    Drop("New");
    EXPECT_THAT(Plan(), ElementsAre("New 2 7", "New 2 gone +"));
}

TEST_F(WritePlans, RecordsThatCannotBeCarriedOut_FailAlone)
{
    Put("A", -3, 1);
    Put("A", LargestPosition + 1, 1);
    Put("", -1, 1);
    Drop("A", -2);
    table.push_back({"A", -1, std::nullopt});
    Put("A", LargestPosition, 1);
    Put("A", -2, 1);  // there is nothing behind it
    Put("B", -1, 1);
    EXPECT_THAT(Plan(), ElementsAre("A 16777215 1", "B -1 1"));
    EXPECT_THAT(Answers(), ElementsAre(false, false, false, false, false, true, false, true));
}

TEST_F(WritePlans, KeysOutsideTheLimit_AreNotWritten)
{
    char const* const keys[] = {"S*", nullptr};
    KeyFilter const limit(keys);
    Put("Single", -1, 7);
    Put("Vector", -1, 7);
    Drop("Vector");
    EXPECT_THAT(Plan(&limit), ElementsAre("Single -1 7"));
    EXPECT_THAT(Answers(), ElementsAre(true, false, false));
}

TEST_F(WritePlans, OfATicketThatBeginsEmpty_KnowNoValues)
{
    Put("Single", -2, 7);
    Drop("Vector");
    WritePlan plan(nullptr, table);
    ASSERT_THAT(plan.Changes(), SizeIs(1));
    EXPECT_EQ(Shown(plan.Changes()[0]), "Single 0 7");
}

TEST_F(WritePlans, ATable_CanBePlannedAnew)
{
    table.push_back({"New", -2, TicketValue::String("text")});
    Plan();
    ticket.Make(Putting("New", 0, TicketValue::Int(1)));  // somebody was faster
    EXPECT_THAT(Plan(), ElementsAre("New 1 text"));
    EXPECT_EQ(table[0].value->text->bytes, "text");
}

// A change without hadOthers must say the truth: a store then takes nothing away but position 0. And what the
// changes say is what the table does.
TEST_F(WritePlans, RandomTables_AreWhatAPlainMapMakesOfThem)
{
    char const* const keys[] = {"Single", "Vector", "Far", "New"};
    std::mt19937 random(7);
    auto const among = [&](int from, int to) { return std::uniform_int_distribution(from, to)(random); };
    for (int round = 0; round < 3000 && !HasFailure(); ++round)
    {
        table.clear();
        std::map<std::string, std::map<int, int>> model;
        for (auto const& [key, values] : ticket.Model())
            for (auto const& [pos, value] : values)
                model[key][pos] = static_cast<int>(value.word);
        for (int count = among(0, 6); count > 0; --count)
        {
            char const* const key = keys[among(0, 3)];
            int const pos = among(-2, 4);
            auto& values = model[key];
            if (pos >= -1 && among(0, 2) == 0)
            {
                Drop(key, pos);
                pos == -1 ? values.clear() : static_cast<void>(values.erase(pos));
                continue;
            }
            Put(key, pos, round);
            if (pos == -1)
                values.clear();
            int const end = values.empty() ? 0 : values.rbegin()->first + 1;
            values[pos == -2 ? end : std::max(pos, 0)] = round;
        }
        std::erase_if(model, [](auto const& entry) { return entry.second.empty(); });
        WritePlan plan(ticket.Now(), table);
        for (ParameterChange const& change : plan.Changes())
        {
            std::map<std::string, std::map<int, MODEL_VALUE>> const& before = ticket.Model();
            auto const known = before.find(change.key);
            bool const others = known != before.end() && known->second.rbegin()->first > 0;
            EXPECT_TRUE(change.pos != -1 || change.hadOthers || !others) << Shown(change);
            ticket.Make(ParameterChange{change.key, change.pos, change.value.Copy(), change.hadOthers});
        }
        std::map<std::string, std::map<int, int>> result;
        for (auto const& [key, values] : ticket.Model())
            for (auto const& [pos, value] : values)
                result[key][pos] = static_cast<int>(value.word);
        ASSERT_EQ(result, model) << round;
    }
}
