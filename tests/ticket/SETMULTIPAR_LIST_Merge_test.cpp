#include "comgui/ticket/PARTIAL_MODE.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "comgui/ticket/STICKET_ACCESS.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <string>
#include <vector>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
// A ticket that delivers a few records to a walk, some of which are no parameters.
class Ticket
{
public:
    Ticket()
    {
        m_access.Instance = this;
        m_access.SWALKPARAMETERS = OnWalk;
    }
    Ticket(Ticket const&) = delete;

    STICKET_ACCESS const* Access() const { return &m_access; }

    int const copies = 3;
    double const scale = 1.5;
    std::vector<std::string> walks;  // prefix and limit of each

private:
    static int OnWalk(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix,
                      int limit)
    {
        Ticket& ticket = *static_cast<Ticket*>(instance);
        ticket.walks.push_back(std::string(prefix) + " " + std::to_string(limit));
        int const count = 1;
        return action(context, "Job/Copies", PARAM_INT, &ticket.copies, -1) &&
               action(context, "Job/Gone", PARAM_NONE, nullptr, -1) &&
               action(context, "Job/Scale", PARAM_DOUBLE, &ticket.scale, 0) &&
               action(context, "Job/Scale", PARAM_COUNT, &count, -1) &&
               action(context, "Job/Scale", PARAM_DOUBLE, &ticket.scale, 1) &&
               action(context, "Name", PARAM_STRING, "A4", -1);
    }

    STICKET_ACCESS m_access{};
};

class Merge : public testing::Test
{
protected:
    // The records of the list, each as its key and position.
    std::vector<std::string> Records()
    {
        std::vector<std::string> records;
        for (SETMULTIPAR const* record = list.Table(false); record && record->key; ++record)
            records.push_back(std::string(record->key) + " " + std::to_string(record->pos));
        return records;
    }

    void MergeKeys(std::vector<char const*> keys)
    {
        keys.push_back(nullptr);
        list.Merge(ticket.Access(), keys.data());
    }

    void FilteredMergeKeys(std::vector<char const*> keys)
    {
        keys.push_back(nullptr);
        list.FilteredMerge(ticket.Access(), keys.data());
    }

    Ticket ticket;
    SETMULTIPAR_LIST list{false};
    char const* const* const noKeys = nullptr;
};
}  // namespace

TEST_F(Merge, NullTicket_AddsNothing)
{
    char const* const keys[] = {"Job/*", nullptr};
    list.Merge(nullptr, keys);
    list.Merge(nullptr, noKeys);
    list.Merge(nullptr, PARTIAL_MODE(keys));
    list.Merge(nullptr, PARTIAL_MODE(nullptr));
    list.FilteredMerge(nullptr, keys);
    list.FilteredMerge(nullptr, noKeys);
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Merge, NullKeys_TakesAllParameters)
{
    list.Merge(ticket.Access(), noKeys);
    EXPECT_THAT(Records(), ElementsAre("Job/Copies -1", "Job/Scale -1", "Job/Scale 1", "Name -1"));
}

TEST_F(Merge, EmptyTable_TakesAllParameters)
{
    MergeKeys({});
    EXPECT_THAT(Records(), ElementsAre("Job/Copies -1", "Job/Scale -1", "Job/Scale 1", "Name -1"));
}

TEST_F(Merge, Keys_SelectWhatIsTaken)
{
    MergeKeys({"Job/S*", "Name"});
    EXPECT_THAT(Records(), ElementsAre("Job/Scale -1", "Job/Scale 1", "Name -1"));
}

TEST_F(Merge, Star_TakesAllParametersAndNothingElse)
{
    MergeKeys({"*"});
    EXPECT_THAT(Records(), ElementsAre("Job/Copies -1", "Job/Scale -1", "Job/Scale 1", "Name -1"));
}

TEST_F(Merge, TableThatOnlyRemoves_TakesNothing_ByDesign)
{
    MergeKeys({"", "Name"});
    EXPECT_THAT(Records(), IsEmpty());
}

TEST_F(Merge, Mode_SelectsWhatIsTaken)
{
    char const* const keys[] = {"Job/Copies", nullptr};
    list.Merge(ticket.Access(), PARTIAL_MODE(keys));
    EXPECT_THAT(Records(), ElementsAre("Job/Copies -1"));
}

TEST_F(Merge, ModeWithPrefixesOnly_SelectsWhatIsTaken)
{
    char const* const keys[] = {"N*", nullptr};
    list.Merge(ticket.Access(), PARTIAL_MODE(keys));
    EXPECT_THAT(Records(), ElementsAre("Name -1"));
}

TEST_F(Merge, ModeWithoutPatterns_TakesAllParameters)
{
    list.Merge(ticket.Access(), PARTIAL_MODE(nullptr));
    EXPECT_THAT(Records(), ElementsAre("Job/Copies -1", "Job/Scale -1", "Job/Scale 1", "Name -1"));
}

TEST_F(Merge, Filtered_TakesWhatKeysDoNotSelect)
{
    FilteredMergeKeys({"Job/S*", "Name"});
    EXPECT_THAT(Records(), ElementsAre("Job/Copies -1"));
}

TEST_F(Merge, Filtered_NullKeysOrAnEmptyTable_TakesAllParameters)
{
    list.FilteredMerge(ticket.Access(), noKeys);
    EXPECT_EQ(list.Size(), 4u);
    FilteredMergeKeys({});
    EXPECT_EQ(list.Size(), 8u);
}

TEST_F(Merge, Filtered_Star_TakesNothing)
{
    FilteredMergeKeys({"*"});
    EXPECT_THAT(Records(), IsEmpty());
}

TEST_F(Merge, Filtered_TableThatOnlyRemoves_TakesAllParameters)
{
    FilteredMergeKeys({"", "Name"});
    EXPECT_EQ(list.Size(), 4u);
}

TEST_F(Merge, EveryForm_WalksOverTheWholeTicketOnce)
{
    char const* const keys[] = {"Job/*", nullptr};
    list.Merge(ticket.Access(), keys);
    list.Merge(ticket.Access(), noKeys);
    list.Merge(ticket.Access(), PARTIAL_MODE(keys));
    list.Merge(ticket.Access(), PARTIAL_MODE(nullptr));
    list.FilteredMerge(ticket.Access(), keys);
    list.FilteredMerge(ticket.Access(), noKeys);
    EXPECT_THAT(ticket.walks, ElementsAre(" 8000", " 8000", " 8000", " 8000", " 8000", " 8000"));
}

TEST_F(Merge, Values_StayInTheTicketUnlessTheListCopies)
{
    MergeKeys({"Job/*"});
    EXPECT_NE(list.Table(false)[0].value, &ticket.copies);  // an int is always copied
    EXPECT_EQ(list.Table(false)[1].value, &ticket.scale);

    SETMULTIPAR_LIST copying(true);
    char const* const keys[] = {"Job/Scale", nullptr};
    copying.Merge(ticket.Access(), keys);
    ASSERT_EQ(copying.Size(), 2u);
    EXPECT_NE(copying.Table(false)[0].value, &ticket.scale);
    EXPECT_EQ(*static_cast<double const*>(copying.Table(false)[0].value), 1.5);
}

TEST_F(Merge, List_KeepsWhatItHeld)
{
    list.SetParameter("First", 1, -1);
    MergeKeys({"Name"});
    EXPECT_THAT(Records(), ElementsAre("First -1", "Name -1"));
}
