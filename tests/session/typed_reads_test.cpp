// Values of a ticket as the types of C++ and wx, and what type a key has.
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
