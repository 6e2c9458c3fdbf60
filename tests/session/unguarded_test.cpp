// What goes to a container without asking for a login: a deletion, whole tickets.
#include "comgui/session/ComGUIManager.h"

#include "tests/session/Faults.h"
#include "tests/session/Tickets.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using comgui::test::CALL;
using comgui::test::SLOT;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char const* const Keys[] = {"Job/*", nullptr};

// They ask for no login, so all of them are tried without one.
using Unguarded = TicketsLoggedOut;
using UnguardedDeathTest = TicketsLoggedOut;
}  // namespace

TEST_F(Unguarded, DeleteParameter_OfAContainer_DeletesThereAndGivesTheSlotsResult)
{
    other.Put(3, 7, Key, 5);
    other.success = -2;
    EXPECT_EQ(manager.DeleteParameter(other.Access(), 3, 7, Key, 4), -2);
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::SET, 3, 7, "Key", PARAM_NONE, 4}));
    EXPECT_EQ(manager.DeleteParameter(other.Access(), 3, 8, Key, -1), 0);
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Unguarded, DeleteParameter_OfTheSession_FetchesTheContainerOfTheProcesssManager_ByDesign)
{
    ComGUIManager& single = *ComGUIManager::GetInstance();
    char session = 0;
    module.onLogin = [&](TLogin& login) { login.hSession = &session; };
    single.MacLogin();
    Reset();
    other.Put(3, 7, Key, 5);
    other.success = 0x100;
    module.container = other.Access();
    EXPECT_EQ(manager.DeleteParameter(3, 7, Key, -1), 0x100);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
    EXPECT_EQ(module.session, &session);
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::SET, 3, 7, "Key", PARAM_NONE, -1}));
    EXPECT_TRUE(FakeIsTheContainer());  // this manager's own stays
}

TEST_F(Unguarded, CreateOrOpenTicket_OfAnOpenOne_IsTrueAndCreatesNothing)
{
    fake.AddTicket(3, 7);
    other.AddTicket(3, 7);
    EXPECT_TRUE(manager.CreateOrOpenTicket(3, 7, Keys));
    EXPECT_THAT(WithoutAddresses(fake.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_TRUE(manager.CreateOrOpenTicket(other.Access(), 3, 7, Keys));
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Unguarded, CreateOrOpenTicket_OfAMissingOne_CreatesItOfTheKeys)
{
    CALL created{SLOT::CREATE, 3, 7};
    created.keys = {"Job/*"};
    EXPECT_TRUE(manager.CreateOrOpenTicket(3, 7, Keys));
    EXPECT_THAT(WithoutAddresses(fake.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN), created));
    EXPECT_TRUE(manager.CreateOrOpenTicket(other.Access(), 3, 7, Keys));
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN), created));
}

TEST_F(Unguarded, CreateOrOpenTicket_OfAContainerThatCreatesNone_IsFalse)
{
    fake.Access()->MCREATETICKET = nullptr;
    other.Access()->MCREATETICKET = nullptr;
    EXPECT_FALSE(manager.CreateOrOpenTicket(3, 7, Keys));
    EXPECT_FALSE(manager.CreateOrOpenTicket(other.Access(), 3, 7, Keys));
}

TEST_F(Unguarded, CreateNextTicket_GivesTheNewIdOrMinus1)
{
    other.AddTicket(3, 1);
    EXPECT_EQ(manager.CreateNextTicket(other.Access(), 3), 2);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, -4, MTICKET_OP_CREATE_NEXT)));
    other.FailCall(0);
    EXPECT_EQ(manager.CreateNextTicket(other.Access(), 3), -1);
}

TEST_F(Unguarded, CloseTicket_PassesFalseAndGivesTheSlotsResult)
{
    static int flag;
    flag = -1;
    other.Access()->MOPERATION = [](void*, int type, int id, TICKET_OP op, void* arg)
    {
        EXPECT_EQ(type, 3);
        EXPECT_EQ(id, 7);
        EXPECT_EQ(op.GetInt(), MTICKET_OP_CLOSE);
        flag = *static_cast<unsigned char*>(arg);
        return 0x100;
    };
    EXPECT_EQ(manager.CloseTicket(other.Access(), 3, 7), 0x100);
    EXPECT_EQ(flag, 0);
}

TEST_F(Unguarded, SetPartial_HandsTheKeysThemselvesOverAndGivesTheSlotsResult)
{
    static int result;
    auto const slot = [](void*, int, int, TICKET_OP op, void* arg)
    { return op.GetInt() == STICKET_OP_SET_PARTIAL && arg == Keys ? result : 0; };
    fake.Access()->MOPERATION = slot;
    result = 0x100;
    EXPECT_EQ(manager.SetPartial(3, 7, Keys), 0x100);
    EXPECT_EQ(manager.SetPartial(other.Access(), 3, 7, Keys), 0);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, STICKET_OP_SET_PARTIAL)));
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(UnguardedDeathTest, OfANullContainer_GoThroughNull_ByDesign)
{
    EXPECT_EXIT(manager.DeleteParameter(nullptr, 3, 7, Key, -1), Faults, "");
    EXPECT_EXIT(manager.CreateOrOpenTicket(nullptr, 3, 7, Keys), Faults, "");
    EXPECT_EXIT(manager.CreateNextTicket(nullptr, 3), Faults, "");
    EXPECT_EXIT(manager.CloseTicket(nullptr, 3, 7), Faults, "");
    EXPECT_EXIT(manager.SetPartial(nullptr, 3, 7, Keys), Faults, "");
    LoseTheContainer();
    EXPECT_EXIT(manager.CreateOrOpenTicket(3, 7, Keys), Faults, "");
    EXPECT_EXIT(manager.SetPartial(3, 7, Keys), Faults, "");
}
