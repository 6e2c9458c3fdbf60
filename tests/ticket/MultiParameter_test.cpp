#include "comgui/ticket/MultiParameter.h"

#include <climits>
#include <cstdlib>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>
#include <vector>

using testing::ElementsAre;

namespace
{
struct Free
{
    void operator()(void* table) const { std::free(table); }
};
template <typename RECORD>
using OWNED = std::unique_ptr<RECORD, Free>;

bool IsZero(void const* record)
{
    return std::string(static_cast<char const*>(record), sizeof(SETMULTIPAR)) ==
           std::string(sizeof(SETMULTIPAR), '\0');
}

template <typename RECORD>
std::vector<RECORD> TableOf(std::vector<int> const& okBytes)
{
    std::vector<RECORD> table;
    for (int const ok : okBytes)
    {
        table.push_back({});
        table.back().key = "Key";
        std::memset(&table.back().ok, ok, 1);
    }
    table.push_back({});
    return table;
}

std::vector<bool> Oks(std::vector<SETMULTIPAR> const& table)
{
    std::vector<bool> oks;
    for (SETMULTIPAR const& record : table)
        oks.push_back(record.ok);
    return oks;
}
}  // namespace

// Tables made for one key.

TEST(NewGetMultipar, Positions_BeginAtZero)
{
    OWNED<GETMULTIPAR> const table(NewGetMultipar(3, "Key", PARAM_INT));
    ASSERT_NE(table, nullptr);
    for (int i = 0; i < 3; ++i)
    {
        GETMULTIPAR const& record = table.get()[i];
        EXPECT_STREQ(record.key, "Key");
        EXPECT_EQ(record.type, PARAM_INT);
        EXPECT_EQ(record.value, nullptr);
        EXPECT_EQ(record.pos, i);
        EXPECT_FALSE(record.ok);
    }
    EXPECT_TRUE(IsZero(table.get() + 3));
}

TEST(NewSetMultipar, FirstPosition_IsTheKeyAsAWhole_ByDesign)
{
    OWNED<SETMULTIPAR> const table(NewSetMultipar(3, "Key", PARAM_DOUBLE));
    ASSERT_NE(table, nullptr);
    int const positions[] = {-1, 1, 2};
    for (int i = 0; i < 3; ++i)
    {
        SETMULTIPAR const& record = table.get()[i];
        EXPECT_STREQ(record.key, "Key");
        EXPECT_EQ(record.type, PARAM_DOUBLE);
        EXPECT_EQ(record.value, nullptr);
        EXPECT_EQ(record.pos, positions[i]);
        EXPECT_FALSE(record.ok);
    }
    EXPECT_TRUE(IsZero(table.get() + 3));
}

TEST(NewMultipar, Key_IsNotCopied)
{
    char const key[] = "Key";
    OWNED<GETMULTIPAR> const get(NewGetMultipar(2, key, PARAM_INT));
    OWNED<SETMULTIPAR> const set(NewSetMultipar(2, key, PARAM_INT));
    for (int i = 0; i < 2; ++i)
    {
        EXPECT_EQ(get.get()[i].key, key);
        EXPECT_EQ(set.get()[i].key, key);
    }
}

TEST(NewMultipar, OneRecord_StandsWhereItsDirectionBegins)
{
    OWNED<GETMULTIPAR> const get(NewGetMultipar(1, "Key", PARAM_INT));
    OWNED<SETMULTIPAR> const set(NewSetMultipar(1, "Key", PARAM_INT));
    EXPECT_EQ(get->pos, 0);
    EXPECT_EQ(set->pos, -1);
}

TEST(NewMultipar, NoRecords_GiveTheEndAlone)
{
    OWNED<GETMULTIPAR> const get(NewGetMultipar(0, "Key", PARAM_INT));
    OWNED<SETMULTIPAR> const set(NewSetMultipar(0, "Key", PARAM_INT));
    ASSERT_NE(get, nullptr);
    ASSERT_NE(set, nullptr);
    EXPECT_TRUE(IsZero(get.get()));
    EXPECT_TRUE(IsZero(set.get()));
}

TEST(NewMultipar, MoreThanThereIsRoomFor_GivesNull)
{
    // The first needs more bytes than an address can tell, the second one record more than it can count.
    for (unsigned long const count : {ULONG_MAX / 2, ULONG_MAX})
    {
        EXPECT_EQ(NewGetMultipar(count, "Key", PARAM_INT), nullptr);
        EXPECT_EQ(NewSetMultipar(count, "Key", PARAM_INT), nullptr);
    }
}

TEST(MultiParameterDup, Null_GivesNull) { EXPECT_EQ(MultiParameterDup(nullptr), nullptr); }

TEST(MultiParameterDup, Copy_HasEveryByteOfTheTable)
{
    int const value = 5;
    SETMULTIPAR const table[] = {{"a", PARAM_INT, 0, &value, -1, true, {}},
                                 {"b", PARAM_NONE, 7, nullptr, 3, false, {1, 2, 3}},
                                 {nullptr, PARAM_INT, 9, &value, 9, true, {}}};
    OWNED<SETMULTIPAR> const copy(MultiParameterDup(table));
    ASSERT_NE(copy, nullptr);
    EXPECT_NE(copy.get(), table);
    EXPECT_EQ(std::memcmp(copy.get(), table, sizeof table), 0);
}

TEST(MultiParameterDup, EmptyTable_GivesTheEndAlone)
{
    SETMULTIPAR const end = {};
    OWNED<SETMULTIPAR> const copy(MultiParameterDup(&end));
    ASSERT_NE(copy, nullptr);
    EXPECT_TRUE(IsZero(copy.get()));
}

// Results.

TEST(MultiParameterResultCpy, Results_AreCopiedRecordByRecord)
{
    std::vector<SETMULTIPAR> target = TableOf<SETMULTIPAR>({1, 0, 0});
    std::vector<SETMULTIPAR> const source = TableOf<SETMULTIPAR>({0, 1, 0});
    MultiParameterResultCpy(target.data(), source.data());
    EXPECT_THAT(Oks(target), ElementsAre(false, true, false, false));
}

TEST(MultiParameterResultCpy, Keys_AreNotCompared_ByDesign)
{
    std::vector<SETMULTIPAR> target = TableOf<SETMULTIPAR>({0});
    std::vector<SETMULTIPAR> source = TableOf<SETMULTIPAR>({1});
    source[0].key = "Other";
    source[0].pos = 9;
    MultiParameterResultCpy(target.data(), source.data());
    EXPECT_TRUE(target[0].ok);
    EXPECT_STREQ(target[0].key, "Key");
    EXPECT_EQ(target[0].pos, 0);
}

TEST(MultiParameterResultCpy, ShorterSource_SetsTheEnd)
{
    std::vector<SETMULTIPAR> target = TableOf<SETMULTIPAR>({0, 0, 1});
    std::vector<SETMULTIPAR> const source = TableOf<SETMULTIPAR>({1});
    MultiParameterResultCpy(target.data(), source.data());
    EXPECT_THAT(Oks(target), ElementsAre(true, false, true, false));
}

TEST(MultiParameterResultCpy, ShorterTarget_SetsTheEnd)
{
    std::vector<SETMULTIPAR> target = TableOf<SETMULTIPAR>({0});
    std::vector<SETMULTIPAR> const source = TableOf<SETMULTIPAR>({1, 1, 1});
    MultiParameterResultCpy(target.data(), source.data());
    EXPECT_THAT(Oks(target), ElementsAre(true, false));
}

TEST(MultiParameterResultCpy, EmptyTables_AreLeftAlone)
{
    std::vector<SETMULTIPAR> target = TableOf<SETMULTIPAR>({0});
    std::vector<SETMULTIPAR> empty = TableOf<SETMULTIPAR>({});
    MultiParameterResultCpy(target.data(), empty.data());
    MultiParameterResultCpy(empty.data(), target.data());
    EXPECT_FALSE(target[0].ok);
    EXPECT_TRUE(IsZero(empty.data()));
}

TEST(MultiParameterResultCpy, NullOnEitherSide_DoesNothing)
{
    std::vector<SETMULTIPAR> table = TableOf<SETMULTIPAR>({1, 0});
    MultiParameterResultCpy(nullptr, table.data());
    MultiParameterResultCpy(table.data(), nullptr);
    MultiParameterResultCpy(nullptr, nullptr);
    EXPECT_THAT(Oks(table), ElementsAre(true, false, false));
}

template <typename RECORD>
class MultiParameterOk : public testing::Test
{
protected:
    bool All(std::vector<int> const& okBytes) { return AllMultiParameterOk(TableOf<RECORD>(okBytes).data()); }
    bool Any(std::vector<int> const& okBytes) { return AnyMultiParameterOk(TableOf<RECORD>(okBytes).data()); }
};
using RECORDS = testing::Types<SETMULTIPAR, GETMULTIPAR>;
TYPED_TEST_SUITE(MultiParameterOk, RECORDS, );

TYPED_TEST(MultiParameterOk, NullTable_IsNeither)
{
    EXPECT_FALSE(AllMultiParameterOk(static_cast<TypeParam const*>(nullptr)));
    EXPECT_FALSE(AnyMultiParameterOk(static_cast<TypeParam const*>(nullptr)));
}

TYPED_TEST(MultiParameterOk, EmptyTable_IsAllButNotAny)
{
    EXPECT_TRUE(this->All({}));
    EXPECT_FALSE(this->Any({}));
}

TYPED_TEST(MultiParameterOk, EveryRecordOk_IsBoth)
{
    EXPECT_TRUE(this->All({1, 1}));
    EXPECT_TRUE(this->Any({1, 1}));
}

TYPED_TEST(MultiParameterOk, OneRecordFailed_IsAnyButNotAll)
{
    for (std::vector<int> const& oks : {std::vector{0, 1, 1}, std::vector{1, 0, 1}, std::vector{1, 1, 0}})
    {
        EXPECT_FALSE(this->All(oks));
        EXPECT_TRUE(this->Any(oks));
    }
}

TYPED_TEST(MultiParameterOk, EveryRecordFailed_IsNeither)
{
    EXPECT_FALSE(this->All({0, 0}));
    EXPECT_FALSE(this->Any({0, 0}));
}

TYPED_TEST(MultiParameterOk, AnyByteButZero_IsOk)
{
    EXPECT_TRUE(this->All({2, 255}));
    EXPECT_TRUE(this->Any({0, 128}));
}

TYPED_TEST(MultiParameterOk, EndRecord_IsNotCounted)
{
    std::vector<TypeParam> table = TableOf<TypeParam>({0});
    table.back().ok = true;
    EXPECT_FALSE(AnyMultiParameterOk(table.data()));
}
