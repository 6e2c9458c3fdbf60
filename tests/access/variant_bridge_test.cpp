// Variants from a ticket, variants like a default, and variants into a ticket.
#include "tests/access/FolderVariablesFake.h"
#include "tests/access/ListFamilies.h"
#include <clocale>
#include <gmock/gmock.h>
#include <wx/datetime.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
template <typename Family>
class VariantTest : public ListsInBothFamilies<Family>
{
protected:
    // Names in a list of the same order.
    static wxVariant List(std::initializer_list<wxVariant> elements, wxString const& name = "k")
    {
        wxVariant list;
        list.NullList();
        list.SetName(name);
        for (wxVariant const& element : elements)
            list.Append(element);
        return list;
    }
    static wxArrayString Texts(std::initializer_list<wxString> texts)
    {
        wxArrayString array;
        for (wxString const& text : texts)
            array.Add(text);
        return array;
    }
    // "name: value" of each element, or of the variant itself.
    static std::vector<wxString> Told(wxVariant const& variant)
    {
        std::vector<wxString> told;
        for (std::size_t i = 0; i < variant.GetCount(); ++i)
            told.push_back(variant[i].GetName() + ": " + variant[i].GetType() + " " +
                           variant[i].MakeString());
        return told;
    }
    static wxVariant Long(long value, wxString const& name = "k") { return wxVariant(value, name); }
};

template <typename Family>
class VariantChk : public VariantTest<Family>
{
protected:
    // An old value of another type and name.
    wxVariant value = wxVariant("old", "older");

    void ExpectNull() const
    {
        EXPECT_TRUE(value.IsNull());
        EXPECT_EQ(value.GetName(), "k");
    }
};
template <typename Family>
class VariantDef : public VariantTest<Family>
{
};
template <typename Family>
class VariantSet : public VariantTest<Family>
{
protected:
    std::optional<double> Double(int pos = -1)
    {
        return this->ticket.fake.Double(Family::Type, Family::Id, "k", pos);
    }
    std::optional<int> Int(int pos = -1) { return this->ticket.fake.Int(Family::Type, Family::Id, "k", pos); }
};

// The local encoding while it lives.
class Locale
{
public:
    explicit Locale(char const* name) : m_old(std::setlocale(LC_CTYPE, nullptr))
    {
        EXPECT_NE(std::setlocale(LC_CTYPE, name), nullptr) << name;
    }
    ~Locale() { std::setlocale(LC_CTYPE, m_old.c_str()); }
    Locale(Locale const&) = delete;
    Locale& operator=(Locale const&) = delete;

private:
    std::string m_old;
};
}  // namespace

TYPED_TEST_SUITE(VariantChk, Families);
TYPED_TEST_SUITE(VariantDef, Families);
TYPED_TEST_SUITE(VariantSet, Families);

TYPED_TEST(VariantChk, MissingKey_IsFalseAndANullVariantOfItsName)
{
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, -1));
    this->ExpectNull();
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_NONE, -1)));
}

TYPED_TEST(VariantChk, Int_IsALong)
{
    this->ticket.Store(-42, -1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "long");
    EXPECT_EQ(this->value.GetLong(), -42);
    EXPECT_EQ(this->value.GetName(), "k");
}

TYPED_TEST(VariantChk, IntThatWasABool_IsALong)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(true), -1));
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "long");
    EXPECT_EQ(this->value.GetLong(), 1);
}

TYPED_TEST(VariantChk, Double_IsADouble)
{
    this->ticket.Store(2.5, -1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "double");
    EXPECT_EQ(this->value.GetDouble(), 2.5);
    EXPECT_EQ(this->value.GetName(), "k");
}

TYPED_TEST(VariantChk, Pointer_IsAVoidPointerNullIncluded)
{
    this->ticket.Store(static_cast<void*>(this), -1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "void*");
    EXPECT_EQ(this->value.GetVoidPtr(), this);
    EXPECT_EQ(this->value.GetName(), "k");
    this->ticket.Store(static_cast<void*>(nullptr), -1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetVoidPtr(), nullptr);
}

TYPED_TEST(VariantChk, Text_IsAStringResolved)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    this->ticket.Store("$(A)/x", -1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "string");
    EXPECT_EQ(this->value.GetString(), "<$(A)/x>");
    EXPECT_EQ(this->value.GetName(), "k");
}

TYPED_TEST(VariantChk, TypesThatHaveNoVariant_AreFalseAndNull)
{
    BIN_STRING const bytes("abc", 3);
    this->ticket.fake.Put(TypeParam::Type, TypeParam::Id, "k", PARAM_BINSTRING, &bytes, -1);
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, -1));
    this->ExpectNull();
    this->ticket.Store(5LL, -1);
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, -1));
    this->ticket.Store(5u, -1);
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, -1));
    this->ticket.Store(5ull, -1);
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, -1));
    this->ExpectNull();
}

TYPED_TEST(VariantChk, TypesThatNobodyKnows_AreFalseAndNull)
{
    for (int const type : {PARAM_UNSIGNED64 + 1, -1})
    {
        static int answer;
        answer = type;
        this->ticket.fake.Access()->MGETPARAMETER =
            [](void*, int, int, char const*, PARAM_TYPE, void* out, int)
        {
            *static_cast<int*>(out) = answer;
            return 1;
        };
        this->value = wxVariant(5L, "old");
        EXPECT_FALSE(this->ticket.GetVariantChk(this->value, -1));
        this->ExpectNull();
    }
}

TYPED_TEST(VariantChk, ValueThatGoesBetweenTheCalls_Is0)
{
    this->ticket.Store(5, -1);
    this->ticket.fake.FailCall(1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value, this->Long(0));
}

TYPED_TEST(VariantChk, VectorOfTexts_IsAnArrstringResolved)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    this->ticket.Store("a", -1);
    this->ticket.Store("$(B)/x", 1);
    this->ticket.Store("c", 2);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "arrstring");
    EXPECT_EQ(this->value.GetName(), "k");
    EXPECT_THAT(this->value.GetArrayString(), ElementsAre("a", "<$(B)/x>", "c"));
}

TYPED_TEST(VariantChk, VectorWithoutValues_IsAnEmptyArrstring)
{
    this->ticket.fake.Access()->MGETPARAMETER =
        [](void*, int, int, char const*, PARAM_TYPE type, void* out, int pos)
    {
        if (type != PARAM_NONE || pos != -1)
            return 0;
        *static_cast<int*>(out) = PARAM_COUNT;
        return 1;
    };
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "arrstring");
    EXPECT_TRUE(this->value.GetArrayString().empty());
    EXPECT_EQ(this->value.GetName(), "k");
}

TYPED_TEST(VariantChk, VectorOfAnIntAndAText_IsAListNamedByTheKey)
{
    this->ticket.Store(5, -1);
    this->ticket.Store("b", 1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "list");
    EXPECT_EQ(this->value.GetName(), "k");
    EXPECT_THAT(this->Told(this->value), ElementsAre("k: long 5", "k: string b"));
}

TYPED_TEST(VariantChk, VectorThatBeginsWithTexts_IsAListIfANumberFollows)
{
    this->ticket.Store("a", -1);
    this->ticket.Store("b", 1);
    this->ticket.Store(2.5, 2);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_THAT(this->Told(this->value), ElementsAre("k: string a", "k: string b", "k: double 2.5"));
}

TYPED_TEST(VariantChk, VectorOfInt64_IsAnEmptyList)
{
    this->ticket.StoreList(std::vector<long long>{1, 2});
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_EQ(this->value.GetType(), "list");
    EXPECT_EQ(this->value.GetCount(), 0u);
    EXPECT_EQ(this->value.GetName(), "k");
}

TYPED_TEST(VariantChk, ElementThatCannotBeRead_CutsTheList_ByDesign)
{
    this->ticket.Store(1, -1);
    this->ticket.Store(2LL, 1);
    this->ticket.Store(3, 2);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_THAT(this->Told(this->value), ElementsAre("k: long 1"));
}

TYPED_TEST(VariantChk, ElementsOfAList_KeepTheirOwnValues)
{
    this->ticket.StoreList(std::vector<int>{1, 2, 3});
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1));
    EXPECT_THAT(this->Told(this->value), ElementsAre("k: long 1", "k: long 2", "k: long 3"));
}

TYPED_TEST(VariantChk, Position_GivesTheElement)
{
    BIN_STRING const bytes("abc", 3);
    this->ticket.Store(5, -1);
    this->ticket.Store("b", 1);
    this->ticket.fake.Put(TypeParam::Type, TypeParam::Id, "k", PARAM_BINSTRING, &bytes, 2);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, 0));
    EXPECT_EQ(this->value, this->Long(5));
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, 1));
    EXPECT_EQ(this->value.GetString(), "b");
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, 2));
    this->ExpectNull();
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, 3));
    this->ExpectNull();
}

TYPED_TEST(VariantChk, VectorAtAPosition_IsFalseAndNull)
{
    this->ticket.fake.Access()->MGETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void* out, int)
    {
        *static_cast<int*>(out) = PARAM_COUNT;
        return 1;
    };
    EXPECT_FALSE(this->ticket.GetVariantChk(this->value, 0));
    this->ExpectNull();
}

TYPED_TEST(VariantChk, Name_IsTheKeyReadAsUtf8WhateverTheLocalEncoding)
{
    Locale const plain("C");
    this->ticket.fake.Put(TypeParam::Type, TypeParam::Id, "Gr\xC3\xBCn", 5, -1);
    EXPECT_TRUE(this->ticket.GetVariantChk(this->value, -1, "Gr\xC3\xBCn"));
    EXPECT_EQ(this->value.GetName(), wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(this->value.GetLong(), 5);
}

TYPED_TEST(VariantDef, KeyOutsideTheLocalEncoding_CannotBeRead_ByDesign)
{
    wxString const name = wxString::FromUTF8("Gr\xC3\xBCn");
    this->ticket.fake.Put(TypeParam::Type, TypeParam::Id, "Gr\xC3\xBCn", 5, -1);
    {
        Locale const plain("C");
        wxVariant const value = this->ticket.GetVariantDef(wxVariant(7L, name), -1);
        EXPECT_EQ(value.GetLong(), 7);
        EXPECT_EQ(value.GetName(), name);
    }
    Locale const unicode("C.UTF-8");
    EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(7L, name), -1).GetLong(), 5);
}

TYPED_TEST(VariantDef, Bool_IsAnIntThatIsNot0)
{
    this->ticket.Store(-3, -1);
    wxVariant const value = this->ticket.GetVariantDef(wxVariant(false, "k"), -1);
    EXPECT_EQ(value.GetType(), "bool");
    EXPECT_TRUE(value.GetBool());
    EXPECT_EQ(value.GetName(), "k");
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_INT, -1)));
}

TYPED_TEST(VariantDef, Double_IsADouble)
{
    this->ticket.Store(2.5, -1);
    wxVariant const value = this->ticket.GetVariantDef(wxVariant(1.0, "k"), -1);
    EXPECT_EQ(value.GetType(), "double");
    EXPECT_EQ(value.GetDouble(), 2.5);
    EXPECT_EQ(value.GetName(), "k");
}

TYPED_TEST(VariantDef, Long_IsAnInt)
{
    this->ticket.Store(-5, 2);
    wxVariant const value = this->ticket.GetVariantDef(wxVariant(7L, "k"), 2);
    EXPECT_EQ(value.GetType(), "long");
    EXPECT_EQ(value.GetLong(), -5);
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_INT, 2)));
}

TYPED_TEST(VariantDef, LongBeyond32BitsOnAMissingKey_IsCutToAnInt_ByDesign)
{
    EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(0x100000005L, "k"), -1).GetLong(), 5);
    EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(0x1FFFFFFFFL, "k"), -1).GetLong(), -1);
}

TYPED_TEST(VariantDef, String_IsATextResolvedButNotTheDefault)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    wxVariant const def("$(D)/x", "k");
    EXPECT_EQ(this->ticket.GetVariantDef(def, -1).GetString(), "$(D)/x");
    this->ticket.Store("$(A)/x", -1);
    wxVariant const value = this->ticket.GetVariantDef(def, -1);
    EXPECT_EQ(value.GetType(), "string");
    EXPECT_EQ(value.GetString(), "<$(A)/x>");
    EXPECT_EQ(value.GetName(), "k");
}

TYPED_TEST(VariantDef, VoidPointer_IsAPointer)
{
    void* const pointer = this;
    this->ticket.Store(pointer, -1);
    wxVariant const value = this->ticket.GetVariantDef(wxVariant(static_cast<void*>(nullptr), "k"), -1);
    EXPECT_EQ(value.GetType(), "void*");
    EXPECT_EQ(value.GetVoidPtr(), pointer);
    EXPECT_EQ(value.GetName(), "k");
}

TYPED_TEST(VariantDef, MissingKeyOrOtherType_IsTheDefaultWithItsName)
{
    for (char const* const key : {"missing", "k"})
    {
        this->ticket.Store(5LL, -1);
        EXPECT_TRUE(this->ticket.GetVariantDef(wxVariant(true, key), -1).GetBool());
        EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(2.5, key), -1).GetDouble(), 2.5);
        EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(7L, key), -1).GetLong(), 7);
        EXPECT_EQ(this->ticket.GetVariantDef(wxVariant("text", key), -1).GetString(), "text");
        void* const pointer = this;
        EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(pointer, key), -1).GetVoidPtr(), pointer);
        EXPECT_EQ(this->ticket.GetVariantDef(wxVariant(7L, key), -1).GetName(), key);
    }
}

TYPED_TEST(VariantDef, List_IsReadElementByElementUnderItsOwnName)
{
    this->ticket.Store("a", -1);
    this->ticket.Store(5, 1);
    wxVariant const def = this->List({wxVariant("x", "other"), wxVariant(7L, "names")});
    wxVariant const value = this->ticket.GetVariantDef(def, -1);
    EXPECT_EQ(value.GetType(), "list");
    EXPECT_EQ(value.GetName(), "k");
    EXPECT_THAT(this->Told(value), ElementsAre("k: string a", "k: long 5"));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_STRING, 0), this->ticket.Get(PARAM_INT, 1)));
    EXPECT_THAT(this->Told(def), ElementsAre("other: string x", "names: long 7"));
}

TYPED_TEST(VariantDef, List_IsAsLongAsTheDefault)
{
    this->ticket.StoreList(std::vector<int>{1, 2, 3});
    wxVariant const shorter = this->List({this->Long(7)});
    EXPECT_THAT(this->Told(this->ticket.GetVariantDef(shorter, -1)), ElementsAre("k: long 1"));
    wxVariant const longer = this->List({this->Long(7), this->Long(8), this->Long(9), this->Long(10, "x")});
    EXPECT_THAT(this->Told(this->ticket.GetVariantDef(longer, -1)),
                ElementsAre("k: long 1", "k: long 2", "k: long 3", "k: long 10"));
    EXPECT_EQ(this->ticket.GetVariantDef(this->List({}), -1).GetCount(), 0u);
}

TYPED_TEST(VariantDef, ListAtAPosition_IsACopyOfTheDefault)
{
    this->ticket.Store(5, -1);
    wxVariant const def = this->List({this->Long(7, "a"), this->Long(8, "b")});
    wxVariant const value = this->ticket.GetVariantDef(def, 0);
    EXPECT_EQ(value.GetName(), "k");
    EXPECT_THAT(this->Told(value), ElementsAre("a: long 7", "b: long 8"));
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(VariantDef, ListInAList_IsACopyUnderTheOuterName)
{
    this->ticket.Store(5, -1);
    wxVariant const def = this->List({this->List({this->Long(7, "a")}, "inner")});
    wxVariant const value = this->ticket.GetVariantDef(def, -1);
    ASSERT_EQ(value.GetCount(), 1u);
    EXPECT_EQ(value[0].GetName(), "k");
    EXPECT_THAT(this->Told(value[0]), ElementsAre("a: long 7"));
}

TYPED_TEST(VariantDef, Arrstring_IsReadElementByElementEachItsOwnDefault)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    this->ticket.Store("a", -1);
    this->ticket.Store("$(B)/x", 1);
    wxVariant const def(this->Texts({"x", "y", "$(Z)/z"}), "k");
    wxVariant const value = this->ticket.GetVariantDef(def, -1);
    EXPECT_EQ(value.GetType(), "arrstring");
    EXPECT_EQ(value.GetName(), "k");
    EXPECT_THAT(value.GetArrayString(), ElementsAre("a", "<$(B)/x>", "$(Z)/z"));
    EXPECT_EQ(this->calls[0], this->ticket.Get(PARAM_STRING, 0));
}

TYPED_TEST(VariantDef, ArrstringAtAPosition_IsACopyOfTheDefault)
{
    this->ticket.Store("a", -1);
    wxVariant const def(this->Texts({"x"}), "k");
    wxVariant const value = this->ticket.GetVariantDef(def, 0);
    EXPECT_THAT(value.GetArrayString(), ElementsAre("x"));
    EXPECT_EQ(value.GetName(), "k");
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(VariantDef, AnyOtherType_IsACopyOfTheDefault)
{
    this->ticket.Store(5, -1);
    wxVariant const date(wxDateTime(1, wxDateTime::Feb, 2003), "k");
    wxVariant const value = this->ticket.GetVariantDef(date, -1);
    EXPECT_EQ(value.GetType(), "datetime");
    EXPECT_EQ(value, date);
    EXPECT_EQ(value.GetName(), "k");
    wxVariant null;
    null.SetName("k");
    EXPECT_TRUE(this->ticket.GetVariantDef(null, -1).IsNull());
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(VariantSet, Bool_IsAnInt)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(true), 0));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Set(PARAM_INT, 0)));
    EXPECT_EQ(this->Int(0), 1);
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(false), -1));
    EXPECT_EQ(this->Int(), 0);
}

TYPED_TEST(VariantSet, Double_IsADouble)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(2.5), 1));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Set(PARAM_DOUBLE, 1)));
    EXPECT_EQ(this->Double(1), 2.5);
}

TYPED_TEST(VariantSet, Long_IsStoredAsADouble_ByDesign)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(5L), -1));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Set(PARAM_DOUBLE, -1)));
    EXPECT_EQ(this->Double(), 5.0);
    wxVariant back;
    EXPECT_TRUE(this->ticket.GetVariantChk(back, -1));
    EXPECT_EQ(back.GetType(), "double");
}

TYPED_TEST(VariantSet, LongBeyond53Bits_LosesDigits_ByDesign)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant((1L << 53) + 1), -1));
    EXPECT_EQ(this->Double(), 9007199254740992.0);
}

TYPED_TEST(VariantSet, String_IsTextInUtf8)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(wxString::FromUTF8("Gr\xC3\xBCn")), -2));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Set(PARAM_STRING, -2)));
    EXPECT_EQ(this->ticket.Text(-1), "Gr\xC3\xBCn");
}

TYPED_TEST(VariantSet, VoidPointer_IsAPointer)
{
    void* const pointer = this;
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(pointer), -1));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Set(PARAM_POINTER, -1)));
    EXPECT_EQ(this->ticket.GetVoidParameter(-1, "k", nullptr), pointer);
}

TYPED_TEST(VariantSet, Name_IsNotTheKey)
{
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(2.5, "other"), -1));
    EXPECT_EQ(this->Double(), 2.5);
}

TYPED_TEST(VariantSet, SlotThatRefuses_IsFalse)
{
    void* const pointer = this;
    for (wxVariant const& value :
         {wxVariant(true), wxVariant(2.5), wxVariant(5L), wxVariant("text"), wxVariant(pointer)})
    {
        this->ticket.fake.FailCall(0);
        EXPECT_FALSE(this->ticket.SetVariant(value, -1)) << value.GetType();
    }
}

TYPED_TEST(VariantSet, AnyResultOfTheSlotBut0_IsTrue)
{
    this->ticket.fake.success = 0x4000;
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(5L), -1));
}

TYPED_TEST(VariantSet, List_IsOneCallAnElementFromMinus1)
{
    wxVariant const list = this->List({wxVariant("a"), wxVariant(true), wxVariant(2.5)});
    EXPECT_TRUE(this->ticket.SetVariant(list, -1));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Set(PARAM_STRING, -1), this->ticket.Set(PARAM_INT, 1),
                                         this->ticket.Set(PARAM_DOUBLE, 2)));
}

TYPED_TEST(VariantSet, ListOverALongerOne_StartsTheKeyAnew)
{
    this->ticket.StoreList(SomeValues<int>());
    EXPECT_TRUE(this->ticket.SetVariant(this->List({wxVariant("a"), wxVariant("b")}), -1));
    EXPECT_EQ(this->ticket.Count(), 2u);
}

TYPED_TEST(VariantSet, ListWhoseElementsFail_IsTrueAllTheSame_ByDesign)
{
    wxVariant const list = this->List({wxVariant("a"), wxVariant(wxDateTime::Now()), wxVariant("c")});
    this->ticket.fake.FailCall(0);
    EXPECT_TRUE(this->ticket.SetVariant(list, -1));
    EXPECT_THAT(this->calls,
                ElementsAre(this->ticket.Set(PARAM_STRING, -1), this->ticket.Set(PARAM_STRING, 2)));
}

TYPED_TEST(VariantSet, ListAtAPosition_IsFalseAndCallsNoSlot)
{
    wxVariant const list = this->List({wxVariant("a"), wxVariant("b"), wxVariant("c")});
    EXPECT_FALSE(this->ticket.SetVariant(list, 2));
    EXPECT_FALSE(this->ticket.SetVariant(list, 0));
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(VariantSet, EmptyList_IsTrueAndLeavesTheOldValue_ByDesign)
{
    this->ticket.Store(5, -1);
    EXPECT_TRUE(this->ticket.SetVariant(this->List({}), -1));
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(VariantSet, ListInAList_IsWrittenInFirstPlaceAndDroppedBehind_ByDesign)
{
    wxVariant const inner = this->List({wxVariant("a"), wxVariant("b")});
    EXPECT_TRUE(this->ticket.SetVariant(this->List({inner, inner}), -1));
    EXPECT_THAT(this->calls,
                ElementsAre(this->ticket.Set(PARAM_STRING, -1), this->ticket.Set(PARAM_STRING, 1)));
}

TYPED_TEST(VariantSet, Arrstring_IsWrittenAsTheWxArrayIs)
{
    wxArrayString const texts = this->Texts({"a", "b"});
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(texts), -1));
    auto const written = this->calls;
    this->calls.clear();
    EXPECT_TRUE(this->ticket.SetWxArray(texts));
    EXPECT_EQ(written, this->calls);
    EXPECT_EQ(written[0], this->ticket.SetTable());
}

TEST(VariantSetContained, Arrstring_StandsBehindAsManyEmptyTexts_ByDesign)
{
    LISTS<CONTAINED> ticket;
    wxArrayString texts;
    texts.Add("a");
    EXPECT_TRUE(ticket.SetVariant(wxVariant(texts), -1));
    EXPECT_EQ(ticket.Count(), 2u);
    EXPECT_EQ(ticket.Text(0), "");
    EXPECT_EQ(ticket.Text(1), "a");
}

TYPED_TEST(VariantSet, ArrstringWhoseRecordFails_IsFalse)
{
    this->ticket.fake.FailPosition(1);
    EXPECT_FALSE(this->ticket.SetVariant(wxVariant(this->Texts({"a", "b"})), -1));
}

TYPED_TEST(VariantSet, EmptyArrstring_DeletesTheKey)
{
    this->ticket.Store(5, -1);
    EXPECT_TRUE(this->ticket.SetVariant(wxVariant(wxArrayString()), -1));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Delete()));
}

TYPED_TEST(VariantSet, ArrstringAtAPosition_IsFalseAndCallsNoSlot)
{
    EXPECT_FALSE(this->ticket.SetVariant(wxVariant(this->Texts({"a"})), 0));
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(VariantSet, AnyOtherType_IsFalseAndCallsNoSlot)
{
    EXPECT_FALSE(this->ticket.SetVariant(wxVariant(wxDateTime::Now()), -1));
    EXPECT_FALSE(this->ticket.SetVariant(wxVariant(), -1));
    EXPECT_FALSE(this->ticket.SetVariant(wxVariant(wxLongLong(5)), -1));
    EXPECT_THAT(this->calls, IsEmpty());
}
