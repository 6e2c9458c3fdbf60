// What lists take from the heap, and what becomes of them when there is nothing to take.
#include "tests/access/ListFamilies.h"
#include "tests/support/Allocations.h"
#include "tests/support/Callocs.h"
#include <gmock/gmock.h>
#include <new>

using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
constexpr unsigned long Size = 1000;

// A module that holds 1000 values of every type and takes no memory: what is taken is the library's.
int CountThem(void*, int, int, char const*, PARAM_TYPE, void* value, int)
{
    *static_cast<unsigned long*>(value) = Size;
    return 1;
}
int ReadThem(void*, int, int, GETMULTIPAR* table)
{
    for (; table->key; ++table)
    {
        if (table->type == PARAM_STRING)
            *static_cast<char const**>(table->value) = "text, too long to need no memory of its own";
        else
            *static_cast<int*>(table->value) = 7;
        table->ok = true;
    }
    return 1;
}
int WriteThem(void*, int, int, SETMULTIPAR* table)
{
    for (; table->key; ++table)
        table->ok = true;
    return 1;
}

template <typename Family>
class ListMemory : public ListsInBothFamilies<Family>
{
protected:
    void UseFrugalModule()
    {
        this->ticket.fake.Access()->MGETPARAMETER = CountThem;
        this->ticket.fake.Access()->MGETMULTIPAR = ReadThem;
        this->ticket.fake.Access()->MSETMULTIPAR = WriteThem;
    }

    // The number of callocs that the operation makes; it must succeed, and call operator new not once.
    template <typename Operation>
    static int Tables(Operation operation)
    {
        FailingAllocation const failing(0);
        CountedCallocs const callocs;
        bool const isDone = operation();
        int const count = callocs.Count();
        bool const isFrugal = !failing.HasHappened();
        FailingAllocation::Stop();
        EXPECT_TRUE(isDone);
        EXPECT_TRUE(isFrugal);
        return count;
    }
};

template <typename Family>
class ListMemoryDeathTest : public ListsInBothFamilies<Family>
{
protected:
    ListMemoryDeathTest() { this->ticket.StoreList(std::vector<int>{1, 2, 3}); }

    // failing: which of the operation's callocs gives null.
    template <typename Operation>
    static void ExpectDeath(Operation operation, int failing = 0)
    {
        EXPECT_DEATH(
            {
                FailingCalloc const failingCalloc(failing);
                operation();
            },
            "");
    }
};
}  // namespace

TYPED_TEST_SUITE(ListMemory, Families);
TYPED_TEST_SUITE(ListMemoryDeathTest, Families);

TYPED_TEST(ListMemory, Read_TakesOneBlock)
{
    this->UseFrugalModule();
    std::vector<int> list(Size);
    EXPECT_EQ(this->Tables([&] { return this->ticket.GetVector(list); }), 1);
    EXPECT_THAT(list, Each(7));
    EXPECT_EQ(this->Tables([&] { return this->ticket.GetArray(list.data(), Size); }), 1);
}

TYPED_TEST(ListMemory, Write_TakesOneBlock)
{
    this->UseFrugalModule();
    std::vector<int> const list(Size);
    EXPECT_EQ(this->Tables([&] { return this->ticket.SetVector(list); }), 1);
    EXPECT_EQ(this->Tables([&] { return this->ticket.SetArray(list.data(), Size); }), 1);
    wxArrayInt array;
    array.Add(5, Size);
    EXPECT_EQ(this->Tables([&] { return this->ticket.SetWxArray(array); }), 1);
}

TYPED_TEST(ListMemory, EmptyList_TakesNone)
{
    EXPECT_EQ(this->Tables([&] { return !this->ticket.GetArray(static_cast<int*>(nullptr), 0); }), 0);
    this->ticket.fake.Access()->MSETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void const*, int)
    { return 1; };
    EXPECT_EQ(this->Tables([&] { return this->ticket.SetVector(std::vector<int>()); }), 0);
    EXPECT_EQ(this->Tables([&] { return this->ticket.SetArray(static_cast<bool*>(nullptr), 0); }), 0);
}

TYPED_TEST(ListMemory, ReadOfABoolArray_TakesABlockForTheIntsToo)
{
    this->UseFrugalModule();
    bool array[Size] = {};
    EXPECT_EQ(this->Tables([&] { return this->ticket.GetArray(array, Size); }), 2);
    EXPECT_THAT(array, Each(true));
}

TYPED_TEST(ListMemory, WriteOfABoolArray_TakesABlockForTheIntsAlone)
{
    this->ticket.fake.Access()->MSETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void const*, int)
    { return 1; };
    bool const array[Size] = {};
    EXPECT_EQ(this->Tables([&] { return this->ticket.SetArray(array, Size); }), 1);
}

TYPED_TEST(ListMemory, BoolArrayThatCannotBeRead_LeavesTheArray)
{
    this->ticket.StoreList(std::vector<int>{0, 0});
    bool array[] = {true, true};
    {
        FailingCalloc const failing(0);
        EXPECT_FALSE(this->ticket.GetArray(array, 2));
    }
    EXPECT_THAT(array, ElementsAre(true, true));
    EXPECT_THAT(this->calls, IsEmpty());
}

TYPED_TEST(ListMemory, BoolArrayThatCannotBeWritten_LeavesTheKey)
{
    this->ticket.StoreList(std::vector<int>{0, 0});
    bool const array[] = {true, true};
    {
        FailingCalloc const failing(0);
        EXPECT_FALSE(this->ticket.SetArray(array, 2));
    }
    EXPECT_THAT(this->calls, IsEmpty());
    EXPECT_EQ(this->ticket.Count(), 2u);
}

TYPED_TEST(ListMemory, WxArrayIntWithoutATable_IsFalseAndLeavesTheArray)
{
    this->ticket.StoreList(std::vector<int>{1, 2});
    wxArrayInt array;
    array.Add(99);
    {
        FailingCalloc const failing(0);
        EXPECT_FALSE(this->ticket.GetWxArray(array));
    }
    EXPECT_EQ(array.size(), 1u);
    EXPECT_THAT(this->calls, ElementsAre(this->ticket.Get(PARAM_COUNT, -1)));
}

TEST(ListMemorySingle, VectorWithoutATable_IsFalseAndLeavesTheVector)
{
    LISTS<SINGLE> ticket;
    ticket.StoreList(std::vector<int>{1, 2});
    std::vector<int> list = {99};
    std::vector<bool> bools = {true};
    std::vector<wxString> texts = {"old"};
    wxArrayString array;
    array.Add("old");
    for (int i = 0; i < 4; ++i)
    {
        FailingCalloc const failing(0);
        EXPECT_FALSE(i == 0   ? ticket.GetVector(list)
                     : i == 1 ? ticket.GetVector(bools)
                     : i == 2 ? ticket.GetVector(texts)
                              : ticket.GetWxArray(array));
    }
    EXPECT_THAT(list, ElementsAre(99));
    EXPECT_THAT(bools, ElementsAre(true));
    EXPECT_THAT(texts, ElementsAre("old"));
    EXPECT_THAT(array, ElementsAre("old"));
    EXPECT_THAT(ticket.fake.calls, Each(ticket.Get(PARAM_COUNT, -1)));
}

using ContainedListDeathTest = ListMemoryDeathTest<CONTAINED>;

TEST_F(ContainedListDeathTest, VectorReadWithoutATable_EndsTheProcess_ByDesign)
{
    ExpectDeath(
        [this]
        {
            std::vector<int> list;
            ticket.GetVector(list);
        });
    ExpectDeath(
        [this]
        {
            std::vector<bool> bools;
            ticket.GetVector(bools);
        });
    ExpectDeath(
        [this]
        {
            std::vector<wxString> texts;
            ticket.GetVector(texts);
        });
}

TYPED_TEST(ListMemoryDeathTest, ArrayReadWithoutATable_EndsTheProcess_ByDesign)
{
    int array[3] = {};
    this->ExpectDeath([&] { this->ticket.GetArray(array, 3); });
    bool bools[3] = {};
    this->ExpectDeath([&] { this->ticket.GetArray(bools, 3); }, 1);  // behind the ints
}

TYPED_TEST(ListMemoryDeathTest, VectorWriteWithoutATable_EndsTheProcess_ByDesign)
{
    this->ExpectDeath([&] { this->ticket.SetVector(std::vector<int>(3)); });
}

TYPED_TEST(ListMemoryDeathTest, ArrayWriteWithoutATable_EndsTheProcess_ByDesign)
{
    int const array[3] = {};
    this->ExpectDeath([&] { this->ticket.SetArray(array, 3); });
}

TYPED_TEST(ListMemory, AllocationThatFailsUnderTheTable_ThrowsAndKeepsNothing)
{
    this->UseFrugalModule();
    auto const read = [this]
    {
        try
        {
            std::vector<wxString> list;
            this->ticket.GetVector(list);
            wxArrayInt array;
            this->ticket.GetWxArray(array);
        }
        catch (std::bad_alloc const&)
        {
        }
    };
    this->ticket.fake.Access()->MGETPARAMETER = [](void*, int, int, char const*, PARAM_TYPE, void* value, int)
    {
        *static_cast<unsigned long*>(value) = 3;
        return 1;
    };
    EXPECT_GT(FailEachAllocation(read, [](bool) {}), 3);
}
