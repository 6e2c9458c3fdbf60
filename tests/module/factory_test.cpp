#include "tests/module/ModuleUnderTest.h"

#include <CoreFoundation/CoreFoundation.h>
#include <cstring>

namespace
{
COMGUI_UUID const Interface = {
    {0x33, 0xFC, 0x3B, 0x14, 0x6C, 0xFF, 0x11, 0xD8, 0xAB, 0x09, 0x00, 0x30, 0x65, 0xB1, 0x34, 0x6E}};
COMGUI_UUID const OtherInterface = {
    {0x33, 0xFC, 0x3B, 0x14, 0x6C, 0xFF, 0x11, 0xD8, 0xAB, 0x09, 0x00, 0x30, 0x65, 0xB1, 0x34, 0x6F}};

ComGUIModuleInterface const& TableOf(void* object) { return **static_cast<ComGUIModuleInterface**>(object); }
}  // namespace

TEST(ModuleFactory, AnotherType_GivesNull)
{
    EXPECT_EQ(MODULE::Make("5CDEF0B8-6CFC-11D8-A365-003065B1346F"), nullptr);
    EXPECT_EQ(MODULE::Make(COMGUI_INTERFACE_UUID), nullptr);
}

TEST(ModuleFactory, QueryInterface_GivesTheObjectWithAReferenceOfItsOwn)
{
    void* const object = MODULE::Make(COMGUI_PLUGIN_TYPE_UUID);
    ASSERT_TRUE(object);
    auto const& table = TableOf(object);
    void* out = nullptr;
    EXPECT_EQ(table.QueryInterface(object, Interface, &out), 0);
    EXPECT_EQ(out, object);
    EXPECT_EQ(table.AddRef(object), 3u);
    EXPECT_EQ(table.Release(object), 2u);
    EXPECT_EQ(table.Release(object), 1u);
    EXPECT_EQ(table.Release(object), 0u);
}

TEST(ModuleFactory, QueryInterface_ForAnotherInterface_LeavesTheOutPointer)
{
    void* const object = MODULE::Make(COMGUI_PLUGIN_TYPE_UUID);
    ASSERT_TRUE(object);
    int something = 0;
    void* out = &something;
    EXPECT_NE(TableOf(object).QueryInterface(object, OtherInterface, &out), 0);
    EXPECT_EQ(out, &something);
    EXPECT_NE(TableOf(object).QueryInterface(object, Interface, nullptr), 0);
    EXPECT_EQ(TableOf(object).Release(object), 0u);
}

TEST(ModuleFactory, Table_EveryEntryThatIsCalledIsThereAndAllOtherWordsAreNull)
{
    MODULE const module;
    void* words[44];
    static_assert(sizeof words == sizeof(ComGUIModuleInterface));
    std::memcpy(words, &module.Table(), sizeof words);
    for (int i = 0; i < 44; ++i)
    {
        bool const unused = i == 0 || i == 5 || i == 14 || i == 15 || i == 22 || i == 23 || i > 25;
        EXPECT_EQ(words[i] == nullptr, unused) << i;
    }
}

TEST(ModuleFactory, Open_GivesEachCallerAnInstanceOfItsOwn)
{
    MODULE const one;
    MODULE const other;
    EXPECT_NE(one.Instance(), nullptr);
    EXPECT_NE(one.Instance(), other.Instance());
    EXPECT_NE(one->Open(nullptr), 0);
}
