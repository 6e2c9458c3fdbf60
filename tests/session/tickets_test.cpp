// Reads, writes and deletions that go from the session to the container's slots.
#include "comgui/session/ComGUIManager.h"

#include "tests/session/FakeModule.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char key[] = "Key";

// Logged in, with the fake as the session's container and another one beside it.
class Tickets : public WithManager
{
protected:
    Tickets()
    {
        LogIn();
        Reset();
    }

    void Reset()
    {
        module.calls.clear();
        fake.calls.clear();
        other.calls.clear();
    }

    ContainerFake other;
};

class TicketsLoggedOut : public Tickets
{
protected:
    TicketsLoggedOut()
    {
        manager.Logout();
        Reset();
    }
};

using TicketsDeathTest = Tickets;

// Answers every read with the same results and remembers how a count was asked for.
struct BARE_CONTAINER
{
    BARE_CONTAINER() { access.Instance = this; }

    MTICKET_ACCESS access = {};
};

std::vector<int> Values(wxArrayInt const& array) { return {array.begin(), array.end()}; }

std::vector<std::string> Values(wxArrayString const& array)
{
    std::vector<std::string> values;
    for (wxString const& text : array)
        values.push_back(text.utf8_string());
    return values;
}
}  // namespace

// --- GetParameter ----------------------------------------------------------------------------------------

TEST_F(Tickets, GetParameter_AsksTheSessionsContainer)
{
    fake.Put(3, 7, key, 42, 1);
    fake.success = 0x100;
    int value = 0;
    EXPECT_EQ(manager.GetParameter(3, 7, key, PARAM_INT, &value, 1), 0x100);  // passed on as it stands
    EXPECT_EQ(value, 42);
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_INT, 1}));
}

TEST_F(Tickets, GetParameter_OfAMissingKey_Gives0AndLeavesTheValue)
{
    int value = 5;
    EXPECT_EQ(manager.GetParameter(3, 7, key, PARAM_INT, &value, -1), 0);
    EXPECT_EQ(value, 5);
}

TEST_F(Tickets, GetParameter_OfAContainer_AsksThatOne)
{
    other.Put(3, 7, key, "text");
    char const* value = nullptr;
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, key, PARAM_STRING, &value, -1), 1);
    EXPECT_STREQ(value, "text");
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_STRING, -1}));
    EXPECT_THAT(fake.calls, IsEmpty());
}

TEST_F(Tickets, GetParameter_OfANullContainer_GivesMinus1AndLeavesTheValue)
{
    int value = 5;
    EXPECT_EQ(manager.GetParameter(nullptr, 3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(value, 5);
}

TEST_F(TicketsLoggedOut, GetParameter_GivesMinus1AndLeavesTheValueInBothForms)
{
    fake.Put(3, 7, key, 42);
    other.Put(3, 7, key, 42);
    int value = 5;
    EXPECT_EQ(manager.GetParameter(3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(manager.GetParameter(nullptr, 3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(value, 5);
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(other.calls, IsEmpty());
}

TEST_F(TicketsLoggedOut, GetParameter_OfTheBackwardContainer_IsGuardedByTheImplicitSession_ByDesign)
{
    TLogin record = {};
    manager.LoginBackward(&record);
    int value = 5;
    EXPECT_EQ(manager.GetParameter(manager.GetBackwardContainer(), 3, 7, key, PARAM_INT, &value, -1), -1);
}

TEST_F(TicketsDeathTest, GetParameter_WithoutAContainerOfTheSession_GoesThroughNull_ByDesign)
{
    module.container = nullptr;
    manager.Login(nullptr, nullptr, nullptr, -1);
    int value = 0;
    EXPECT_DEATH(manager.GetParameter(3, 7, key, PARAM_INT, &value, -1), "");
}

// --- SetParameter ----------------------------------------------------------------------------------------

TEST_F(Tickets, SetParameter_WritesToTheSessionsContainer)
{
    fake.AddTicket(3, 7);
    fake.success = 2;
    int const value = 42;
    EXPECT_EQ(manager.SetParameter(3, 7, key, PARAM_INT, &value, -1), 2);
    EXPECT_EQ(fake.Int(3, 7, key), 42);
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::SET, 3, 7, "Key", PARAM_INT, -1}));
}

TEST_F(Tickets, SetParameter_OfAContainer_WritesToThatOne)
{
    other.AddTicket(3, 7);
    EXPECT_EQ(manager.SetParameter(other.Access(), 3, 7, key, PARAM_STRING, "text", 0), 1);
    EXPECT_EQ(other.Text(3, 7, key, 0), "text");
    EXPECT_THAT(fake.calls, IsEmpty());
}

TEST_F(Tickets, SetParameter_Refused_GivesTheSlots0)
{
    int const value = 42;
    EXPECT_EQ(manager.SetParameter(3, 7, key, PARAM_INT, &value, -1), 0);  // there is no such ticket
}

TEST_F(TicketsLoggedOut, SetParameter_GivesMinus1InBothForms)
{
    fake.AddTicket(3, 7);
    other.AddTicket(3, 7);
    int const value = 42;
    EXPECT_EQ(manager.SetParameter(3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(manager.SetParameter(other.Access(), 3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_EQ(manager.SetParameter(nullptr, 3, 7, key, PARAM_INT, &value, -1), -1);
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(other.calls, IsEmpty());
}

TEST_F(TicketsDeathTest, SetParameter_OfANullContainer_GoesThroughNull_ByDesign)
{
    int const value = 42;
    EXPECT_DEATH(manager.SetParameter(nullptr, 3, 7, key, PARAM_INT, &value, -1), "");
}

// --- the system ticket -----------------------------------------------------------------------------------

TEST_F(TicketsLoggedOut, GetSystemTicketParamForKey_ReadsTicket00WithoutALogin_ByDesign)
{
    fake.Put(0, 0, key, 42);
    other.Put(0, 0, key, 43);
    int value = 0;
    EXPECT_EQ(manager.GetSystemTicketParamForKey(key, PARAM_INT, &value, -1), 1);
    EXPECT_EQ(value, 42);
    EXPECT_EQ(manager.GetSystemTicketParamForKey(other.Access(), key, PARAM_INT, &value, 0), 1);
    EXPECT_EQ(value, 43);
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::GET, 0, 0, "Key", PARAM_INT, -1}));
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::GET, 0, 0, "Key", PARAM_INT, 0}));
}

TEST_F(TicketsDeathTest, GetSystemTicketParamForKey_OfANullContainer_GoesThroughNull_ByDesign)
{
    int value = 0;
    EXPECT_DEATH(manager.GetSystemTicketParamForKey(nullptr, key, PARAM_INT, &value, -1), "");
}

// --- counts and arrays -----------------------------------------------------------------------------------

TEST_F(TicketsLoggedOut, GetValueCount_AsksTheContainerWithoutALogin)
{
    wxString const umlaut = wxString::FromUTF8("K\xC3\xA4y");
    other.Put(3, 7, "K\xC3\xA4y", 1, -1);
    other.Put(3, 7, "K\xC3\xA4y", 2, 1);
    EXPECT_EQ(manager.GetValueCount(other.Access(), 3, 7, umlaut), 2);
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "K\xC3\xA4y", PARAM_COUNT, -1}));
}

TEST_F(Tickets, GetValueCount_OfAMissingKey_Is0)
{
    EXPECT_EQ(manager.GetValueCount(fake.Access(), 3, 7, key), 0);
}

TEST_F(Tickets, GetValueCount_OfASlotThatSucceedsAndWritesNothing_Is0)
{
    BARE_CONTAINER bare;
    bare.access.MGETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void*, int) { return 1; };
    EXPECT_EQ(manager.GetValueCount(&bare.access, 3, 7, key), 0);
}

TEST_F(Tickets, GetIntArray_ReadsEachPositionInAllThreeForms)
{
    for (ContainerFake* container : {&fake, &other})
    {
        container->Put(3, 7, key, 10, -1);
        container->Put(3, 7, key, -20, 1);
        container->Put(3, 7, key, 30, 2);
    }
    EXPECT_THAT(Values(manager.GetIntArray(3, 7, key)), ElementsAre(10, -20, 30));
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_COUNT, -1},
                                        CALL{SLOT::GET, 3, 7, "Key", PARAM_INT, 0},
                                        CALL{SLOT::GET, 3, 7, "Key", PARAM_INT, 1},
                                        CALL{SLOT::GET, 3, 7, "Key", PARAM_INT, 2}));
    EXPECT_THAT(Values(manager.GetIntArray(other.Access(), 3, 7, key)), ElementsAre(10, -20, 30));
    EXPECT_THAT(Values(manager.GetIntArray(other.Access(), 3, 7, wxString("Key"))), ElementsAre(10, -20, 30));
    EXPECT_EQ(fake.calls.size(), 4u);
    EXPECT_EQ(other.calls.size(), 8u);
}

TEST_F(Tickets, GetIntArray_FailedRead_GivesThePreviousValueAgain_ByDesign)
{
    fake.Put(3, 7, key, 10, -1);
    fake.Put(3, 7, key, 20, 1);
    fake.Put(3, 7, key, 30, 2);
    fake.FailPosition(1);
    EXPECT_THAT(Values(manager.GetIntArray(3, 7, key)), ElementsAre(10, 10, 30));
}

TEST_F(Tickets, GetIntArray_FirstReadFailed_GivesZero)
{
    fake.Put(3, 7, key, 10, -1);
    fake.Put(3, 7, key, 20, 1);
    fake.FailPosition(0);
    EXPECT_THAT(Values(manager.GetIntArray(3, 7, key)), ElementsAre(0, 20));
}

TEST_F(Tickets, GetIntArray_OfAMissingKeyOrNullContainer_IsEmpty)
{
    EXPECT_THAT(Values(manager.GetIntArray(3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetIntArray(nullptr, 3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetIntArray(nullptr, 3, 7, wxString("Key"))), IsEmpty());
}

TEST_F(TicketsLoggedOut, Arrays_AreEmpty)
{
    fake.Put(3, 7, key, 10);
    other.Put(3, 7, key, 10);
    EXPECT_THAT(Values(manager.GetIntArray(3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetIntArray(other.Access(), 3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetIntArray(other.Access(), 3, 7, wxString("Key"))), IsEmpty());
    EXPECT_THAT(Values(manager.GetStringArray(3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetStringArray(other.Access(), 3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetStringArray(other.Access(), 3, 7, wxString("Key"))), IsEmpty());
}

TEST_F(Tickets, GetStringArray_ReadsEachPositionAsUtf8InAllThreeForms)
{
    for (ContainerFake* container : {&fake, &other})
    {
        container->Put(3, 7, key, "Gr\xC3\xBCn", -1);
        container->Put(3, 7, key, "", 1);
    }
    EXPECT_THAT(Values(manager.GetStringArray(3, 7, key)), ElementsAre("Gr\xC3\xBCn", ""));
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_COUNT, -1},
                                        CALL{SLOT::GET, 3, 7, "Key", PARAM_STRING, 0},
                                        CALL{SLOT::GET, 3, 7, "Key", PARAM_STRING, 1}));
    EXPECT_THAT(Values(manager.GetStringArray(other.Access(), 3, 7, key)), ElementsAre("Gr\xC3\xBCn", ""));
    EXPECT_THAT(Values(manager.GetStringArray(other.Access(), 3, 7, wxString("Key"))),
                ElementsAre("Gr\xC3\xBCn", ""));
}

TEST_F(Tickets, GetStringArray_FailedRead_GivesThePreviousTextAgain_ByDesign)
{
    fake.Put(3, 7, key, "a", -1);
    fake.Put(3, 7, key, "b", 1);
    fake.Put(3, 7, key, "c", 2);
    fake.FailPosition(1);
    EXPECT_THAT(Values(manager.GetStringArray(3, 7, key)), ElementsAre("a", "a", "c"));
}

TEST_F(Tickets, GetStringArray_FirstReadFailed_GivesTheEmptyText)
{
    fake.Put(3, 7, key, "a", -1);
    fake.Put(3, 7, key, "b", 1);
    fake.FailPosition(0);
    EXPECT_THAT(Values(manager.GetStringArray(3, 7, key)), ElementsAre("", "b"));
}

TEST_F(Tickets, GetStringArray_OfAMissingKeyOrACountOf0_IsEmpty)
{
    EXPECT_THAT(Values(manager.GetStringArray(3, 7, key)), IsEmpty());
    BARE_CONTAINER bare;
    bare.access.MGETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void* value, int)
    {
        *static_cast<unsigned long*>(value) = 0;
        return 1;
    };
    EXPECT_THAT(Values(manager.GetStringArray(&bare.access, 3, 7, key)), IsEmpty());
}

// --- whole tickets ---------------------------------------------------------------------------------------

TEST_F(Tickets, DeleteTicketOfType_FetchesTheContainerAnewAndDeletesThere)
{
    other.AddTicket(3, 7);
    module.container = other.Access();
    EXPECT_EQ(manager.DeleteTicketOfType(3, 7), 1);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
    EXPECT_FALSE(other.HasTicket(3, 7));
    ASSERT_EQ(other.calls.size(), 1u);
    EXPECT_EQ(other.calls[0].slot, SLOT::OPERATION);
    EXPECT_EQ(other.calls[0].op, 106);
    EXPECT_EQ(other.calls[0].arg, nullptr);
}

TEST_F(TicketsLoggedOut, DeleteTicketOfType_AsksForNoLogin_ByDesign)
{
    fake.AddTicket(3, 7);
    other.AddTicket(3, 7);
    EXPECT_EQ(manager.DeleteTicketOfType(3, 7), 1);
    EXPECT_EQ(manager.DeleteTicketOfType(other.Access(), 3, 7), 1);
    EXPECT_FALSE(fake.HasTicket(3, 7));
    EXPECT_FALSE(other.HasTicket(3, 7));
}

TEST_F(Tickets, DeleteTicketOfType_OfAMissingTicket_GivesTheSlots0)
{
    EXPECT_EQ(manager.DeleteTicketOfType(other.Access(), 3, 7), 0);
}

TEST_F(TicketsDeathTest, DeleteTicketOfType_OfANullContainer_GoesThroughNull_ByDesign)
{
    EXPECT_DEATH(manager.DeleteTicketOfType(nullptr, 3, 7), "");
    module.container = nullptr;
    EXPECT_DEATH(manager.DeleteTicketOfType(3, 7), "");
}

TEST_F(TicketsLoggedOut, GetTicketData_PassesItsFiveValuesOnWithoutALogin)
{
    int size = 5;
    char data[4];
    TLogin record = {};
    record.hSession = &record;
    module.results["GetTicketDataEntry"] = 41;
    EXPECT_EQ(manager.GetTicketData(&record, 1, 2, 3, &size, data), 41);
    EXPECT_EQ(module.session, &record);
    EXPECT_THAT(module.ints, ElementsAre(1, 2, 3));
    EXPECT_THAT(module.pointers, ElementsAre(&size, data));
    EXPECT_EQ(manager.GetTicketData(4, 5, 6, nullptr, nullptr), 41);
    EXPECT_EQ(module.session, nullptr);
    EXPECT_THAT(module.ints, ElementsAre(4, 5, 6));
}
