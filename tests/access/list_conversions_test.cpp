// Lists that a ticket stores as lists of something else: bools as ints, wide texts as UTF-8. And the arrays
// of wxWidgets.
#include "tests/access/FolderVariablesFake.h"
#include "tests/access/ListFamilies.h"
#include <gmock/gmock.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
int ReadNothingButSayOk(void*, int, int, GETMULTIPAR* table)
{
    for (; table->key; ++table)
        table->ok = true;
    return 1;
}

template <typename Family>
class BoolList : public ListsInBothFamilies<Family>
{
protected:
    std::vector<bool> list = {true, false, true, true, true};
    bool array[4] = {true, false, true, true};
};
template <typename Family>
class TextList : public ListsInBothFamilies<Family>
{
protected:
    void StoreTexts()
    {
        this->ticket.Store("a", -1);
        this->ticket.Store("Gr\xC3\xBCn", 1);
        this->ticket.Store("", 2);
    }
    wxString const green = wxString::FromUTF8("Gr\xC3\xBCn");
    std::vector<wxString> list = {"old", "older"};
};
template <typename Family>
class TextArray : public TextList<Family>
{
protected:
    wxArrayString array;
};
template <typename Family>
class IntArray : public ListsInBothFamilies<Family>
{
protected:
    IntArray() { array.Add(99, 5); }
    static std::vector<int> Of(wxArrayInt const& array)
    {
        return std::vector<int>(array.begin(), array.end());
    }
    wxArrayInt array;
};
}  // namespace

TYPED_TEST_SUITE(BoolList, Families);
TYPED_TEST_SUITE(TextList, Families);
TYPED_TEST_SUITE(TextArray, Families);
TYPED_TEST_SUITE(IntArray, Families);

TYPED_TEST(BoolList, ReadVector_IsWhetherTheIntsAreNot0)
{
    this->ticket.StoreList(std::vector<int>{-1, 0, 2});
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre(true, false, true));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_COUNT, -1), this->ticket.GetTable(),
                                         this->ticket.Get(PARAM_INT, 0), this->ticket.Get(PARAM_INT, 1),
                                         this->ticket.Get(PARAM_INT, 2)));
}

TYPED_TEST(BoolList, ReadVectorLongerThanBefore_HoldsAllValues)
{
    this->ticket.StoreList(std::vector<int>{0, 1, 0});
    this->list = {true};
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre(false, true, false));
}

TYPED_TEST(BoolList, ReadVector_RecordThatFails_IsLeftOut)
{
    this->ticket.StoreList(std::vector<int>{1, 1, 0});
    this->ticket.fake.FailPosition(1);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre(true, false));
}

TYPED_TEST(BoolList, ReadVectorOfAMissingKey_LeavesTheVector)
{
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre(true, false, true, true, true));
}

TYPED_TEST(BoolList, ReadVectorOfWhichAllRecordsFail_LeavesTheVector)
{
    this->ticket.StoreList(std::vector<int>{1, 0});
    this->ticket.fake.FailCall(1);
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list.size(), 5u);
}

TYPED_TEST(BoolList, ReadOfIntsThatTheSlotDoesNotWrite_IsFalses)
{
    this->ticket.StoreList(std::vector<int>{1, 1, 1});
    this->ticket.fake.Access()->MGETMULTIPAR = ReadNothingButSayOk;
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre(false, false, false));
    EXPECT_TRUE(this->ticket.GetArray(this->array, 3));
    EXPECT_THAT(this->array, ElementsAre(false, false, false, true));
}

TYPED_TEST(BoolList, ReadArray_IsWhetherTheIntsAreNot0)
{
    this->ticket.StoreList(std::vector<int>{0, 256, 0});
    EXPECT_TRUE(this->ticket.GetArray(this->array, 3));
    EXPECT_THAT(this->array, ElementsAre(false, true, false, true));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.GetTable(), this->ticket.Get(PARAM_INT, 0),
                                         this->ticket.Get(PARAM_INT, 1), this->ticket.Get(PARAM_INT, 2)));
}

TYPED_TEST(BoolList, ReadArrayShorterThanTheList_HasItsHead)
{
    this->ticket.StoreList(std::vector<int>{0, 1, 0});
    EXPECT_TRUE(this->ticket.GetArray(this->array, 2));
    EXPECT_THAT(this->array, ElementsAre(false, true, true, true));
}

TYPED_TEST(BoolList, ReadArrayThatFails_LeavesAllPlaces_ByDesign)
{
    this->ticket.StoreList(std::vector<int>{0, 1, 0});
    EXPECT_FALSE(this->ticket.GetArray(this->array, 4));
    EXPECT_THAT(this->array, ElementsAre(true, false, true, true));
}

TYPED_TEST(BoolList, ReadArrayOf0_IsFalseAndCallsNoSlot)
{
    this->ticket.StoreList(std::vector<int>{0, 1});
    EXPECT_FALSE(this->ticket.GetArray(this->array, 0));
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(BoolList, WriteVector_GoesAsATableOfInts1And0)
{
    EXPECT_TRUE(this->ticket.SetVector(std::vector<bool>{true, false, true}));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.SetTable(), this->ticket.Set(PARAM_INT, -1),
                                         this->ticket.Set(PARAM_INT, 1), this->ticket.Set(PARAM_INT, 2)));
    std::vector<int> stored;
    EXPECT_TRUE(this->ticket.GetVector(stored));
    EXPECT_THAT(stored, ElementsAre(1, 0, 1));
}

TYPED_TEST(BoolList, WriteEmptyVector_DeletesTheKey)
{
    this->ticket.Store(1, -1);
    EXPECT_TRUE(this->ticket.SetVector(std::vector<bool>()));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Delete()));
}

TYPED_TEST(BoolList, WriteArray_DeletesTheKeyAndWritesNothing_ByDesign)
{
    this->ticket.StoreList(std::vector<int>{5, 6});
    EXPECT_TRUE(this->ticket.SetArray(this->array, 3));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Delete()));
    EXPECT_EQ(this->ticket.Count(), 0u);
}

TYPED_TEST(BoolList, WriteArrayThatTheSlotRefuses_IsTrueAllTheSame_ByDesign)
{
    this->ticket.StoreList(std::vector<int>{5, 6});
    this->ticket.fake.FailCall(0);
    EXPECT_TRUE(this->ticket.SetArray(this->array, 3));
    EXPECT_EQ(this->ticket.Count(), 2u);
}

TYPED_TEST(BoolList, WriteArrayOf0_IsTrueAndCallsNoSlot_ByDesign)
{
    this->ticket.Store(5, -1);
    EXPECT_TRUE(this->ticket.SetArray(this->array, 0));
    EXPECT_THAT(this->calls, IsEmpty());
    EXPECT_EQ(this->ticket.Count(), 1u);
}

TYPED_TEST(TextList, Read_IsOneTableOfTextsInUtf8)
{
    this->StoreTexts();
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre("a", this->green, ""));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_COUNT, -1), this->ticket.GetTable(),
                                         this->ticket.Get(PARAM_STRING, 0), this->ticket.Get(PARAM_STRING, 1),
                                         this->ticket.Get(PARAM_STRING, 2)));
}

TYPED_TEST(TextList, Read_ResolvesEachTextByItselfFromTheLastOn)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    this->ticket.Store("$(A)/x", -1);
    this->ticket.Store("plain", 1);
    this->ticket.Store("$(B)/y", 2);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre("<$(A)/x>", "plain", "<$(B)/y>"));
    EXPECT_THAT(folders.decoded, ElementsAre("$(B)/y", "$(A)/x"));
    EXPECT_EQ(this->ticket.TranslatorsAsked(), 2u);
}

TYPED_TEST(TextList, ReadWithoutATranslator_GivesPathsLiterally)
{
    this->ticket.SetTranslator(nullptr);
    this->ticket.Store("$(A)/x", -1);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre("$(A)/x"));
}

TYPED_TEST(TextList, Read_LeavesNullTextsOut)
{
    this->StoreTexts();
    static char const* const texts[] = {nullptr, "b", nullptr};
    this->ticket.fake.Access()->MGETMULTIPAR = [](void*, int, int, GETMULTIPAR* table)
    {
        for (int i = 0; i < 3; ++i)
        {
            *static_cast<char const**>(table[i].value) = texts[i];
            table[i].ok = true;
        }
        return 1;
    };
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre("b"));
}

TYPED_TEST(TextList, ReadOfNothingButNullTexts_IsFalseAndEmpty)
{
    this->StoreTexts();
    this->ticket.fake.nullTexts = true;
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, IsEmpty());
}

TYPED_TEST(TextList, ReadOfTextsThatTheSlotDoesNotWrite_LeavesThemOut)
{
    this->StoreTexts();
    this->ticket.fake.Access()->MGETMULTIPAR = ReadNothingButSayOk;
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, IsEmpty());
}

TYPED_TEST(TextList, Read_RecordThatFails_IsLeftOut)
{
    this->StoreTexts();
    this->ticket.fake.FailPosition(0);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre(this->green, ""));
}

TYPED_TEST(TextList, ReadOfAMissingKey_LeavesTheVector)
{
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre("old", "older"));
}

TYPED_TEST(TextList, ReadOfWhichAllRecordsFail_LeavesTheVector)
{
    this->StoreTexts();
    this->ticket.fake.FailCall(1);
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_THAT(this->list, ElementsAre("old", "older"));
}

TYPED_TEST(TextList, Write_IsOneTableOfTextsInUtf8)
{
    EXPECT_TRUE(this->ticket.SetVector(std::vector<wxString>{"a", this->green, ""}));
    EXPECT_THAT(this->calls,
                ElementsAre(this->ticket.SetTable(), this->ticket.Set(PARAM_STRING, -1),
                            this->ticket.Set(PARAM_STRING, 1), this->ticket.Set(PARAM_STRING, 2)));
    EXPECT_EQ(this->ticket.Text(0), "a");
    EXPECT_EQ(this->ticket.Text(1), "Gr\xC3\xBCn");
    EXPECT_EQ(this->ticket.Text(2), "");
}

TYPED_TEST(TextList, Write_HandsOverTheTextItself)
{
    this->ticket.fake.Access()->MSETMULTIPAR = [](void*, int, int, SETMULTIPAR* table)
    {
        EXPECT_STREQ(static_cast<char const*>(table->value), "text");
        table->ok = true;
        return 1;
    };
    EXPECT_TRUE(this->ticket.SetVector(std::vector<wxString>{"text"}));
}

TYPED_TEST(TextList, WriteOfAPathInVariableForm_IsStoredAsItIs)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    EXPECT_TRUE(this->ticket.SetVector(std::vector<wxString>{"$(A)/x", "/tmp"}));
    EXPECT_EQ(this->ticket.Text(0), "$(A)/x");
    EXPECT_EQ(this->ticket.Text(1), "/tmp");
    EXPECT_EQ(this->ticket.TranslatorsAsked(), 0u);
}

TYPED_TEST(TextList, WriteOfARecordThatFails_IsFalse)
{
    this->ticket.fake.FailPosition(1);
    EXPECT_FALSE(this->ticket.SetVector(std::vector<wxString>{"a", "b"}));
    EXPECT_EQ(this->ticket.Count(), 1u);
}

TYPED_TEST(TextList, WriteEmpty_DeletesTheKeyWhateverTheSlotSays)
{
    this->StoreTexts();
    this->ticket.fake.FailCall(0);
    EXPECT_TRUE(this->ticket.SetVector(std::vector<wxString>()));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Delete()));
}

TYPED_TEST(TextArray, Read_AppendsToWhatTheArrayHolds_ByDesign)
{
    this->StoreTexts();
    this->array.Add("old");
    EXPECT_TRUE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->array, ElementsAre("old", "a", this->green, ""));
}

TYPED_TEST(TextArray, Read_ResolvesTexts)
{
    FolderVariablesFake folders;
    this->ticket.SetTranslator(&folders);
    this->ticket.Store("$(A)/x", -1);
    EXPECT_TRUE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->array, ElementsAre("<$(A)/x>"));
}

TYPED_TEST(TextArray, ReadOfAMissingKey_IsFalseAndLeavesTheArray)
{
    this->array.Add("old");
    EXPECT_FALSE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->array, ElementsAre("old"));
}

TYPED_TEST(TextArray, ReadOfNothingButNullTexts_IsFalseAndLeavesTheArray)
{
    this->StoreTexts();
    this->ticket.fake.nullTexts = true;
    this->array.Add("old");
    EXPECT_FALSE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->array, ElementsAre("old"));
}

// Its push_back puts a text where it belongs in the order.
TEST(WxTextArray, ReadIntoASortedOne_KeepsItSortedAndWhole)
{
    LISTS<SINGLE> ticket;
    ticket.Store("a", -1);
    ticket.Store("d", 1);
    wxSortedArrayString array;
    array.Add("c");
    array.Add("b");
    EXPECT_TRUE(ticket.GetWxArray(static_cast<wxArrayString&>(array)));
    EXPECT_THAT(array, ElementsAre("a", "b", "c", "d"));
}

TYPED_TEST(TextArray, WriteOfARecordThatFails_IsFalse)
{
    this->ticket.fake.FailPosition(1);
    this->array.Add("a", 2);
    EXPECT_FALSE(this->ticket.SetWxArray(this->array));
}

TYPED_TEST(TextArray, WriteEmpty_DeletesTheKey)
{
    this->StoreTexts();
    EXPECT_TRUE(this->ticket.SetWxArray(this->array));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Delete()));
}

TEST(WxTextArray, WriteToASingleTicket_IsTheTexts)
{
    LISTS<SINGLE> ticket;
    wxArrayString array;
    array.Add("a");
    array.Add("b");
    EXPECT_TRUE(ticket.SetWxArray(array));
    EXPECT_THAT(ticket.fake.calls,
                ElementsAre(ticket.SetTable(), ticket.Set(PARAM_STRING, -1), ticket.Set(PARAM_STRING, 1)));
    EXPECT_EQ(ticket.Text(0), "a");
    EXPECT_EQ(ticket.Text(1), "b");
}

TEST(WxTextArray, WriteToATicketOfAContainer_IsAsManyEmptyTextsAndThenTheTexts_ByDesign)
{
    LISTS<CONTAINED> ticket;
    wxArrayString array;
    array.Add("a");
    array.Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_TRUE(ticket.SetWxArray(array));
    EXPECT_THAT(ticket.fake.calls,
                ElementsAre(ticket.SetTable(), ticket.Set(PARAM_STRING, -1), ticket.Set(PARAM_STRING, 1),
                            ticket.Set(PARAM_STRING, 2), ticket.Set(PARAM_STRING, 3)));
    EXPECT_EQ(ticket.Text(0), "");
    EXPECT_EQ(ticket.Text(1), "");
    EXPECT_EQ(ticket.Text(2), "a");
    EXPECT_EQ(ticket.Text(3), "Gr\xC3\xBCn");
}

TYPED_TEST(IntArray, Read_ReplacesWhatTheArrayHolds)
{
    this->ticket.StoreList(std::vector<int>{1, -2, 3});
    EXPECT_TRUE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->Of(this->array), ElementsAre(1, -2, 3));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_COUNT, -1), this->ticket.GetTable(),
                                         this->ticket.Get(PARAM_INT, 0), this->ticket.Get(PARAM_INT, 1),
                                         this->ticket.Get(PARAM_INT, 2)));
}

TYPED_TEST(IntArray, Read_StartsFromZeros)
{
    this->ticket.StoreList(std::vector<int>{1, -2, 3});
    this->ticket.fake.Access()->MGETMULTIPAR = ReadNothingButSayOk;
    EXPECT_TRUE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->Of(this->array), ElementsAre(0, 0, 0));
}

TYPED_TEST(IntArray, Read_RecordThatFails_IsLeftOut)
{
    this->ticket.StoreList(std::vector<int>{1, -2, 3});
    this->ticket.fake.FailPosition(1);
    EXPECT_TRUE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->Of(this->array), ElementsAre(1, 3));
}

TYPED_TEST(IntArray, ReadOfWhichAllRecordsFail_IsFalseAndEmpty)
{
    this->ticket.StoreList(std::vector<int>{1, -2, 3});
    this->ticket.fake.FailCall(1);
    EXPECT_FALSE(this->ticket.GetWxArray(this->array));
    EXPECT_TRUE(this->array.empty());
}

TYPED_TEST(IntArray, ReadOfAMissingKey_IsFalseAndLeavesTheArray)
{
    EXPECT_FALSE(this->ticket.GetWxArray(this->array));
    EXPECT_THAT(this->Of(this->array), ElementsAre(99, 99, 99, 99, 99));
}

TYPED_TEST(IntArray, Write_IsOneTableOfInts)
{
    this->array[2] = -7;
    EXPECT_TRUE(this->ticket.SetWxArray(this->array));
    std::vector<int> stored;
    EXPECT_EQ(this->calls.size(), 6u);
    EXPECT_EQ(this->calls[1], this->ticket.Set(PARAM_INT, -1));
    EXPECT_EQ(this->calls[5], this->ticket.Set(PARAM_INT, 4));
    EXPECT_TRUE(this->ticket.GetVector(stored));
    EXPECT_THAT(stored, ElementsAre(99, 99, -7, 99, 99));
}

TYPED_TEST(IntArray, WriteOfARecordThatFails_IsFalse)
{
    this->ticket.fake.FailPosition(4);
    EXPECT_FALSE(this->ticket.SetWxArray(this->array));
    EXPECT_EQ(this->ticket.Count(), 4u);
}

TYPED_TEST(IntArray, WriteEmpty_DeletesTheKeyWhateverTheSlotSays)
{
    this->ticket.Store(5, -1);
    this->ticket.fake.FailCall(0);
    this->array.clear();
    EXPECT_TRUE(this->ticket.SetWxArray(this->array));
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Delete()));
}
