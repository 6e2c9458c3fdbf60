// Reads, writes and deletions that go from the session to the container's slots.
#include "comgui/session/ComGUIManager.h"

#include "tests/session/Faults.h"
#include "tests/session/Tickets.h"
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using comgui::test::CALL;
using comgui::test::ContainerFake;
using comgui::test::SLOT;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char key[] = "Key";

using TicketsDeathTest = Tickets;

// A container whose slots answer a count and nothing else: what it writes and what it says about that.
struct COUNT_ANSWER
{
    char const* name;
    int result;             // of the slot
    unsigned long written;  // nothing if its size is 0
    std::size_t size;       // of the word that it writes
    int values;             // so many does the library see
    int valueCount;         // and so many does GetValueCount tell, which looks at the result, too
};

class Counts : public Tickets, public testing::WithParamInterface<COUNT_ANSWER>
{
protected:
    Counts()
    {
        access.MGETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE ptype, void* value, int) -> int
        {
            if (ptype != PARAM_COUNT)
                return 0;
            std::memcpy(value, &GetParam().written, GetParam().size);
            return GetParam().result;
        };
        module.container = &access;
        manager.GetClientContainer();
    }

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
    int value = 0;
    EXPECT_EQ(manager.GetParameter(3, 7, key, PARAM_INT, &value, 1), 1);
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
    LoseTheContainer();
    int value = 0;
    EXPECT_EXIT(manager.GetParameter(3, 7, key, PARAM_INT, &value, -1), Faults, "");
}

// --- SetParameter ----------------------------------------------------------------------------------------

TEST_F(Tickets, SetParameter_WritesToTheSessionsContainer)
{
    fake.AddTicket(3, 7);
    int const value = 42;
    EXPECT_EQ(manager.SetParameter(3, 7, key, PARAM_INT, &value, -1), 1);
    EXPECT_EQ(fake.Int(3, 7, key), 42);
    EXPECT_THAT(fake.calls, ElementsAre(CALL{SLOT::SET, 3, 7, "Key", PARAM_INT, -1}));
}

TEST_F(Tickets, SetParameter_OfAContainer_WritesToThatOne)
{
    other.AddTicket(3, 7);
    EXPECT_EQ(manager.SetParameter(other.Access(), 3, 7, key, PARAM_STRING, "text", 0), 1);
    EXPECT_EQ(other.Text(3, 7, key, 0), "text");
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::SET, 3, 7, "Key", PARAM_STRING, 0}));
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
    EXPECT_EXIT(manager.SetParameter(nullptr, 3, 7, key, PARAM_INT, &value, -1), Faults, "");
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
    LoseTheContainer();
    int value = 0;
    EXPECT_EXIT(manager.GetSystemTicketParamForKey(key, PARAM_INT, &value, -1), Faults, "");
    EXPECT_EXIT(manager.GetSystemTicketParamForKey(nullptr, key, PARAM_INT, &value, -1), Faults, "");
}

// --- what all forms of reading and writing have in common -------------------------------------------------

namespace
{
struct FORM
{
    char const* name;
    int (*call)(ComGUIManager& manager, MTICKET_ACCESS const* container, int& value, int pos);
    bool system = false;  // goes to the system ticket, not to (3, 7)
};

// Through the session's container, which is the one beside it as well: a form goes to either.
class Forms : public Tickets, public testing::WithParamInterface<FORM>
{
protected:
    Forms()
    {
        fake.Put(0, 0, key, 42);
        fake.Put(3, 7, key, 42);
    }

    int Call(int pos) { return GetParam().call(manager, fake.Access(), value, pos); }

    int value = 43;
};
}  // namespace

TEST_P(Forms, PassTheSlotsResultOnUnchanged)
{
    for (int const result : {0x100, -2, -1, 7})
    {
        fake.success = result;
        EXPECT_EQ(Call(-1), result);
    }
}

TEST_P(Forms, PassPositionMinus2On)
{
    Call(-2);
    ASSERT_EQ(fake.calls.size(), 1u);
    EXPECT_EQ(fake.calls[0].pos, -2);
    EXPECT_EQ(fake.calls[0].type, GetParam().system ? 0 : 3);
    EXPECT_EQ(fake.calls[0].id, GetParam().system ? 0 : 7);
}

INSTANTIATE_TEST_SUITE_P(
    All, Forms,
    testing::Values(FORM{"GetParameter", [](ComGUIManager& m, MTICKET_ACCESS const*, int& value, int pos)
                         { return m.GetParameter(3, 7, key, PARAM_INT, &value, pos); }},
                    FORM{"GetParameterOfAContainer",
                         [](ComGUIManager& m, MTICKET_ACCESS const* c, int& value, int pos)
                         { return m.GetParameter(c, 3, 7, key, PARAM_INT, &value, pos); }},
                    FORM{"SetParameter", [](ComGUIManager& m, MTICKET_ACCESS const*, int& value, int pos)
                         { return m.SetParameter(3, 7, key, PARAM_INT, &value, pos); }},
                    FORM{"SetParameterOfAContainer",
                         [](ComGUIManager& m, MTICKET_ACCESS const* c, int& value, int pos)
                         { return m.SetParameter(c, 3, 7, key, PARAM_INT, &value, pos); }},
                    FORM{"GetSystemTicketParamForKey",
                         [](ComGUIManager& m, MTICKET_ACCESS const*, int& value, int pos)
                         { return m.GetSystemTicketParamForKey(key, PARAM_INT, &value, pos); },
                         true},
                    FORM{"GetSystemTicketParamForKeyOfAContainer",
                         [](ComGUIManager& m, MTICKET_ACCESS const* c, int& value, int pos)
                         { return m.GetSystemTicketParamForKey(c, key, PARAM_INT, &value, pos); },
                         true}),
    [](auto const& form) { return std::string(form.param.name); });

// --- counts and arrays -----------------------------------------------------------------------------------

TEST_F(TicketsLoggedOut, GetValueCount_AsksTheContainerWithoutALogin)
{
    other.Put(3, 7, Umlaut, 1, -1);
    other.Put(3, 7, Umlaut, 2, 1);
    EXPECT_EQ(manager.GetValueCount(other.Access(), 3, 7, wxString::FromUTF8(Umlaut)), 2);
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::GET, 3, 7, Umlaut, PARAM_COUNT, -1}));
}

TEST_F(Tickets, GetValueCount_OfAMissingKey_Is0)
{
    EXPECT_EQ(manager.GetValueCount(fake.Access(), 3, 7, key), 0);
}

TEST_P(Counts, AreTheLow32BitsOfWhatTheSlotWrote)
{
    EXPECT_EQ(manager.GetValueCount(&access, 3, 7, key), GetParam().valueCount);
    std::vector<int> const zeros(static_cast<std::size_t>(GetParam().values), 0);
    EXPECT_EQ(Values(manager.GetIntArray(3, 7, key)), zeros);
    EXPECT_EQ(Values(manager.GetIntArray(&access, 3, 7, key)), zeros);
    EXPECT_EQ(Values(manager.GetIntArray(&access, 3, 7, wxString(key))), zeros);
    std::vector<std::string> const texts(zeros.size());
    EXPECT_EQ(Values(manager.GetStringArray(3, 7, key)), texts);
    EXPECT_EQ(Values(manager.GetStringArray(&access, 3, 7, key)), texts);
    EXPECT_EQ(Values(manager.GetStringArray(&access, 3, 7, wxString(key))), texts);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, Counts,
    testing::Values(COUNT_ANSWER{"Of64Bits", 1, 3, 8, 3, 3}, COUNT_ANSWER{"Of32Bits", 1, 3, 4, 3, 3},
                    COUNT_ANSWER{"Of0", 1, 0, 8, 0, 0},
                    COUNT_ANSWER{"WithBitsAbove32", 1, 0x100000002, 8, 2, 2},
                    COUNT_ANSWER{"NegativeIn32Bits", 1, 0xFFFFFFFF, 4, 0, -1},
                    COUNT_ANSWER{"SuccessOfAnyBit", 0x100, 2, 8, 2, 2},
                    COUNT_ANSWER{"NegativeSuccess", -2, 2, 8, 2, 2},
                    COUNT_ANSWER{"WrittenAndYetAFailure_ArraysDoNotLook_ByDesign", 0, 2, 8, 2, 0},
                    COUNT_ANSWER{"SuccessAndNothingWritten", 1, 0, 0, 0, 0},
                    COUNT_ANSWER{"FailureAndNothingWritten", 0, 0, 0, 0, 0}),
    [](auto const& answer) { return std::string(answer.param.name); });

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

TEST_F(Tickets, GetStringArray_OfAMissingKeyOrNullContainer_IsEmpty)
{
    EXPECT_THAT(Values(manager.GetStringArray(3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetStringArray(nullptr, 3, 7, key)), IsEmpty());
    EXPECT_THAT(Values(manager.GetStringArray(nullptr, 3, 7, wxString("Key"))), IsEmpty());
}

TEST_F(Tickets, Arrays_WideKeysGoOutInUtf8)
{
    other.Put(3, 7, Umlaut, 10);
    EXPECT_THAT(Values(manager.GetIntArray(other.Access(), 3, 7, wxString::FromUTF8(Umlaut))),
                ElementsAre(10));
    other.Put(3, 7, Umlaut, "text");
    EXPECT_THAT(Values(manager.GetStringArray(other.Access(), 3, 7, wxString::FromUTF8(Umlaut))),
                ElementsAre("text"));
}

TEST_F(TicketsDeathTest, Arrays_WithoutAContainerOfTheSession_GoThroughNull_ByDesign)
{
    LoseTheContainer();
    EXPECT_EXIT(manager.GetIntArray(3, 7, key), Faults, "");
    EXPECT_EXIT(manager.GetStringArray(3, 7, key), Faults, "");
}

// --- whole tickets ---------------------------------------------------------------------------------------

TEST_F(Tickets, DeleteTicketOfType_FetchesTheContainerAnewKeepsItAndDeletesThere)
{
    other.AddTicket(3, 7);
    other.success = 0x100;
    module.container = other.Access();
    EXPECT_EQ(manager.DeleteTicketOfType(3, 7), 0x100);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::OPERATION, 3, 7, {}, PARAM_NONE, 0, 106, nullptr}));
    EXPECT_FALSE(FakeIsTheContainer());
}

TEST_F(Tickets, DeleteTicketOfType_OfAContainer_DeletesThereAndPassesTheResultOn)
{
    other.AddTicket(3, 7);
    other.success = -2;
    EXPECT_EQ(manager.DeleteTicketOfType(other.Access(), 3, 7), -2);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::OPERATION, 3, 7, {}, PARAM_NONE, 0, 106, nullptr}));
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
    EXPECT_EXIT(manager.DeleteTicketOfType(nullptr, 3, 7), Faults, "");
    module.container = nullptr;
    EXPECT_EXIT(manager.DeleteTicketOfType(3, 7), Faults, "");
}

TEST_F(TicketsLoggedOut, GetTicketData_PassesItsFiveValuesOnWithoutALogin)
{
    int size = 5;
    char data[4];
    TLogin record = {};
    own->hSession = own;
    record.hSession = &record;
    module.results["GetTicketDataEntry"] = 41;
    EXPECT_EQ(manager.GetTicketData(&record, 1, 2, 3, &size, data), 41);
    EXPECT_EQ(module.session, &record);
    EXPECT_THAT(module.ints, ElementsAre(1, 2, 3));
    EXPECT_THAT(module.pointers, ElementsAre(&size, data));
    EXPECT_EQ(manager.GetTicketData(4, 5, 6, nullptr, data), 41);
    EXPECT_EQ(module.session, own);
    EXPECT_THAT(module.ints, ElementsAre(4, 5, 6));
    EXPECT_THAT(module.pointers, ElementsAre(nullptr, data));
}
