// What waits for a subscriber, merged.
#include "comgui/client/PendingEvents.h"

#include "comgui/ticket/TICKET_ID.h"
#include "tests/support/Allocations.h"
#include <algorithm>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using namespace comgui;
using namespace comgui::detail;
using testing::SizeIs;

namespace
{
constexpr TicketAddress Job{3, 1};

struct Pending : testing::Test
{
    void Change(TicketAddress ticket, std::string const& key, std::optional<Value> value)
    {
        pending.Add(interest, TicketEvent{TicketEvent::Changed, ticket, {{key, std::move(value)}}});
    }
    void Create(TicketAddress ticket = Job)
    {
        pending.Add(interest, TicketEvent{TicketEvent::Created, ticket});
    }
    void Delete(TicketAddress ticket = Job)
    {
        pending.Add(interest, TicketEvent{TicketEvent::Deleted, ticket});
    }

    // "D", "C" and keys with their values.
    std::string Taken()
    {
        std::string all;
        for (Event const& event : pending.Take())
        {
            if (std::holds_alternative<TicketDeleted>(event))
                all += "D ";
            else if (std::holds_alternative<TicketCreated>(event))
                all += "C ";
            else if (std::holds_alternative<ServerLost>(event))
                all += "lost ";
            else if (auto const* const back = std::get_if<ServerBack>(&event))
                all += back->isNewSession ? "anew " : "back ";
            else if (auto const* const many = std::get_if<ManyTicketsChanged>(&event))
                all += "many" + std::to_string(many->type) + " ";
            else if (auto const* const changed = std::get_if<TicketChanged>(&event))
            {
                all += changed->isWhole ? "whole " : "";
                for (KeyChange const& change : changed->keys)
                    all += change.key + "=" + (change.value ? ToText(*change.value) : "?") + " ";
            }
        }
        return all;
    }

    Interest interest{{3, 7}, {}, {}, true};
    PendingEvents pending;
};

using PendingEventsOf = Pending;
}  // namespace

TEST_F(PendingEventsOf, LatestValueCounts)
{
    Change(Job, "A", Value(1));
    Change(Job, "B", Value(2));
    Change(Job, "A", Value(3));
    EXPECT_EQ(Taken(), "A=3 B=2 ");
    EXPECT_EQ(Taken(), "");
    EXPECT_TRUE(pending.IsEmpty());
}

TEST_F(PendingEventsOf, PartOfAList_MakesItsValueUnknown)
{
    Change(Job, "A", Value(1));
    Change(Job, "A", std::nullopt);
    EXPECT_EQ(Taken(), "A=? ");
}

TEST_F(PendingEventsOf, CreationsAndDeletions_KeepTheirSense)
{
    Create();
    Change(Job, "A", Value(1));
    EXPECT_EQ(Taken(), "C A=1 ");
    Change(Job, "A", Value(1));
    Delete();
    EXPECT_EQ(Taken(), "D ");
    Create();
    Delete();
    EXPECT_EQ(Taken(), "");
    Delete();
    Create();
    Change(Job, "A", Value(2));
    EXPECT_EQ(Taken(), "D C A=2 ");
    Delete();
    Create();
    Delete();
    EXPECT_EQ(Taken(), "D ");
}

TEST_F(PendingEventsOf, OtherTypes_DoNotCount)
{
    Change({12, 1}, "A", Value(1));
    EXPECT_TRUE(pending.IsEmpty());
}

TEST_F(PendingEventsOf, TooManyKeys_AreTheWholeTicket)
{
    for (std::size_t i = 0; i < PendingEvents::MostKeysOfATicket; ++i)
        Change(Job, std::to_string(i), Value(1));
    Change(Job, "0", Value(2));
    auto const all = pending.Take();
    ASSERT_THAT(all, SizeIs(1));
    EXPECT_THAT(std::get<TicketChanged>(all[0]).keys, SizeIs(PendingEvents::MostKeysOfATicket));
    for (std::size_t i = 0; i <= PendingEvents::MostKeysOfATicket; ++i)
        Change(Job, std::to_string(i), Value(1));
    Change(Job, "0", Value(2));
    EXPECT_EQ(Taken(), "whole ");
}

TEST_F(PendingEventsOf, TooManyTickets_AreTheirType)
{
    Change({7, 1}, "A", Value(1));
    for (int id = 0; id <= static_cast<int>(PendingEvents::MostTickets); ++id)
        Change({3, id}, "A", Value(1));
    Delete({3, 77});
    EXPECT_EQ(Taken(), "A=1 many3 ");
    Change(Job, "A", Value(5));
    EXPECT_EQ(Taken(), "A=5 ");
}

TEST_F(PendingEventsOf, TypeThatWasUnheard_IsToBeListedAnew)
{
    Change(Job, "A", 1);
    Change({7, 1}, "B", 2);
    pending.AddUnheard(interest, {3, TICKET_ID_ALL});
    pending.AddUnheard(interest, {4, TICKET_ID_ALL});  // of no interest
    Change(Job, "C", 3);
    EXPECT_EQ(Taken(), "B=2 many3 ");
}

TEST_F(PendingEventsOf, TicketThatWasUnheard_IsToBeReadAnew)
{
    interest.tickets = {{5, 1}};
    Create({5, 1});
    Change({5, 1}, "A", 1);
    pending.AddUnheard(interest, {5, 1});
    pending.AddUnheard(interest, Job);  // of interest by its type only
    Change({5, 1}, "B", 2);
    EXPECT_EQ(Taken(), "C whole ");
}

TEST_F(PendingEventsOf, TicketThatWasUnheard_IsPartOfItsType)
{
    interest.tickets = {Job};
    pending.AddUnheard(interest, {3, TICKET_ID_ALL});
    pending.AddUnheard(interest, Job);
    EXPECT_EQ(Taken(), "many3 ");
}

TEST_F(PendingEventsOf, TooManyBytes_AreLeftOut)
{
    std::string const large(PendingEvents::MostBytes / 2 + 1, 'x');
    Change(Job, "A", Value(large));
    Change(Job, "B", Value(large));
    Change(Job, "A", Value(1));
    Change(Job, "C", Value(large));
    auto const all = pending.Take();
    auto const& keys = std::get<TicketChanged>(all.at(0)).keys;
    ASSERT_THAT(keys, SizeIs(3));
    EXPECT_EQ(keys[0].value, Value(1));
    EXPECT_FALSE(keys[1].value);
    EXPECT_EQ(keys[2].value, Value(large));
}

TEST_F(PendingEventsOf, Server_IsLostAndBackOnceAtMost)
{
    ServerLost const lost{};
    pending.Add(interest, Event(lost));
    pending.Add(interest, Event(ServerBack{true}));
    pending.Add(interest, Event(lost));
    EXPECT_EQ(Taken(), "lost ");
    pending.Add(interest, Event(lost));
    pending.Add(interest, Event(ServerBack{true}));
    pending.Add(interest, Event(lost));
    pending.Add(interest, Event(ServerBack{false}));
    EXPECT_EQ(Taken(), "lost anew ");
    pending.Add(interest, Event(ServerBack{false}));
    EXPECT_EQ(Taken(), "back ");
}

TEST_F(PendingEventsOf, DroppedTickets_LeaveTheServer)
{
    Change(Job, "A", Value(1));
    pending.Add(interest, Event(ServerBack{false}));
    pending.DropTickets();
    EXPECT_EQ(Taken(), "back ");
}

TEST(ChangesOfRecords, OfOneKey_AreOneChange)
{
    char const* const a = "A";
    char const* const b = "B";
    int const one = 1, two = 2;
    SETMULTIPAR const records[] = {{a, PARAM_INT, 0, &one, -1, true, {}},
                                   {a, PARAM_INT, 0, &two, 1, true, {}},
                                   {b, PARAM_NONE, 0, nullptr, -1, true, {}},
                                   {a, PARAM_INT, 0, &two, 3, true, {}},
                                   {}};
    auto const changes = ChangesOf(records);
    ASSERT_THAT(changes, SizeIs(3));
    EXPECT_EQ(changes[0].value, Value(MakeList<int>({1, 2})));
    EXPECT_EQ(changes[1].value, Value());
    EXPECT_FALSE(changes[2].value);
    EXPECT_THAT(ChangesOf(nullptr), SizeIs(0));
}

// Measured at the heap: what an event comes to there is more than its texts.
TEST_F(PendingEventsOf, ManySmallKeysOfManyTickets_TakeLittleMemory)
{
    constexpr std::size_t Most = std::size_t{32} << 20;
    std::size_t const before = LiveBytes();
    for (int id = 0; id < 1000; ++id)
        for (int key = 0; key < 1000; ++key)
            Change({3, id}, "Some/Folder/Of/Keys/" + std::to_string(key), Value(key));
    EXPECT_GT(LiveBytes() - before, Most / 8);
    EXPECT_LT(LiveBytes() - before, Most);
    auto const events = pending.Take();
    EXPECT_LT(LiveBytes() - before, Most);
    ASSERT_THAT(events, SizeIs(1000));
    EXPECT_THAT(std::get<TicketChanged>(events.front()).keys, SizeIs(1000));
    EXPECT_TRUE(std::get<TicketChanged>(events.back()).isWhole);
}

TEST_F(PendingEventsOf, DroppedTickets_GiveTheirMemoryBack)
{
    auto const fill = [this]
    {
        for (int id = 0; id < 300; ++id)
            for (int key = 0; key < 1000; ++key)
                Change({3, id}, std::to_string(key), Value(key));
    };
    auto const wholeOnes = [this]
    {
        auto const events = pending.Take();
        return std::count_if(events.begin(), events.end(),
                             [](Event const& event) { return std::get<TicketChanged>(event).isWhole; });
    };
    fill();
    pending.DropTickets();
    fill();
    auto const first = wholeOnes();
    EXPECT_GT(first, 0);
    fill();
    EXPECT_EQ(wholeOnes(), first);
}
