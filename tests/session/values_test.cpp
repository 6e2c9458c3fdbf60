// A host's own values on their way to and from a container: variants, lists, arrays, holders; and whole
// tickets.
#include "comgui/session/ComGUIManager.h"

#include "comgui/session/SetDataHolder.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/folders/FolderServer.h"
#include "tests/session/Faults.h"
#include "tests/session/ScarceMemory.h"
#include "tests/session/Tickets.h"
#include <climits>
#include <cstdlib>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>
#include <wx/debug.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char const Key[] = "Key";
char const Umlaut[] = "K\xC3\xA4y";
char const* const Keys[] = {"Job/*", nullptr};

CALL Operation(int type, int id, int op, void* arg = nullptr)
{
    return {SLOT::OPERATION, type, id, {}, PARAM_NONE, 0, op, arg};
}

// What a slot was asked to do, without where it shall put what it finds.
std::vector<CALL> WithoutAddresses(std::vector<CALL> calls)
{
    for (CALL& call : calls)
        call.arg = nullptr;
    return calls;
}

class Variants : public Tickets
{
protected:
    Variants() { value.SetName("Before"); }

    void ExpectUntouched() const
    {
        EXPECT_EQ(value.GetType(), "string");
        EXPECT_EQ(value.GetString(), "before");
        EXPECT_EQ(value.GetName(), "Before");
        EXPECT_THAT(fake.calls, IsEmpty());
        EXPECT_THAT(other.calls, IsEmpty());
    }

    void ExpectMinus1() const
    {
        EXPECT_EQ(value.GetType(), "long");
        EXPECT_EQ(value.GetLong(), -1);
        EXPECT_EQ(value.GetName(), "");
    }

    wxVariant value{"before"};
    wxVariant const none;
    wxVariant const marker{"marker"};
};
}  // namespace

// --- GetParameter and GetParameterEx of a variant ----------------------------------------------------------

TEST_F(Variants, GetParameter_GivesTheTicketsTypeAndTheKeyForAName)
{
    other.Put(3, 7, Umlaut, 42);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Umlaut, value, -1), 1);
    EXPECT_EQ(value.GetType(), "long");
    EXPECT_EQ(value.GetLong(), 42);
    EXPECT_EQ(value.GetName(), wxString::FromUTF8(Umlaut));
    EXPECT_THAT(fake.calls, IsEmpty());
}

TEST_F(Variants, GetParameter_OfAPosition_GivesThatValue)
{
    other.Put(3, 7, Key, 42, 0);
    other.Put(3, 7, Key, "text", 1);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, 1), 1);
    EXPECT_EQ(value.GetType(), "string");
    EXPECT_EQ(value.GetString(), "text");
}

TEST_F(Variants, GetParameter_OfAList_GivesItWhole)
{
    other.Put(3, 7, Key, "a", 0);
    other.Put(3, 7, Key, "b", 1);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, -1), 1);
    EXPECT_EQ(value.GetType(), "arrstring");
    EXPECT_EQ(value.GetArrayString().size(), 2u);
}

TEST_F(Variants, GetParameter_OfAMissingKey_Gives1AndTheLongMinus1_ByDesign)
{
    other.AddTicket(3, 7);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, -1), 1);
    ExpectMinus1();
}

TEST_F(Variants, GetParameter_OfAMissingTicket_Gives1AndTheLongMinus1_ByDesign)
{
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, -1), 1);
    ExpectMinus1();
}

TEST_F(Variants, GetParameter_OfATypeThatNoVariantHas_Gives1AndTheLongMinus1_ByDesign)
{
    long long const number = 5;
    other.Put(3, 7, Key, PARAM_INT64, &number, -1);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, -1), 1);
    ExpectMinus1();
}

TEST_F(Variants, GetParameterEx_OfAKeyThatIsThere_Gives1WhateverTheMarker)
{
    other.Put(3, 7, Key, 42);
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, marker), 1);
    EXPECT_EQ(value.GetLong(), 42);
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, 0, none), 1);
    EXPECT_EQ(value.GetLong(), 42);
    EXPECT_EQ(value.GetName(), Key);
}

TEST_F(Variants, GetParameterEx_OfAPosition_GivesThatValue)
{
    other.Put(3, 7, Key, 42, 0);
    other.Put(3, 7, Key, "text", 1);
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, 1, none), 1);
    EXPECT_EQ(value.GetType(), "string");
    EXPECT_EQ(value.GetString(), "text");
}

TEST_F(Variants, GetParameterEx_OfAMissingKeyWithANullMarker_Gives0AndWhatTheReadItselfLeft)
{
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, none), 0);
    EXPECT_TRUE(value.IsNull());
    EXPECT_EQ(value.GetName(), Key);
}

TEST_F(Variants, GetParameterEx_OfANullMarker_TakesNoNoticeOfItsName)
{
    wxVariant named;
    named.SetName("marker");
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, named), 0);
    EXPECT_TRUE(value.IsNull());
}

TEST_F(Variants, GetParameterEx_OfAMissingKeyWithAMarker_Gives1AndTheLongMinus1NotTheMarker_ByDesign)
{
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, marker), 1);
    ExpectMinus1();
}

TEST_F(Variants, LoggedOut_GiveMinus1AndLeaveTheVariant)
{
    other.Put(3, 7, Key, 42);
    manager.Logout();
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, -1), -1);
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, marker), -1);
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, none), -1);
    ExpectUntouched();
}

TEST_F(Variants, OfANullContainer_GiveMinus1AndLeaveTheVariant)
{
    EXPECT_EQ(manager.GetParameter(nullptr, 3, 7, Key, value, -1), -1);
    EXPECT_EQ(manager.GetParameterEx(nullptr, 3, 7, Key, value, -1, marker), -1);
    EXPECT_EQ(manager.GetParameterEx(nullptr, 3, 7, Key, value, -1, none), -1);
    ExpectUntouched();
}

TEST_F(Variants, WithABackwardSessionAlone_GiveMinus1AndLeaveTheVariant_ByDesign)
{
    manager.Logout();
    TLogin second{};
    ASSERT_EQ(manager.LoginBackward(&second), 0);
    other.Put(3, 7, Key, 42);
    EXPECT_EQ(manager.GetParameter(other.Access(), 3, 7, Key, value, -1), -1);
    EXPECT_EQ(manager.GetParameterEx(other.Access(), 3, 7, Key, value, -1, none), -1);
    ExpectUntouched();
}

// --- GetKeyParameterType -----------------------------------------------------------------------------------

namespace
{
class KeyTypes : public Tickets
{
protected:
    bool Ask(MTICKET_ACCESS const* container)
    {
        return manager.GetKeyParameterType(container, 3, 7, Key, ptype, elementType);
    }

    int ptype = 77;
    int elementType = 88;
};
}  // namespace

TEST_F(KeyTypes, OfOneValue_IsItsTypeAndTheElementTypeIsLeftAlone)
{
    other.Put(3, 7, Key, "text");
    EXPECT_TRUE(Ask(other.Access()));
    EXPECT_EQ(ptype, PARAM_STRING);
    EXPECT_EQ(elementType, 88);
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_NONE, -1}));
}

TEST_F(KeyTypes, OfSeveralValues_IsTheCountAndTheTypeOfTheFirst)
{
    other.Put(3, 7, Key, 1.5, 0);
    other.Put(3, 7, Key, 5, 1);
    EXPECT_TRUE(Ask(other.Access()));
    EXPECT_EQ(ptype, PARAM_COUNT);
    EXPECT_EQ(elementType, PARAM_DOUBLE);
    EXPECT_THAT(other.calls, ElementsAre(CALL{SLOT::GET, 3, 7, "Key", PARAM_NONE, -1},
                                         CALL{SLOT::GET, 3, 7, "Key", PARAM_NONE, 0}));
}

TEST_F(KeyTypes, OfSeveralValuesBehindAGap_IsTheCountAndNoElementType)
{
    other.Put(3, 7, Key, 5, 1);
    EXPECT_TRUE(Ask(other.Access()));
    EXPECT_EQ(ptype, PARAM_COUNT);
    EXPECT_EQ(elementType, 0);
}

TEST_F(KeyTypes, OfAMissingKey_IsFalseAnd0)
{
    EXPECT_FALSE(Ask(other.Access()));
    EXPECT_EQ(ptype, 0);
    EXPECT_EQ(elementType, 88);
}

TEST_F(KeyTypes, LoggedOut_IsFalseAnd0)
{
    other.Put(3, 7, Key, 5);
    manager.Logout();
    EXPECT_FALSE(Ask(other.Access()));
    EXPECT_EQ(ptype, 0);
    EXPECT_EQ(elementType, 88);
    EXPECT_THAT(other.calls, IsEmpty());
}

TEST_F(KeyTypes, OfANullContainer_IsFalseAnd0)
{
    EXPECT_FALSE(Ask(nullptr));
    EXPECT_EQ(ptype, 0);
    EXPECT_EQ(elementType, 88);
}

// --- typed reads -------------------------------------------------------------------------------------------

namespace
{
// They ask for no login, so all of them are tried without one.
class TypedReads : public TicketsLoggedOut
{
protected:
    TypedReads() { fake.AddTicket(3, 7); }

    ComGUIManager const& reader = manager;
};

using TypedReadsDeathTest = TypedReads;

// Whether nothing of the default is lost on its way in.
template <typename Default>
constexpr bool IsADefaultOfAPosition = requires(ComGUIManager const& manager, Default def)
{
    manager.GetDoubleParameter(3, 7, 0, Key, {def});
};
}  // namespace

TEST_F(TypedReads, GetIntParameter_GivesTheValueOrTheDefault)
{
    fake.Put(3, 7, Key, 42);
    EXPECT_EQ(reader.GetIntParameter(3, 7, Key, 5), 42);
    EXPECT_EQ(reader.GetIntParameter(3, 7, "Missing", 5), 5);
    EXPECT_EQ(fake.calls[0], (CALL{SLOT::GET, 3, 7, "Key", PARAM_INT, -1}));
}

TEST_F(TypedReads, GetIntParameter_OfAPosition_GivesThatOneOrTheDefault)
{
    fake.Put(3, 7, Key, 42, 2);
    EXPECT_EQ(reader.GetIntParameter(3, 7, 2, Key, 5), 42);
    EXPECT_EQ(reader.GetIntParameter(3, 7, 1, Key, 5), 5);
}

TEST_F(TypedReads, GetDoubleParameter_GivesTheValueOrTheDefault)
{
    fake.Put(3, 7, Key, 42.5);
    EXPECT_EQ(reader.GetDoubleParameter(3, 7, Key, 5.5), 42.5);
    EXPECT_EQ(reader.GetDoubleParameter(3, 7, "Missing", 5.5), 5.5);
    EXPECT_EQ(fake.calls[0], (CALL{SLOT::GET, 3, 7, "Key", PARAM_DOUBLE, -1}));
}

TEST_F(TypedReads, GetDoubleParameter_OfAPosition_GivesThatOneOrTheDefault)
{
    fake.Put(3, 7, Key, 42.5, 2);
    EXPECT_EQ(reader.GetDoubleParameter(3, 7, 2, Key, 5), 42.5);
    EXPECT_EQ(reader.GetDoubleParameter(3, 7, 1, Key, 5), 5.0);
}

TEST_F(TypedReads, GetDoubleParameter_OfAPosition_TakesAWholeNumberForADefault_ByDesign)
{
    EXPECT_TRUE(IsADefaultOfAPosition<int>);
    EXPECT_FALSE(IsADefaultOfAPosition<double>);
}

TEST_F(TypedReads, GetBoolParameter_GivesWhetherTheIntIsNot0OrTheDefault)
{
    fake.Put(3, 7, Key, 0, 0);
    fake.Put(3, 7, Key, -2, 1);
    EXPECT_FALSE(reader.GetBoolParameter(3, 7, 0, Key, true));
    EXPECT_TRUE(reader.GetBoolParameter(3, 7, 1, Key, false));
    EXPECT_TRUE(reader.GetBoolParameter(3, 7, 2, Key, true));
    EXPECT_FALSE(reader.GetBoolParameter(3, 7, 2, Key, false));
}

TEST_F(TypedReads, GetParameter_OfAText_GivesItOrEmptiesTheCallers)
{
    fake.Put(3, 7, Key, "Gr\xC3\xBCn", 1);
    wxString value = "before";
    EXPECT_TRUE(reader.GetParameter(3, 7, Key, value, 1));
    EXPECT_EQ(value, wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_FALSE(reader.GetParameter(3, 7, Key, value, 2));
    EXPECT_EQ(value, "");
}

TEST_F(TypedReads, GetwxStringParameter_GivesTheTextOrTheEmptyOne)
{
    fake.Put(3, 7, Key, "Gr\xC3\xBCn", 1);
    EXPECT_EQ(reader.GetwxStringParameter(3, 7, Key, 1), wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(reader.GetwxStringParameter(3, 7, Key, 2), "");
}

TEST_F(TypedReads, GetVectorParameter_GivesAllValuesOfEachOfThreeTypes)
{
    fake.Put(3, 7, "Ints", 1, 0);
    fake.Put(3, 7, "Ints", 2, 1);
    fake.Put(3, 7, "Doubles", 1.5, 0);
    fake.Put(3, 7, "Doubles", 2.5, 1);
    fake.Put(3, 7, "Texts", "a", 0);
    fake.Put(3, 7, "Texts", "b", 1);
    std::vector<int> ints;
    std::vector<double> doubles;
    std::vector<wxString> texts;
    EXPECT_TRUE(reader.GetVectorParameter(3, 7, "Ints", ints));
    EXPECT_TRUE(reader.GetVectorParameter(3, 7, "Doubles", doubles));
    EXPECT_TRUE(reader.GetVectorParameter(3, 7, "Texts", texts));
    EXPECT_THAT(ints, ElementsAre(1, 2));
    EXPECT_THAT(doubles, ElementsAre(1.5, 2.5));
    EXPECT_THAT(texts, ElementsAre("a", "b"));
    EXPECT_FALSE(reader.GetVectorParameter(3, 7, "Missing", ints));
    EXPECT_FALSE(reader.GetVectorParameter(3, 7, "Missing", doubles));
    EXPECT_FALSE(reader.GetVectorParameter(3, 7, "Missing", texts));
}

TEST_F(TypedReadsDeathTest, WithoutAContainer_GoThroughNull_ByDesign)
{
    LoseTheContainer();
    wxString text;
    std::vector<int> ints;
    std::vector<double> doubles;
    std::vector<wxString> texts;
    EXPECT_EXIT(reader.GetIntParameter(3, 7, Key, 5), Faults, "");
    EXPECT_EXIT(reader.GetIntParameter(3, 7, 0, Key, 5), Faults, "");
    EXPECT_EXIT(reader.GetDoubleParameter(3, 7, Key, 5), Faults, "");
    EXPECT_EXIT(reader.GetDoubleParameter(3, 7, 0, Key, 5), Faults, "");
    EXPECT_EXIT(reader.GetBoolParameter(3, 7, 0, Key, true), Faults, "");
    EXPECT_EXIT(reader.GetParameter(3, 7, Key, text, 0), Faults, "");
    EXPECT_EXIT(reader.GetwxStringParameter(3, 7, Key, 0), Faults, "");
    EXPECT_EXIT(reader.GetVectorParameter(3, 7, Key, ints), Faults, "");
    EXPECT_EXIT(reader.GetVectorParameter(3, 7, Key, doubles), Faults, "");
    EXPECT_EXIT(reader.GetVectorParameter(3, 7, Key, texts), Faults, "");
}

// --- SetMultiParameter of holders --------------------------------------------------------------------------

namespace
{
// A record as the slot saw it; of an int or double the number, of a text the text.
struct RECORD
{
    std::string key;
    PARAM_TYPE type;
    std::string value;  // "null" for a null pointer
    int pos;

    friend bool operator==(RECORD const&, RECORD const&) = default;
    friend void PrintTo(RECORD const& record, std::ostream* out)
    {
        *out << record.key << " type " << record.type << " at " << record.pos << ": " << record.value;
    }
};

std::string Shown(PARAM_TYPE type, void const* value)
{
    if (!value)
        return "null";
    if (type == PARAM_INT)
        return std::to_string(*static_cast<int const*>(value));
    if (type == PARAM_DOUBLE)
        return std::to_string(*static_cast<double const*>(value));
    return type == PARAM_STRING ? static_cast<char const*>(value) : "?";
}

// Puts holders into a container that shows the tables it gets.
class Holders : public Tickets
{
protected:
    Holders()
    {
        records.clear();
        tables = 0;
        result = 1;
        other.Access()->MSETMULTIPAR = [](void*, int type, int id, SETMULTIPAR* table)
        {
            EXPECT_EQ(type, 3);
            EXPECT_EQ(id, 7);
            ++tables;
            for (; table && table->key; ++table)
                records.push_back({table->key, table->type, Shown(table->type, table->value), table->pos});
            return result;
        };
    }

    ~Holders() override
    {
        for (SetDataHolder* holder : untouched)
            delete holder;
    }

    void Add(PARAM_TYPE type, int pos = -1) { holders.push_back(new SetDataHolder(Key, type, nullptr, pos)); }
    void AddInt(int value, int pos = -1)
    {
        holders.push_back(new SetDataHolder(Key, PARAM_INT, &value, pos));
    }
    void AddDouble(double value, int pos = -1)
    {
        holders.push_back(new SetDataHolder(Key, PARAM_DOUBLE, &value, pos));
    }
    void AddText(std::string value, int pos = -1)
    {
        holders.push_back(new SetDataHolder(Key, PARAM_STRING, value.data(), pos));
    }

    // The pointers of the last vector are dead after a call, if nothing else is said.
    int Set(int ignored = 0)
    {
        records.clear();
        int const code = manager.SetMultiParameter(other.Access(), 3, 7, ignored, holders);
        holders.clear();
        return code;
    }

    static inline std::vector<RECORD> records;
    static inline int tables;
    static inline int result;
    std::vector<SetDataHolder*> holders;
    std::vector<SetDataHolder*> untouched;  // by the call, and so still the test's
};

using HoldersDeathTest = Holders;
}  // namespace

TEST_F(Holders, AreWrittenAsOneTableInTheirOrder)
{
    AddInt(5, 1);
    AddDouble(2.5, 0);
    AddInt(-7, -1);
    EXPECT_EQ(Set(), 1);
    EXPECT_EQ(tables, 1);
    EXPECT_THAT(records,
                ElementsAre(RECORD{"Key", PARAM_INT, "5", 1}, RECORD{"Key", PARAM_DOUBLE, "2.500000", 0},
                            RECORD{"Key", PARAM_INT, "-7", -1}));
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Holders, OfSeveralKeys_AreNotSorted)
{
    AddInt(5);
    AddInt(6);
    std::strcpy(holders[0]->key, "Z");
    std::strcpy(holders[1]->key, "A");
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Z", PARAM_INT, "5", -1}, RECORD{"A", PARAM_INT, "6", -1}));
}

TEST_F(Holders, Vector_KeepsItsDeadPointers_ByDesign)
{
    AddInt(5);
    holders.push_back(nullptr);
    Add(PARAM_COUNT);
    std::vector<SetDataHolder*> const before = holders;
    EXPECT_EQ(manager.SetMultiParameter(other.Access(), 3, 7, 0, holders), 1);
    EXPECT_EQ(holders, before);
}

TEST_F(Holders, ResultIsTheSlots)
{
    for (int const code : {0, 0x100, -2, INT_MIN})
    {
        result = code;
        AddInt(5);
        EXPECT_EQ(Set(), code);
    }
}

TEST_F(Holders, NumberBehindTheId_CountsForNothing)
{
    for (int const ignored : {INT_MIN, -1, 1, INT_MAX})
    {
        AddInt(5);
        EXPECT_EQ(Set(ignored), 1);
        EXPECT_EQ(records.size(), 1u);
    }
}

TEST_F(Holders, SessionForm_FetchesTheContainerAnewKeepsItAndWritesThere)
{
    module.container = other.Access();
    AddInt(5);
    EXPECT_EQ(manager.SetMultiParameter(3, 7, 99, holders), 1);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_INT, "5", -1}));
    EXPECT_FALSE(FakeIsTheContainer());
}

TEST_F(Holders, EmptyVector_GivesMinus2005)
{
    EXPECT_EQ(Set(), -2005);
    EXPECT_EQ(tables, 0);
}

TEST_F(Holders, EmptyVectorInTheSessionForm_GivesMinus2005BehindTheFetch)
{
    EXPECT_EQ(manager.SetMultiParameter(3, 7, 0, holders), -2005);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
}

TEST_F(Holders, OnlyNulls_Give0AndNothingIsWritten)
{
    holders = {nullptr, nullptr};
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(tables, 0);
}

TEST_F(Holders, LoggedOut_GiveMinus1AndTheHoldersStay)
{
    manager.Logout();
    Reset();
    AddInt(5);
    untouched = holders;
    EXPECT_EQ(manager.SetMultiParameter(3, 7, 0, holders), -1);
    EXPECT_EQ(manager.SetMultiParameter(other.Access(), 3, 7, 0, holders), -1);
    EXPECT_EQ(manager.SetMultiParameter(nullptr, 3, 7, 0, holders), -1);
    EXPECT_EQ(holders, untouched);
    EXPECT_EQ(*static_cast<int*>(holders[0]->m_value), 5);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_EQ(tables, 0);
}

TEST_F(Holders, LoggedOutWithAnEmptyVector_GiveMinus1)
{
    manager.Logout();
    EXPECT_EQ(manager.SetMultiParameter(3, 7, 0, holders), -1);
    EXPECT_EQ(manager.SetMultiParameter(other.Access(), 3, 7, 0, holders), -1);
}

TEST_F(Holders, TypeThatIsNotForHere_IsThatOfTheHolderBefore_ByDesign)
{
    for (int const type : {-1, 0, 1, 5, 7, 8, 9, 10})
    {
        AddInt(5);
        Add(static_cast<PARAM_TYPE>(type), 1);
        EXPECT_EQ(Set(), 1);
        EXPECT_THAT(records,
                    ElementsAre(RECORD{"Key", PARAM_INT, "5", -1}, RECORD{"Key", PARAM_INT, "null", 1}))
            << type;
    }
}

TEST_F(Holders, TypeBefore_HoldsAcrossSeveralAndAcrossNulls_ByDesign)
{
    AddInt(5);
    Add(PARAM_POINTER, 1);
    holders.push_back(nullptr);
    Add(PARAM_NONE, 2);
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_INT, "5", -1}, RECORD{"Key", PARAM_INT, "null", 1},
                                     RECORD{"Key", PARAM_INT, "null", 2}));
}

TEST_F(Holders, PointerBehindAText_IsAnEmptyText_ByDesign)
{
    AddText("");
    Add(PARAM_POINTER, 1);
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records,
                ElementsAre(RECORD{"Key", PARAM_STRING, "", -1}, RECORD{"Key", PARAM_STRING, "", 1}));
}

TEST_F(Holders, ValueOfAPointerBehindAnInt_GoesAsAnInt_ByDesign)
{
    AddInt(5);
    AddInt(6, 1);
    holders[1]->m_type = PARAM_POINTER;
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_INT, "5", -1}, RECORD{"Key", PARAM_INT, "6", 1}));
}

TEST_F(Holders, TypeThatIsNotForHereInFront_AddsNothing)
{
    Add(PARAM_POINTER);
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(tables, 0);
    Add(PARAM_POINTER);
    AddInt(5, 1);
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_INT, "5", 1}));
}

TEST_F(Holders, Counts_AddNothingNorDoesWhatFollowsThem_ByDesign)
{
    AddInt(5);
    Add(PARAM_COUNT, 1);
    Add(PARAM_POINTER, 2);
    AddInt(6, 3);
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_INT, "5", -1}, RECORD{"Key", PARAM_INT, "6", 3}));
}

TEST_F(Holders, OnlyACount_Gives0AndNothingIsWritten)
{
    Add(PARAM_COUNT);
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(tables, 0);
}

TEST_F(Holders, NarrowText_IsReadAsWide_ByDesign)
{
    AddText("ab");  // one wide character, U+6261, with the zero that follows
    AddText("ab", 1);
    holders[1]->m_type = PARAM_POINTER;
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_STRING, "\xE6\x89\xA1", -1},
                                     RECORD{"Key", PARAM_STRING, "\xE6\x89\xA1", 1}));
}

TEST_F(Holders, WideTextThatTheHostPutThere_IsWritten)
{
    static wchar_t const text[] = L"Gr\u00FCn";
    Add(PARAM_POINTER);
    holders[0]->m_type = PARAM_STRING;
    holders[0]->m_value = std::calloc(1, sizeof text);
    std::memcpy(holders[0]->m_value, text, sizeof text);
    EXPECT_EQ(Set(), 1);
    EXPECT_THAT(records, ElementsAre(RECORD{"Key", PARAM_STRING, "Gr\xC3\xBCn", -1}));
}

// Nothing is leaked then either, which a leak checker sees.
TEST_F(Holders, WithoutMemory_ThrowAndWriteNothing)
{
    records.reserve(3);  // what the test itself needs is there
    int failures = 0;
    for (bool written = false; !written; ++failures)
    {
        ASSERT_LT(failures, 100);
        AddInt(5);
        AddDouble(2.5, 1);
        AddInt(7, 2);
        try
        {
            ScarceMemory const memory(failures);
            manager.SetMultiParameter(other.Access(), 3, 7, 0, holders);
            written = true;
        }
        catch (std::bad_alloc const&)
        {
            EXPECT_EQ(tables, 0);
        }
        holders.clear();
    }
    EXPECT_GT(failures, 1);
    EXPECT_EQ(tables, 1);
}

TEST_F(HoldersDeathTest, OfANullContainer_GoThroughNull_ByDesign)
{
    AddInt(5);
    untouched = holders;  // by this process
    EXPECT_EXIT(manager.SetMultiParameter(nullptr, 3, 7, 0, holders), Faults, "");
    module.container = nullptr;
    EXPECT_EXIT(manager.SetMultiParameter(3, 7, 0, holders), Faults, "");
}

TEST_F(Holders, OfANullContainerWithNothingToWrite_Give0)
{
    holders = {nullptr};
    EXPECT_EQ(manager.SetMultiParameter(nullptr, 3, 7, 0, holders), 0);
}

// --- SetMultiParameter of a list ---------------------------------------------------------------------------

namespace
{
// Both containers open tickets that take tables.
class Lists : public Tickets
{
protected:
    Lists()
    {
        for (auto* container : {&fake, &other})
        {
            container->AddTicket(3, 7);
            container->opened = ticket.Access();
        }
    }

    void FillList()
    {
        list.SetParameter("Z", 5, -1);
        list.SetParameter("A", wxString("text"), 0);
    }

    std::vector<CALL> Written() const { return ticket.container.calls; }

    SETMULTIPAR_LIST list{false};
    TicketFake ticket;
};

using ListsDeathTest = Lists;

auto const ListOfTwo = ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, "Z", PARAM_INT, -1},
                                   CALL{SLOT::SET, 0, 0, "A", PARAM_STRING, 0});
}  // namespace

TEST_F(Lists, GoIntoTheOpenedTicketInTheirOrderAndItStaysOpen)
{
    FillList();
    manager.SetMultiParameter(other.Access(), 3, 7, list);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), ListOfTwo);
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Lists, SessionForm_FetchesTheContainerAnewKeepsItAndWritesThere)
{
    module.container = other.Access();
    FillList();
    manager.SetMultiParameter(3, 7, list);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), ListOfTwo);
    EXPECT_FALSE(FakeIsTheContainer());
}

TEST_F(Lists, ListAfterwards_TellsWhatBecameOfEachRecord)
{
    FillList();
    ticket.container.FailPosition(0);
    manager.SetMultiParameter(other.Access(), 3, 7, list);
    ASSERT_EQ(list.Size(), 2u);
    EXPECT_EQ(list.Table(false)[0].ok, 1);
    EXPECT_EQ(list.Table(false)[1].ok, 0);
}

TEST_F(Lists, EmptyList_OpensTheTicketAndWritesNothing)
{
    manager.SetMultiParameter(other.Access(), 3, 7, list);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), IsEmpty());
}

TEST_F(Lists, MissingTicket_IsNotWrittenTo)
{
    FillList();
    manager.SetMultiParameter(other.Access(), 3, 8, list);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 8, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), IsEmpty());
    EXPECT_EQ(list.Table(false)[0].ok, 0);
}

TEST_F(Lists, LoggedOut_DoNothing)
{
    manager.Logout();
    Reset();
    FillList();
    wxList values;
    wxArrayString texts;
    texts.Add("a");
    manager.SetMultiParameter(3, 7, list);
    for (MTICKET_ACCESS const* container :
         {static_cast<MTICKET_ACCESS const*>(other.Access()), static_cast<MTICKET_ACCESS const*>(nullptr)})
    {
        manager.SetMultiParameter(container, 3, 7, list);
        EXPECT_EQ(manager.SetMultiParameter(container, 3, 7, Key, values), 0);
        EXPECT_EQ(manager.SetArrayParameter(container, 3, 7, Key, texts), 0);
    }
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(other.calls, IsEmpty());
}

TEST_F(ListsDeathTest, OfANullContainer_GoThroughNull_ByDesign)
{
    wxList values;
    wxArrayString texts;
    EXPECT_EXIT(manager.SetMultiParameter(nullptr, 3, 7, list), Faults, "");
    EXPECT_EXIT(manager.SetMultiParameter(nullptr, 3, 7, Key, values), Faults, "");
    EXPECT_EXIT(manager.SetArrayParameter(nullptr, 3, 7, Key, texts), Faults, "");
    module.container = nullptr;
    EXPECT_EXIT(manager.SetMultiParameter(3, 7, list), Faults, "");
}

// --- SetMultiParameter of a wxList, and SetArrayParameter --------------------------------------------------

namespace
{
// A value of a type that only its name tells from a text.
class OddlyNamed : public wxVariantData
{
public:
    explicit OddlyNamed(char const* typeName) : m_typeName(typeName) {}
    bool Eq(wxVariantData&) const override { return false; }
    wxString GetType() const override { return m_typeName; }
    bool Write(wxString& text) const override
    {
        text = "odd";
        return true;
    }

private:
    wxString m_typeName;
};

class ValueLists : public Lists
{
protected:
    void Add(wxVariant const& value)
    {
        owned.push_back(std::make_unique<wxVariant>(value));
        values.Append(owned.back().get());
    }

    int Set() { return manager.SetMultiParameter(other.Access(), 3, 7, Umlaut, values); }

    ContainerFake& Stored() { return ticket.container; }  // under 0/0

    std::vector<std::unique_ptr<wxVariant>> owned;
    wxList values;
    wxArrayString texts;
};

auto const OneDeletion =
    ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, Umlaut, PARAM_NONE, -1});
}  // namespace

TEST_F(ValueLists, AreWrittenBehindADeletionOfTheKey)
{
    Add(5L);
    Add(2.5);
    Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(Set(), 0);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(),
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, Umlaut, PARAM_NONE, -1},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_INT, 0},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_DOUBLE, 1},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_STRING, 2}));
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 5);
    EXPECT_EQ(Stored().Double(0, 0, Umlaut, 1), 2.5);
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 2), "Gr\xC3\xBCn");
}

TEST_F(ValueLists, OldValuesBeyondTheNewOnes_AreGone)
{
    for (int pos = 0; pos < 5; ++pos)
        Stored().Put(0, 0, Umlaut, pos, pos);
    Add(7L);
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 1u);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 7);
}

TEST_F(ValueLists, EmptyList_DeletesTheKey)
{
    Stored().Put(0, 0, Umlaut, 5);
    EXPECT_EQ(Set(), 0);
    EXPECT_THAT(Written(), OneDeletion);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 0u);
}

TEST_F(ValueLists, OtherTypes_LeaveAGap)
{
    Add(5L);
    Add(true);
    Add("text");
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 5);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 1), std::nullopt);
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 2), "text");
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 3u);
}

TEST_F(ValueLists, NullArraysAndLists_LeaveGapsAndNestedValuesAreNotWritten)
{
    wxVariant nested;
    nested.NullList();
    nested.Append(5L);
    texts.Add("a");
    Add(wxVariant());
    Add(nested);
    Add(texts);
    EXPECT_EQ(Set(), 0);
    EXPECT_THAT(Written(), OneDeletion);
}

TEST_F(ValueLists, Long_IsWrittenAsAnIntOfItsLow32Bits)
{
    Add(0x100000002L);
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 2);
}

TEST_F(ValueLists, TypeNames_CountInAnyLetterCase)
{
    Add(wxVariant(new OddlyNamed("StRiNg")));
    Add(wxVariant(new OddlyNamed("LONG")));
    Add(wxVariant(new OddlyNamed("Double")));
    Add(wxVariant(new OddlyNamed("strings")));
    auto const before = wxSetAssertHandler(nullptr);  // wxVariant complains that it makes no number of them
    EXPECT_EQ(Set(), 0);
    wxSetAssertHandler(before);
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 0), "odd");
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 1), 0);
    EXPECT_EQ(Stored().Double(0, 0, Umlaut, 2), 0.0);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 3u);
}

TEST_F(ValueLists, FailureOfTheWrite_Is0AllTheSame_ByDesign)
{
    Add(5L);
    texts.Add("a");
    Stored().FailCall(0);
    EXPECT_EQ(Set(), 0);
    Stored().FailCall(0);
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 7, Umlaut, texts), 0);
    EXPECT_EQ(manager.SetMultiParameter(other.Access(), 3, 8, Umlaut, values), 0);
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 8, Umlaut, texts), 0);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 0u);
}

TEST_F(ValueLists, SetArrayParameter_WritesEachTextBehindADeletionOfTheKey)
{
    Stored().Put(0, 0, Umlaut, 5, 4);
    texts.Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    texts.Add("");
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 7, Umlaut, texts), 0);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(),
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, Umlaut, PARAM_NONE, -1},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_STRING, 0},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_STRING, 1}));
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 0), "Gr\xC3\xBCn");
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 1), "");
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 2u);
}

TEST_F(ValueLists, SetArrayParameter_OfAnEmptyArray_DeletesTheKey)
{
    Stored().Put(0, 0, Umlaut, 5);
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 7, Umlaut, texts), 0);
    EXPECT_THAT(Written(), OneDeletion);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 0u);
}

// --- DeleteParameter, whole tickets ------------------------------------------------------------------------

namespace
{
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

// --- GetDecodedPath ----------------------------------------------------------------------------------------

namespace
{
// A manager that is kept, since it does not free its translator.
class DecodedPaths : public Tickets
{
protected:
    DecodedPaths() : kept(*NewManager())
    {
        first.SetFolder("System/Folders/Temp", "/first");
        second.SetFolder("System/Folders/Temp", "/second");
    }

    void LogInAt(FolderServer& server)
    {
        module.container = server.container.Access();
        kept.Login("u", "p", "h", 1);
    }

    ComGUIManager& kept;
    FolderServer first;
    FolderServer second;

private:
    static ComGUIManager* NewManager()
    {
        static std::vector<std::unique_ptr<ComGUIManager>>& managers =
            *new std::vector<std::unique_ptr<ComGUIManager>>;
        return managers.emplace_back(std::make_unique<ComGUIManager>()).get();
    }
};
}  // namespace

TEST_F(DecodedPaths, LoggedOut_AreEmptyAndNothingIsAsked)
{
    EXPECT_EQ(kept.GetDecodedPath("/a"), "");
    EXPECT_THAT(first.container.calls, IsEmpty());
}

TEST_F(DecodedPaths, AreResolvedWithTheFoldersOfTheServer)
{
    LogInAt(first);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x/y"), "/first/x/y");
    EXPECT_EQ(kept.GetDecodedPath("$(UNKNOWN)/x"), "$(UNKNOWN)/x");
    EXPECT_EQ(kept.GetDecodedPath("/a/b"), "/a/b");
}

TEST_F(DecodedPaths, Folders_AreAskedForAtTheFirstCallAlone)
{
    LogInAt(first);
    EXPECT_THAT(first.container.calls, IsEmpty());
    kept.GetDecodedPath("$(TEMP)/x");
    EXPECT_FALSE(first.container.calls.empty());
    first.container.calls.clear();
    first.SetFolder("System/Folders/Temp", "/changed");
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "/first/x");
    EXPECT_THAT(first.container.calls, IsEmpty());
}

TEST_F(DecodedPaths, AfterALogoutAndAnotherLogin_AreThoseOfTheFirstSession_ByDesign)
{
    LogInAt(first);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "/first/x");
    kept.Logout();
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "");
    LogInAt(second);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "/first/x");
    EXPECT_THAT(second.container.calls, IsEmpty());
}

TEST_F(DecodedPaths, LoggedInWithoutAContainer_StayAsTheyAre)
{
    module.container = nullptr;
    kept.Login("u", "p", "h", 1);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "$(TEMP)/x");
}
