// Values of a ticket as variants.
#include "comgui/session/ComGUIManager.h"

#include "tests/session/Tickets.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::IsEmpty;

namespace
{
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
