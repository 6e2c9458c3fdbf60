#include "comgui/testing/ContainerContract.h"

#include <climits>
#include <utility>

namespace comgui::test
{
int ContainerContract::Int(int id, char const* key) const
{
    int value = -1;
    access->MGETPARAMETER(access->Instance, subject->type, id, key, PARAM_INT, &value, -1);
    return value;
}

int ContainerContract::SetInt(int id, char const* key, int value) const
{
    return access->MSETPARAMETER(access->Instance, subject->type, id, key, PARAM_INT, &value, -1);
}

TEST_P(ContainerContract, MGETPARAMETER_MissingTicket_FailsAndLeavesTheValue)
{
    EXPECT_TRUE(SetInt(subject->id, "K", 7));
    int value = 42;
    EXPECT_EQ(access->MGETPARAMETER(access->Instance, subject->type, subject->missingId, "K", PARAM_INT,
                                    &value, -1),
              0);
    EXPECT_EQ(value, 42);
}

TEST_P(ContainerContract, MGETMULTIPAR_MissingTicket_FailsInEveryRecordAndLeavesTheValues)
{
    EXPECT_TRUE(SetInt(subject->id, "K", 7));
    int value = 42;
    GETMULTIPAR table[] = {
        {"K", PARAM_INT, 0, &value, -1, true, {}}, {"L", PARAM_INT, 0, &value, -1, true, {}}, {}};
    access->MGETMULTIPAR(access->Instance, subject->type, subject->missingId, table);
    EXPECT_FALSE(table[0].ok);
    EXPECT_FALSE(table[1].ok);
    EXPECT_EQ(value, 42);
}

TEST_P(ContainerContract, MSETPARAMETER_MissingTicket_IsRefusedAndNotMade)
{
    EXPECT_EQ(SetInt(subject->missingId, "K", 7), 0);
    EXPECT_EQ(Int(subject->missingId, "K"), -1);
    EXPECT_EQ(Int(subject->id, "K"), -1);
}

TEST_P(ContainerContract, MSETMULTIPAR_MissingTicket_FailsWithEveryRecordUnmarked)
{
    int const value = 7;
    SETMULTIPAR table[] = {{"A", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_EQ(access->MSETMULTIPAR(access->Instance, subject->type, subject->missingId, table), 0);
    EXPECT_FALSE(table[0].ok);
}

TEST_P(ContainerContract, MOPERATION_Delete_TakesTheTicketOnce)
{
    EXPECT_TRUE(SetInt(subject->id, "K", 7));
    auto const erase = [&]
    { return access->MOPERATION(access->Instance, subject->type, subject->id, MTICKET_OP_DELETE, nullptr); };
    EXPECT_NE(erase(), 0);
    EXPECT_EQ(Int(subject->id, "K"), -1);
    EXPECT_EQ(SetInt(subject->id, "K", 8), 0);
    EXPECT_EQ(erase(), 0);
}

TEST_P(ContainerContract, MOPERATION_DeleteOfTheSystemTicket_IsRefused)
{
    EXPECT_EQ(access->MOPERATION(access->Instance, 0, 0, MTICKET_OP_DELETE, nullptr), 0);
}

TEST_P(ContainerContract, AnAddressOutOfRange_IsRefusedEverywhere)
{
    int value = 42;
    for (auto const& [type, id] :
         {std::pair{-1, -1}, {100, 0}, {3, -1}, {3, -3}, {3, -4}, {3, 16777216}, {INT_MIN, INT_MAX}})
    {
        EXPECT_EQ(access->MGETPARAMETER(access->Instance, type, id, "K", PARAM_INT, &value, -1), 0);
        EXPECT_EQ(access->MSETPARAMETER(access->Instance, type, id, "K", PARAM_INT, &value, -1), 0);
        EXPECT_EQ(access->MOPERATION(access->Instance, type, id, MTICKET_OP_DELETE, nullptr), 0);
    }
    EXPECT_EQ(value, 42);
}
}  // namespace comgui::test
