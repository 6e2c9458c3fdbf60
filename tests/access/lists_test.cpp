// Lists of the plain element types, in tickets of both families: vectors and arrays.
#include "tests/access/ListFamilies.h"

#include <cstring>

using comgui::test::CALL;

namespace
{
template <typename Family, typename T>
struct LIST_CASE
{
    using FAMILY = Family;
    using ELEMENT = T;
};

template <typename Case>
class ListTest : public ListsInBothFamilies<typename Case::FAMILY>
{
protected:
    using T = typename Case::ELEMENT;
    using Ticket = LISTS<typename Case::FAMILY>;

    PARAM_TYPE const type = GetParamType<T>();
    std::vector<T> const three = SomeValues<T>(3);
    std::vector<T> list = std::vector<T>(5, SomeValues<T>()[1]);

    static std::vector<T> List(std::initializer_list<T> values) { return values; }

    std::vector<T> Stored()
    {
        std::vector<T> values(this->ticket.Count());
        for (std::size_t i = 0; i < values.size(); ++i)
            EXPECT_TRUE(
                this->ticket.fake.Read(Ticket::Type, Ticket::Id, "k", type, &values[i], static_cast<int>(i)));
        return values;
    }
};

template <typename Case>
class VectorRead : public ListTest<Case>
{
};
template <typename Case>
class ArrayRead : public ListTest<Case>
{
};

// A way to write a list: as a vector, or as an array.
template <typename Case>
class ListWrite : public ListTest<Case>
{
protected:
    using typename ListTest<Case>::T;

    // Each test runs its facts on a ticket that is as new.
    template <typename Facts>
    void ByEachForm(Facts facts)
    {
        facts([this](std::vector<T> const& in) { return this->ticket.SetVector(in); });
        this->ticket.DelParameter("k", -1);
        this->calls.clear();
        facts([this](std::vector<T> const& in) { return this->ticket.SetArray(in.data(), in.size()); });
    }
};

using Cases =
    testing::Types<LIST_CASE<SINGLE, void*>, LIST_CASE<SINGLE, int>, LIST_CASE<SINGLE, unsigned int>,
                   LIST_CASE<SINGLE, long long>, LIST_CASE<SINGLE, unsigned long long>,
                   LIST_CASE<SINGLE, double>, LIST_CASE<CONTAINED, void*>, LIST_CASE<CONTAINED, int>,
                   LIST_CASE<CONTAINED, unsigned int>, LIST_CASE<CONTAINED, long long>,
                   LIST_CASE<CONTAINED, unsigned long long>, LIST_CASE<CONTAINED, double>>;

std::vector<CALL> Calls(std::initializer_list<CALL> calls) { return calls; }

// Slots of tables that report failure and success in their records, and something else in their result.
int ReadNothingButSayOk(void*, int, int, GETMULTIPAR* table)
{
    for (; table->key; ++table)
    {
        unsigned char const oddTrue = 0x80;
        std::memcpy(&table->ok, &oddTrue, 1);
    }
    return 0;
}
int SayOkAndReadNothing(void*, int, int, GETMULTIPAR*) { return 1; }
int FailButWriteACount(void*, int, int, char const*, PARAM_TYPE, void* value, int)
{
    *static_cast<unsigned long*>(value) = 3;
    return 0;
}
int WriteNothingButSayOk(void*, int, int, SETMULTIPAR* table)
{
    for (; table->key; ++table)
        table->ok = true;
    return 0;
}
int SayOkAndWriteNothing(void*, int, int, SETMULTIPAR*) { return 1; }
}  // namespace

TYPED_TEST_SUITE(VectorRead, Cases);
TYPED_TEST_SUITE(ArrayRead, Cases);
TYPED_TEST_SUITE(ListWrite, Cases);

TYPED_TEST(VectorRead, Values_ComeWithOneCountAndOneTableFrom0)
{
    this->ticket.StoreList(this->three);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->three);
    EXPECT_EQ(this->calls, Calls({this->ticket.Get(PARAM_COUNT, -1), this->ticket.GetTable(),
                                  this->ticket.Get(this->type, 0), this->ticket.Get(this->type, 1),
                                  this->ticket.Get(this->type, 2)}));
}

TYPED_TEST(VectorRead, AllOfTheRange_ComesBack)
{
    auto const values = SomeValues<typename TestFixture::T>();
    this->ticket.StoreList(values);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, values);
}

TYPED_TEST(VectorRead, SingleValue_IsAListOfOne)
{
    this->ticket.Store(this->three[0], -1);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->List({this->three[0]}));
}

TYPED_TEST(VectorRead, MissingKey_IsFalseAndLeavesTheVector)
{
    auto const old = this->list;
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, old);
    EXPECT_EQ(this->calls, Calls({this->ticket.Get(PARAM_COUNT, -1)}));
}

TYPED_TEST(VectorRead, CountThatTheSlotDoesNotWrite_Is0)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.Access()->MGETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void*, int)
    { return 1; };
    auto const old = this->list;
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, old);
    EXPECT_TRUE(this->calls.empty());
}

TYPED_TEST(VectorRead, CountOfASlotThatFails_DoesNotCount)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.Access()->MGETPARAMETER = FailButWriteACount;
    auto const old = this->list;
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, old);
    EXPECT_TRUE(this->calls.empty());
}

TYPED_TEST(VectorRead, ValueThatTheSlotDoesNotWrite_IsWhatTheVectorHeldThereOr0_ByDesign)
{
    auto const old = this->list[0];
    this->list.resize(2);
    this->ticket.StoreList(this->three);
    this->ticket.fake.Access()->MGETMULTIPAR = ReadNothingButSayOk;
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->List({old, old, {}}));
}

TYPED_TEST(VectorRead, RecordThatFails_IsLeftOutAndTheLaterOnesMoveUp)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.FailPosition(1);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->List({this->three[0], this->three[2]}));
}

TYPED_TEST(VectorRead, FirstAndLastRecordsThatFail_AreLeftOut)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.FailPosition(0);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->List({this->three[1], this->three[2]}));
    this->ticket.fake.FailPosition(2);
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->List({this->three[0], this->three[1]}));
}

TYPED_TEST(VectorRead, AllRecordsFail_IsFalseAndEmpty)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.FailCall(1);
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_TRUE(this->list.empty());
}

TYPED_TEST(VectorRead, ValuesOfAnotherType_Fail)
{
    this->ticket.Store("text", -1);
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_TRUE(this->list.empty());
}

TYPED_TEST(VectorRead, ListThatShrinksBetweenTheCalls_IsReadAsItIs)
{
    this->ticket.StoreList(this->three);
    static MTICKET_ACCESS const* access;
    access = this->ticket.fake.Access();
    static MGETMULTIPAR const read = access->MGETMULTIPAR;
    this->ticket.fake.Access()->MGETMULTIPAR = [](void* instance, int ticketType, int id, GETMULTIPAR* table)
    {
        access->MSETPARAMETER(instance, ticketType, id, "k", PARAM_NONE, nullptr, 2);
        return read(instance, ticketType, id, table);
    };
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list, this->List({this->three[0], this->three[1]}));
}

TYPED_TEST(VectorRead, ResultOfTheTableSlot_DoesNotCount)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.Access()->MGETMULTIPAR = ReadNothingButSayOk;
    EXPECT_TRUE(this->ticket.GetVector(this->list));
    EXPECT_EQ(this->list.size(), 3u);
    this->ticket.fake.Access()->MGETMULTIPAR = SayOkAndReadNothing;
    EXPECT_FALSE(this->ticket.GetVector(this->list));
    EXPECT_TRUE(this->list.empty());
}

TYPED_TEST(ArrayRead, AsLongAsTheList_IsReadWithOneTableAndNoCount)
{
    this->ticket.StoreList(this->three);
    auto const old = this->list;
    EXPECT_TRUE(this->ticket.GetArray(this->list.data(), 3));
    EXPECT_EQ(this->list, this->List({this->three[0], this->three[1], this->three[2], old[3], old[4]}));
    EXPECT_EQ(this->calls, Calls({this->ticket.GetTable(), this->ticket.Get(this->type, 0),
                                  this->ticket.Get(this->type, 1), this->ticket.Get(this->type, 2)}));
}

TYPED_TEST(ArrayRead, ShorterThanTheList_IsTrueWithTheFirstValues)
{
    this->ticket.StoreList(this->three);
    auto const old = this->list;
    EXPECT_TRUE(this->ticket.GetArray(this->list.data(), 2));
    EXPECT_EQ(this->list, this->List({this->three[0], this->three[1], old[2], old[3], old[4]}));
}

TYPED_TEST(ArrayRead, LongerThanTheList_IsFalseWithItsHeadWritten)
{
    this->ticket.StoreList(this->three);
    auto const old = this->list;
    EXPECT_FALSE(this->ticket.GetArray(this->list.data(), 4));
    EXPECT_EQ(this->list, this->List({this->three[0], this->three[1], this->three[2], old[3], old[4]}));
}

TYPED_TEST(ArrayRead, RecordThatFails_IsFalseAndItsPlaceIsAsItWas)
{
    this->ticket.StoreList(this->three);
    this->ticket.fake.FailPosition(0);
    auto const old = this->list;
    EXPECT_FALSE(this->ticket.GetArray(this->list.data(), 3));
    EXPECT_EQ(this->list, this->List({old[0], this->three[1], this->three[2], old[3], old[4]}));
}

TYPED_TEST(ArrayRead, MissingKey_IsFalseAndLeavesTheArray)
{
    auto const old = this->list;
    EXPECT_FALSE(this->ticket.GetArray(this->list.data(), 5));
    EXPECT_EQ(this->list, old);
    EXPECT_EQ(this->calls.size(), 6u);  // all records were asked for
}

TYPED_TEST(ArrayRead, CountOf0_IsFalseAndCallsNoSlot)
{
    this->ticket.StoreList(this->three);
    EXPECT_FALSE(this->ticket.GetArray(this->list.data(), 0));
    EXPECT_FALSE(this->ticket.xGetArray(this->list.data(), 0));
    EXPECT_TRUE(this->calls.empty());
}

TYPED_TEST(ArrayRead, ResultOfTheTableSlot_DoesNotCount)
{
    auto const old = this->list;
    this->ticket.fake.Access()->MGETMULTIPAR = ReadNothingButSayOk;
    EXPECT_TRUE(this->ticket.GetArray(this->list.data(), 3));
    this->ticket.fake.Access()->MGETMULTIPAR = SayOkAndReadNothing;
    EXPECT_FALSE(this->ticket.GetArray(this->list.data(), 3));
    EXPECT_EQ(this->list, old);
}

TYPED_TEST(ListWrite, Three_GoAsOneTableFromMinus1)
{
    this->ByEachForm(
        [this](auto write)
        {
            EXPECT_TRUE(write(this->three));
            EXPECT_EQ(this->Stored(), this->three);
            EXPECT_EQ(this->calls, Calls({this->ticket.SetTable(), this->ticket.Set(this->type, -1),
                                          this->ticket.Set(this->type, 1), this->ticket.Set(this->type, 2)}));
        });
}

TYPED_TEST(ListWrite, AllOfTheRange_Arrives)
{
    auto const values = SomeValues<typename TestFixture::T>();
    this->ByEachForm(
        [&](auto write)
        {
            EXPECT_TRUE(write(values));
            EXPECT_EQ(this->Stored(), values);
        });
}

TYPED_TEST(ListWrite, One_GoesAsAScalarDoes)
{
    this->ByEachForm(
        [this](auto write)
        {
            EXPECT_TRUE(write({this->three[0]}));
            EXPECT_EQ(this->Stored(), this->List({this->three[0]}));
            EXPECT_EQ(this->calls, Calls({this->ticket.SetTable(), this->ticket.Set(this->type, -1)}));
        });
}

TYPED_TEST(ListWrite, Empty_DeletesTheKey)
{
    this->ByEachForm(
        [this](auto write)
        {
            this->ticket.StoreList(this->three);
            EXPECT_TRUE(write({}));
            EXPECT_EQ(this->ticket.Count(), 0u);
            EXPECT_EQ(this->calls, Calls({this->ticket.Delete()}));
        });
}

TYPED_TEST(ListWrite, EmptyThatTheSlotRefuses_IsTrueAllTheSame_ByDesign)
{
    this->ByEachForm(
        [this](auto write)
        {
            this->ticket.StoreList(this->three);
            this->ticket.fake.FailCall(0);
            EXPECT_TRUE(write({}));
            EXPECT_EQ(this->ticket.Count(), 3u);
        });
}

TYPED_TEST(ListWrite, OverALongerList_LeavesNothingOfIt)
{
    this->ByEachForm(
        [this](auto write)
        {
            this->ticket.StoreList(SomeValues<typename TestFixture::T>());
            EXPECT_TRUE(write(this->three));
            EXPECT_EQ(this->Stored(), this->three);
        });
}

TYPED_TEST(ListWrite, RecordThatFails_IsFalseAndTheOthersStayWritten)
{
    this->ByEachForm(
        [this](auto write)
        {
            this->ticket.fake.FailPosition(2);
            EXPECT_FALSE(write(this->three));
            this->ticket.fake.FailPosition(1000);
            EXPECT_EQ(this->Stored(), this->List({this->three[0], this->three[1]}));
        });
}

TYPED_TEST(ListWrite, ResultOfTheTableSlot_DoesNotCount)
{
    this->ByEachForm(
        [this](auto write)
        {
            this->ticket.fake.Access()->MSETMULTIPAR = WriteNothingButSayOk;
            EXPECT_TRUE(write(this->three));
            this->ticket.fake.Access()->MSETMULTIPAR = SayOkAndWriteNothing;
            EXPECT_FALSE(write(this->three));
        });
}
