// Tickets as people type them.
#include "desk/model/TicketName.h"

#include <gtest/gtest.h>

using namespace desk;

TEST(TicketName, IsATypeAndANumber)
{
    EXPECT_EQ(TicketFromText("3/17", 7), (comgui::TicketAddress{3, 17}));
    EXPECT_EQ(TicketFromText(" 0/0 ", 7), (comgui::TicketAddress{0, 0}));
    EXPECT_EQ(TicketFromText("99/16777215", 7), (comgui::TicketAddress{99, 16'777'215}));
}

TEST(TicketName, WithoutAType_IsOfTheOneThatIsClear)
{
    EXPECT_EQ(TicketFromText("17", 7), (comgui::TicketAddress{7, 17}));
}

TEST(TicketName, ThatIsNone_IsNone)
{
    for (char const* const text : {"", " ", "/", "3/", "/3", "3/17/1", "x", "3/x", "100/1", "-1/1", "3/-1",
                                   "3/16777216", "3 / 17", "99999999999", "+3"})
        EXPECT_FALSE(TicketFromText(text, 7)) << text;
}
