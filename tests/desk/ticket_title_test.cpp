#include "desk/model/TicketTitle.h"

#include "comgui/client/Text.h"
#include "comgui/client/TicketAddress.h"
#include "standin/server/site/Seed.h"
#include <gtest/gtest.h>

using desk::LongestTitle;
using desk::TitleKeyOf;
using desk::TitleOf;

TEST(TitleKey, IsInEveryTicketOfANewSite)
{
    auto const seed = standin::Seed::Read(COMGUI_SEED);
    ASSERT_GT(seed.tickets.size(), 10U);
    for (auto const& ticket : seed.tickets)
    {
        char const* const key = TitleKeyOf(ticket.address->type);
        ASSERT_NE(key, nullptr) << ticket.address->type;
        bool isThere = false;
        ticket.Walk([&](std::string_view name, int, standin::StoredValue const& value)
                    { isThere |= name == key && value.type == PARAM_STRING && !value.bytes.empty(); });
        EXPECT_TRUE(isThere) << ticket.address->type << "/" << ticket.address->id << " " << key;
    }
}

TEST(TitleKey, OfUnknownTypesIsNull)
{
    for (int const type : {-1, 1, 99})
        EXPECT_EQ(TitleKeyOf(type), nullptr) << type;
}

TEST(TitleOfValue, IsItsText)
{
    EXPECT_EQ(TitleOf("Spring catalogue"), "Spring catalogue");
    EXPECT_EQ(TitleOf(7), "7");
}

TEST(TitleOfValue, ThatSaysNothing_IsNone)
{
    EXPECT_EQ(TitleOf(""), std::nullopt);
    EXPECT_EQ(TitleOf(comgui::Value()), std::nullopt);
    EXPECT_EQ(TitleOf(comgui::List{}), std::nullopt);
}

TEST(TitleOfValue, OfAnyLength_IsCutAtTheEndOfACharacter)
{
    for (std::size_t ahead = 0; ahead < 4; ++ahead)
    {
        std::string text(ahead, 'x');
        while (text.size() < 1000000)
            text += "\xF0\x9F\x96\xA8";  // four bytes
        auto const title = TitleOf(text);
        ASSERT_TRUE(title);
        EXPECT_LE(title->size(), LongestTitle);
        EXPECT_GT(title->size(), LongestTitle - 4);
        EXPECT_EQ(comgui::ToUtf8(comgui::ToWx(*title)), *title) << "half a character, after " << ahead;
    }
}

TEST(TitleOfValue, OfTheLongestLength_IsWhole)
{
    std::string const text(LongestTitle, 'x');
    EXPECT_EQ(TitleOf(text), text);
    EXPECT_EQ(TitleOf(text + 'x'), text);
}

TEST(TitleOfValue, ThatIsNoUtf8_IsCutToo)
{
    auto const title = TitleOf(std::string(1000, '\x80'));
    ASSERT_TRUE(title);
    EXPECT_EQ(title->size(), LongestTitle);
}
