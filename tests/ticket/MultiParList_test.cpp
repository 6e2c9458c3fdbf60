#include "comgui/ticket/MultiParList.h"

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include <cstdlib>
#include <gtest/gtest.h>

namespace
{
class MultiParList : public testing::Test
{
protected:
    ~MultiParList() override { MultiParListDestroy(&list); }
    SETMULTIPAR const& Added() { return *MultiParListTable(list, false); }

    SETMULTIPAR_LIST* list = MultiParListCreate();
};
}  // namespace

TEST_F(MultiParList, Create_GivesAnEmptyList)
{
    ASSERT_NE(list, nullptr);
    EXPECT_EQ(MultiParListSize(list), 0u);
    EXPECT_EQ(MultiParListTable(list, false), nullptr);
}

TEST_F(MultiParList, Create_GivesAListThatDoesNotCopyWhatAWalkKeeps)
{
    double const value = 1.5;
    list->ySetParameter("Key", PARAM_DOUBLE, &value, -1);
    EXPECT_EQ(Added().value, &value);
}

TEST_F(MultiParList, Destroy_SetsThePointerToNull)
{
    MultiParListDestroy(&list);
    EXPECT_EQ(list, nullptr);
    MultiParListDestroy(&list);
    EXPECT_EQ(list, nullptr);
}

// The exit code of the child process proves that the call returned.
TEST(MultiParListDestroy, NullAddress_IsPutUpWith)
{
    EXPECT_EXIT((MultiParListDestroy(nullptr), std::_Exit(7)), testing::ExitedWithCode(7), "");
}

TEST(MultiParListOfNull, Everything_IsNothing)
{
    int const value = 5;
    EXPECT_EQ(MultiParListSize(nullptr), 0u);
    EXPECT_EQ(MultiParListTable(nullptr, false), nullptr);
    EXPECT_EQ(MultiParListTable(nullptr, true), nullptr);
    EXPECT_EQ(MultiParListSetParameter(nullptr, "Key", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(MultiParListSetParameter(nullptr, "Key", PARAM_STRING, L"text", -1), 0);
}

TEST_F(MultiParList, SetParameter_AddsARecord)
{
    int const value = 5;
    EXPECT_EQ(MultiParListSetParameter(list, "Key", PARAM_INT, &value, 0), 1);
    EXPECT_EQ(MultiParListSize(list), 1u);
    EXPECT_STREQ(Added().key, "Key");
    EXPECT_EQ(Added().type, PARAM_INT);
    EXPECT_EQ(*static_cast<int const*>(Added().value), 5);
    EXPECT_EQ(Added().pos, 0);
}

TEST_F(MultiParList, SetParameter_Text_IsTakenAsWide_ByDesign)
{
    EXPECT_EQ(MultiParListSetParameter(list, "Key", PARAM_STRING, L"\u00E4\u20AC", 2), 1);
    EXPECT_EQ(Added().type, PARAM_STRING);
    EXPECT_STREQ(static_cast<char const*>(Added().value), "\xC3\xA4\xE2\x82\xAC");
    EXPECT_EQ(Added().pos, 2);
}

TEST_F(MultiParList, SetParameter_NullText_CountsAsEmpty)
{
    EXPECT_EQ(MultiParListSetParameter(list, "Key", PARAM_STRING, nullptr, -1), 1);
    ASSERT_NE(Added().value, nullptr);
    EXPECT_STREQ(static_cast<char const*>(Added().value), "");
}

TEST_F(MultiParList, SetParameter_OtherTypes_AreCopiedByTheList)
{
    std::string bytes("a\0b", 3);
    BIN_STRING const view(bytes);
    EXPECT_EQ(MultiParListSetParameter(list, "Key", PARAM_BINSTRING, &view, -1), 1);
    bytes = "___";
    BIN_STRING const& stored = *static_cast<BIN_STRING const*>(Added().value);
    EXPECT_EQ(std::string(stored.begin(), stored.end()), std::string("a\0b", 3));
}

TEST_F(MultiParList, SetParameter_UnknownType_KeepsTheWord)
{
    int target = 0;
    EXPECT_EQ(MultiParListSetParameter(list, "Key", static_cast<PARAM_TYPE>(10), &target, -1), 1);
    EXPECT_EQ(Added().value, &target);
}

TEST_F(MultiParList, Table_SortsIfAsked)
{
    int const value = 5;
    MultiParListSetParameter(list, "b", PARAM_INT, &value, -1);
    MultiParListSetParameter(list, "a", PARAM_INT, &value, -1);
    EXPECT_STREQ(MultiParListTable(list, false)->key, "b");
    EXPECT_STREQ(MultiParListTable(list, true)->key, "a");
}
