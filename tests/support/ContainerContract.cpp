#include "tests/support/ContainerContract.h"

#include "comgui/ticket/BIN_STRING.h"
#include <climits>
#include <cmath>

int ContainerContract::Read(char const* key, PARAM_TYPE type, void* value, int pos) const
{
    return access->MGETPARAMETER(access->Instance, subject->type, subject->id, key, type, value, pos);
}

int ContainerContract::Write(char const* key, PARAM_TYPE type, void const* value, int pos) const
{
    return access->MSETPARAMETER(access->Instance, subject->type, subject->id, key, type, value, pos);
}

int ContainerContract::Int(char const* key, int pos) const
{
    int value = -1;
    Read(key, PARAM_INT, &value, pos);
    return value;
}

std::string ContainerContract::Text(char const* key, int pos) const
{
    char const* value = "";
    Read(key, PARAM_STRING, &value, pos);
    return value;
}

unsigned long ContainerContract::Count(char const* key) const
{
    unsigned long count = 0;
    Read(key, PARAM_COUNT, &count);
    return count;
}

int ContainerContract::Type(char const* key, int pos) const
{
    int type = 0;
    Read(key, PARAM_NONE, &type, pos);
    return type;
}

TEST_P(ContainerContract, MGETPARAMETER_MissingKey_FailsAndLeavesTheValue)
{
    int value = 42;
    char const* text = "kept";
    unsigned long count = 43;
    int type = 44;
    EXPECT_EQ(Read("Missing", PARAM_INT, &value), 0);
    EXPECT_EQ(Read("Missing", PARAM_INT, &value, 0), 0);
    EXPECT_EQ(Read("Missing", PARAM_STRING, &text), 0);
    EXPECT_EQ(Read("Missing", PARAM_COUNT, &count), 0);
    EXPECT_EQ(Read("Missing", PARAM_NONE, &type), 0);
    EXPECT_EQ(value, 42);
    EXPECT_STREQ(text, "kept");
    EXPECT_EQ(count, 43u);
    EXPECT_EQ(type, 44);
}

TEST_P(ContainerContract, MGETPARAMETER_MissingTicket_FailsAndLeavesTheValue)
{
    int value = 42;
    EXPECT_EQ(access->MGETPARAMETER(access->Instance, subject->type, subject->missingId, "K", PARAM_INT,
                                    &value, -1),
              0);
    EXPECT_EQ(value, 42);
}

TEST_P(ContainerContract, MGETPARAMETER_AnotherTypeThanStored_FailsAndLeavesTheValue)
{
    EXPECT_TRUE(WriteInt("K", 7));
    for (int type = PARAM_POINTER; type <= PARAM_UNSIGNED64; ++type)
    {
        if (type == PARAM_INT || type == PARAM_COUNT)
            continue;
        unsigned char value[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
        EXPECT_EQ(Read("K", static_cast<PARAM_TYPE>(type), value), 0) << type;
        for (unsigned i = 0; i < sizeof value; ++i)
            EXPECT_EQ(value[i], i + 1) << type;
    }
}

TEST_P(ContainerContract, MGETPARAMETER_UnknownTypeOrPosition_Fails)
{
    EXPECT_TRUE(WriteInt("K", 7));
    int value = 42;
    EXPECT_EQ(Read("K", static_cast<PARAM_TYPE>(10), &value), 0);
    EXPECT_EQ(Read("K", static_cast<PARAM_TYPE>(-1), &value), 0);
    EXPECT_EQ(Read("K", PARAM_INT, &value, -2), 0);
    EXPECT_EQ(Read("K", PARAM_INT, &value, INT_MIN), 0);
    EXPECT_EQ(Read("K", PARAM_INT, &value, INT_MAX), 0);
    EXPECT_EQ(Read("K", PARAM_INT, &value, 1), 0);
    EXPECT_EQ(value, 42);
}

TEST_P(ContainerContract, MGETPARAMETER_NullKeyOrValue_Fails)
{
    EXPECT_TRUE(WriteInt("K", 7));
    int value = 42;
    EXPECT_EQ(Read(nullptr, PARAM_INT, &value), 0);
    EXPECT_EQ(Read("K", PARAM_INT, nullptr), 0);
    EXPECT_EQ(value, 42);
}

TEST_P(ContainerContract, MSETPARAMETER_OfEveryType_IsReadBack)
{
    int target = 0;
    int const i = INT_MIN;
    double const d = -0.0;
    std::string bytes("a\0b", 3);
    BIN_STRING const b(bytes.data(), bytes.size());
    long long const l = LLONG_MIN;
    unsigned const u = UINT_MAX;
    unsigned long long const ul = ULLONG_MAX;
    EXPECT_TRUE(Write("P", PARAM_POINTER, &target));
    EXPECT_TRUE(Write("I", PARAM_INT, &i));
    EXPECT_TRUE(Write("D", PARAM_DOUBLE, &d));
    EXPECT_TRUE(Write("S", PARAM_STRING, "text \xC3\xA4"));
    EXPECT_TRUE(Write("B", PARAM_BINSTRING, &b));
    EXPECT_TRUE(Write("L", PARAM_INT64, &l));
    EXPECT_TRUE(Write("U", PARAM_UNSIGNED, &u));
    EXPECT_TRUE(Write("UL", PARAM_UNSIGNED64, &ul));
    bytes = "xxx";  // no slot keeps what it was given

    void* pointer = nullptr;
    double number = 1;
    BIN_STRING binary;
    long long wide = 0;
    unsigned plain = 0;
    unsigned long long widest = 0;
    EXPECT_TRUE(Read("P", PARAM_POINTER, &pointer) && pointer == &target);
    EXPECT_EQ(Int("I"), INT_MIN);
    EXPECT_TRUE(Read("D", PARAM_DOUBLE, &number) && number == 0 && std::signbit(number));
    EXPECT_EQ(Text("S"), "text \xC3\xA4");
    ASSERT_TRUE(Read("B", PARAM_BINSTRING, &binary));
    EXPECT_EQ(std::string(static_cast<char const*>(binary.data), binary.size), std::string("a\0b", 3));
    EXPECT_TRUE(Read("L", PARAM_INT64, &wide) && wide == LLONG_MIN);
    EXPECT_TRUE(Read("U", PARAM_UNSIGNED, &plain) && plain == UINT_MAX);
    EXPECT_TRUE(Read("UL", PARAM_UNSIGNED64, &widest) && widest == ULLONG_MAX);
}

TEST_P(ContainerContract, MSETPARAMETER_ANullPointerAndAnEmptyText_AreValues)
{
    void* pointer = &pointer;
    EXPECT_TRUE(Write("P", PARAM_POINTER, nullptr));
    EXPECT_TRUE(WriteText("S", ""));
    EXPECT_TRUE(Read("P", PARAM_POINTER, &pointer));
    EXPECT_EQ(pointer, nullptr);
    char const* text = nullptr;
    EXPECT_TRUE(Read("S", PARAM_STRING, &text));
    EXPECT_STREQ(text, "");
}

TEST_P(ContainerContract, MSETPARAMETER_WhatIsNoValue_IsRefusedAndChangesNothing)
{
    EXPECT_TRUE(WriteInt("K", 7));
    int const value = 8;
    BIN_STRING const empty("x", 0);
    BIN_STRING const null(nullptr, 3);
    EXPECT_EQ(Write("K", PARAM_COUNT, &value), 0);
    EXPECT_EQ(Write("K", static_cast<PARAM_TYPE>(10), &value), 0);
    EXPECT_EQ(Write("K", static_cast<PARAM_TYPE>(-1), &value), 0);
    EXPECT_EQ(Write("K", PARAM_NONE, &value), 0);
    EXPECT_EQ(Write("K", PARAM_BINSTRING, &empty), 0);
    EXPECT_EQ(Write("K", PARAM_BINSTRING, &null), 0);
    for (PARAM_TYPE const type : {PARAM_INT, PARAM_DOUBLE, PARAM_STRING, PARAM_BINSTRING, PARAM_COUNT,
                                  PARAM_INT64, PARAM_UNSIGNED, PARAM_UNSIGNED64})
        EXPECT_EQ(Write("K", type, nullptr), 0) << type;
    EXPECT_EQ(Int("K"), 7);
    EXPECT_EQ(Count("K"), 1u);
}

TEST_P(ContainerContract, MSETPARAMETER_NullOrEmptyKey_IsRefused)
{
    EXPECT_EQ(WriteInt(nullptr, 7), 0);
    EXPECT_EQ(WriteInt("", 7), 0);
    EXPECT_EQ(Delete(""), 0);
    int value = 42;
    EXPECT_EQ(Read("", PARAM_INT, &value), 0);
}

TEST_P(ContainerContract, MSETPARAMETER_OtherNegativePositionsAndFarOnes_AreRefused)
{
    for (int const pos : {-3, -4, INT_MIN, 16777216, INT_MAX})
    {
        EXPECT_EQ(WriteInt("K", 7, pos), 0) << pos;
        EXPECT_EQ(Delete("K", pos), 0) << pos;
    }
    EXPECT_EQ(Count("K"), 0u);
}

TEST_P(ContainerContract, MSETPARAMETER_MissingTicket_IsRefused)
{
    int const value = 7;
    EXPECT_EQ(access->MSETPARAMETER(access->Instance, subject->type, subject->missingId, "K", PARAM_INT,
                                    &value, -1),
              0);
}

TEST_P(ContainerContract, MSETPARAMETER_AtMinus1_StartsTheKeyAnew)
{
    for (int pos = 0; pos < 3; ++pos)
        EXPECT_TRUE(WriteInt("K", pos, pos));
    EXPECT_TRUE(WriteText("K", "alone"));
    EXPECT_EQ(Count("K"), 1u);
    EXPECT_EQ(Text("K"), "alone");
    EXPECT_EQ(Text("K", 0), "alone");
}

TEST_P(ContainerContract, MSETPARAMETER_AtAPosition_LeavesTheOthers)
{
    EXPECT_TRUE(WriteInt("K", 10));
    EXPECT_TRUE(WriteInt("K", 11, 1));
    EXPECT_TRUE(WriteText("K", "mixed", 2));
    EXPECT_TRUE(WriteInt("K", 20, 0));
    EXPECT_EQ(Count("K"), 3u);
    EXPECT_EQ(Int("K", 0), 20);
    EXPECT_EQ(Int("K", 1), 11);
    EXPECT_EQ(Text("K", 2), "mixed");
}

TEST_P(ContainerContract, MSETPARAMETER_AtMinus2_AppendsBehindTheLastValue)
{
    EXPECT_TRUE(WriteInt("K", 10, -2));
    EXPECT_TRUE(WriteInt("K", 11, -2));
    EXPECT_TRUE(WriteInt("K", 15, 5));
    EXPECT_TRUE(WriteInt("K", 16, -2));
    EXPECT_EQ(Count("K"), 7u);
    EXPECT_EQ(Int("K", 0), 10);
    EXPECT_EQ(Int("K", 1), 11);
    EXPECT_EQ(Int("K", 6), 16);
}

TEST_P(ContainerContract, MSETPARAMETER_AtTheLargestPosition_LeavesAGapAndNoRoomToAppend)
{
    EXPECT_TRUE(WriteInt("K", 7, 16777215));
    EXPECT_EQ(Count("K"), 16777216u);
    EXPECT_EQ(Int("K", 16777215), 7);
    EXPECT_EQ(Int("K", 16777214), -1);
    EXPECT_EQ(WriteInt("K", 8, -2), 0);
}

TEST_P(ContainerContract, AGap_CountsButCannotBeRead)
{
    EXPECT_TRUE(WriteInt("K", 12, 2));
    EXPECT_EQ(Count("K"), 3u);
    EXPECT_EQ(Int("K", 0), -1);
    EXPECT_EQ(Int("K", -1), -1);
    EXPECT_EQ(Type("K", 0), PARAM_NONE);
    EXPECT_EQ(Type("K", -1), PARAM_COUNT);
    EXPECT_EQ(Int("K", 2), 12);
}

TEST_P(ContainerContract, AReadAtMinus1_OfAVector_GivesItsFirstValue)
{
    EXPECT_TRUE(WriteInt("K", 10, 0));
    EXPECT_TRUE(WriteInt("K", 11, 1));
    EXPECT_EQ(Int("K", -1), 10);
}

TEST_P(ContainerContract, ATypeQuery_AtMinus1_TellsAVectorFromASingleValue)
{
    EXPECT_TRUE(WriteText("K", "a"));
    EXPECT_EQ(Type("K", -1), PARAM_STRING);
    EXPECT_EQ(Type("K", 0), PARAM_STRING);
    EXPECT_TRUE(WriteInt("K", 1, 1));
    EXPECT_EQ(Type("K", -1), PARAM_COUNT);
    EXPECT_EQ(Type("K", 0), PARAM_STRING);
    EXPECT_EQ(Type("K", 1), PARAM_INT);
    EXPECT_EQ(Type("K", 2), PARAM_NONE);
}

TEST_P(ContainerContract, ACountQuery_IsForMinus1Only)
{
    EXPECT_TRUE(WriteInt("K", 7));
    unsigned long count = ULONG_MAX;
    EXPECT_EQ(Read("K", PARAM_COUNT, &count, 0), 0);
    EXPECT_EQ(count, ULONG_MAX);
    EXPECT_TRUE(Read("K", PARAM_COUNT, &count, -1));
    EXPECT_EQ(count, 1u);  // all 64 bits
}

TEST_P(ContainerContract, ADeletion_AtMinus1_TakesTheWholeKey)
{
    EXPECT_TRUE(WriteInt("K", 10, 0));
    EXPECT_TRUE(WriteInt("K", 11, 1));
    EXPECT_TRUE(Delete("K"));
    EXPECT_EQ(Count("K"), 0u);
    EXPECT_EQ(Type("K", -1), PARAM_NONE);
}

TEST_P(ContainerContract, ADeletion_InTheMiddle_LeavesAGapAndAtTheEndTheCountShrinks)
{
    for (int pos = 0; pos < 4; ++pos)
        EXPECT_TRUE(WriteInt("K", pos, pos));
    EXPECT_TRUE(Delete("K", 2));
    EXPECT_EQ(Count("K"), 4u);
    EXPECT_EQ(Int("K", 2), -1);
    EXPECT_EQ(Int("K", 3), 3);
    EXPECT_TRUE(Delete("K", 3));
    EXPECT_EQ(Count("K"), 2u);  // past the gap in front of it, too
    EXPECT_TRUE(WriteInt("K", 9, -2));
    EXPECT_EQ(Int("K", 2), 9);
}

TEST_P(ContainerContract, ADeletion_OfTheLastValue_TakesTheKey)
{
    EXPECT_TRUE(WriteInt("K", 7));
    EXPECT_TRUE(Delete("K", 0));
    EXPECT_EQ(Count("K"), 0u);
    EXPECT_EQ(Type("K", -1), PARAM_NONE);
}

TEST_P(ContainerContract, ADeletion_OfWhatIsNotThere_Succeeds_ByDesign)
{
    EXPECT_TRUE(WriteInt("K", 7));
    EXPECT_TRUE(Delete("Missing"));
    EXPECT_TRUE(Delete("Missing", 3));
    EXPECT_TRUE(Delete("K", 3));
    EXPECT_EQ(Int("K"), 7);
    EXPECT_EQ(Count("Missing"), 0u);
}

TEST_P(ContainerContract, ADeletion_AtMinus2_IsRefused)
{
    EXPECT_TRUE(WriteInt("K", 7));
    EXPECT_EQ(Delete("K", -2), 0);
    EXPECT_EQ(Int("K"), 7);
}

TEST_P(ContainerContract, ATextThatWasRead_StaysAfterItIsReplacedOrDeleted)
{
    EXPECT_TRUE(WriteText("K", "the first text, longer than any short string"));
    char const* first = nullptr;
    ASSERT_TRUE(Read("K", PARAM_STRING, &first));
    EXPECT_TRUE(WriteText("K", "second"));
    char const* second = nullptr;
    ASSERT_TRUE(Read("K", PARAM_STRING, &second));
    EXPECT_TRUE(Delete("K"));
    EXPECT_STREQ(first, "the first text, longer than any short string");
    EXPECT_STREQ(second, "second");
}

TEST_P(ContainerContract, MSETMULTIPAR_CarriesOutEveryRecordItCanAndMarksEach)
{
    int const value = 7;
    SETMULTIPAR table[] = {{"A", PARAM_INT, 0, &value, -1, false, {}},
                           {"B", PARAM_COUNT, 0, &value, -1, true, {}},
                           {"A", PARAM_STRING, 0, "second", 1, false, {}},
                           {"C", PARAM_NONE, 0, nullptr, -1, false, {}},
                           {}};
    EXPECT_NE(access->MSETMULTIPAR(access->Instance, subject->type, subject->id, table), 0);
    EXPECT_TRUE(table[0].ok);
    EXPECT_FALSE(table[1].ok);
    EXPECT_TRUE(table[2].ok);
    EXPECT_TRUE(table[3].ok);
    EXPECT_EQ(Int("A", 0), 7);
    EXPECT_EQ(Text("A", 1), "second");
    EXPECT_EQ(Count("B"), 0u);
}

TEST_P(ContainerContract, MSETMULTIPAR_NullTable_FailsAndAnEmptyOneSucceeds)
{
    SETMULTIPAR empty[1] = {};
    EXPECT_EQ(access->MSETMULTIPAR(access->Instance, subject->type, subject->id, nullptr), 0);
    EXPECT_NE(access->MSETMULTIPAR(access->Instance, subject->type, subject->id, empty), 0);
}

TEST_P(ContainerContract, MSETMULTIPAR_MissingTicket_FailsWithEveryRecordUnmarked)
{
    int const value = 7;
    SETMULTIPAR table[] = {{"A", PARAM_INT, 0, &value, -1, true, {}}, {}};
    EXPECT_EQ(access->MSETMULTIPAR(access->Instance, subject->type, subject->missingId, table), 0);
    EXPECT_FALSE(table[0].ok);
}

TEST_P(ContainerContract, MGETMULTIPAR_ReadsEachRecordAndMarksIt)
{
    EXPECT_TRUE(WriteInt("A", 10, 0));
    EXPECT_TRUE(WriteText("A", "eleven", 1));
    int first = 0;
    int untouched = 42;
    char const* second = nullptr;
    unsigned long count = 0;
    GETMULTIPAR table[] = {
        {"A", PARAM_INT, 0, &first, 0, false, {}},          {"A", PARAM_INT, 0, &untouched, 1, true, {}},
        {"A", PARAM_STRING, 0, &second, 1, false, {}},      {"A", PARAM_COUNT, 0, &count, -1, false, {}},
        {"Missing", PARAM_INT, 0, &untouched, 0, true, {}}, {}};
    access->MGETMULTIPAR(access->Instance, subject->type, subject->id, table);
    EXPECT_TRUE(table[0].ok && first == 10);
    EXPECT_FALSE(table[1].ok);
    EXPECT_TRUE(table[2].ok);
    EXPECT_STREQ(second, "eleven");
    EXPECT_TRUE(table[3].ok && count == 2);
    EXPECT_FALSE(table[4].ok);
    EXPECT_EQ(untouched, 42);
}

TEST_P(ContainerContract, MGETMULTIPAR_NullTable_IsPutUpWith)
{
    EXPECT_EQ(access->MGETMULTIPAR(access->Instance, subject->type, subject->id, nullptr), 0);
}

TEST_P(ContainerContract, MOPERATION_Delete_TakesTheTicketOnce)
{
    EXPECT_TRUE(WriteInt("K", 7));
    auto const erase = [&]
    { return access->MOPERATION(access->Instance, subject->type, subject->id, MTICKET_OP_DELETE, nullptr); };
    EXPECT_NE(erase(), 0);
    EXPECT_EQ(Int("K"), -1);
    EXPECT_EQ(WriteInt("K", 8), 0);
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
