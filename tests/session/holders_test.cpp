// Values that a host has gathered in holders, on their way to a ticket.
#include "comgui/session/ComGUIManager.h"

#include "comgui/session/SetDataHolder.h"
#include "tests/session/Faults.h"
#include "tests/session/ScarceMemory.h"
#include "tests/session/Tickets.h"
#include <climits>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAre;
using testing::IsEmpty;

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
