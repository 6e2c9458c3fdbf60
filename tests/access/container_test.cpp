// Tickets of a container as wholes: opening, creating, listing, walking, closing, notifications.
#include "comgui/access/MTICKET_ADMIN.h"

#include "comgui/access/MTICKET_MODIFY.h"
#include "comgui/access/MTICKET_READ.h"
#include "comgui/testing/ContainerFake.h"
#include "tests/access/FolderVariablesFake.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using comgui::test::CALL;
using comgui::test::ContainerFake;
using comgui::test::SLOT;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char const* const keys[] = {"a", "b*", nullptr};

class Container : public testing::Test
{
protected:
    ContainerFake fake;
    MTICKET_READ const& read = *MTICKET_READ::Of(fake.Access());
    MTICKET_MODIFY const& modify = *MTICKET_MODIFY::Of(fake.Access());
    MTICKET_ADMIN const& admin = *MTICKET_ADMIN::Of(fake.Access());
    std::vector<int> ids = {99};
};

// Walks that keep to an order of their own.
int WalkBackwards(void*, MWALKTICKETS_ACTION action, void* context, int type)
{
    for (int const id : {9, 3, 5})
        action(context, type, id, nullptr);
    return 0;
}
}  // namespace

TEST_F(Container, Views_AreTheAddressOfTheRecord)
{
    EXPECT_EQ(static_cast<void const*>(&read), fake.Access());
    EXPECT_EQ(static_cast<void const*>(&modify), fake.Access());
    EXPECT_EQ(static_cast<void const*>(&admin), fake.Access());
}

TEST_F(Container, Translator_OfAnOperationThatFailedAndWrote_IsNotUsed)
{
    FolderVariablesFake folders;
    fake.folders = &folders;
    fake.Access()->MOPERATION = [](void* instance, int, int, TICKET_OP, void* arg)
    {
        *static_cast<clFOLDER_VARIABLES**>(arg) = static_cast<ContainerFake*>(instance)->folders;
        return 0;
    };
    EXPECT_EQ(read.Decode("$(TEMP)/x"), "$(TEMP)/x");
}

TEST_F(Container, GetTickets_OfATypeThatIsNone_ClearsAndCallsNoSlot)
{
    for (int const type : {100, -1})
    {
        ids = {99};
        EXPECT_FALSE(read.GetTickets(type, ids));
        EXPECT_THAT(ids, IsEmpty());
    }
    EXPECT_THAT(fake.calls, IsEmpty());
}

TEST_F(Container, GetTickets_OfTheLastType_ReachesTheWalk)
{
    fake.AddTicket(99, 4);
    EXPECT_TRUE(read.GetTickets(99, ids));
    EXPECT_THAT(ids, ElementsAre(4));
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::WALK, 99}));
}

TEST_F(Container, GetTickets_WithoutTickets_IsFalseAndEmpty)
{
    fake.AddTicket(4, 1);
    EXPECT_FALSE(read.GetTickets(3, ids));
    EXPECT_THAT(ids, IsEmpty());
}

TEST_F(Container, GetTickets_KeepsTheOrderOfTheWalkWhateverItsResult)
{
    fake.Access()->MWALKTICKETS = WalkBackwards;
    EXPECT_TRUE(read.GetTickets(3, ids));
    EXPECT_THAT(ids, ElementsAre(9, 3, 5));
}

TEST_F(Container, WalkTickets_OfATypeThatIsNone_CallsTheSlotAllTheSame_ByDesign)
{
    fake.success = 5;
    EXPECT_EQ(read.WalkTickets([](void*, int, int, STICKET_ACCESS const*) { return true; }, nullptr, -7), 5);
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::WALK, -7}));
}

TEST_F(Container, WalkTickets_HandsOutEachTicketUntilTheCallbackStops)
{
    for (int const id : {1, 2, 3})
        fake.AddTicket(3, id);
    read.WalkTickets(
        [](void* user, int type, int id, STICKET_ACCESS const* ticket)
        {
            EXPECT_EQ(type, 3);
            EXPECT_NE(ticket, nullptr);
            static_cast<std::vector<int>*>(user)->push_back(id);
            return id < 2;
        },
        &ids, 3);
    EXPECT_THAT(ids, ElementsAre(99, 1, 2));
}

TEST_F(Container, OpenTicket_GivesTheModulesTable)
{
    fake.AddTicket(3, 7);
    EXPECT_NE(read.OpenTicket(3, 7), nullptr);
    ASSERT_EQ(fake.calls.size(), 1u);
    EXPECT_EQ(fake.calls[0].type, 3);
    EXPECT_EQ(fake.calls[0].id, 7);
    EXPECT_EQ(fake.calls[0].op, 102);
}

TEST_F(Container, OpenTicket_OfAMissingTicket_IsNull) { EXPECT_EQ(read.OpenTicket(3, 7), nullptr); }

TEST_F(Container, OpenTicket_ThatFailedAndWrote_IsNull)
{
    fake.Access()->MOPERATION = [](void* instance, int, int, TICKET_OP, void* arg)
    {
        *static_cast<void**>(arg) = instance;
        return 0;
    };
    EXPECT_EQ(read.OpenTicket(3, 7), nullptr);
}

TEST_F(Container, CreateNextTicket_AsksForTheNextIdAndGivesIt)
{
    fake.AddTicket(3, 1);
    EXPECT_EQ(admin.CreateNextTicket(3), 2);
    ASSERT_EQ(fake.calls.size(), 1u);
    EXPECT_EQ(fake.calls[0].type, 3);
    EXPECT_EQ(fake.calls[0].id, -4);
    EXPECT_EQ(fake.calls[0].op, 104);
}

TEST_F(Container, CreateNextTicket_ThatFails_IsMinus1EvenIfTheSlotWrote)
{
    fake.Access()->MOPERATION = [](void*, int, int, TICKET_OP, void* arg)
    {
        *static_cast<int*>(arg) = 5;
        return 0;
    };
    EXPECT_EQ(admin.CreateNextTicket(3), -1);
}

TEST_F(Container, CreateOrOpenTicket_OfAnOpenTicket_DoesNotCreate)
{
    fake.AddTicket(3, 7);
    EXPECT_NE(admin.CreateOrOpenTicket(3, 7, keys), nullptr);
    EXPECT_EQ(fake.calls.size(), 1u);
    EXPECT_EQ(fake.calls[0].op, 102);
}

TEST_F(Container, CreateOrOpenTicket_OfAMissingTicket_CreatesItWithItsKeys)
{
    EXPECT_NE(admin.CreateOrOpenTicket(3, 7, keys), nullptr);
    ASSERT_EQ(fake.calls.size(), 2u);
    EXPECT_EQ(fake.calls[1].slot, SLOT::CREATE);
    EXPECT_EQ(fake.calls[1].type, 3);
    EXPECT_EQ(fake.calls[1].id, 7);
    EXPECT_THAT(fake.calls[1].keys, ElementsAre("a", "b*"));
}

TEST_F(Container, CreateOrOpenTicket_OfAModuleThatCreatesNone_IsNull)
{
    fake.Access()->MCREATETICKET = nullptr;
    EXPECT_EQ(admin.CreateOrOpenTicket(3, 7, keys), nullptr);
    EXPECT_EQ(fake.calls.size(), 1u);
}

TEST_F(Container, CloseTicket_HandsOverTheAddressOfOneByte)
{
    for (bool const flag : {false, true})
    {
        static int seen;
        seen = -1;
        fake.Access()->MOPERATION = [](void*, int type, int id, TICKET_OP op, void* arg)
        {
            EXPECT_EQ(type, 3);
            EXPECT_EQ(id, 7);
            EXPECT_EQ(op.GetInt(), 107);
            seen = *static_cast<unsigned char*>(arg);
            return 6;
        };
        EXPECT_EQ(admin.CloseTicket(3, 7, flag), 6);
        EXPECT_EQ(seen, flag ? 1 : 0);
    }
}

TEST_F(Container, Notifications_AreSwitchedOnWithKeysAndOffWithout)
{
    fake.success = 4;
    EXPECT_EQ(admin.EnableNotification(3, 7, 12, keys), 4);
    EXPECT_EQ(admin.DisableNotification(3, 7, 12), 4);
    CALL on{SLOT::SWITCH, 3, 7};
    on.notification = 12;
    on.enable = true;
    on.keys = {"a", "b*"};
    CALL off = on;
    off.enable = false;
    off.keys.clear();
    EXPECT_THAT(fake.calls, ElementsAre(on, off));
}

TEST_F(Container, DisableNotification_HandsOverANullTable)
{
    static char const* const* seen;
    seen = keys;
    fake.Access()->MENDISNOTIF = [](void*, int, int, int, bool, char const* const* table)
    {
        seen = table;
        return 1;
    };
    admin.DisableNotification(3, 7, 12);
    EXPECT_EQ(seen, nullptr);
}

TEST_F(Container, SetPartial_SendsTheTableItself)
{
    static void* seen;
    seen = nullptr;
    fake.Access()->MOPERATION = [](void*, int type, int id, TICKET_OP op, void* arg)
    {
        EXPECT_EQ(type, 3);
        EXPECT_EQ(id, 7);
        EXPECT_EQ(op.GetInt(), 3);
        seen = arg;
        return 8;
    };
    EXPECT_EQ(modify.SetPartial(3, 7, keys), 8);
    EXPECT_EQ(seen, keys);
}

TEST_F(Container, AddressesThatAreNone_GoToTheSlotAsTheyAre_ByDesign)
{
    read.GetIntParameter(-5, 1 << 30, "k", 0);
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::GET, -5, 1 << 30, "k", PARAM_INT, -1}));
}
