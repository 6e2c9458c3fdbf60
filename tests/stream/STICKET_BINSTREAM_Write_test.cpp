#include "comgui/stream/STICKET_BINSTREAM.h"

#include "tests/support/HexText.h"
#include "tests/support/StreamOracle.h"
#include <climits>
#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <vector>

using namespace StreamOracle;
using WRITE = STICKET_BINSTREAM::WRITE;

namespace
{
constexpr char const* Signature = "09 53 54 49 43 4B 45 54 5F 31";
constexpr double NaN = std::numeric_limits<double>::quiet_NaN();
constexpr double Infinity = std::numeric_limits<double>::infinity();

// What one item writer puts into an empty stream.
template <typename F>
std::string HexBy(F put)
{
    WRITE writer(0);
    put(writer);
    std::string bytes;
    writer.Swap(bytes);
    return HexOf(bytes);
}

std::string HexOfTag(unsigned char tag, unsigned long size)
{
    return HexBy([=](WRITE& writer) { writer.PutTag(tag, size); });
}

std::string HexOfKey(unsigned long shared, std::string const& tail)
{
    return HexBy([&](WRITE& writer) { writer.PutKeyOpt(shared, tail.c_str()); });
}

std::string HexOfDouble(double value)
{
    return HexBy([=](WRITE& writer) { writer.PutOptimizedTDouble(value); });
}

// The same bytes wherever the keys stand.
std::string HexOfTable(std::vector<RECORD> const& records)
{
    TABLE apart(records);
    std::string bytes;
    STICKET_BINSTREAM::Write(bytes, apart.Records(), 0);
    TABLE shared(records, KEYS::SHARED);
    std::string same;
    STICKET_BINSTREAM::Write(same, shared.Records(), 0);
    EXPECT_EQ(HexOf(same), HexOf(bytes));
    return HexOf(bytes);
}

// The same without the signature, which has to be there.
std::string HexBehindSignature(std::vector<RECORD> const& records)
{
    std::string const hex = HexOfTable(records);
    EXPECT_EQ(hex.substr(0, 29), Signature);
    return hex.size() > 30 ? hex.substr(30) : "";
}

// Behind signature and the key "k" at -1.
std::string HexOfValue(RECORD const& record)
{
    std::string const hex = HexBehindSignature({record});
    EXPECT_EQ(hex.substr(0, 5), "01 6B");
    return hex.substr(6);
}

// The beginning of what an item writer throws at.
template <typename F>
std::string WordsOf(F put)
{
    try
    {
        HexBy(put);
    }
    catch (char const* words)
    {
        return words;
    }
    return "nothing thrown";
}
}  // namespace

// The tag header.

struct TAG_FACT
{
    char const* name;
    unsigned long size;
    char const* bytes;
};
class PutTag : public testing::TestWithParam<TAG_FACT>
{
};
TEST_P(PutTag, TakesTheShortestForm) { EXPECT_EQ(HexOfTag(0x60, GetParam().size), GetParam().bytes); }
INSTANTIATE_TEST_SUITE_P(
    Facts, PutTag,
    testing::Values(TAG_FACT{"Zero", 0, "60"}, TAG_FACT{"One", 1, "61"}, TAG_FACT{"LargestShort", 15, "6F"},
                    TAG_FACT{"SmallestMedium", 16, "70 10"}, TAG_FACT{"MediumOfTwoBytes", 256, "71 00"},
                    TAG_FACT{"LargestMedium", 2047, "77 FF"}, TAG_FACT{"SmallestLong", 2048, "78 00 08 00"},
                    TAG_FACT{"LongOfThreeBytes", 0x123456, "78 12 34 56"},
                    TAG_FACT{"LongOfAllBits", 0x1000000, "79 00 00 00"},
                    TAG_FACT{"LargestLong", 134217727, "7F FF FF FF"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(PutTagOfAnyClass, Class_StandsInTheTopThreeBits)
{
    EXPECT_EQ(HexOfTag(0x00, 9), "09");
    EXPECT_EQ(HexOfTag(0x20, 20), "30 14");
    EXPECT_EQ(HexOfTag(0x80, 134217727), "9F FF FF FF");
    EXPECT_EQ(HexOfTag(0xA0, 1), "A1");
    EXPECT_EQ(HexOfTag(0xC0, 0), "C0");
    EXPECT_EQ(HexOfTag(0xE0, 15), "EF");
}

TEST(PutTagOfAnyClass, SizeOf128MiB_Throws)
{
    for (unsigned long const size : {134217728ul, 0xFFFFFFFFul, 0x100000000ul, ULONG_MAX})
        EXPECT_EQ(WordsOf([=](WRITE& writer) { writer.PutTag(0x60, size); }), "Tag size overflow") << size;
}

// Compressed keys.

struct KEY_FACT
{
    char const* name;
    unsigned long shared;
    char const* bytes;
};
class PutKeyOpt : public testing::TestWithParam<KEY_FACT>
{
};
TEST_P(PutKeyOpt, TakesTheShortestNumberOfSharedBytes)
{
    EXPECT_EQ(HexOfKey(GetParam().shared, "Z"), GetParam().bytes);
}
INSTANTIATE_TEST_SUITE_P(Facts, PutKeyOpt,
                         testing::Values(KEY_FACT{"One", 1, "22 01 5A"},
                                         KEY_FACT{"LargestByte", 127, "22 7F 5A"},
                                         KEY_FACT{"SmallestShort", 128, "23 80 80 5A"},
                                         KEY_FACT{"ShortOfTwoBytes", 256, "23 81 00 5A"},
                                         KEY_FACT{"LargestShort", 16383, "23 BF FF 5A"},
                                         KEY_FACT{"SmallestLong", 16384, "25 C0 00 40 00 5A"},
                                         KEY_FACT{"LongOfFourBytes", 0x12345678, "25 D2 34 56 78 5A"},
                                         KEY_FACT{"LargestLong", 1073741823, "25 FF FF FF FF 5A"}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST(PutKeyOptOfAnyTail, Size_CountsTheSharedBytesNumberToo)
{
    EXPECT_EQ(HexOfKey(1, ""), "21 01");
    EXPECT_EQ(HexOfKey(1, std::string(14, 'a')).substr(0, 5), "2F 01");
    EXPECT_EQ(HexOfKey(1, std::string(15, 'a')).substr(0, 8), "30 10 01");
    EXPECT_EQ(HexOfKey(128, std::string(13, 'a')).substr(0, 8), "2F 80 80");
    EXPECT_EQ(HexOfKey(128, std::string(14, 'a')).substr(0, 11), "30 10 80 80");
    EXPECT_EQ(HexOfKey(16384, std::string(11, 'a')).substr(0, 14), "2F C0 00 40 00");
    EXPECT_EQ(HexOfKey(16384, std::string(12, 'a')).substr(0, 17), "30 10 C0 00 40 00");
    EXPECT_EQ(HexOfKey(1, std::string(2046, 'a')).substr(0, 8), "37 FF 01");
    EXPECT_EQ(HexOfKey(1, std::string(2047, 'a')).substr(0, 14), "38 00 08 00 01");
}

TEST(PutKeyOptOfAnyTail, TooManySharedBytes_Throw)
{
    for (unsigned long const shared : {1073741824ul, 0x100000001ul, ULONG_MAX})
        EXPECT_EQ(WordsOf([=](WRITE& writer) { writer.PutKeyOpt(shared, ""); }), "Key same overflow")
            << shared;
}

// Numbers.

struct INTEGER_FACT
{
    char const* name;
    int value;
    char const* bytes;
};
class PutTInteger : public testing::TestWithParam<INTEGER_FACT>
{
};
TEST_P(PutTInteger, TakesTheShortestForm)
{
    int const value = GetParam().value;
    EXPECT_EQ(HexBy([=](WRITE& writer) { writer.PutTInteger(value); }), GetParam().bytes);
    EXPECT_EQ(HexOfValue(Int("k", value)), GetParam().bytes);
}
// Integers go the same way whatever they are stored in.
TEST_P(PutTInteger, TakesTheSameFormFromADouble)
{
    EXPECT_EQ(HexOfDouble(GetParam().value), GetParam().bytes);
    EXPECT_EQ(HexOfValue(Double("k", GetParam().value)), GetParam().bytes);
}
TEST_P(PutTInteger, TakesTheSameFormFrom64Bits)
{
    EXPECT_EQ(HexOfValue(Int64("k", GetParam().value)), GetParam().bytes);
}
TEST_P(PutTInteger, TakesTheSameFormFromAnUnsigned)
{
    if (GetParam().value < 0)
        return;
    auto const value = static_cast<unsigned int>(GetParam().value);
    EXPECT_EQ(HexOfValue(Unsigned("k", value)), GetParam().bytes);
    EXPECT_EQ(HexOfValue(Unsigned64("k", value)), GetParam().bytes);
}
INSTANTIATE_TEST_SUITE_P(Facts, PutTInteger,
                         testing::Values(INTEGER_FACT{"Zero", 0, "40"}, INTEGER_FACT{"One", 1, "41 01"},
                                         INTEGER_FACT{"MinusOne", -1, "41 FF"},
                                         INTEGER_FACT{"LargestInt8", 127, "41 7F"},
                                         INTEGER_FACT{"PastInt8", 128, "42 00 80"},
                                         INTEGER_FACT{"SmallestInt8", -128, "41 80"},
                                         INTEGER_FACT{"BelowInt8", -129, "42 FF 7F"},
                                         INTEGER_FACT{"LargestInt16", 32767, "42 7F FF"},
                                         INTEGER_FACT{"PastInt16", 32768, "44 00 00 80 00"},
                                         INTEGER_FACT{"SmallestInt16", -32768, "42 80 00"},
                                         INTEGER_FACT{"BelowInt16", -32769, "44 FF FF 7F FF"},
                                         INTEGER_FACT{"LargestInt32", INT_MAX, "44 7F FF FF FF"},
                                         INTEGER_FACT{"SmallestInt32", INT_MIN, "44 80 00 00 00"}),
                         [](auto const& fact) { return std::string(fact.param.name); });

struct DOUBLE_FACT
{
    char const* name;
    double value;
    char const* bytes;
};
class PutOptimizedTDouble : public testing::TestWithParam<DOUBLE_FACT>
{
};
TEST_P(PutOptimizedTDouble, TakesTheSmallestFormThatGivesBackTheNumber)
{
    EXPECT_EQ(HexOfDouble(GetParam().value), GetParam().bytes);
    EXPECT_EQ(HexOfValue(Double("k", GetParam().value)), GetParam().bytes);
}
INSTANTIATE_TEST_SUITE_P(
    Facts, PutOptimizedTDouble,
    testing::Values(DOUBLE_FACT{"Two", 2.0, "41 02"}, DOUBLE_FACT{"OneAndAHalf", 1.5, "45 69 3F C0 00 00"},
                    DOUBLE_FACT{"Tenth", 0.1, "48 3F B9 99 99 99 99 99 9A"},
                    DOUBLE_FACT{"PastInt32", 2147483648.0, "45 69 4F 00 00 00"},
                    DOUBLE_FACT{"BelowInt32", -2147483649.0, "48 C1 E0 00 00 00 20 00 00"},
                    DOUBLE_FACT{"JustAboveInt32", 2147483647.5, "48 41 DF FF FF FF E0 00 00"},
                    DOUBLE_FACT{"ThreeBillion", 3000000000.0, "45 69 4F 32 D0 5E"},
                    DOUBLE_FACT{"LargestSingle", std::numeric_limits<float>::max(), "45 69 7F 7F FF FF"},
                    DOUBLE_FACT{"PastSingle", 0x1p128, "48 47 F0 00 00 00 00 00 00"},
                    DOUBLE_FACT{"SmallestSingle", 0x1p-149, "45 69 00 00 00 01"},
                    DOUBLE_FACT{"BelowSingle", 0x1p-150, "48 36 90 00 00 00 00 00 00"},
                    DOUBLE_FACT{"LargestDouble", std::numeric_limits<double>::max(),
                                "48 7F EF FF FF FF FF FF FF"},
                    DOUBLE_FACT{"SmallestDouble", -0x1p-1074, "48 80 00 00 00 00 00 00 01"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(PutOptimizedTDoubleOf, MinusZero_IsTheIntegerZero_ByDesign) { EXPECT_EQ(HexOfDouble(-0.0), "40"); }

TEST(PutOptimizedTDoubleOf, WhatIsNoNumber_IsTheOnePatternOfNaN_ByDesign)
{
    for (double const value : {NaN, -NaN, std::numeric_limits<double>::signaling_NaN(), Infinity, -Infinity})
    {
        EXPECT_EQ(HexOfDouble(value), "48 7F F8 00 00 00 00 00 00");
        EXPECT_EQ(HexOfValue(Double("k", value)), "48 7F F8 00 00 00 00 00 00");
    }
}

TEST(PutTFloat, Single_StandsBehindItsMarker)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutTFloat(1.0f); }), "45 69 3F 80 00 00");
}

TEST(PutTDouble, Double_StandsInEightBytes)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutTDouble(1.0); }), "48 3F F0 00 00 00 00 00 00");
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutTDouble(-0.0); }), "48 80 00 00 00 00 00 00 00");
}

TEST(PutTPoly64, Value_StandsBehindItsMarker)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutTPoly64(0x0123456789ABCDEF, 'x'); }),
              "49 78 01 23 45 67 89 AB CD EF");
}

TEST(PutTPoly64, SmallValue_IsNotShortened)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutTPoly64(0, 'd'); }), "49 64 00 00 00 00 00 00 00 00");
}

struct INT64_FACT
{
    char const* name;
    long long value;
    char const* bytes;
};
class PutTInt64 : public testing::TestWithParam<INT64_FACT>
{
};
TEST_P(PutTInt64, TakesADoublesFormUpTo53Bits)
{
    long long const value = GetParam().value;
    EXPECT_EQ(HexBy([=](WRITE& writer) { writer.PutTInt64(value); }), GetParam().bytes);
    EXPECT_EQ(HexOfValue(Int64("k", value)), GetParam().bytes);
}
INSTANTIATE_TEST_SUITE_P(
    Facts, PutTInt64,
    testing::Values(INT64_FACT{"PastInt32", 2147483648, "45 69 4F 00 00 00"},
                    INT64_FACT{"Below53Bits", 9007199254740991, "48 43 3F FF FF FF FF FF FF"},
                    INT64_FACT{"Largest", 9007199254740992, "45 69 5A 00 00 00"},
                    INT64_FACT{"PastLargest", 9007199254740993, "49 64 00 20 00 00 00 00 00 01"},
                    INT64_FACT{"Smallest", -9007199254740992, "45 69 DA 00 00 00"},
                    INT64_FACT{"BelowSmallest", -9007199254740993, "49 64 FF DF FF FF FF FF FF FF"},
                    INT64_FACT{"LargestOfAll", LLONG_MAX, "49 64 7F FF FF FF FF FF FF FF"},
                    INT64_FACT{"SmallestOfAll", LLONG_MIN, "49 64 80 00 00 00 00 00 00 00"}),
    [](auto const& fact) { return std::string(fact.param.name); });

struct UNSIGNED64_FACT
{
    char const* name;
    unsigned long long value;
    char const* bytes;
};
class PutTUnsigned64 : public testing::TestWithParam<UNSIGNED64_FACT>
{
};
TEST_P(PutTUnsigned64, IsMarkedUnsignedOnlyWhereSignedWillNotDo)
{
    unsigned long long const value = GetParam().value;
    EXPECT_EQ(HexBy([=](WRITE& writer) { writer.PutTUnsigned64(value); }), GetParam().bytes);
    EXPECT_EQ(HexOfValue(Unsigned64("k", value)), GetParam().bytes);
}
INSTANTIATE_TEST_SUITE_P(
    Facts, PutTUnsigned64,
    testing::Values(UNSIGNED64_FACT{"Below53Bits", 9007199254740991, "48 43 3F FF FF FF FF FF FF"},
                    UNSIGNED64_FACT{"LargestDouble", 9007199254740992, "45 69 5A 00 00 00"},
                    UNSIGNED64_FACT{"PastDouble", 9007199254740993, "49 64 00 20 00 00 00 00 00 01"},
                    UNSIGNED64_FACT{"LargestSigned", 9223372036854775807u, "49 64 7F FF FF FF FF FF FF FF"},
                    UNSIGNED64_FACT{"PastSigned", 9223372036854775808u, "49 75 80 00 00 00 00 00 00 00"},
                    UNSIGNED64_FACT{"LargestOfAll", ULLONG_MAX, "49 75 FF FF FF FF FF FF FF FF"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(Unsigned32, PastInt32_IsWrittenAsADouble)
{
    EXPECT_EQ(HexOfValue(Unsigned("k", 2147483648)), "45 69 4F 00 00 00");
    EXPECT_EQ(HexOfValue(Unsigned("k", 4294967040)), "45 69 4F 7F FF FF");
    EXPECT_EQ(HexOfValue(Unsigned("k", 4294967295)), "48 41 EF FF FF FF E0 00 00");
}

TEST(PutPlainNumbers, AreBigEndian)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutUShort(0x1234); }), "12 34");
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutUnsigned(0x12345678); }), "12 34 56 78");
}

// Texts and bytes.

TEST(PutString, Text_StandsBehindItsLengthWithoutAnEnd)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutString(0, "ab"); }), "02 61 62");
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutString(0x60, "ab"); }), "62 61 62");
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutString(0x60, ""); }), "60");
}

TEST(PutTBinString, Bytes_StandBehindTheirLength)
{
    EXPECT_EQ(HexBy([](WRITE& writer) { writer.PutTBinString(BIN_STRING("\0\xFF\0", 3)); }), "83 00 FF 00");
}

TEST(PutTBinString, InvalidBytes_AreAnItemOfNoSize)
{
    for (BIN_STRING const& invalid : {BIN_STRING(), BIN_STRING("abc", 0), BIN_STRING(nullptr, 3)})
    {
        EXPECT_EQ(HexBy([&](WRITE& writer) { writer.PutTBinString(invalid); }), "80");
        WRITE writer(0);
        EXPECT_TRUE(writer.SetParameter("k", PARAM_BINSTRING, &invalid, -1));
        std::string bytes;
        writer.Swap(bytes);
        EXPECT_EQ(HexOf(bytes), std::string(Signature) + " 01 6B 80");
    }
}

struct LENGTH_FACT
{
    char const* name;
    std::size_t length;
    char const* tail;  // of the tag, behind its first digit
};
class ValueOfBytes : public testing::TestWithParam<LENGTH_FACT>
{
protected:
    // The tag has that digit in front; then come as many bytes of 'x'.
    std::string Expected(char first) const
    {
        std::string const tag = BytesOf(first + std::string(GetParam().tail));
        return HexOf(tag + std::string(GetParam().length, 'x'));
    }
    std::string const bytes = std::string(GetParam().length, 'x');
};
TEST_P(ValueOfBytes, Text_IsWrittenWhole)
{
    EXPECT_EQ(HexOfValue(Text("k", bytes)), Expected(GetParam().length < 16 ? '6' : '7'));
}
TEST_P(ValueOfBytes, Bytes_AreWrittenWhole)
{
    EXPECT_EQ(HexOfValue(Bytes("k", bytes)), Expected(GetParam().length < 16 ? '8' : '9'));
}
TEST_P(ValueOfBytes, FullKey_IsWrittenWhole)
{
    EXPECT_EQ(HexBehindSignature({Int(bytes, 0)}),
              GetParam().length == 0 ? "40" : Expected(GetParam().length < 16 ? '0' : '1') + " 40");
}
INSTANTIATE_TEST_SUITE_P(Facts, ValueOfBytes,
                         testing::Values(LENGTH_FACT{"Empty", 0, "0"}, LENGTH_FACT{"LargestShort", 15, "F"},
                                         LENGTH_FACT{"SmallestMedium", 16, "0 10"},
                                         LENGTH_FACT{"LargestMedium", 2047, "7 FF"},
                                         LENGTH_FACT{"SmallestLong", 2048, "8 00 08 00"},
                                         LENGTH_FACT{"OfAChunk", 4096, "8 00 10 00"},
                                         LENGTH_FACT{"OfManyChunks", 100000, "8 01 86 A0"}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST(NullText, IsWrittenAsTheEmptyText)
{
    RECORD text = Text("k", "");
    text.isNull = true;
    EXPECT_EQ(HexOfValue(text), "60");
}

TEST(Deletion, IsAnItemOfNoSize) { EXPECT_EQ(HexOfValue(Delete("k")), "C0"); }

// Keys and positions.

TEST(Stream, WorkedExample_Has62Bytes)
{
    EXPECT_EQ(HexOfTable({Int("Job/Copies", 3), Text("Job/Name", "A4"), Double("Job/Scale", 1.5),
                          Int("Job/Tray", 300, 0), Int("Job/Tray", -1, 1), Delete("Job/X")}),
              "09 53 54 49 43 4B 45 54 5F 31 "
              "0A 4A 6F 62 2F 43 6F 70 69 65 73 41 03 "
              "25 04 4E 61 6D 65 62 41 34 "
              "26 04 53 63 61 6C 65 45 69 3F C0 00 00 "
              "25 04 54 72 61 79 A2 42 01 2C "
              "41 FF "
              "22 04 58 A1 C0");
}

TEST(Key, EmptyOneFirst_IsNotTold_ByDesign)
{
    EXPECT_EQ(HexBehindSignature({Int("", 1), Int("", 2)}), "41 01 41 02");
}

TEST(Key, EmptyOneLater_IsAFullKeyOfNoSize)
{
    EXPECT_EQ(HexBehindSignature({Int("a", 1), Int("", 2), Int("a", 3)}), "01 61 41 01 00 41 02 01 61 41 03");
}

TEST(Key, SignatureIsNotThePreviousOne)
{
    EXPECT_EQ(HexBehindSignature({Int("STICKET_1", 0)}), "09 53 54 49 43 4B 45 54 5F 31 40");
    EXPECT_EQ(HexBehindSignature({Int("STAR", 0)}), "04 53 54 41 52 40");
}

TEST(Key, Same_IsToldOnce)
{
    EXPECT_EQ(HexBehindSignature({Int("a", 1), Int("a", 2), Int("a", 3)}), "01 61 41 01 41 02 41 03");
}

TEST(Key, SameBehindRefusedRecords_IsNotToldAgain)
{
    RECORD refused = Int("between", 5, 7);
    refused.type = PARAM_POINTER;
    EXPECT_EQ(HexBehindSignature({Int("a", 1), refused, Int("a", 2)}), "01 61 41 01 41 02");
}

TEST(Key, BeginningOfThePreviousOne_HasAnEmptyTail)
{
    EXPECT_EQ(HexBehindSignature({Int("abc", 1), Int("ab", 2)}), "03 61 62 63 41 01 21 02 41 02");
}

TEST(Key, LongerThanThePreviousOne_SharesAllOfIt)
{
    EXPECT_EQ(HexBehindSignature({Int("ab", 1), Int("abc", 2)}), "02 61 62 41 01 22 02 63 41 02");
}

TEST(Key, WithNothingShared_IsFull)
{
    EXPECT_EQ(HexBehindSignature({Int("ab", 1), Int("b", 2)}), "02 61 62 41 01 01 62 41 02");
}

TEST(Key, ShareIsThatWithThePreviousKeyAlone)
{
    EXPECT_EQ(HexBehindSignature({Int("abc", 0), Int("x", 0), Int("abd", 0)}),
              "03 61 62 63 40 01 78 40 03 61 62 64 40");
}

TEST(Position, Table)
{
    EXPECT_EQ(HexOfValue(Int("k", 0, -2)), "A0 40");
    EXPECT_EQ(HexOfValue(Int("k", 0, -1)), "40");
    EXPECT_EQ(HexOfValue(Int("k", 0, 0)), "A2 40");
    EXPECT_EQ(HexOfValue(Int("k", 0, 13)), "AF 40");
    EXPECT_EQ(HexOfValue(Int("k", 0, 14)), "B0 10 40");
    EXPECT_EQ(HexOfValue(Int("k", 0, 2045)), "B7 FF 40");
    EXPECT_EQ(HexOfValue(Int("k", 0, 2046)), "B8 00 08 00 40");
    EXPECT_EQ(HexOfValue(Int("k", 0, 134217725)), "BF FF FF FF 40");
}

TEST(Position, RunningOn_IsNotTold)
{
    EXPECT_EQ(HexOfValue(Int("k", 0, 0)), "A2 40");
    EXPECT_EQ(HexBehindSignature({Int("k", 0, 0), Int("k", 0, 1), Int("k", 0, 2)}), "01 6B A2 40 40 40");
}

TEST(Position, Negative_StaysWhereItIs)
{
    EXPECT_EQ(HexBehindSignature({Int("k", 0, -1), Int("k", 0, -1)}), "01 6B 40 40");
    EXPECT_EQ(HexBehindSignature({Int("k", 0, -2), Int("k", 0, -2), Int("k", 0, -1)}),
              "01 6B A0 40 40 A1 40");
}

TEST(Position, AtWhichAValueStood_IsToldAgain)
{
    EXPECT_EQ(HexBehindSignature({Int("k", 0, 5), Int("k", 0, 5)}), "01 6B A7 40 A7 40");
}

TEST(Position, RunningOnPastTheLargestThatCanBeTold_IsNotTold)
{
    EXPECT_EQ(HexBehindSignature({Int("k", 0, 134217725), Int("k", 0, 134217726)}),
              "01 6B BF FF FF FF 40 40");
}

TEST(Position, CarriesOverToTheNextKey_ByDesign)
{
    EXPECT_EQ(HexBehindSignature({Int("a", 0, 0), Int("a", 0, 1), Int("a", 0, 2), Int("b", 0, 3)}),
              "01 61 A2 40 40 40 01 62 40");
    EXPECT_EQ(HexBehindSignature({Int("a", 0, 0), Int("b", 0, 0)}), "01 61 A2 40 01 62 A2 40");
}

TEST(Position, DeletionMovesItOnToo)
{
    EXPECT_EQ(HexBehindSignature({Delete("k", 0), Int("k", 0, 1), Delete("k", 2)}), "01 6B A2 C0 40 C0");
}

TEST(Position, RefusedRecordDoesNotMoveIt)
{
    RECORD refused = Int("k", 0, 1);
    refused.type = PARAM_COUNT;
    EXPECT_EQ(HexBehindSignature({Int("k", 0, 0), refused, Int("k", 0, 1)}), "01 6B A2 40 40");
}

// Vectors.

TEST(Vector, OfOneType_IsNumbersAlone)
{
    EXPECT_EQ(HexBehindSignature({Unsigned("k", 1, 0), Unsigned("k", 2, 1), Unsigned("k", 3, 2)}),
              "01 6B A2 41 01 41 02 41 03");
    EXPECT_EQ(HexBehindSignature({Double("k", 0.5, 0), Double("k", 2, 1)}),
              "01 6B A2 45 69 3F 00 00 00 41 02");
}

TEST(Vector, OfManyTypes_HasEachValueInItsOwnForm)
{
    EXPECT_EQ(HexBehindSignature({Int("k", 1, 0), Double("k", 1.5, 1), Int64("k", 1, 2), Unsigned("k", 1, 3),
                                  Unsigned64("k", 1ull << 63, 4), Text("k", "A4", 5), Int("k", 2, 6)}),
              "01 6B A2 41 01 45 69 3F C0 00 00 41 01 41 01 49 75 80 00 00 00 00 00 00 00 62 41 34 41 02");
}

TEST(Vector, Gap_IsToldByAPosition)
{
    EXPECT_EQ(HexBehindSignature({Int("k", 1, 0), Int("k", 2, 1), Int("k", 3, 3), Int("k", 4, -1)}),
              "01 6B A2 41 01 41 02 A5 41 03 A1 41 04");
}

TEST(Vector, LongerThanABuffer_IsWrittenWhole)
{
    std::vector<RECORD> records;
    std::string expected = "01 6B A2";
    for (int i = 0; i < 5000; ++i)
    {
        records.push_back(Int("k", 128, i));
        expected += " 42 00 80";
    }
    EXPECT_EQ(HexBehindSignature(records), expected);
}

// Three texts fill the writer's buffer up to a place near its end; then come one more and a key of that size.
TEST(Buffer, BytesOfAnySizeAtAnyPlaceOfIt_AreWrittenWhole)
{
    for (std::size_t const size : {0u, 1u, 15u, 16u, 17u, 63u, 64u, 65u, 2047u, 2048u, 2049u, 4096u, 4097u})
        for (std::size_t filled = 4000; filled <= 4100; ++filled)
        {
            std::vector<RECORD> const records = {
                Text("a", std::string(1300, 'a')),           Text("a", std::string(1300, 'b')),
                Text("a", std::string(filled - 2600, 'c')),  Text("a", std::string(size, 'd')),
                Int64(std::string(size, 'k'), 1LL << 60, 0), Double("end", 0.1, 1)};
            TABLE table(records);
            std::string bytes;
            STICKET_BINSTREAM::Write(bytes, table.Records(), 0);
            ASSERT_TRUE(bytes == Encode(records)) << size << " bytes behind " << filled;
        }
}

// What a stream can hold.

TEST(Valid, Table)
{
    int const value = 0;
    struct
    {
        int type;
        bool ofNull;
        bool ofAValue;
    } const facts[] = {{PARAM_NONE, true, false},
                       {PARAM_POINTER, false, false},
                       {PARAM_INT, false, true},
                       {PARAM_DOUBLE, false, true},
                       {PARAM_STRING, true, true},
                       {PARAM_BINSTRING, false, true},
                       {PARAM_COUNT, false, false},
                       {PARAM_INT64, false, true},
                       {PARAM_UNSIGNED, false, true},
                       {PARAM_UNSIGNED64, false, true},
                       {10, false, false},
                       {INT_MAX, false, false},
                       {-1, false, false},
                       {INT_MIN, false, false}};
    for (auto const& fact : facts)
    {
        auto const type = static_cast<PARAM_TYPE>(fact.type);
        EXPECT_EQ(STICKET_BINSTREAM::Valid(type, nullptr), fact.ofNull) << fact.type;
        EXPECT_EQ(STICKET_BINSTREAM::Valid(type, &value), fact.ofAValue) << fact.type;
    }
}

TEST(RefusedRecord, LeavesNoTrace)
{
    int value = 0;
    for (int const type : {PARAM_NONE + 0, PARAM_POINTER + 0, PARAM_COUNT + 0, 10, -1})
    {
        WRITE writer(0);
        EXPECT_FALSE(writer.SetParameter("k", static_cast<PARAM_TYPE>(type), &value, 5)) << type;
        EXPECT_FALSE(writer.Failed());
        EXPECT_TRUE(writer.SetParameter("k", PARAM_INT, &value, -1));
        std::string bytes;
        writer.Swap(bytes);
        EXPECT_EQ(HexOf(bytes), std::string(Signature) + " 01 6B 40") << type;
    }
}

TEST(RefusedRecord, NullInAVector_LeavesNoTrace)
{
    TABLE table({Int("k", 1, 0), Int("k", 2, 1), Int("k", 3, 1)}, KEYS::SHARED);
    table.Records()[1].value = nullptr;
    std::string out;
    STICKET_BINSTREAM::Write(out, table.Records(), 0);
    EXPECT_EQ(HexOf(out), std::string(Signature) + " 01 6B A2 41 01 41 03");
    EXPECT_FALSE(table.Records()[1].ok);
    EXPECT_TRUE(table.Records()[2].ok);
}

TEST(RefusedRecord, Alone_GivesNoSignatureEither)
{
    RECORD pointer = Int("k", 0);
    pointer.type = PARAM_POINTER;
    EXPECT_EQ(HexOfTable({pointer}), "");
}

TEST(Table, Ok_TakesTheResultOfEachRecord)
{
    RECORD pointer = Int("b", 0);
    pointer.type = PARAM_POINTER;
    TABLE table({Int("a", 0), pointer, Int("c", 0)});
    table.Records()[1].ok = true;
    std::string out;
    STICKET_BINSTREAM::Write(out, table.Records(), 0);
    EXPECT_TRUE(table.Records()[0].ok);
    EXPECT_FALSE(table.Records()[1].ok);
    EXPECT_TRUE(table.Records()[2].ok);
    EXPECT_FALSE(table.Records()[3].ok);
}

// The writer as a whole.

TEST(Writer, New_IsEmptyAndHasNotFailed)
{
    for (unsigned long const reserve : {0ul, 1000000ul})
    {
        WRITE writer(reserve);
        EXPECT_FALSE(writer.Failed());
        std::string bytes = "before";
        writer.Swap(bytes);
        EXPECT_EQ(bytes, "");
    }
}

TEST(Writer, Swap_GivesTheContentsOfOutInExchange)
{
    WRITE writer(0);
    std::string first = "before";
    writer.Swap(first);
    std::string second;
    writer.Swap(second);
    EXPECT_EQ(second, "before");
}

TEST(Writer, NullTable_IsNothing)
{
    WRITE writer(0);
    writer.SetMultiParameter(nullptr);
    EXPECT_FALSE(writer.Failed());
    std::string bytes;
    writer.Swap(bytes);
    EXPECT_EQ(bytes, "");
}

TEST(Writer, TableOneByOne_IsTheTableAtOnce)
{
    std::vector<RECORD> const records = {Int("Job/Copies", 3),  Text("Job/Name", "A4"),
                                         Int("Job/Tray", 1, 0), Int("Job/Tray", 2, 1),
                                         Delete("Job/X"),       Text("Job/X", std::string(5000, 'x'))};
    TABLE table(records);
    WRITE writer(0);
    for (SETMULTIPAR const* record = table.Records(); record->key; ++record)
    {
        std::string const key = record->key;  // gone before the next
        EXPECT_TRUE(writer.SetParameter(key.c_str(), record->type, record->value, record->pos));
    }
    std::string bytes;
    writer.Swap(bytes);
    EXPECT_EQ(HexOf(bytes), HexOfTable(records));
}

TEST(Writer, TwoTables_AreOneStream)
{
    WRITE writer(0);
    {
        TABLE first({Int("Job/a", 1, 0)});
        writer.SetMultiParameter(first.Records());
    }
    TABLE second({Int("Job/b", 2, 1)});
    writer.SetMultiParameter(second.Records());
    std::string bytes;
    writer.Swap(bytes);
    EXPECT_EQ(HexOf(bytes), HexOfTable({Int("Job/a", 1, 0), Int("Job/b", 2, 1)}));
}

TEST(OpaqueWriter, Null_DoesNothing)
{
    int const value = 1;
    TABLE table({Int("k", 1)});
    EXPECT_FALSE(WRITE::SetParameter(nullptr, "k", PARAM_INT, &value, -1));
    WRITE::SetMultiParameter(nullptr, table.Records());
    EXPECT_FALSE(table.Records()->ok);
}

TEST(OpaqueWriter, IsTheWriter)
{
    WRITE writer(0);
    auto* const opaque = reinterpret_cast<STICKET*>(&writer);
    int const value = 1;
    EXPECT_TRUE(WRITE::SetParameter(opaque, "a", PARAM_INT, &value, -1));
    EXPECT_FALSE(WRITE::SetParameter(opaque, "a", PARAM_POINTER, &value, -1));
    TABLE table({Int("b", 2)});
    WRITE::SetMultiParameter(opaque, table.Records());
    WRITE::SetMultiParameter(opaque, nullptr);
    std::string bytes;
    writer.Swap(bytes);
    EXPECT_EQ(HexOf(bytes), std::string(Signature) + " 01 61 41 01 01 62 41 02");
}

TEST(Strsame, CountsEqualBytesUpToTheEndOfEither)
{
    EXPECT_EQ(STICKET_BINSTREAM::strsame("", ""), 0u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("", "abc"), 0u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("abc", ""), 0u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("abc", "abd"), 2u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("abc", "abc"), 3u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("abc", "ab"), 2u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("ab", "abc"), 2u);
    EXPECT_EQ(STICKET_BINSTREAM::strsame("xbc", "abc"), 0u);
}

TEST(Strsame, EveryPlaceOfTheFirstDifference_IsFound)
{
    for (std::size_t size = 1; size <= 40; ++size)
        for (std::size_t at = 0; at < size; ++at)
        {
            std::string const key(size, '\x80');
            std::string other = key;
            other[at] = '\x81';
            EXPECT_EQ(STICKET_BINSTREAM::strsame(key.c_str(), other.c_str()), at) << "of " << size;
            EXPECT_EQ(STICKET_BINSTREAM::strsame(key.c_str(), key.substr(0, at).c_str()), at);
        }
}

TEST(IncPos, GoesOnFromZeroAndStaysBelow)
{
    int const positions[][2] = {{-2, -2},          {-1, -1}, {0, 1}, {1, 2}, {134217725, 134217726},
                                {INT_MAX, INT_MIN}};
    for (auto const& [before, after] : positions)
    {
        int pos = before;
        STICKET_BINSTREAM::IncPos(pos);
        EXPECT_EQ(pos, after);
    }
}

// Failure.

namespace
{
struct FAILING_FACT
{
    char const* name;
    RECORD record;
};
void PrintTo(FAILING_FACT const& fact, std::ostream* out) { *out << fact.name; }

class FailingRecord : public testing::TestWithParam<FAILING_FACT>
{
protected:
    std::vector<RECORD> const records = {Int("a", 1), GetParam().record, Int("c", 3)};
    TABLE table{records};
};
INSTANTIATE_TEST_SUITE_P(Facts, FailingRecord,
                         testing::Values(FAILING_FACT{"PositionBelowAppending", Int("b", 2, -3)},
                                         FAILING_FACT{"LowestPosition", Int("b", 2, INT_MIN)},
                                         FAILING_FACT{"PositionPastATag", Int("b", 2, 134217726)},
                                         FAILING_FACT{"HighestPosition", Int("b", 2, INT_MAX)}),
                         [](auto const& fact) { return std::string(fact.param.name); });
}  // namespace

TEST_P(FailingRecord, Table_LeavesOutAsItWas)
{
    std::string out = "before";
    EXPECT_EQ(STICKET_BINSTREAM::Write(out, table.Records(), 0), 6u);
    EXPECT_EQ(out, "before");
}

TEST_P(FailingRecord, AndAllBehindIt_AreNotOk)
{
    std::string out;
    STICKET_BINSTREAM::Write(out, table.Records(), 0);
    EXPECT_TRUE(table.Records()[0].ok);
    EXPECT_FALSE(table.Records()[1].ok);
    EXPECT_FALSE(table.Records()[2].ok);
}

TEST_P(FailingRecord, Writer_RefusesEverythingFromThenOn)
{
    WRITE writer(0);
    writer.SetMultiParameter(table.Records());
    EXPECT_TRUE(writer.Failed());
    int const value = 1;
    EXPECT_FALSE(writer.SetParameter("d", PARAM_INT, &value, -1));
    EXPECT_TRUE(writer.Failed());
}

TEST_P(FailingRecord, TableThatComesLater_IsNotOk)
{
    WRITE writer(0);
    writer.SetMultiParameter(table.Records());
    TABLE later({Int("d", 1), Int("e", 2)});
    for (SETMULTIPAR* record = later.Records(); record->key; ++record)
        record->ok = true;
    writer.SetMultiParameter(later.Records());
    EXPECT_FALSE(later.Records()[0].ok);
    EXPECT_FALSE(later.Records()[1].ok);
}

TEST(FailingVector, ValuesBeforeTheOneThatFailed_AreOk)
{
    TABLE table({Int("k", 1, 0), Int("k", 2, 1), Int("k", 3, -3), Int("k", 4, -3)}, KEYS::SHARED);
    for (SETMULTIPAR* record = table.Records(); record->key; ++record)
        record->ok = true;
    std::string out;
    STICKET_BINSTREAM::Write(out, table.Records(), 0);
    EXPECT_TRUE(table.Records()[0].ok);
    EXPECT_TRUE(table.Records()[1].ok);
    EXPECT_FALSE(table.Records()[2].ok);
    EXPECT_FALSE(table.Records()[3].ok);
}

TEST(BytesOf128MiB, FailTheWriter)
{
    // Only their size is looked at before the writing fails.
    BIN_STRING const bytes("x", 134217728);
    WRITE writer(0);
    EXPECT_FALSE(writer.SetParameter("k", PARAM_BINSTRING, &bytes, -1));
    EXPECT_TRUE(writer.Failed());
    EXPECT_EQ(WordsOf([&](WRITE& other) { other.PutTBinString(bytes); }), "Tag size overflow");
}

TEST(TextOf128MiB, FailsTheWriterAsValueAndAsKey)
{
    std::string const text(134217728, 'x');
    WRITE ofValue(0);
    EXPECT_FALSE(ofValue.SetParameter("k", PARAM_STRING, text.c_str(), -1));
    EXPECT_TRUE(ofValue.Failed());
    WRITE ofKey(0);
    EXPECT_FALSE(ofKey.SetParameter(text.c_str(), PARAM_STRING, "v", -1));
    EXPECT_TRUE(ofKey.Failed());
    EXPECT_EQ(WordsOf([&](WRITE& writer) { writer.PutString(0x60, text.c_str()); }), "Tag size overflow");
}

TEST(TextOfOneByteLess, IsWritten)
{
    std::string const text(134217727, 'x');
    WRITE writer(0);
    EXPECT_TRUE(writer.SetParameter("k", PARAM_STRING, text.c_str(), -1));
    std::string bytes;
    writer.Swap(bytes);
    EXPECT_EQ(bytes.size(), 10u + 2 + 4 + text.size());
    EXPECT_EQ(HexOf(bytes.substr(12, 4)), "7F FF FF FF");
}
