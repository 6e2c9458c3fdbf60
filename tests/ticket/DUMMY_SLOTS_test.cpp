#include "comgui/ticket/DUMMY_SLOTS.h"

#include "comgui/ticket/TICKET_ID.h"

#include <gtest/gtest.h>

// A module without writes, locks and notifications fills its table so.
TEST(DUMMY_Slots, InATable_ReportSuccessAndLeaveTheArgumentsAlone)
{
    MTICKET_ACCESS table = {};
    table.MSETPARAMETER = DUMMY_MSETPARAMETER;
    table.MSETMULTIPAR = DUMMY_MSETMULTIPAR;
    table.MOPERATION = DUMMY_MOPERATION;
    table.MENDISNOTIF = DUMMY_MENDISNOTIF;

    SETMULTIPAR records[2] = {};
    records[0].key = "k";
    int created = 7;
    EXPECT_EQ(table.MSETPARAMETER(nullptr, 0, 0, nullptr, PARAM_NONE, nullptr, -1), 1);
    EXPECT_EQ(table.MSETMULTIPAR(nullptr, 0, 0, records), 1);
    EXPECT_EQ(table.MOPERATION(nullptr, 0, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &created), 1);
    EXPECT_EQ(table.MENDISNOTIF(nullptr, 0, 0, -1, true, nullptr), 1);
    EXPECT_FALSE(records[0].ok);
    EXPECT_EQ(created, 7);
}

TEST(DUMMY_Slots, OfUnknownArguments_ReportSuccessWhateverComes)
{
    EXPECT_EQ(DUMMY_MLOCK(nullptr, 3, 1, 19, 0), 1);
    EXPECT_EQ(DUMMY_MSETNOTIFICATION(), 1);
    EXPECT_EQ(DUMMY_MSETNOTIFICATION2(nullptr, 1.5, "text"), 1);
}
