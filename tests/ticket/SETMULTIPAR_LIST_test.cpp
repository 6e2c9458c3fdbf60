#include "comgui/ticket/SETMULTIPAR_LIST.h"

#include "comgui/foundation/MathLib.h"
#include <algorithm>
#include <cmath>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <limits>
#include <random>
#include <type_traits>
#include <vector>

using testing::ElementsAre;

namespace
{
static_assert(!std::is_copy_constructible_v<SETMULTIPAR_LIST> &&
              !std::is_copy_assignable_v<SETMULTIPAR_LIST>);

constexpr double NaN = std::numeric_limits<double>::quiet_NaN();
constexpr double Infinity = std::numeric_limits<double>::infinity();

std::vector<std::string> Keys(SETMULTIPAR const* table)
{
    std::vector<std::string> keys;
    for (; table->key; ++table)
        keys.emplace_back(table->key);
    return keys;
}

std::vector<int> Positions(SETMULTIPAR const* table)
{
    std::vector<int> positions;
    for (; table->key; ++table)
        positions.push_back(table->pos);
    return positions;
}

template <typename T>
T Value(SETMULTIPAR const& record)
{
    return *static_cast<T const*>(record.value);
}

char const* Text(SETMULTIPAR const& record) { return static_cast<char const*>(record.value); }

std::string Bytes(SETMULTIPAR const& record)
{
    BIN_STRING const& bytes = *static_cast<BIN_STRING const*>(record.value);
    return {bytes.begin(), bytes.end()};
}

class List : public testing::Test
{
protected:
    SETMULTIPAR const& Last() { return list.Table(false)[list.Size() - 1]; }

    SETMULTIPAR_LIST list{false};
};
}  // namespace

TEST_F(List, New_IsEmpty)
{
    EXPECT_EQ(list.Size(), 0u);
    EXPECT_EQ(list.Table(false), nullptr);
    EXPECT_EQ(list.Table(true), nullptr);
}

TEST_F(List, SortOfNothing_IsNotRemembered)
{
    EXPECT_EQ(list.Table(true), nullptr);
    list.SetParameter("b", 1, -1);
    list.SetParameter("a", 2, -1);
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("b", "a"));
    EXPECT_THAT(Keys(list.Table(true)), ElementsAre("a", "b"));
}

// What every add does, whatever the type.

TEST_F(List, Add_FillsOneRecord)
{
    EXPECT_EQ(list.SetParameter("Key", 5, 3), 1);
    SETMULTIPAR const& record = Last();
    EXPECT_EQ(list.Size(), 1u);
    EXPECT_STREQ(record.key, "Key");
    EXPECT_EQ(record.type, PARAM_INT);
    EXPECT_EQ(record.reserved12, 0);
    EXPECT_EQ(Value<int>(record), 5);
    EXPECT_EQ(record.pos, 3);
    EXPECT_FALSE(record.ok);
    EXPECT_EQ(std::string(record.reserved29, 3), std::string(3, '\0'));
}

TEST_F(List, Key_IsTheListsOwn)
{
    std::string key = "Key";
    list.SetParameter(key.c_str(), 5, -1);
    key = "___";
    EXPECT_STREQ(Last().key, "Key");
}

TEST_F(List, Positions_StayAsTheyAre)
{
    for (int const pos : {-2, -1, 0, 1, 1000000})
        list.SetParameter("Key", 5, pos);
    EXPECT_THAT(Positions(list.Table(false)), ElementsAre(-2, -1, 0, 1, 1000000));
}

TEST_F(List, EqualKeysAndValues_ShareTheirAddresses)
{
    list.SetParameter("k", 5, -1);
    list.SetParameter("k", 5, -1);
    SETMULTIPAR const* const table = list.Table(false);
    EXPECT_EQ(table[0].key, table[1].key);
    EXPECT_EQ(table[0].value, table[1].value);
}

TEST_F(List, KeysAndTexts_AreKeptApart)
{
    list.SetParameter("same", std::string("same"), -1);
    EXPECT_NE(Last().key, Text(Last()));
    EXPECT_STREQ(Last().key, Text(Last()));
}

TEST_F(List, KeyAndValueAddresses_SurviveManyAdds)
{
    list.SetParameter("first", std::string("text"), -1);
    SETMULTIPAR const first = Last();
    for (int i = 0; i < 20000; ++i)
        list.SetParameter(std::to_string(i).c_str(), std::to_string(-i), -1);
    EXPECT_STREQ(first.key, "first");
    EXPECT_STREQ(Text(first), "text");
    EXPECT_EQ(list.Table(false)[0].key, first.key);
    EXPECT_EQ(list.Table(false)[0].value, first.value);
}

// xSetParameter, type by type.

template <typename T>
class CopiedNumber : public testing::Test
{
};
struct AnInt
{
    static constexpr PARAM_TYPE Type = PARAM_INT;
    static constexpr int Value = -7;
};
struct AnUnsigned
{
    static constexpr PARAM_TYPE Type = PARAM_UNSIGNED;
    static constexpr unsigned int Value = 4000000000;
};
struct AnInt64
{
    static constexpr PARAM_TYPE Type = PARAM_INT64;
    static constexpr long long Value = -5000000000;
};
struct AnUnsigned64
{
    static constexpr PARAM_TYPE Type = PARAM_UNSIGNED64;
    static constexpr unsigned long long Value = 0xFFFFFFFFFFFFFFFF;
};
struct ADouble
{
    static constexpr PARAM_TYPE Type = PARAM_DOUBLE;
    static constexpr double Value = 0.1;
};
using NUMBERS = testing::Types<AnInt, AnUnsigned, AnInt64, AnUnsigned64, ADouble>;
TYPED_TEST_SUITE(CopiedNumber, NUMBERS, );

TYPED_TEST(CopiedNumber, XSetParameter_KeepsACopy)
{
    SETMULTIPAR_LIST list(false);
    auto value = TypeParam::Value;
    EXPECT_EQ(list.xSetParameter("Key", TypeParam::Type, &value, 0), 1);
    value = 1;
    SETMULTIPAR const& record = *list.Table(false);
    EXPECT_EQ(record.type, TypeParam::Type);
    EXPECT_EQ(Value<decltype(value)>(record), TypeParam::Value);
    EXPECT_EQ(record.pos, 0);
}

TYPED_TEST(CopiedNumber, EqualOnes_ShareTheirAddress)
{
    SETMULTIPAR_LIST list(false);
    auto const value = TypeParam::Value;
    auto const same = value;
    list.xSetParameter("a", TypeParam::Type, &value, -1);
    list.xSetParameter("b", TypeParam::Type, &same, -1);
    EXPECT_EQ(list.Table(false)[0].value, list.Table(false)[1].value);
}

TYPED_TEST(CopiedNumber, YSetParameter_InAListThatCopies_KeepsACopy)
{
    SETMULTIPAR_LIST list(true);
    auto value = TypeParam::Value;
    EXPECT_EQ(list.ySetParameter("Key", TypeParam::Type, &value, 2), 1);
    value = 1;
    EXPECT_EQ(Value<decltype(value)>(*list.Table(false)), TypeParam::Value);
}

TYPED_TEST(CopiedNumber, YSetParameter_InAListThatDoesNotCopy_CopiesPlainIntegersAlone)
{
    SETMULTIPAR_LIST list(false);
    auto const value = TypeParam::Value;
    EXPECT_EQ(list.ySetParameter("Key", TypeParam::Type, &value, 2), 1);
    EXPECT_EQ(list.Table(false)->value == &value, TypeParam::Type != PARAM_INT);
    EXPECT_EQ(Value<std::remove_const_t<decltype(value)>>(*list.Table(false)), TypeParam::Value);
}

TEST_F(List, Text_IsCopied)
{
    std::string text = "text";
    EXPECT_EQ(list.xSetParameter("Key", PARAM_STRING, text.c_str(), -1), 1);
    text = "____";
    EXPECT_STREQ(Text(Last()), "text");
}

TEST_F(List, Bytes_AreCopiedWithTheirView)
{
    std::string bytes("a\0b", 3);
    BIN_STRING view(bytes);
    EXPECT_EQ(list.xSetParameter("Key", PARAM_BINSTRING, &view, -1), 1);
    bytes = "___";
    view = BIN_STRING();
    EXPECT_EQ(Bytes(Last()), std::string("a\0b", 3));
}

TEST_F(List, EqualTextsAndBytes_ShareTheirAddresses)
{
    for (int i = 0; i < 2; ++i)
    {
        std::string const value = "same";
        list.SetParameter("a", value, -1);
        list.SetParameter("b", BIN_STRING(value), -1);
    }
    SETMULTIPAR const* const table = list.Table(false);
    EXPECT_EQ(table[0].value, table[2].value);
    EXPECT_EQ(table[1].value, table[3].value);
}

TEST_F(List, WordsThatAreNoValues_StayTheCallersOwn)
{
    int target = 0;
    for (int const type : {PARAM_NONE + 0, PARAM_POINTER + 0, PARAM_COUNT + 0, 10, -1})
    {
        list.xSetParameter("Key", static_cast<PARAM_TYPE>(type), &target, -1);
        EXPECT_EQ(Last().type, type);
        EXPECT_EQ(Last().value, &target) << type;
    }
    EXPECT_EQ(list.Size(), 5u);
}

TEST_F(List, NullValue_StaysNull)
{
    for (PARAM_TYPE const type : {PARAM_NONE, PARAM_POINTER, PARAM_INT, PARAM_STRING, PARAM_BINSTRING,
                                  PARAM_COUNT, PARAM_INT64, PARAM_UNSIGNED, PARAM_UNSIGNED64})
    {
        EXPECT_EQ(list.xSetParameter("Key", type, nullptr, -1), 1);
        EXPECT_EQ(Last().value, nullptr) << type;
    }
}

TEST_F(List, WhatIsNoNumber_PointsAtTheOneConstant)
{
    for (double const value : {NaN, -NaN, std::numeric_limits<double>::signaling_NaN(), Infinity, -Infinity})
    {
        list.SetParameter("k", value, -1);
        EXPECT_EQ(Last().type, PARAM_DOUBLE);
        EXPECT_EQ(Last().value, &MathLib::NOT_A_DOUBLE_NUMBER) << value;
    }
}

TEST_F(List, LargestAndSmallestDoubles_AreNumbers)
{
    for (double const value : {std::numeric_limits<double>::max(), std::numeric_limits<double>::lowest(),
                               std::numeric_limits<double>::denorm_min()})
    {
        list.SetParameter("k", value, -1);
        EXPECT_EQ(Value<double>(Last()), value);
    }
}

// SetParameter by the type of the value, and DelParameter.

TEST_F(List, SetParameter_Double_IsADouble)
{
    EXPECT_EQ(list.SetParameter("Key", 1.5, 4), 1);
    EXPECT_EQ(Last().type, PARAM_DOUBLE);
    EXPECT_EQ(Value<double>(Last()), 1.5);
    EXPECT_EQ(Last().pos, 4);
}

TEST_F(List, SetParameter_Text_EndsAtItsFirstZeroByte_ByDesign)
{
    EXPECT_EQ(list.SetParameter("Key", std::string("before\0after", 12), 4), 1);
    EXPECT_EQ(Last().type, PARAM_STRING);
    EXPECT_STREQ(Text(Last()), "before");
    EXPECT_EQ(Last().pos, 4);
    // Nothing of the rest was stored: the text is the very one that is cached for "before".
    list.SetParameter("Key", std::string("before"), 4);
    EXPECT_EQ(list.Table(false)[0].value, list.Table(false)[1].value);
}

TEST_F(List, SetParameter_WideText_IsStoredAsUtf8)
{
    EXPECT_EQ(list.SetParameter("Key", wxString::FromUTF8("\xC3\xA4\xE2\x82\xAC\xF0\x9F\x98\x80"), 4), 1);
    EXPECT_EQ(Last().type, PARAM_STRING);
    EXPECT_STREQ(Text(Last()), "\xC3\xA4\xE2\x82\xAC\xF0\x9F\x98\x80");
    EXPECT_EQ(Last().pos, 4);
}

TEST_F(List, SetParameter_Bytes_KeepTheirZeroBytes)
{
    std::string const bytes("\0a\0", 3);
    EXPECT_EQ(list.SetParameter("Key", BIN_STRING(bytes), 4), 1);
    EXPECT_EQ(Last().type, PARAM_BINSTRING);
    EXPECT_EQ(Bytes(Last()), bytes);
    EXPECT_EQ(Last().pos, 4);
}

TEST_F(List, SetParameter_InvalidBytes_GiveAnInvalidView)
{
    list.SetParameter("Key", BIN_STRING("abc", 0), -1);
    ASSERT_NE(Last().value, nullptr);
    EXPECT_FALSE(Value<BIN_STRING>(Last()).valid());
    EXPECT_EQ(Value<BIN_STRING>(Last()).data, nullptr);
}

TEST_F(List, DelParameter_RecordsADeletion)
{
    EXPECT_EQ(list.DelParameter("Key", 7), 1);
    EXPECT_STREQ(Last().key, "Key");
    EXPECT_EQ(Last().type, PARAM_NONE);
    EXPECT_EQ(Last().value, nullptr);
    EXPECT_EQ(Last().pos, 7);
}

// The add of a walk.

TEST_F(List, YSetParameter_PositionZero_BecomesTheKeyAsAWhole_ByDesign)
{
    int const value = 5;
    for (int const pos : {-2, -1, 0, 1})
        list.ySetParameter("Key", PARAM_INT, &value, pos);
    EXPECT_THAT(Positions(list.Table(false)), ElementsAre(-2, -1, -1, 1));
}

TEST(ListThatCopies, YSetParameter_PositionZero_BecomesTheKeyAsAWhole_ByDesign)
{
    SETMULTIPAR_LIST list(true);
    int const value = 5;
    for (int const pos : {-2, -1, 0, 1})
        list.ySetParameter("Key", PARAM_INT, &value, pos);
    EXPECT_THAT(Positions(list.Table(false)), ElementsAre(-2, -1, -1, 1));
}

TEST_F(List, YSetParameter_Key_IsCopied)
{
    std::string key = "Key";
    list.ySetParameter(key.c_str(), PARAM_STRING, "text", -1);
    key = "___";
    EXPECT_STREQ(Last().key, "Key");
}

TEST_F(List, YSetParameter_Text_StaysInTheTicket)
{
    std::string const text = "text";
    list.ySetParameter("Key", PARAM_STRING, text.c_str(), -1);
    EXPECT_EQ(Last().value, text.c_str());
}

TEST(ListThatCopies, YSetParameter_Text_IsCopied)
{
    SETMULTIPAR_LIST list(true);
    std::string const text = "text";
    list.ySetParameter("Key", PARAM_STRING, text.c_str(), -1);
    EXPECT_NE(list.Table(false)->value, text.c_str());
    EXPECT_STREQ(Text(*list.Table(false)), "text");
}

TEST_F(List, YSetParameter_Bytes_AreCopiedAllTheSame)
{
    std::string bytes = "abc";
    BIN_STRING const view(bytes);
    list.ySetParameter("Key", PARAM_BINSTRING, &view, -1);
    bytes = "___";
    EXPECT_NE(Last().value, &view);
    EXPECT_EQ(Bytes(Last()), "abc");
}

TEST_F(List, YSetParameter_NoNumber_StaysInTheTicket_ByDesign)
{
    list.ySetParameter("Key", PARAM_DOUBLE, &NaN, -1);
    EXPECT_EQ(Last().value, &NaN);
}

TEST(ListThatCopies, YSetParameter_NoNumber_PointsAtTheOneConstant)
{
    SETMULTIPAR_LIST list(true);
    list.ySetParameter("Key", PARAM_DOUBLE, &NaN, -1);
    EXPECT_EQ(list.Table(false)->value, &MathLib::NOT_A_DOUBLE_NUMBER);
}

TEST_F(List, YSetParameter_NullValue_StaysNull)
{
    for (PARAM_TYPE const type : {PARAM_INT, PARAM_DOUBLE, PARAM_STRING, PARAM_BINSTRING})
    {
        EXPECT_EQ(list.ySetParameter("Key", type, nullptr, -1), 1);
        EXPECT_EQ(Last().value, nullptr) << type;
    }
}

TEST_F(List, CollectAction_AddsAsAWalkDoes)
{
    double const value = 1.5;
    EXPECT_TRUE(SETMULTIPAR_LIST::CollectAction(&list, "Key", PARAM_DOUBLE, &value, 0));
    EXPECT_STREQ(Last().key, "Key");
    EXPECT_EQ(Last().value, &value);
    EXPECT_EQ(Last().pos, -1);
}

TEST_F(List, CollectAction_TakesParametersAlone)
{
    int const value = 1;
    for (int type = -2; type <= 11; ++type)
        EXPECT_TRUE(SETMULTIPAR_LIST::CollectAction(&list, std::to_string(type).c_str(),
                                                    static_cast<PARAM_TYPE>(type),
                                                    type == PARAM_BINSTRING ? nullptr : &value, 1));
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("1", "2", "3", "4", "5", "7", "8", "9"));
}

// The table.

TEST_F(List, Table_EndsAtAZeroRecord)
{
    list.SetParameter("k", 1, 5);
    SETMULTIPAR const* const table = list.Table(false);
    std::string const end(reinterpret_cast<char const*>(table + 1), sizeof(SETMULTIPAR));
    EXPECT_EQ(end, std::string(sizeof(SETMULTIPAR), '\0'));
}

TEST_F(List, Table_Unchanged_IsHandedOutAgain)
{
    list.SetParameter("b", 1, -1);
    list.SetParameter("a", 2, -1);
    SETMULTIPAR* const unsorted = list.Table(false);
    EXPECT_EQ(list.Table(false), unsorted);
    SETMULTIPAR* const sorted = list.Table(true);
    EXPECT_EQ(list.Table(true), sorted);
}

TEST_F(List, Sort_IsNotUndoneByAnUnsortedTable)
{
    list.SetParameter("b", 1, -1);
    list.SetParameter("a", 2, -1);
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("b", "a"));
    SETMULTIPAR* const sorted = list.Table(true);
    EXPECT_THAT(Keys(sorted), ElementsAre("a", "b"));
    EXPECT_EQ(list.Table(false), sorted);
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("a", "b"));
}

TEST_F(List, AddAfterASort_StandsBehindTheSortedRecords)
{
    for (char const* const key : {"c", "b"})
        list.SetParameter(key, 1, -1);
    list.Table(true);
    list.SetParameter("a", 1, -1);
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("b", "c", "a"));
    EXPECT_THAT(Keys(list.Table(true)), ElementsAre("a", "b", "c"));
}

TEST_F(List, Sort_KeepsTheOrderOfOneKeysRecords)
{
    list.SetParameter("b", 1, 7);
    list.SetParameter("a", 1, 3);
    list.SetParameter("b", 1, 2);
    list.SetParameter("a", 1, 1);
    EXPECT_THAT(Keys(list.Table(true)), ElementsAre("a", "a", "b", "b"));
    EXPECT_THAT(Positions(list.Table(true)), ElementsAre(3, 1, 7, 2));
}

TEST_F(List, Sort_ComparesUnsignedBytesAndPutsTheShorterFirst)
{
    for (char const* const key : {"\xC3\xA4", "ab", "z", "a", ""})
        list.SetParameter(key, 1, -1);
    EXPECT_THAT(Keys(list.Table(true)), ElementsAre("", "a", "ab", "z", "\xC3\xA4"));
}

TEST_F(List, Sort_OfManyRecords_IsAStableSort)
{
    std::mt19937 random(1);
    std::vector<std::pair<std::string, int>> expected;
    for (int i = 0; i < 5000; ++i)
    {
        expected.emplace_back(std::to_string(random() % 50), i);
        list.SetParameter(expected.back().first.c_str(), 1, i);
    }
    std::stable_sort(expected.begin(), expected.end(),
                     [](auto const& left, auto const& right) { return left.first < right.first; });
    SETMULTIPAR const* record = list.Table(true);
    for (auto const& [key, pos] : expected)
    {
        ASSERT_EQ(record->key, key);
        ASSERT_EQ(record->pos, pos);
        ++record;
    }
}

TEST_F(List, Add_LeavesOutNothingThatStoodInTheTable)
{
    list.SetParameter("a", 1, -1);
    list.Table(false)->ok = true;
    list.SetParameter("b", 2, -1);
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("a", "b"));
    EXPECT_FALSE(list.Table(false)->ok);  // the table is a copy: what others set in it goes with it
}

TEST_F(List, FreeTbl_LeavesTheRecordsInTheirOrder)
{
    list.SetParameter("b", 1, -1);
    list.SetParameter("a", 2, -1);
    list.Table(true);
    list.freeTbl();
    list.freeTbl();
    EXPECT_EQ(list.Size(), 2u);
    EXPECT_THAT(Keys(list.Table(false)), ElementsAre("a", "b"));
    EXPECT_THAT(Keys(list.Table(true)), ElementsAre("a", "b"));
}

TEST_F(List, Clear_EmptiesTheList)
{
    list.SetParameter("b", 1, -1);
    list.Table(true);
    list.Clear();
    EXPECT_EQ(list.Size(), 0u);
    EXPECT_EQ(list.Table(false), nullptr);
    EXPECT_EQ(list.Table(true), nullptr);
}

TEST_F(List, Clear_LeavesAListThatWorks)
{
    for (int round = 0; round < 3; ++round)
    {
        list.SetParameter("b", std::string("text"), -1);
        list.SetParameter("a", BIN_STRING("abc", 3), -1);
        list.SetParameter("c", 1.5, -1);
        list.SetParameter("d", 1, -1);
        EXPECT_THAT(Keys(list.Table(false)), ElementsAre("b", "a", "c", "d"));
        EXPECT_STREQ(Text(list.Table(false)[0]), "text");
        EXPECT_EQ(Bytes(list.Table(false)[1]), "abc");
        EXPECT_EQ(Value<double>(list.Table(false)[2]), 1.5);
        EXPECT_EQ(Value<int>(list.Table(false)[3]), 1);
        list.Clear();
    }
}

// What comes first behind a Clear() takes the memory of what went.
TYPED_TEST(CopiedNumber, Clear_ForgetsTheNumber)
{
    SETMULTIPAR_LIST list(false);
    auto const value = TypeParam::Value;
    for (int round = 0; round < 3; ++round)
    {
        list.SetParameter("Key", std::string(400, 'x'), -1);
        list.xSetParameter("Key", TypeParam::Type, &value, -1);
        void const* const kept = list.Table(false)[1].value;
        EXPECT_EQ(Value<std::remove_const_t<decltype(value)>>(list.Table(false)[1]), value);
        for (int i = 0; i < 300; ++i)
            list.SetParameter("Key", std::string(100, static_cast<char>('a' + i % 26)) + std::to_string(i),
                              -1);
        EXPECT_EQ(list.Table(false)[1].value, kept);
        EXPECT_EQ(Value<std::remove_const_t<decltype(value)>>(list.Table(false)[1]), value);
        list.Clear();
    }
}

TEST(ListThatCopies, Clear_LeavesItCopying)
{
    SETMULTIPAR_LIST list(true);
    list.Clear();
    double const value = 1.5;
    list.ySetParameter("Key", PARAM_DOUBLE, &value, -1);
    EXPECT_NE(list.Table(false)->value, &value);
}
