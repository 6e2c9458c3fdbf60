#include "comgui/testing/TicketContract.h"

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/TICKET_OP.h"
#include <array>
#include <cstring>
#include <gmock/gmock.h>
#include <limits>

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

namespace comgui::test
{
namespace
{
constexpr int LargestPosition = 16777215;

constexpr PARAM_TYPE EveryType[] = {PARAM_NONE,     PARAM_POINTER,   PARAM_INT,   PARAM_DOUBLE,
                                    PARAM_STRING,   PARAM_BINSTRING, PARAM_COUNT, PARAM_INT64,
                                    PARAM_UNSIGNED, PARAM_UNSIGNED64};
constexpr PARAM_TYPE StoredTypes[] = {PARAM_POINTER,   PARAM_INT,   PARAM_DOUBLE,   PARAM_STRING,
                                      PARAM_BINSTRING, PARAM_INT64, PARAM_UNSIGNED, PARAM_UNSIGNED64};

// Longer than any short string that lies inside its object.
std::string const LongText = "a text that lies on the heap, since it is longer than any short string";

std::string KeyOf(PARAM_TYPE type) { return "K" + std::to_string(type); }

// Room for one value of any type, filled with a pattern that shows how many bytes a slot wrote. No value of
// this suite ends with the byte of the pattern.
class GUARDED
{
public:
    GUARDED() { m_bytes.fill(Pattern); }
    void* Place() { return m_bytes.data(); }

    // Bytes up to the last that differs from the pattern.
    std::size_t Written() const
    {
        std::size_t size = m_bytes.size();
        while (size && m_bytes[size - 1] == Pattern)
            --size;
        return size;
    }

private:
    static constexpr unsigned char Pattern = 0xA5;
    alignas(16) std::array<unsigned char, 32> m_bytes;
};

std::string BytesOf(BIN_STRING const& binary) { return {static_cast<char const*>(binary.data), binary.size}; }
}  // namespace

int TicketContract::SetBytes(char const* key, std::string const& bytes, int pos) const
{
    BIN_STRING const binary(bytes.data(), bytes.size());
    return Set(key, PARAM_BINSTRING, &binary, pos);
}

int TicketContract::Int(char const* key, int pos) const
{
    int value = -1;
    Get(key, PARAM_INT, &value, pos);
    return value;
}

std::string TicketContract::Text(char const* key, int pos) const
{
    char const* value = "none";
    Get(key, PARAM_STRING, &value, pos);
    return value;
}

std::string TicketContract::Bytes(char const* key, int pos) const
{
    BIN_STRING value("none", 4);
    Get(key, PARAM_BINSTRING, &value, pos);
    return BytesOf(value);
}

unsigned long TicketContract::Count(char const* key) const
{
    unsigned long count = 0;
    Get(key, PARAM_COUNT, &count);
    return count;
}

int TicketContract::Type(char const* key, int pos) const
{
    int type = PARAM_NONE;
    Get(key, PARAM_NONE, &type, pos);
    return type;
}

void TicketContract::SetEveryType() const
{
    int const number = INT_MIN;
    double const real = -0.5;
    long long const wide = LLONG_MIN;
    unsigned const plain = UINT_MAX;
    unsigned long long const widest = ULLONG_MAX;
    EXPECT_TRUE(Set("K1", PARAM_POINTER, this));
    EXPECT_TRUE(Set("K2", PARAM_INT, &number));
    EXPECT_TRUE(Set("K3", PARAM_DOUBLE, &real));
    EXPECT_TRUE(SetText("K4", "text"));
    EXPECT_TRUE(SetBytes("K5", std::string("a\0b", 3)));
    EXPECT_TRUE(Set("K7", PARAM_INT64, &wide));
    EXPECT_TRUE(Set("K8", PARAM_UNSIGNED, &plain));
    EXPECT_TRUE(Set("K9", PARAM_UNSIGNED64, &widest));
}

void TicketContract::ExpectUnreadable(char const* key, PARAM_TYPE type, int pos) const
{
    GUARDED value;
    EXPECT_EQ(Get(key, type, value.Place(), pos), 0) << "type " << type << " at " << pos;
    EXPECT_EQ(value.Written(), 0u) << "type " << type << " at " << pos;
}

void TicketContract::ExpectUnreadable(char const* key, int pos) const
{
    for (PARAM_TYPE const type : EveryType)
        ExpectUnreadable(key, type, pos);
}

int TicketContract::Walk(ACTION action, char const* prefix, int limit) const
{
    auto const call = [](void* context, char const* key, PARAM_TYPE type, void const* value, int pos)
    { return (*static_cast<ACTION*>(context))(key, type, value, pos); };
    return access->SWALKPARAMETERS(access->Instance, call, &action, prefix, limit);
}

std::string TicketContract::Line(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    std::string const place = std::string(key) + "[" + std::to_string(pos) + "]";
    if (type == PARAM_STRING)
        return place + "=" + static_cast<char const*>(value);
    if (type == PARAM_INT)
        return place + "=" + std::to_string(*static_cast<int const*>(value));
    return place + " " + std::to_string(type);
}

std::vector<std::string> TicketContract::Walked(char const* prefix, int limit) const
{
    std::vector<std::string> lines;
    auto const take = [&](char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        lines.push_back(Line(key, type, value, pos));
        return true;
    };
    EXPECT_EQ(Walk(take, prefix, limit), 1);
    return lines;
}

void TicketContract::Churn() const
{
    for (int i = 0; i < 50; ++i)
    {
        SetText("Churn", std::string(LongText.size(), '#'));
        SetBytes("Churn", std::string(LongText.size(), '#'));
    }
}

// --- The table ---------------------------------------------------------------------------------------------

TEST_P(TicketContract, TheTable_HasEverySlot)
{
    EXPECT_NE(access->SGETPARAMETER, nullptr);
    EXPECT_NE(access->SGETMULTIPAR, nullptr);
    EXPECT_NE(access->SWALKPARAMETERS, nullptr);
    EXPECT_NE(access->SSETPARAMETER, nullptr);
    EXPECT_NE(access->SSETMULTIPAR, nullptr);
    EXPECT_NE(access->SOPTION, nullptr);
}

TEST_P(TicketContract, TheTable_HasNullInTheWordsThatNobodyCalls)
{
    EXPECT_EQ(access->reserved0[0], nullptr);
    EXPECT_EQ(access->reserved0[1], nullptr);
    for (void* const word : access->reserved48)
        EXPECT_EQ(word, nullptr);
    EXPECT_EQ(access->reserved224, nullptr);
}

// --- Reads that fail ---------------------------------------------------------------------------------------

TEST_P(TicketContract, SGETPARAMETER_MissingKey_LeavesTheValue)
{
    SetInt("K", 7);
    for (int const pos : {-2, -1, 0, 1})
        ExpectUnreadable("Missing", pos);
}

TEST_P(TicketContract, SGETPARAMETER_BeginningOrContinuationOfAKey_LeavesTheValue)
{
    SetInt("Job/Name", 7);
    for (char const* const key : {"Job", "Job/", "Job/Names", "job/name", "Job\\Name"})
        ExpectUnreadable(key, -1);
}

TEST_P(TicketContract, SGETPARAMETER_PositionWithoutValue_LeavesTheValue)
{
    SetInt("K", 7);
    for (int const pos : {-2, -3, INT_MIN, 1, LargestPosition, LargestPosition + 1, INT_MAX})
        ExpectUnreadable("K", pos);
}

TEST_P(TicketContract, SGETPARAMETER_AnotherTypeThanStored_LeavesTheValue)
{
    SetEveryType();
    for (PARAM_TYPE const stored : StoredTypes)
        for (PARAM_TYPE const type : StoredTypes)
            if (type != stored)
            {
                ExpectUnreadable(KeyOf(stored).c_str(), type, -1);
                ExpectUnreadable(KeyOf(stored).c_str(), type, 0);
            }
}

TEST_P(TicketContract, SGETPARAMETER_UnknownType_LeavesTheValue)
{
    SetEveryType();
    for (PARAM_TYPE const stored : StoredTypes)
        for (int const type : {-1, 10, 99, INT_MIN, INT_MAX})
            ExpectUnreadable(KeyOf(stored).c_str(), static_cast<PARAM_TYPE>(type), -1);
}

TEST_P(TicketContract, SGETPARAMETER_NullKey_LeavesTheValue)
{
    SetInt("K", 7);
    ExpectUnreadable(nullptr, -1);
    ExpectUnreadable(nullptr, 0);
}

TEST_P(TicketContract, SGETPARAMETER_EmptyKey_LeavesTheValue)
{
    SetInt("K", 7);
    ExpectUnreadable("", -1);
    ExpectUnreadable("", 0);
}

TEST_P(TicketContract, SGETPARAMETER_NullValue_Fails)
{
    SetEveryType();
    for (PARAM_TYPE const stored : StoredTypes)
        for (PARAM_TYPE const type : {stored, PARAM_NONE, PARAM_COUNT})
            EXPECT_EQ(Get(KeyOf(stored).c_str(), type, nullptr), 0) << stored << ' ' << type;
}

TEST_P(TicketContract, SGETPARAMETER_CountAtAPosition_LeavesTheValue)
{
    SetInt("K", 7);
    ExpectUnreadable("K", PARAM_COUNT, 0);
}

// --- Reads that succeed ------------------------------------------------------------------------------------

TEST_P(TicketContract, SGETPARAMETER_OfEachType_WritesItsWidthAndNoMore)
{
    SetEveryType();
    struct FACT
    {
        char const* key;
        PARAM_TYPE type;
        std::size_t width;
    };
    for (FACT const& fact :
         {FACT{"K1", PARAM_POINTER, 8}, FACT{"K2", PARAM_INT, 4}, FACT{"K3", PARAM_DOUBLE, 8},
          FACT{"K4", PARAM_STRING, 8}, FACT{"K5", PARAM_BINSTRING, 16}, FACT{"K7", PARAM_INT64, 8},
          FACT{"K8", PARAM_UNSIGNED, 4}, FACT{"K9", PARAM_UNSIGNED64, 8}, FACT{"K2", PARAM_COUNT, 8},
          FACT{"K2", PARAM_NONE, 4}})
    {
        GUARDED value;
        EXPECT_TRUE(Get(fact.key, fact.type, value.Place())) << fact.type;
        EXPECT_EQ(value.Written(), fact.width) << fact.type;
    }
}

TEST_P(TicketContract, SGETPARAMETER_AtMinus1OfAVector_GivesItsFirstValue)
{
    SetInt("K", 10, 0);
    SetInt("K", 11, 1);
    EXPECT_EQ(Int("K", -1), 10);
}

TEST_P(TicketContract, SGETPARAMETER_AGap_CountsButCannotBeRead)
{
    SetInt("K", 12, 2);
    EXPECT_EQ(Count("K"), 3u);
    EXPECT_EQ(Int("K", 2), 12);
    ExpectUnreadable("K", 0);
    ExpectUnreadable("K", 1);
    ExpectUnreadable("K", PARAM_INT, -1);  // where position 0 is read
}

TEST_P(TicketContract, SGETPARAMETER_Count_IsOneMoreThanTheLargestPosition)
{
    SetInt("K", 10);
    EXPECT_EQ(Count("K"), 1u);
    SetText("K", "eleven", 1);
    EXPECT_EQ(Count("K"), 2u);
    SetInt("K", 14, 4);
    EXPECT_EQ(Count("K"), 5u);
}

TEST_P(TicketContract, SGETPARAMETER_TypeQuery_GivesTheStoredType)
{
    SetEveryType();
    for (PARAM_TYPE const stored : StoredTypes)
    {
        EXPECT_EQ(Type(KeyOf(stored).c_str(), -1), stored);
        EXPECT_EQ(Type(KeyOf(stored).c_str(), 0), stored);
    }
}

TEST_P(TicketContract, SGETPARAMETER_TypeQueryAtMinus1OfAVector_GivesCount)
{
    SetText("K", "a");
    SetInt("K", 1, 1);
    EXPECT_EQ(Type("K", -1), PARAM_COUNT);
    EXPECT_EQ(Type("K", 0), PARAM_STRING);
    EXPECT_EQ(Type("K", 1), PARAM_INT);
}

TEST_P(TicketContract, SGETPARAMETER_TypeQueryAtMinus1OfOneValueFarOut_GivesCount)
{
    SetInt("K", 7, 3);
    EXPECT_EQ(Type("K", -1), PARAM_COUNT);
    EXPECT_EQ(Type("K", 3), PARAM_INT);
}

// --- What each type keeps ----------------------------------------------------------------------------------

TEST_P(TicketContract, SSETPARAMETER_Pointer_IsReadBack)
{
    for (void const* const written : {static_cast<void const*>(this), static_cast<void const*>(nullptr)})
    {
        void* read = &read;
        EXPECT_TRUE(Set("K", PARAM_POINTER, written));
        EXPECT_TRUE(Get("K", PARAM_POINTER, &read));
        EXPECT_EQ(read, written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_Int_IsReadBack)
{
    for (int const written : {0, 1, -1, INT_MIN, INT_MAX})
    {
        int read = 42;
        EXPECT_TRUE(Set("K", PARAM_INT, &written));
        EXPECT_TRUE(Get("K", PARAM_INT, &read));
        EXPECT_EQ(read, written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_Double_IsReadBackBitForBit)
{
    using LIMITS = std::numeric_limits<double>;
    for (double const written : {0.1, 0.0, -0.0, LIMITS::max(), LIMITS::denorm_min(), -LIMITS::infinity()})
    {
        double read = 42;
        EXPECT_TRUE(Set("K", PARAM_DOUBLE, &written));
        EXPECT_TRUE(Get("K", PARAM_DOUBLE, &read));
        EXPECT_EQ(std::memcmp(&read, &written, sizeof read), 0) << written << ' ' << read;
    }
}

TEST_P(TicketContract, SSETPARAMETER_String_IsReadBack)
{
    for (std::string const& written :
         {std::string("text \xC3\xA4"), std::string(), std::string("\x01\xFF no UTF-8"), LongText})
    {
        EXPECT_TRUE(SetText("K", written));
        EXPECT_EQ(Text("K"), written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_BinString_IsReadBack)
{
    for (std::string const& written : {std::string("a\0b", 3), std::string(1, '\0'), LongText})
    {
        EXPECT_TRUE(SetBytes("K", written));
        EXPECT_EQ(Bytes("K"), written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_Int64_IsReadBack)
{
    for (long long const written : {0LL, -1LL, LLONG_MIN, LLONG_MAX})
    {
        long long read = 42;
        EXPECT_TRUE(Set("K", PARAM_INT64, &written));
        EXPECT_TRUE(Get("K", PARAM_INT64, &read));
        EXPECT_EQ(read, written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_Unsigned_IsReadBack)
{
    for (unsigned const written : {0u, 1u, UINT_MAX})
    {
        unsigned read = 42;
        EXPECT_TRUE(Set("K", PARAM_UNSIGNED, &written));
        EXPECT_TRUE(Get("K", PARAM_UNSIGNED, &read));
        EXPECT_EQ(read, written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_Unsigned64_IsReadBack)
{
    for (unsigned long long const written : {0ull, 1ull, ULLONG_MAX})
    {
        unsigned long long read = 42;
        EXPECT_TRUE(Set("K", PARAM_UNSIGNED64, &written));
        EXPECT_TRUE(Get("K", PARAM_UNSIGNED64, &read));
        EXPECT_EQ(read, written);
    }
}

TEST_P(TicketContract, SSETPARAMETER_AnotherType_ReplacesTheValueAndItsType)
{
    for (int const pos : {-1, 0})
    {
        SetText("K", "text");
        EXPECT_TRUE(SetInt("K", 7, pos));
        EXPECT_EQ(Type("K"), PARAM_INT);
        EXPECT_EQ(Int("K"), 7);
        ExpectUnreadable("K", PARAM_STRING, -1);
    }
}

TEST_P(TicketContract, SSETPARAMETER_KeepsNoPointerToItsArguments)
{
    std::string key = "Key";
    std::string text = "text";
    std::string bytes = "bytes";
    BIN_STRING binary(bytes.data(), bytes.size());
    EXPECT_TRUE(SetText(key.c_str(), text, 0));
    EXPECT_TRUE(Set(key.c_str(), PARAM_BINSTRING, &binary, 1));
    key = "___";
    text = "____";
    bytes = "_____";
    binary = {};
    EXPECT_EQ(Text("Key", 0), "text");
    EXPECT_EQ(Bytes("Key", 1), "bytes");
}

// --- Positions of a write ----------------------------------------------------------------------------------

TEST_P(TicketContract, SSETPARAMETER_AtMinus1_StartsTheKeyAnew)
{
    for (int pos = 0; pos < 3; ++pos)
        SetInt("K", pos, pos);
    EXPECT_TRUE(SetText("K", "alone"));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=alone"));
    EXPECT_EQ(Count("K"), 1u);
}

TEST_P(TicketContract, SSETPARAMETER_AtAPosition_LeavesTheOthers)
{
    SetInt("K", 10);
    EXPECT_TRUE(SetInt("K", 11, 1));
    EXPECT_TRUE(SetText("K", "mixed", 2));
    EXPECT_TRUE(SetInt("K", 20, 0));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=20", "K[1]=11", "K[2]=mixed"));
}

TEST_P(TicketContract, SSETPARAMETER_AtAPositionInAGap_FillsIt)
{
    SetInt("K", 10, 0);
    SetInt("K", 12, 2);
    EXPECT_TRUE(SetInt("K", 11, 1));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=10", "K[1]=11", "K[2]=12"));
}

TEST_P(TicketContract, SSETPARAMETER_AtMinus2OfAMissingKey_WritesPosition0)
{
    EXPECT_TRUE(SetInt("K", 10, -2));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=10"));
}

TEST_P(TicketContract, SSETPARAMETER_AtMinus2_AppendsBehindTheLastValue)
{
    SetInt("K", 10);
    EXPECT_TRUE(SetInt("K", 11, -2));
    SetInt("K", 15, 5);
    EXPECT_TRUE(SetInt("K", 16, -2));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=10", "K[1]=11", "K[5]=15", "K[6]=16"));
}

TEST_P(TicketContract, SSETPARAMETER_AtTheLargestPosition_Succeeds)
{
    EXPECT_TRUE(SetInt("K", 7, LargestPosition));
    EXPECT_EQ(Int("K", LargestPosition), 7);
    EXPECT_EQ(Count("K"), 16777216u);
    EXPECT_EQ(Int("K", LargestPosition - 1), -1);
}

TEST_P(TicketContract, SSETPARAMETER_AtMinus2BehindTheLargestPosition_IsRefused)
{
    SetInt("K", 7, LargestPosition);
    EXPECT_EQ(SetInt("K", 8, -2), 0);
    EXPECT_EQ(Count("K"), 16777216u);
}

TEST_P(TicketContract, SSETPARAMETER_AtAPositionThatIsNone_IsRefused)
{
    SetInt("K", 7);
    for (int const pos : {-3, -4, INT_MIN, LargestPosition + 1, INT_MAX})
    {
        EXPECT_EQ(SetInt("K", 8, pos), 0) << pos;
        EXPECT_EQ(SetInt("New", 8, pos), 0) << pos;
        EXPECT_EQ(Delete("K", pos), 0) << pos;
    }
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

// --- Writes that are refused -------------------------------------------------------------------------------

TEST_P(TicketContract, SSETPARAMETER_NullKey_IsRefused)
{
    EXPECT_EQ(SetInt(nullptr, 7), 0);
    EXPECT_EQ(Delete(nullptr), 0);
    EXPECT_THAT(Walked(), IsEmpty());
}

TEST_P(TicketContract, SSETPARAMETER_EmptyKey_IsRefused)
{
    EXPECT_EQ(SetInt("", 7), 0);
    EXPECT_EQ(Delete(""), 0);
    EXPECT_THAT(Walked(), IsEmpty());
}

TEST_P(TicketContract, SSETPARAMETER_NullWhereAnAddressIsDue_IsRefused)
{
    SetInt("K", 7);
    for (PARAM_TYPE const type : StoredTypes)
    {
        if (type == PARAM_POINTER)  // a null one is a value
            continue;
        EXPECT_EQ(Set("K", type, nullptr), 0) << type;
        EXPECT_EQ(Set("New", type, nullptr), 0) << type;
    }
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

TEST_P(TicketContract, SSETPARAMETER_NullOrEmptyBinString_IsRefused)
{
    SetInt("K", 7);
    for (BIN_STRING const& value : {BIN_STRING("x", 0), BIN_STRING(nullptr, 3), BIN_STRING()})
        for (char const* const key : {"K", "New"})
            EXPECT_EQ(Set(key, PARAM_BINSTRING, &value), 0);
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

TEST_P(TicketContract, SSETPARAMETER_ATypeThatCannotBeStored_IsRefused)
{
    SetInt("K", 7);
    unsigned long const value = 8;
    for (int const type : {static_cast<int>(PARAM_COUNT), -1, 10, 99, INT_MIN, INT_MAX})
        for (char const* const key : {"K", "New"})
            EXPECT_EQ(Set(key, static_cast<PARAM_TYPE>(type), &value), 0) << type;
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

TEST_P(TicketContract, SSETPARAMETER_NoneWithAValue_IsRefused)
{
    SetInt("K", 7);
    int const value = 8;
    EXPECT_EQ(Set("K", PARAM_NONE, &value), 0);
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

TEST_P(TicketContract, SSETPARAMETER_ThatIsRefusedAtMinus1_LeavesTheWholeVector)
{
    SetInt("K", 10, 0);
    SetInt("K", 11, 1);
    EXPECT_EQ(Set("K", PARAM_STRING, nullptr, -1), 0);
    EXPECT_THAT(Walked(), ElementsAre("K[0]=10", "K[1]=11"));
}

// --- Deletions ---------------------------------------------------------------------------------------------

TEST_P(TicketContract, ADeletion_AtMinus1_TakesTheWholeKeyAndNoOther)
{
    SetInt("K", 10, 0);
    SetInt("K", 11, 1);
    SetInt("K/2", 12);
    EXPECT_TRUE(Delete("K"));
    EXPECT_THAT(Walked(), ElementsAre("K/2[0]=12"));
    ExpectUnreadable("K", -1);
}

TEST_P(TicketContract, ADeletion_InTheMiddle_LeavesAGap)
{
    for (int pos = 0; pos < 3; ++pos)
        SetInt("K", pos, pos);
    EXPECT_TRUE(Delete("K", 1));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=0", "K[2]=2"));
    EXPECT_EQ(Count("K"), 3u);
    ExpectUnreadable("K", 1);
}

TEST_P(TicketContract, ADeletion_AtTheEnd_ShrinksTheCountPastAGap)
{
    SetInt("K", 0, 0);
    SetInt("K", 3, 3);
    EXPECT_TRUE(Delete("K", 3));
    EXPECT_EQ(Count("K"), 1u);
    EXPECT_TRUE(SetInt("K", 9, -2));
    EXPECT_EQ(Int("K", 1), 9);
}

TEST_P(TicketContract, ADeletion_OfTheLastValue_TakesTheKey)
{
    SetInt("K", 7);
    EXPECT_TRUE(Delete("K", 0));
    EXPECT_THAT(Walked(), IsEmpty());
    ExpectUnreadable("K", -1);
}

TEST_P(TicketContract, ADeletion_OfWhatIsNotThere_Succeeds_ByDesign)
{
    SetInt("K", 7);
    EXPECT_TRUE(Delete("Missing"));
    EXPECT_TRUE(Delete("Missing", 3));
    EXPECT_TRUE(Delete("K", 3));
    EXPECT_TRUE(Delete("K", LargestPosition));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

TEST_P(TicketContract, ADeletion_AtMinus2_IsRefused)
{
    SetInt("K", 7);
    EXPECT_EQ(Delete("K", -2), 0);
    EXPECT_EQ(Delete("Missing", -2), 0);
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7"));
}

// --- How long texts live -----------------------------------------------------------------------------------

TEST_P(TicketContract, ATextThatWasRead_StaysWhenItsValueIsReplaced)
{
    SetText("K", LongText);
    char const* read = nullptr;
    ASSERT_TRUE(Get("K", PARAM_STRING, &read));
    SetInt("K", 7);
    Churn();
    EXPECT_EQ(read, LongText);
}

TEST_P(TicketContract, ATextThatWasRead_StaysWhenItsValueIsDeleted)
{
    SetText("K", LongText, 0);
    SetText("K", LongText, 1);
    char const* first = nullptr;
    char const* second = nullptr;
    ASSERT_TRUE(Get("K", PARAM_STRING, &first, 0));
    ASSERT_TRUE(Get("K", PARAM_STRING, &second, 1));
    Delete("K", 1);
    Delete("K");
    Churn();
    EXPECT_EQ(first, LongText);
    EXPECT_EQ(second, LongText);
}

TEST_P(TicketContract, AShortTextThatWasRead_StaysWhenItsKeyGrowsOrGoes)
{
    SetText("K", "short", 0);
    char const* read = nullptr;
    ASSERT_TRUE(Get("K", PARAM_STRING, &read, 0));
    for (int pos = 1; pos < 100; ++pos)
        SetText("K", "_____", pos);
    EXPECT_STREQ(read, "short");
    Delete("K");
    Churn();
    EXPECT_STREQ(read, "short");
}

TEST_P(TicketContract, ABinStringThatWasRead_StaysWhenItsValueIsReplacedAndDeleted)
{
    SetBytes("Replaced", LongText);
    SetBytes("Deleted", LongText);
    BIN_STRING replaced;
    BIN_STRING deleted;
    ASSERT_TRUE(Get("Replaced", PARAM_BINSTRING, &replaced));
    ASSERT_TRUE(Get("Deleted", PARAM_BINSTRING, &deleted));
    SetBytes("Replaced", "other");
    Delete("Deleted");
    Churn();
    EXPECT_EQ(BytesOf(replaced), LongText);
    EXPECT_EQ(BytesOf(deleted), LongText);
}

TEST_P(TicketContract, ATextReadByATable_StaysWhenItsValueIsDeleted)
{
    SetText("K", LongText);
    char const* read = nullptr;
    GETMULTIPAR table[] = {{"K", PARAM_STRING, 0, &read, -1, false, {}}, {}};
    access->SGETMULTIPAR(access->Instance, table);
    ASSERT_TRUE(table[0].ok);
    Delete("K");
    Churn();
    EXPECT_EQ(read, LongText);
}

TEST_P(TicketContract, TextsAndBytesThatWereWalkedOver_StayWhenTheirValuesAreDeleted)
{
    SetText("K", LongText, 0);
    SetBytes("K", LongText, 1);
    char const* text = nullptr;
    BIN_STRING bytes;
    auto const take = [&](char const*, PARAM_TYPE type, void const* value, int)
    {
        if (type == PARAM_STRING)
            text = static_cast<char const*>(value);
        else
            bytes = *static_cast<BIN_STRING const*>(value);
        return true;
    };
    ASSERT_EQ(Walk(take), 1);
    ASSERT_TRUE(text);
    Delete("K");
    Churn();
    EXPECT_EQ(text, LongText);
    EXPECT_EQ(BytesOf(bytes), LongText);
}

// --- Tables ------------------------------------------------------------------------------------------------

TEST_P(TicketContract, SGETMULTIPAR_EachRecord_SaysWhetherItWasRead)
{
    SetInt("A", 10, 0);
    SetText("A", "eleven", 1);
    int first = 0;
    GUARDED missing;
    GUARDED otherType;
    char const* second = nullptr;
    unsigned long count = 0;
    int type = 0;
    GETMULTIPAR table[] = {{"A", PARAM_INT, 0, &first, 0, false, {}},
                           {"Missing", PARAM_INT, 0, missing.Place(), 0, true, {}},
                           {"A", PARAM_STRING, 0, &second, 1, false, {}},
                           {"A", PARAM_INT, 0, otherType.Place(), 1, true, {}},
                           {"A", PARAM_COUNT, 0, &count, -1, false, {}},
                           {"A", PARAM_INT, 0, nullptr, 0, true, {}},
                           {"", PARAM_INT, 0, missing.Place(), 0, true, {}},
                           {"A", PARAM_NONE, 0, &type, -1, false, {}},
                           {}};
    access->SGETMULTIPAR(access->Instance, table);
    std::vector<bool> ok;
    for (GETMULTIPAR const* record = table; record->key; ++record)
        ok.push_back(record->ok);
    EXPECT_THAT(ok, ElementsAre(true, false, true, false, true, false, false, true));
    EXPECT_EQ(first, 10);
    EXPECT_STREQ(second, "eleven");
    EXPECT_EQ(count, 2u);
    EXPECT_EQ(type, PARAM_COUNT);
    EXPECT_EQ(missing.Written(), 0u);
    EXPECT_EQ(otherType.Written(), 0u);
}

TEST_P(TicketContract, SGETMULTIPAR_RecordsBehindTheNullKey_AreNotLookedAt)
{
    SetInt("K", 7);
    int value = 42;
    GETMULTIPAR table[] = {{}, {"K", PARAM_INT, 0, &value, -1, false, {}}, {}};
    access->SGETMULTIPAR(access->Instance, table);
    EXPECT_FALSE(table[1].ok);
    EXPECT_EQ(value, 42);
}

TEST_P(TicketContract, SGETMULTIPAR_NullTable_Fails)
{
    EXPECT_EQ(access->SGETMULTIPAR(access->Instance, nullptr), 0);
}

TEST_P(TicketContract, SSETMULTIPAR_EachRecord_SaysWhetherItWasCarriedOut)
{
    SetInt("Old", 1);
    int const value = 7;
    SETMULTIPAR table[] = {{"A", PARAM_INT, 0, &value, -1, false, {}},
                           {"B", PARAM_COUNT, 0, &value, -1, true, {}},
                           {"A", PARAM_STRING, 0, "second", 1, false, {}},
                           {"A", PARAM_INT, 0, &value, -3, true, {}},
                           {"A", PARAM_INT, 0, &value, LargestPosition + 1, true, {}},
                           {"", PARAM_INT, 0, &value, -1, true, {}},
                           {"A", PARAM_INT, 0, nullptr, -1, true, {}},
                           {"A", PARAM_NONE, 0, nullptr, -2, true, {}},
                           {"Old", PARAM_NONE, 0, nullptr, -1, false, {}},
                           {"Missing", PARAM_NONE, 0, nullptr, -1, false, {}},
                           {"C", PARAM_INT, 0, &value, -2, false, {}},
                           {}};
    EXPECT_TRUE(access->SSETMULTIPAR(access->Instance, table));
    std::vector<bool> ok;
    for (SETMULTIPAR const* record = table; record->key; ++record)
        ok.push_back(record->ok);
    EXPECT_THAT(ok, ElementsAre(true, false, true, false, false, false, false, false, true, true, true));
    EXPECT_THAT(Walked(), ElementsAre("A[0]=7", "A[1]=second", "C[0]=7"));
}

TEST_P(TicketContract, SSETMULTIPAR_ARecord_SeesThoseBeforeIt)
{
    SetInt("K", 1, 9);
    int const value = 7;
    SETMULTIPAR table[] = {
        {"K", PARAM_NONE, 0, nullptr, -1, false, {}}, {"K", PARAM_INT, 0, &value, -2, false, {}},
        {"K", PARAM_STRING, 0, "x", 3, false, {}},    {"K", PARAM_STRING, 0, "y", -2, false, {}},
        {"K", PARAM_NONE, 0, nullptr, 3, false, {}},  {}};
    EXPECT_TRUE(access->SSETMULTIPAR(access->Instance, table));
    EXPECT_THAT(Walked(), ElementsAre("K[0]=7", "K[4]=y"));
}

TEST_P(TicketContract, SSETMULTIPAR_ChangesNothingOfARecordButItsOk)
{
    int const value = 7;
    SETMULTIPAR table[] = {{"K", PARAM_INT, 5, &value, -2, false, {1, 2, 3}}, {}};
    SETMULTIPAR const given = table[0];
    EXPECT_TRUE(access->SSETMULTIPAR(access->Instance, table));
    EXPECT_TRUE(table[0].ok);
    table[0].ok = false;
    EXPECT_EQ(std::memcmp(&table[0], &given, sizeof given), 0);
}

TEST_P(TicketContract, SSETMULTIPAR_RecordsBehindTheNullKey_AreNotLookedAt)
{
    int const value = 7;
    SETMULTIPAR table[] = {{}, {"K", PARAM_INT, 0, &value, -1, false, {}}, {}};
    EXPECT_TRUE(access->SSETMULTIPAR(access->Instance, table));
    EXPECT_FALSE(table[1].ok);
    EXPECT_THAT(Walked(), IsEmpty());
}

TEST_P(TicketContract, SSETMULTIPAR_NullTable_Fails)
{
    EXPECT_EQ(access->SSETMULTIPAR(access->Instance, nullptr), 0);
}

// --- Walks -------------------------------------------------------------------------------------------------

TEST_P(TicketContract, SWALKPARAMETERS_GoesByKeyBytewiseThenByPosition)
{
    SetInt("b", 4);
    SetText("a/2", "two");
    SetInt("a", 3, 10);
    SetInt("a", 2, 9);
    SetInt("a", 1, 0);
    SetInt("\xC3\xA4", 5);
    SetInt("B", 6);
    EXPECT_THAT(Walked(), ElementsAre("B[0]=6", "a[0]=1", "a[9]=2", "a[10]=3", "a/2[0]=two", "b[0]=4",
                                      "\xC3\xA4[0]=5"));
}

TEST_P(TicketContract, SWALKPARAMETERS_OfAnEmptyTicket_SucceedsWithoutACall)
{
    int calls = 0;
    auto const count = [&](char const*, PARAM_TYPE, void const*, int) { return ++calls != 0; };
    EXPECT_EQ(Walk(count), 1);
    EXPECT_EQ(calls, 0);
    SetInt("K", 7);
    EXPECT_EQ(Walk(count), 1);
    EXPECT_EQ(calls, 1);
}

TEST_P(TicketContract, SWALKPARAMETERS_HandsOutEachTypeAsAWriteTakesIt)
{
    SetEveryType();
    std::vector<PARAM_TYPE> types;
    auto const take = [&](char const*, PARAM_TYPE type, void const* value, int)
    {
        types.push_back(type);
        switch (type)
        {
        case PARAM_POINTER:
            EXPECT_EQ(value, this);
            break;
        case PARAM_INT:
            EXPECT_EQ(*static_cast<int const*>(value), INT_MIN);
            break;
        case PARAM_DOUBLE:
            EXPECT_EQ(*static_cast<double const*>(value), -0.5);
            break;
        case PARAM_STRING:
            EXPECT_STREQ(static_cast<char const*>(value), "text");
            break;
        case PARAM_BINSTRING:
            EXPECT_EQ(BytesOf(*static_cast<BIN_STRING const*>(value)), std::string("a\0b", 3));
            break;
        case PARAM_INT64:
            EXPECT_EQ(*static_cast<long long const*>(value), LLONG_MIN);
            break;
        case PARAM_UNSIGNED:
            EXPECT_EQ(*static_cast<unsigned const*>(value), UINT_MAX);
            break;
        case PARAM_UNSIGNED64:
            EXPECT_EQ(*static_cast<unsigned long long const*>(value), ULLONG_MAX);
            break;
        default:
            ADD_FAILURE() << type;
        }
        return true;
    };
    EXPECT_EQ(Walk(take), 1);
    EXPECT_THAT(types, testing::ElementsAreArray(StoredTypes));
}

TEST_P(TicketContract, SWALKPARAMETERS_OfAPointer_HandsOutThePointerItself)
{
    Set("K", PARAM_POINTER, this, 0);
    Set("K", PARAM_POINTER, nullptr, 1);
    std::vector<void const*> words;
    auto const take = [&](char const*, PARAM_TYPE, void const* value, int)
    {
        words.push_back(value);
        return true;
    };
    EXPECT_EQ(Walk(take), 1);
    EXPECT_THAT(words, ElementsAre(this, nullptr));
}

TEST_P(TicketContract, SWALKPARAMETERS_SelectsTheKeysThatBeginWithThePrefix)
{
    for (char const* const key : {"Job", "Job/Name", "Job/Copies", "Jo", "job/Name", "Jobs"})
        SetInt(key, 1);
    EXPECT_THAT(Walked("Job/"), ElementsAre("Job/Copies[0]=1", "Job/Name[0]=1"));
    EXPECT_THAT(Walked("Job"), SizeIs(4));
    EXPECT_THAT(Walked("Job/Names"), IsEmpty());
}

TEST_P(TicketContract, SWALKPARAMETERS_NullPrefix_SelectsEveryKey)
{
    SetInt("A", 1);
    SetInt("B", 2);
    EXPECT_THAT(Walked(nullptr), ElementsAre("A[0]=1", "B[0]=2"));
}

TEST_P(TicketContract, SWALKPARAMETERS_IgnoresItsLimit_ByDesign)
{
    for (int pos = 0; pos < 3; ++pos)
        SetInt("K", pos, pos);
    for (int const limit : {2, 1, 0, -1, INT_MIN})
        EXPECT_THAT(Walked("", limit), SizeIs(3)) << limit;
}

TEST_P(TicketContract, SWALKPARAMETERS_EndsWhenTheActionSaysSo)
{
    for (int pos = 0; pos < 5; ++pos)
        SetInt("K", pos, pos);
    SetInt("L", 5);
    int calls = 0;
    EXPECT_EQ(Walk([&](char const*, PARAM_TYPE, void const*, int) { return ++calls < 2; }), 1);
    EXPECT_EQ(calls, 2);
}

TEST_P(TicketContract, SWALKPARAMETERS_NullAction_Fails)
{
    SetInt("K", 7);
    EXPECT_EQ(access->SWALKPARAMETERS(access->Instance, nullptr, nullptr, "", INT_MAX), 0);
}

TEST_P(TicketContract, SWALKPARAMETERS_KeysThatTheActionMakes_AreNotWalkedOver)
{
    SetInt("A", 1);
    SetInt("C", 3);
    std::vector<std::string> lines;
    auto const take = [&](char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        lines.push_back(Line(key, type, value, pos));
        return SetInt("B", 2) && SetInt("D", 4);
    };
    EXPECT_EQ(Walk(take), 1);
    EXPECT_THAT(lines, ElementsAre("A[0]=1", "C[0]=3"));
    EXPECT_THAT(Walked(), ElementsAre("A[0]=1", "B[0]=2", "C[0]=3", "D[0]=4"));
}

TEST_P(TicketContract, SWALKPARAMETERS_ValuesThatTheActionDoesNotTouch_AllCome)
{
    for (char const* const key : {"A", "B", "C"})
        for (int pos = 0; pos < 2; ++pos)
            SetInt(key, pos, pos);
    std::vector<std::string> lines;
    auto const take = [&](char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        lines.push_back(Line(key, type, value, pos));
        return Delete(key, pos) != 0;
    };
    EXPECT_EQ(Walk(take), 1);
    EXPECT_THAT(lines, ElementsAre("A[0]=0", "A[1]=1", "B[0]=0", "B[1]=1", "C[0]=0", "C[1]=1"));
    EXPECT_THAT(Walked(), IsEmpty());
}

TEST_P(TicketContract, SWALKPARAMETERS_KeyAndTextThatTheActionDeletes_StayUntilItReturns)
{
    SetText("a key that lies on the heap, since it is long", LongText);
    int calls = 0;
    auto const take = [&](char const* key, PARAM_TYPE, void const* value, int)
    {
        ++calls;
        EXPECT_TRUE(Delete(key));
        Churn();
        EXPECT_STREQ(key, "a key that lies on the heap, since it is long");
        EXPECT_EQ(static_cast<char const*>(value), LongText);
        return true;
    };
    EXPECT_EQ(Walk(take), 1);
    EXPECT_EQ(calls, 1);
}

TEST_P(TicketContract, SWALKPARAMETERS_TheAddressOfANumber_IsGoodWhileOtherKeysAreWrittenTo)
{
    SetInt("K", 7);
    auto const take = [&](char const*, PARAM_TYPE, void const* value, int)
    {
        for (int i = 0; i < 200; ++i)
            EXPECT_TRUE(SetInt(("Other" + std::to_string(i)).c_str(), i));
        EXPECT_EQ(*static_cast<int const*>(value), 7);
        return true;
    };
    EXPECT_EQ(Walk(take), 1);
    EXPECT_THAT(Walked("Other"), SizeIs(200));
}

TEST_P(TicketContract, SWALKPARAMETERS_TheAddressOfANumber_IsGoodAfterTheWalkUntilItsKeyIsWrittenTo)
{
    double const written = 0.1;
    Set("K", PARAM_DOUBLE, &written);
    void const* walked = nullptr;
    auto const take = [&](char const*, PARAM_TYPE, void const* value, int)
    {
        walked = value;
        return true;
    };
    EXPECT_EQ(Walk(take), 1);
    ASSERT_TRUE(walked);
    Churn();
    EXPECT_THAT(Walked("K"), SizeIs(1));
    EXPECT_EQ(*static_cast<double const*>(walked), 0.1);
}

// --- Options -----------------------------------------------------------------------------------------------

TEST_P(TicketContract, SOPTION_WhoAmI_FillsBothWordsAndNoMore)
{
    GUARDED place;
    auto& who = *static_cast<STICKET_OPTION_WHOAMI*>(place.Place());
    EXPECT_EQ(access->SOPTION(access->Instance, STICKET_OP_WHOAMI, &who), 1);
    EXPECT_EQ(place.Written(), sizeof who);
    EXPECT_EQ(who.word0, subject->who.word0);
    EXPECT_EQ(who.word8, subject->who.word8);
}

TEST_P(TicketContract, SOPTION_FolderVariables_GivesATranslatorOrFailsAndLeavesOut)
{
    void* out = this;
    int const result = access->SOPTION(access->Instance, STICKET_OP_FOLDER_VARIABLES, &out);
    EXPECT_TRUE(result == 1 ? out && out != this : result == 0 && out == this) << result;
}

TEST_P(TicketContract, SOPTION_NullOut_Fails)
{
    EXPECT_EQ(access->SOPTION(access->Instance, STICKET_OP_WHOAMI, nullptr), 0);
    EXPECT_EQ(access->SOPTION(access->Instance, STICKET_OP_FOLDER_VARIABLES, nullptr), 0);
}

TEST_P(TicketContract, SOPTION_AnyOtherCode_FailsAndLeavesOut)
{
    for (int const code : {-1, 0, 2, 3, 9, 12, 98, 99, 102, 106, 110, INT_MIN, INT_MAX})
    {
        GUARDED out;
        EXPECT_EQ(access->SOPTION(access->Instance, code, out.Place()), 0) << code;
        EXPECT_EQ(out.Written(), 0u) << code;
    }
}
}  // namespace comgui::test
