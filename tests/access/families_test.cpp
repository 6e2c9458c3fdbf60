// What single tickets and tickets of a container have in common.
#include "tests/access/Families.h"

#include <gmock/gmock.h>

namespace
{
template <typename Family>
class TypedRead : public InBothFamilies<Family>
{
};
template <typename Family>
class TypedWrite : public InBothFamilies<Family>
{
};
}  // namespace

TYPED_TEST_SUITE(TypedRead, Families);
TYPED_TEST_SUITE(TypedWrite, Families);

TYPED_TEST(TypedRead, Int_AsksTheSlotAtTheGivenPosition)
{
    this->Put(-42, 2);
    EXPECT_EQ(this->ticket.GetIntParameter(2, "k", 7), -42);
    EXPECT_EQ(this->OneCall(), this->Get(PARAM_INT, 2));
}

TYPED_TEST(TypedRead, IntWithoutPosition_AsksForTheKeyAsAWhole)
{
    this->Put(42);
    EXPECT_EQ(this->ticket.GetIntParameter("k", 7), 42);
    EXPECT_EQ(this->OneCall(), this->Get(PARAM_INT, -1));
}

TYPED_TEST(TypedRead, Double_AsksTheSlotAtTheGivenPosition)
{
    this->Put(2.5, 1);
    EXPECT_EQ(this->ticket.GetDoubleParameter(1, "k", 7.0), 2.5);
    EXPECT_EQ(this->OneCall(), this->Get(PARAM_DOUBLE, 1));
}

TYPED_TEST(TypedRead, DoubleWithoutPosition_AsksForTheKeyAsAWhole)
{
    this->Put(2.5);
    EXPECT_EQ(this->ticket.GetDoubleParameter("k", 7.0), 2.5);
    EXPECT_EQ(this->OneCall(), this->Get(PARAM_DOUBLE, -1));
}

TYPED_TEST(TypedRead, Bool_IsAnIntThatIsNot0)
{
    this->Put(-2, -1);
    this->Put(0, 1);
    EXPECT_TRUE(this->ticket.GetBoolParameter(0, "k", false));
    EXPECT_FALSE(this->ticket.GetBoolParameter(1, "k", true));
    EXPECT_EQ(this->ticket.fake.calls[0], this->Get(PARAM_INT, 0));
}

TYPED_TEST(TypedRead, Void_GivesThePointer)
{
    this->ticket.fake.Put(TypeParam::Type, TypeParam::Id, "k", PARAM_POINTER, this, 0);
    EXPECT_EQ(this->ticket.GetVoidParameter(0, "k", nullptr), this);
    EXPECT_EQ(this->OneCall(), this->Get(PARAM_POINTER, 0));
}

TYPED_TEST(TypedRead, MissingKey_GivesTheDefault)
{
    EXPECT_EQ(this->ticket.GetIntParameter("k", 7), 7);
    EXPECT_EQ(this->ticket.GetIntParameter(3, "k", 7), 7);
    EXPECT_EQ(this->ticket.GetDoubleParameter("k", 7.5), 7.5);
    EXPECT_EQ(this->ticket.GetDoubleParameter(3, "k", 7.5), 7.5);
    EXPECT_TRUE(this->ticket.GetBoolParameter(-1, "k", true));
    EXPECT_FALSE(this->ticket.GetBoolParameter(-1, "k", false));
    EXPECT_EQ(this->ticket.GetVoidParameter(-1, "k", this), this);
}

TYPED_TEST(TypedRead, ValueOfAnotherType_GivesTheDefault)
{
    this->Put(2.5);
    EXPECT_EQ(this->ticket.GetIntParameter("k", 7), 7);
}

TYPED_TEST(TypedRead, TextOfAMissingKey_EmptiesTheCallersTextAndGivesFalse)
{
    wxString text = "old";
    EXPECT_FALSE(this->ticket.GetParameter("k", text, -1));
    EXPECT_EQ(text, "");
}

TYPED_TEST(TypedRead, Text_IsReadAsUtf8AtTheGivenPosition)
{
    this->Put("Gr\xC3\xBCn", 1);
    wxString text = "old";
    EXPECT_TRUE(this->ticket.GetParameter("k", text, 1));
    EXPECT_EQ(text, wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(this->OneCall(), this->Get(PARAM_STRING, 1));
}

TYPED_TEST(TypedRead, TextThatTheSlotLeavesNull_IsEmptyAndTrue)
{
    this->Put("x");
    this->ticket.fake.nullTexts = true;
    wxString text = "old";
    EXPECT_TRUE(this->ticket.GetParameter("k", text, -1));
    EXPECT_EQ(text, "");
}

TYPED_TEST(TypedRead, WxString_GivesTheTextOrTheDefault)
{
    this->Put("text");
    EXPECT_EQ(this->ticket.GetWxStringParameter(-1, "k", "default"), "text");
    EXPECT_EQ(this->ticket.GetWxStringParameter(5, "k", "default"), "default");
}

TYPED_TEST(TypedRead, ParameterType_OfAMissingKeyIs0) { EXPECT_EQ(this->ticket.ParameterType("k", -1), 0); }

TYPED_TEST(TypedRead, ParameterType_OfAListIs6AsAWholeAndTheElementsAt0)
{
    this->Put(1.5, -1);
    this->Put(2.5, 1);
    EXPECT_EQ(this->ticket.ParameterType("k", -1), 6);
    EXPECT_EQ(this->ticket.ParameterType("k", 0), 3);
    EXPECT_EQ(this->ticket.fake.calls[0], this->Get(PARAM_NONE, -1));
}

TYPED_TEST(TypedWrite, Double_GoesByAddress)
{
    EXPECT_EQ(this->ticket.SetParameter("k", 2.5, 1), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_DOUBLE, 1));
    EXPECT_EQ(this->ticket.fake.Double(TypeParam::Type, TypeParam::Id, "k", 1), 2.5);
}

TYPED_TEST(TypedWrite, Bool_IsStoredAsAnIntAndReadBack)
{
    EXPECT_EQ(this->ticket.SetParameter("k", true, -1), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_INT, -1));
    EXPECT_EQ(this->ticket.fake.Int(TypeParam::Type, TypeParam::Id, "k"), 1);
    EXPECT_TRUE(this->ticket.GetBoolParameter(-1, "k", false));
    this->ticket.SetParameter("k", false, -1);
    EXPECT_EQ(this->ticket.fake.Int(TypeParam::Type, TypeParam::Id, "k"), 0);
}

TYPED_TEST(TypedWrite, Pointer_GoesAsItIs)
{
    void* const pointer = this;
    EXPECT_EQ(this->ticket.SetParameter("k", pointer, 0), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_POINTER, 0));
    EXPECT_EQ(this->ticket.GetVoidParameter(0, "k", nullptr), pointer);
}

TYPED_TEST(TypedWrite, WxString_GoesAsUtf8)
{
    EXPECT_EQ(this->ticket.SetParameter("k", wxString::FromUTF8("Gr\xC3\xBCn"), -2), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_STRING, -2));
    EXPECT_EQ(this->ticket.fake.Text(TypeParam::Type, TypeParam::Id, "k"), "Gr\xC3\xBCn");
}

TYPED_TEST(TypedWrite, TextLiteral_IsATextAndNoBool)
{
    EXPECT_EQ(this->ticket.SetParameter("k", "text", -1), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_STRING, -1));
    EXPECT_EQ(this->ticket.fake.Text(TypeParam::Type, TypeParam::Id, "k"), "text");
}

TYPED_TEST(TypedWrite, WideTextLiteral_IsATextAndNoBool)
{
    EXPECT_EQ(this->ticket.SetParameter("k", wxT("Gr\u00FCn"), -1), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_STRING, -1));
    EXPECT_EQ(this->ticket.fake.Text(TypeParam::Type, TypeParam::Id, "k"), "Gr\xC3\xBCn");
}

TYPED_TEST(TypedWrite, NullPointer_IsAPointer)
{
    EXPECT_EQ(this->ticket.SetParameter("k", nullptr, -1), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_POINTER, -1));
}

TYPED_TEST(TypedWrite, PathInVariableForm_IsStoredAsItIs)
{
    this->ticket.SetParameter("k", wxString("$(TEMP)/x"), -1);
    this->ticket.SetParameter("k", wxString("/tmp/x"), 1);
    EXPECT_EQ(this->ticket.fake.Text(TypeParam::Type, TypeParam::Id, "k", 0), "$(TEMP)/x");
    EXPECT_EQ(this->ticket.fake.Text(TypeParam::Type, TypeParam::Id, "k", 1), "/tmp/x");
}

TYPED_TEST(TypedWrite, Delete_GoesAsNoneWithNull)
{
    this->Put(1, -1);
    this->Put(2, 1);
    EXPECT_EQ(this->ticket.DelParameter("k", 1), 1);
    EXPECT_EQ(this->OneCall(), this->Set(PARAM_NONE, 1));
    EXPECT_EQ(this->ticket.fake.Count(TypeParam::Type, TypeParam::Id, "k"), 1u);
}

TYPED_TEST(TypedWrite, ResultOfTheSlot_ComesBackUnchanged)
{
    this->ticket.fake.success = 0x4000;
    EXPECT_EQ(this->ticket.SetParameter("k", 2.5, -1), 0x4000);
    EXPECT_EQ(this->ticket.SetParameter("k", true, -1), 0x4000);
    EXPECT_EQ(this->ticket.SetParameter("k", static_cast<void*>(this), -1), 0x4000);
    EXPECT_EQ(this->ticket.SetParameter("k", wxString("x"), -1), 0x4000);
    EXPECT_EQ(this->ticket.DelParameter("k", -1), 0x4000);
    this->ticket.fake.FailCall(0);
    EXPECT_EQ(this->ticket.SetParameter("k", 2.5, -1), 0);
}
