#include "comgui/ticket/TICKET_ID.h"

#include <climits>
#include <gtest/gtest.h>
#include <string>

namespace
{
struct VALIDATOR_FACT
{
    char const* name;
    bool (*validator)(int);
    int value;
    bool valid;
};

class Validator : public testing::TestWithParam<VALIDATOR_FACT>
{
};
}  // namespace

TEST_P(Validator, Answers) { EXPECT_EQ(GetParam().validator(GetParam().value), GetParam().valid); }

INSTANTIATE_TEST_SUITE_P(
    Facts, Validator,
    testing::Values(VALIDATOR_FACT{"FirstType", TICKET_TYPE_Valid, 0, true},
                    VALIDATOR_FACT{"LastType", TICKET_TYPE_Valid, 99, true},
                    VALIDATOR_FACT{"PastLastType", TICKET_TYPE_Valid, 100, false},
                    VALIDATOR_FACT{"NegativeType", TICKET_TYPE_Valid, -1, false},
                    VALIDATOR_FACT{"LeastType", TICKET_TYPE_Valid, INT_MIN, false},
                    VALIDATOR_FACT{"FirstId", TICKET_ID_Valid, 0, true},
                    VALIDATOR_FACT{"LastId", TICKET_ID_Valid, 16777215, true},
                    VALIDATOR_FACT{"PastLastId", TICKET_ID_Valid, 16777216, false},
                    VALIDATOR_FACT{"NegativeId", TICKET_ID_Valid, -1, false},
                    VALIDATOR_FACT{"LeastId", TICKET_ID_Valid, INT_MIN, false},
                    VALIDATOR_FACT{"FirstLock", TICKETLOCK_ID_Valid, 0, true},
                    VALIDATOR_FACT{"LastLock", TICKETLOCK_ID_Valid, 19, true},
                    VALIDATOR_FACT{"PastLastLock", TICKETLOCK_ID_Valid, 20, false},
                    VALIDATOR_FACT{"NegativeLock", TICKETLOCK_ID_Valid, -1, false},
                    VALIDATOR_FACT{"FirstOwner", TICKETLOCK_OWNER_Valid, 0, true},
                    VALIDATOR_FACT{"LastOwner", TICKETLOCK_OWNER_Valid, INT_MAX, true},
                    VALIDATOR_FACT{"NegativeOwner", TICKETLOCK_OWNER_Valid, -1, false},
                    VALIDATOR_FACT{"FirstNotification", TICKET_NOTIFICATION_Valid, 0, true},
                    VALIDATOR_FACT{"LastNotification", TICKET_NOTIFICATION_Valid, INT_MAX, true},
                    VALIDATOR_FACT{"NegativeNotification", TICKET_NOTIFICATION_Valid, -1, false}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(TICKET_Valid, TypeAndIdValid_IsTrue) { EXPECT_TRUE(TICKET_Valid(99, 16777215)); }

TEST(TICKET_Valid, TypeInvalid_IsFalse) { EXPECT_FALSE(TICKET_Valid(100, 0)); }

TEST(TICKET_Valid, IdInvalid_IsFalse) { EXPECT_FALSE(TICKET_Valid(0, 16777216)); }

TEST(ReservedTicketIds, AreRefusedByTheValidator_ByDesign)
{
    EXPECT_FALSE(TICKET_ID_Valid(TICKET_ID_NONE));
    EXPECT_FALSE(TICKET_ID_Valid(TICKET_ID_ALL));
    EXPECT_FALSE(TICKET_ID_Valid(TICKET_ID_NEXT));
}

TEST(ReservedTicketIds, HaveTheValuesTheModuleKnows)
{
    EXPECT_EQ(TICKET_ID_NONE, -1);
    EXPECT_EQ(TICKET_ID_ALL, -3);
    EXPECT_EQ(TICKET_ID_NEXT, -4);
}
