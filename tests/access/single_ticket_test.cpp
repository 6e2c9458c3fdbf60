// What only single tickets have.
#include "tests/access/Families.h"
#include "tests/access/FolderVariablesFake.h"
#include <gmock/gmock.h>

using comgui::test::CALL;
using comgui::test::SLOT;
using comgui::test::TicketFake;

using testing::ElementsAre;

namespace
{
class SingleTicket : public testing::Test
{
protected:
    TicketFake fake;
    STICKET_READ const& read = *STICKET_READ::Of(fake.Access());
    STICKET_MODIFY const& modify = *STICKET_MODIFY::Of(fake.Access());
};
}  // namespace

TEST_F(SingleTicket, View_IsTheAddressOfTheRecord)
{
    EXPECT_EQ(static_cast<void const*>(&read), fake.Access());
    EXPECT_EQ(static_cast<void const*>(&modify), fake.Access());
    EXPECT_EQ(STICKET_READ::Of(nullptr), nullptr);
}

TEST_F(SingleTicket, GetStringParameter_GivesTheStoredBytesWithoutResolvingThem)
{
    FolderVariablesFake folders;
    fake.container.folders = &folders;
    fake.container.Put(0, 0, "k", "$(TEMP)/x");
    EXPECT_EQ(read.GetStringParameter("k", "default"), "$(TEMP)/x");
    EXPECT_THAT(fake.options, testing::IsEmpty());
    EXPECT_THAT(fake.container.calls, ElementsAre(CALL{SLOT::GET, 0, 0, "k", PARAM_STRING, -1}));
}

TEST_F(SingleTicket, GetStringParameter_OfAMissingKey_GivesTheDefaultUnresolved)
{
    EXPECT_EQ(read.GetStringParameter("k", "$(TEMP)/x"), "$(TEMP)/x");
}

TEST_F(SingleTicket, GetStringParameter_ThatTheSlotLeavesNull_IsEmpty)
{
    fake.container.Put(0, 0, "k", "x");
    fake.container.nullTexts = true;
    EXPECT_EQ(read.GetStringParameter("k", "default"), "");
}

TEST_F(SingleTicket, GetVectorSize_IsTheCount)
{
    fake.container.Put(0, 0, "k", 1, -1);
    fake.container.Put(0, 0, "k", 2, 1);
    EXPECT_EQ(read.GetVectorSize("k"), 2u);
    EXPECT_THAT(fake.container.calls, ElementsAre(CALL{SLOT::GET, 0, 0, "k", PARAM_COUNT, -1}));
}

TEST_F(SingleTicket, GetVectorSize_OfAMissingKeyIs0) { EXPECT_EQ(read.GetVectorSize("k"), 0u); }

TEST_F(SingleTicket, GetVectorSize_KeepsAll64Bits)
{
    fake.Access()->SGETPARAMETER = [](void*, char const*, PARAM_TYPE, void* value, int)
    {
        *static_cast<unsigned long*>(value) = 0x100000001;
        return 1;
    };
    EXPECT_EQ(read.GetVectorSize("k"), 0x100000001u);
}

TEST_F(SingleTicket, SlotThatSucceedsAndWritesNothing_Gives0)
{
    fake.Access()->SGETPARAMETER = [](void*, char const*, PARAM_TYPE, void*, int) { return 1; };
    EXPECT_EQ(read.GetIntParameter("k", 7), 0);
    EXPECT_EQ(read.GetDoubleParameter("k", 7), 0);
    EXPECT_EQ(read.GetVoidParameter(-1, "k", this), nullptr);
}

TEST_F(SingleTicket, SlotThatFailsAndWritesAllTheSame_GivesTheDefault)
{
    fake.Access()->SGETPARAMETER = [](void*, char const*, PARAM_TYPE, void* value, int)
    {
        *static_cast<int*>(value) = 99;
        return 0;
    };
    EXPECT_EQ(read.GetIntParameter("k", 7), 7);
    EXPECT_EQ(read.ParameterType("k", -1), 0);
}

TEST_F(SingleTicket, WhoAmI_HandsTheRecordToTheModule)
{
    STICKET_OPTION_WHOAMI who = {1, 2};
    EXPECT_TRUE(read.WhoAmI(who));
    EXPECT_EQ(who.word0, 7u);
    EXPECT_EQ(who.word8, 8u);
    EXPECT_THAT(fake.options, ElementsAre(11));
}

TEST_F(SingleTicket, WhoAmI_EvenAnswer_IsAFailureWhateverTheModuleWrote_ByDesign)
{
    for (int const answer : {0, 2, -2})
    {
        fake.optionResult = answer;
        STICKET_OPTION_WHOAMI who = {1, 2};
        EXPECT_FALSE(read.WhoAmI(who));
        EXPECT_EQ(who.word0, 0u);
        EXPECT_EQ(who.word8, ~0ull);
    }
}

TEST_F(SingleTicket, WhoAmI_OddAnswer_IsASuccess)
{
    fake.optionResult = -1;
    STICKET_OPTION_WHOAMI who = {1, 2};
    EXPECT_TRUE(read.WhoAmI(who));
}

TEST_F(SingleTicket, Translator_AnswerWithAClearLowestBit_CountsAllTheSame_ByDesign)
{
    FolderVariablesFake folders;
    fake.container.folders = &folders;
    fake.optionResult = 2;
    EXPECT_EQ(read.Decode("$(TEMP)/x"), "<$(TEMP)/x>");
    EXPECT_THAT(fake.options, ElementsAre(10));
}

TEST_F(SingleTicket, Translator_OfAnOptionThatFailedAndWrote_IsNotUsed)
{
    FolderVariablesFake folders;
    fake.container.folders = &folders;
    fake.Access()->SOPTION = [](void* instance, int, void* out)
    {
        *static_cast<clFOLDER_VARIABLES**>(out) = static_cast<TicketFake*>(instance)->container.folders;
        return 0;
    };
    EXPECT_EQ(read.Decode("$(TEMP)/x"), "$(TEMP)/x");
}

TEST_F(SingleTicket, SetParameter_Int_GoesByAddress)
{
    EXPECT_EQ(modify.SetParameter("k", 42, -2), 1);
    EXPECT_THAT(fake.container.calls, ElementsAre(CALL{SLOT::SET, 0, 0, "k", PARAM_INT, -2}));
    EXPECT_EQ(fake.container.Int(0, 0, "k"), 42);
}

TEST_F(SingleTicket, SetMultiParameter_HandsTheTableOverAndGivesTheSlotsResult)
{
    int const number = 5;
    SETMULTIPAR table[3] = {};
    table[0].key = "a";
    table[0].type = PARAM_INT;
    table[0].value = &number;
    table[0].pos = -1;
    table[1] = table[0];
    table[1].key = "b";
    fake.container.success = 3;
    EXPECT_EQ(modify.SetMultiParameter(table), 3);
    EXPECT_TRUE(table[0].ok);
    EXPECT_TRUE(table[1].ok);
    EXPECT_EQ(fake.container.Int(0, 0, "b"), 5);
}
