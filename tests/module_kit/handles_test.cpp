#include "comgui/module/Handles.h"

#include <atomic>
#include <bit>
#include <gtest/gtest.h>
#include <set>
#include <thread>
#include <vector>

namespace
{
using OneKind = comgui::plugin::Handles<int, 1>;
using OtherKind = comgui::plugin::Handles<int, 2>;

// Tables of handles are for a process: what they hold is never freed.
template <typename Table>
Table* TableOfThisProcess()
{
    static auto* const table = new Table;
    return table;
}

struct HandlesOfOneKind : testing::Test
{
    OneKind* const handles = TableOfThisProcess<OneKind>();
    int first = 1;
    int second = 2;
};

void* At(std::uintptr_t number) { return std::bit_cast<void*>(number); }
}  // namespace

TEST_F(HandlesOfOneKind, Find_GivesTheObjectOfAHandleUntilItIsRemoved)
{
    void* const one = handles->Add(first);
    void* const two = handles->Add(second);
    EXPECT_EQ(handles->Find(one), &first);
    EXPECT_EQ(handles->Find(two), &second);
    EXPECT_EQ(handles->Remove(one), &first);
    EXPECT_EQ(handles->Find(one), nullptr);
    EXPECT_EQ(handles->Remove(one), nullptr);
    EXPECT_EQ(handles->Find(two), &second);
}

TEST_F(HandlesOfOneKind, AHandle_IsNeverGivenOutAgain)
{
    std::set<void*> all;
    for (int i = 0; i < 5000; ++i)
    {
        void* const handle = handles->Add(first);
        EXPECT_TRUE(all.insert(handle).second);
        EXPECT_EQ(handles->Remove(handle), &first);
    }
    void* const newest = handles->Add(second);
    for (void* const stale : all)
        EXPECT_EQ(handles->Find(stale), nullptr);
    EXPECT_EQ(handles->Find(newest), &second);
}

TEST_F(HandlesOfOneKind, Find_OfWhatIsNoHandle_IsNull)
{
    void* const handle = handles->Add(first);
    int other = 0;
    auto const number = std::bit_cast<std::uintptr_t>(handle);
    for (void* const foreign : {static_cast<void*>(nullptr), static_cast<void*>(&other),
                                static_cast<void*>(&first), At(1), At(number + 1), At(number | 0xFFFF'FFFF),
                                At(number + (1ull << 32)), At(number ^ (1ull << 63)), At(~0ull)})
        EXPECT_EQ(handles->Find(foreign), nullptr);
    EXPECT_EQ(handles->Find(handle), &first);
}

TEST_F(HandlesOfOneKind, AHandleOfAnotherKind_IsForeign)
{
    auto* const others = TableOfThisProcess<OtherKind>();
    void* const ours = handles->Add(first);
    void* const theirs = others->Add(second);
    EXPECT_NE(ours, theirs);
    EXPECT_EQ(handles->Find(theirs), nullptr);
    EXPECT_EQ(others->Find(ours), nullptr);
}

TEST_F(HandlesOfOneKind, ManyObjects_AllHaveTheirs)
{
    std::vector<int> objects(10'000);
    std::vector<void*> given;
    for (int& object : objects)
        given.push_back(handles->Add(object));
    for (std::size_t i = 0; i < objects.size(); ++i)
        ASSERT_EQ(handles->Find(given[i]), &objects[i]);
}

TEST_F(HandlesOfOneKind, TwoThreads_AddFindAndRemove)
{
    auto const work = [this](int& own)
    {
        for (int i = 0; i < 20'000; ++i)
        {
            void* const handle = handles->Add(own);
            EXPECT_EQ(handles->Find(handle), &own);
            EXPECT_EQ(handles->Remove(handle), &own);
        }
    };
    std::thread other([&] { work(second); });
    work(first);
    other.join();
}

// Its place may be another's by the time that the object is looked at.
TEST_F(HandlesOfOneKind, Find_NeverGivesAnotherObject_WhileHandlesComeAndGo)
{
    int objects[2] = {};
    std::atomic<void*> given[2] = {};
    std::atomic<bool> isOver{false};
    std::atomic<int> wrong{0};
    std::vector<std::thread> finders;
    for (int i = 0; i < 2; ++i)
        finders.emplace_back(
            [&]
            {
                while (!isOver)
                    for (std::size_t which = 0; which < 2; ++which)
                    {
                        int const* const found = handles->Find(given[which]);
                        wrong += found && found != &objects[which] ? 1 : 0;
                    }
            });
    for (std::size_t round = 0; round < 300'000; ++round)
    {
        std::size_t const which = round % 2;
        given[which] = handles->Add(objects[which]);
        handles->Remove(given[which]);
    }
    isOver = true;
    for (std::thread& finder : finders)
        finder.join();
    EXPECT_EQ(wrong, 0);
}
