#include "comgui/stream/STICKET_BINSTREAM.h"

#include "comgui/foundation/MathLib.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/support/HexText.h"
#include "tests/support/StreamOracle.h"
#include <bit>
#include <cstdio>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <limits>

using namespace StreamOracle;
using testing::ElementsAre;
using IMPORT = STICKET_BINSTREAM::IMPORT_INTERN;

namespace
{
constexpr double NotANumber = std::numeric_limits<double>::quiet_NaN();
constexpr char const* Signature = "09 53 54 49 43 4B 45 54 5F 31 ";
constexpr char const* WorkedExample = "0A 4A 6F 62 2F 43 6F 70 69 65 73 41 03 "
                                      "25 04 4E 61 6D 65 62 41 34 "
                                      "26 04 53 63 61 6C 65 45 69 3F C0 00 00 "
                                      "25 04 54 72 61 79 A2 42 01 2C 41 FF "
                                      "22 04 58 A1 C0";

// Reads bytes in hexadecimal into a list of its own.
class Reader : public testing::Test
{
protected:
    bool Read(std::string const& hex, bool fixPositions = false)
    {
        ExactBytes const bytes(BytesOf(hex));
        return STICKET_BINSTREAM::Read(list, bytes.Data(), bytes.Size(), fixPositions);
    }

    // The same with the signature in front.
    bool ReadBehindSignature(std::string const& hex, bool fixPositions = false)
    {
        return Read(Signature + hex, fixPositions);
    }

    std::vector<RECORD> Records() { return RecordsOf(list.Table(false)); }

    std::vector<int> Positions()
    {
        std::vector<int> positions;
        for (RECORD const& record : Records())
            positions.push_back(record.pos);
        return positions;
    }

    SETMULTIPAR_LIST list{false};
};

// A cursor over bytes in hexadecimal.
class Cursor
{
public:
    explicit Cursor(std::string const& hex) : m_bytes(BytesOf(hex)), m_cursor(m_bytes.Data(), m_bytes.Size())
    {
    }
    IMPORT* operator->() { return &m_cursor; }

private:
    ExactBytes m_bytes;
    IMPORT m_cursor;
};

// The words that taking from such a cursor throws.
template <typename F>
std::string WordsOf(std::string const& hex, F take)
{
    Cursor cursor(hex);
    try
    {
        take(cursor);
    }
    catch (char const* words)
    {
        return words;
    }
    return "nothing thrown";
}

std::string Key(Cursor& cursor, unsigned long size, bool compressed)
{
    std::string key = "before";
    cursor->GetKeyOpt(key, size, compressed);
    return key;
}

unsigned long long BitsOf(double value) { return std::bit_cast<unsigned long long>(value); }
}  // namespace

// The cursor.

TEST(Cursor, HasData_WhileBytesAreLeft)
{
    EXPECT_FALSE(Cursor("")->HasData());
    Cursor cursor("01 02");
    EXPECT_TRUE(cursor->HasData());
    cursor->GetByte();
    EXPECT_TRUE(cursor->HasData());
    cursor->GetByte();
    EXPECT_FALSE(cursor->HasData());
}

TEST(Cursor, GetByte_IsUnsigned) { EXPECT_EQ(Cursor("FF")->GetByte(), 255); }

TEST(Cursor, GetShort_IsBigEndianAndSigned)
{
    Cursor cursor("01 02 FF FE");
    short value;
    cursor->GetShort(value);
    EXPECT_EQ(value, 0x0102);
    cursor->GetShort(value);
    EXPECT_EQ(value, -2);
    EXPECT_FALSE(cursor->HasData());
}

TEST(Cursor, GetInt_IsBigEndianAndSigned)
{
    Cursor cursor("01 02 03 04 FF FF FF FE");
    int value;
    cursor->GetInt(value);
    EXPECT_EQ(value, 0x01020304);
    cursor->GetInt(value);
    EXPECT_EQ(value, -2);
    EXPECT_FALSE(cursor->HasData());
}

TEST(Cursor, GetFloat_PassesOverAnyFirstByte_ByDesign)
{
    for (char const* const marker : {"69 ", "00 ", "FF "})
    {
        Cursor cursor(marker + std::string("3F C0 00 00"));
        double value;
        cursor->GetFloat(value);
        EXPECT_EQ(value, 1.5);
        EXPECT_FALSE(cursor->HasData());
    }
}

TEST(Cursor, GetFloat_IsWidenedExactly)
{
    double value;
    Cursor("69 00 00 00 01")->GetFloat(value);
    EXPECT_EQ(value, 0x1p-149);
    Cursor("69 FF 7F FF FF")->GetFloat(value);
    EXPECT_EQ(value, -static_cast<double>(std::numeric_limits<float>::max()));
    Cursor("69 80 00 00 00")->GetFloat(value);
    EXPECT_EQ(BitsOf(value), BitsOf(-0.0));
}

TEST(Cursor, GetFloat_WhatIsNoNumber_IsTheOnePatternOfNaN)
{
    for (char const* const single :
         {"69 7F 80 00 00", "69 FF 80 00 00", "69 7F C0 00 00", "69 7F 80 00 01", "69 FF FF FF FF"})
    {
        double value;
        Cursor(single)->GetFloat(value);
        EXPECT_EQ(BitsOf(value), BitsOf(MathLib::NOT_A_DOUBLE_NUMBER)) << single;
    }
}

TEST(Cursor, GetDouble_IsBigEndian)
{
    double value;
    Cursor("3F B9 99 99 99 99 99 9A")->GetDouble(value);
    EXPECT_EQ(value, 0.1);
    Cursor("7F EF FF FF FF FF FF FF")->GetDouble(value);
    EXPECT_EQ(value, std::numeric_limits<double>::max());
}

TEST(Cursor, GetDouble_WhatIsNoNumber_IsTheOnePatternOfNaN)
{
    for (char const* const bytes : {"7F F0 00 00 00 00 00 00", "FF F0 00 00 00 00 00 00",
                                    "7F F0 00 00 00 00 00 01", "FF FF FF FF FF FF FF FF"})
    {
        double value;
        Cursor(bytes)->GetDouble(value);
        EXPECT_EQ(BitsOf(value), BitsOf(MathLib::NOT_A_DOUBLE_NUMBER)) << bytes;
    }
}

TEST(Cursor, GetPoly64_MarkerTellsTheType)
{
    PARAM_TYPE type;
    unsigned long long value;
    Cursor("64 01 02 03 04 05 06 07 08")->GetPoly64(type, value);
    EXPECT_EQ(type, PARAM_INT64);
    EXPECT_EQ(value, 0x0102030405060708u);
    Cursor("75 FF FF FF FF FF FF FF FE")->GetPoly64(type, value);
    EXPECT_EQ(type, PARAM_UNSIGNED64);
    EXPECT_EQ(value, 0xFFFFFFFFFFFFFFFEu);
}

TEST(Cursor, GetPoly64_OtherMarker_SetsTheTypeToNoneAndThrows)
{
    PARAM_TYPE type = PARAM_INT;
    for (char const* const bytes : {"65 01 02 03 04 05 06 07 08", "44 01 02 03 04 05 06 07 08"})
    {
        EXPECT_EQ(WordsOf(bytes,
                          [&](Cursor& cursor)
                          {
                              unsigned long long value;
                              cursor->GetPoly64(type, value);
                          }),
                  "Unexpected POLY64_");
        EXPECT_EQ(type, PARAM_NONE);
    }
}

struct TAKEN_TAG
{
    char const* name;
    char const* bytes;
    int itemClass;
    unsigned long size;
};
class GetTag : public testing::TestWithParam<TAKEN_TAG>
{
};
TEST_P(GetTag, GivesClassAndSize)
{
    Cursor cursor(GetParam().bytes);
    unsigned long size;
    EXPECT_EQ(cursor->GetTag(size), GetParam().itemClass);
    EXPECT_EQ(size, GetParam().size);
    EXPECT_FALSE(cursor->HasData());
}
TEST_P(GetTag, CutShort_IsTheEndOfTheData)
{
    std::string const bytes = BytesOf(GetParam().bytes);
    for (std::size_t length = 0; length < bytes.size(); ++length)
        EXPECT_EQ(WordsOf(HexOf(bytes.substr(0, length)),
                          [](Cursor& cursor)
                          {
                              unsigned long size;
                              cursor->GetTag(size);
                          }),
                  "Unexpected EOF");
}
INSTANTIATE_TEST_SUITE_P(Facts, GetTag,
                         testing::Values(TAKEN_TAG{"Zero", "00", 0x00, 0},
                                         TAKEN_TAG{"LargestShort", "6F", 0x60, 15},
                                         TAKEN_TAG{"SmallestMedium", "70 10", 0x60, 16},
                                         TAKEN_TAG{"LargestMedium", "F7 FF", 0xE0, 2047},
                                         TAKEN_TAG{"SmallestLong", "38 00 08 00", 0x20, 2048},
                                         TAKEN_TAG{"LongOfEveryByte", "99 23 45 67", 0x80, 0x1234567},
                                         TAKEN_TAG{"LargestLong", "DF FF FF FF", 0xC0, 134217727},
                                         TAKEN_TAG{"MediumThatCouldBeShort", "50 04", 0x40, 4},
                                         TAKEN_TAG{"LongThatCouldBeShort", "B8 00 00 04", 0xA0, 4},
                                         TAKEN_TAG{"LongThatCouldBeMedium", "78 00 07 FF", 0x60, 2047}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST(Cursor, GetString_TakesRawBytes)
{
    Cursor cursor("61 00 FF 62");
    std::string text = "before";
    cursor->GetString(text, 3);
    EXPECT_EQ(HexOf(text), "61 00 FF");
    cursor->GetString(text, 0);
    EXPECT_EQ(text, "");
    EXPECT_EQ(cursor->GetByte(), 'b');
}

TEST(Cursor, GetString_FalseSize_IsFoundOutBeforeAnythingIsTaken)
{
    for (unsigned long const size : {5ul, 134217727ul, std::numeric_limits<unsigned long>::max()})
        EXPECT_EQ(WordsOf("61 62 63 64",
                          [=](Cursor& cursor)
                          {
                              std::string text;
                              cursor->GetString(text, size);
                          }),
                  "Unexpected EOF");
}

TEST(Cursor, NumberCutShort_IsTheEndOfTheData)
{
    auto const words = [](std::size_t size, auto take)
    { return WordsOf(HexOf(std::string(size, 'd')), [=](Cursor& cursor) { take(cursor); }); };
    short asShort;
    int asInt;
    double asDouble;
    PARAM_TYPE type;
    unsigned long long asInteger;
    EXPECT_EQ(words(0, [](Cursor& cursor) { cursor->GetByte(); }), "Unexpected EOF");
    EXPECT_EQ(words(1, [&](Cursor& cursor) { cursor->GetShort(asShort); }), "Unexpected EOF");
    EXPECT_EQ(words(3, [&](Cursor& cursor) { cursor->GetInt(asInt); }), "Unexpected EOF");
    EXPECT_EQ(words(4, [&](Cursor& cursor) { cursor->GetFloat(asDouble); }), "Unexpected EOF");
    EXPECT_EQ(words(7, [&](Cursor& cursor) { cursor->GetDouble(asDouble); }), "Unexpected EOF");
    EXPECT_EQ(words(8, [&](Cursor& cursor) { cursor->GetPoly64(type, asInteger); }), "Unexpected EOF");
}

// Keys, behind the previous key "abcdef".

struct TAKEN_KEY
{
    char const* name;
    char const* bytes;
    char const* key;
};
class GetKeyOpt : public testing::TestWithParam<TAKEN_KEY>
{
};
TEST_P(GetKeyOpt, BuildsOnThePreviousKey)
{
    std::string const item = BytesOf(GetParam().bytes);
    Cursor cursor("61 62 63 64 65 66" + HexOf(item) + "21 01");
    EXPECT_EQ(Key(cursor, 6, false), "abcdef");
    EXPECT_EQ(Key(cursor, item.size(), true), GetParam().key);
    // It is the previous one for the next.
    EXPECT_EQ(Key(cursor, 2, false), "!\x01");
}
INSTANTIATE_TEST_SUITE_P(
    Facts, GetKeyOpt,
    testing::Values(TAKEN_KEY{"OneByte", "03 58", "abcX"}, TAKEN_KEY{"NoTail", "03", "abc"},
                    TAKEN_KEY{"AllOfIt", "06 58", "abcdefX"},
                    TAKEN_KEY{"MoreThanThereIs", "07 58", "abcdefX"},
                    TAKEN_KEY{"ByteWithMost", "7F 58", "abcdefX"}, TAKEN_KEY{"NothingShared", "00 58", "X"},
                    TAKEN_KEY{"NothingAtAll", "00", ""}, TAKEN_KEY{"TwoBytes", "80 03 58", "abcX"},
                    TAKEN_KEY{"TwoBytesWithNothingShared", "80 00 58", "X"},
                    TAKEN_KEY{"TwoBytesOfAHighValue", "81 00 58", "abcdefX"},
                    TAKEN_KEY{"TwoBytesWithMost", "BF FF", "abcdef"},
                    TAKEN_KEY{"FourBytes", "C0 00 00 03 58", "abcX"},
                    TAKEN_KEY{"FourBytesOfAHighValue", "C0 00 01 00 58", "abcdefX"},
                    TAKEN_KEY{"FourBytesOfAHigherValue", "C0 01 00 00 58", "abcdefX"},
                    TAKEN_KEY{"FourBytesOfTheHighestBits", "C1 00 00 00 58", "abcdefX"},
                    TAKEN_KEY{"FourBytesWithMost", "FF FF FF FF", "abcdef"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(GetKeyOptOf, EveryKey_IsThePreviousOneOfTheNext)
{
    Cursor cursor("61 62 02 58 02 59 61 01");
    EXPECT_EQ(Key(cursor, 2, false), "ab");
    EXPECT_EQ(Key(cursor, 2, true), "abX");
    EXPECT_EQ(Key(cursor, 2, true), "abY");
    EXPECT_EQ(Key(cursor, 1, false), "a");
    EXPECT_EQ(Key(cursor, 1, true), "a");
    EXPECT_FALSE(cursor->HasData());
}

TEST(GetKeyOptOf, LongerKeyBeforeThePreviousOne_IsForgotten)
{
    Cursor cursor("61 62 63 64 65 66 78 79 07 58");
    EXPECT_EQ(Key(cursor, 6, false), "abcdef");
    EXPECT_EQ(Key(cursor, 2, false), "xy");
    EXPECT_EQ(Key(cursor, 2, true), "xyX");
}

TEST(GetKeyOptOf, ZeroBytes_AreKept)
{
    Cursor cursor("61 00 62 02 63");
    EXPECT_EQ(HexOf(Key(cursor, 3, false)), "61 00 62");
    EXPECT_EQ(HexOf(Key(cursor, 2, true)), "61 00 63");
}

TEST(GetKeyOptOf, CutShort_Throws)
{
    auto const words = [](char const* item, unsigned long size, bool compressed = true)
    { return WordsOf(item, [=](Cursor& cursor) { Key(cursor, size, compressed); }); };
    EXPECT_EQ(words("61", 2, false), "Unexpected EOF");
    EXPECT_EQ(words("01", 2), "Unexpected EOF");
    EXPECT_EQ(words("", 0), "Unexpected EOT 1");
    EXPECT_EQ(words("80", 1), "Unexpected EOT 2");
    EXPECT_EQ(words("FF", 1), "Unexpected EOT 2");
    EXPECT_EQ(words("C0 00", 2), "Unexpected EOT 4");
    EXPECT_EQ(words("C0 00 00", 3), "Unexpected EOT 4");
}

TEST(GetKeyOptOf, BytesBehindTheItem_AreNoneOfItsNumber)
{
    auto const words = [](char const* item, unsigned long size)
    { return WordsOf(item, [=](Cursor& cursor) { Key(cursor, size, true); }); };
    EXPECT_EQ(words("01 02", 0), "Unexpected EOT 1");
    EXPECT_EQ(words("80 01", 1), "Unexpected EOT 2");
    EXPECT_EQ(words("C0 00 00 01", 3), "Unexpected EOT 4");
}

// Streams.

TEST_F(Reader, NoBytes_AreASuccess)
{
    EXPECT_TRUE(Read(""));
    EXPECT_TRUE(STICKET_BINSTREAM::Read(list, nullptr, 0, true));
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, SignatureAlone_IsASuccess)
{
    EXPECT_TRUE(Read(Signature));
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, SignatureInALongerForm_IsTaken)
{
    EXPECT_TRUE(Read("10 09 53 54 49 43 4B 45 54 5F 31 41 05"));
    EXPECT_EQ(list.Size(), 1u);
}

TEST_F(Reader, SignatureWithAByteChanged_Fails)
{
    std::string const good = BytesOf(std::string(Signature) + "01 6B 40");
    for (std::size_t at = 0; at < 10; ++at)
    {
        std::string changed = good;
        changed[at] = static_cast<char>(changed[at] ^ 1);
        EXPECT_FALSE(Read(HexOf(changed))) << at;
    }
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, SignatureWithMoreBehindIt_Fails)
{
    EXPECT_FALSE(Read("0A 53 54 49 43 4B 45 54 5F 31 00 40"));
    EXPECT_FALSE(Read("0A 53 54 49 43 4B 45 54 5F 31 32 40"));
    EXPECT_FALSE(Read("08 53 54 49 43 4B 45 54 5F 40"));
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, FirstItemOfAnotherClass_Fails)
{
    for (char const* const first : {"2A 00", "60", "40", "80", "A1", "C0", "E0"})
        EXPECT_FALSE(Read(first + std::string("09 53 54 49 43 4B 45 54 5F 31 01 6B 40"))) << first;
    EXPECT_FALSE(Read("2A 00 53 54 49 43 4B 45 54 5F 31 40"));
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, List_IsNotClearedFirst)
{
    list.SetParameter("before", 1, -1);
    EXPECT_TRUE(ReadBehindSignature("01 6B 41 02"));
    EXPECT_THAT(Records(), ElementsAre(Int("before", 1), Int("k", 2)));
}

TEST_F(Reader, ListWhoseTableWasTaken_GivesANewOne)
{
    list.SetParameter("b", 1, -1);
    list.Table(true);
    EXPECT_TRUE(ReadBehindSignature("01 61 41 02"));
    EXPECT_THAT(Records(), ElementsAre(Int("b", 1), Int("a", 2)));
}

TEST_F(Reader, EqualKeysAndValues_ShareTheirAddresses)
{
    list.SetParameter("a", 5, -1);
    for (char const* const value : {"41 05", "42 00 05", "61 74", "81 74", "45 69 3F C0 00 00",
                                    "49 64 00 20 00 00 00 00 00 01", "49 75 FF FF FF FF FF FF FF FF", "60"})
    {
        EXPECT_TRUE(ReadBehindSignature("01 61" + std::string(value) + "01 62" + value + "01 61" + value));
        SETMULTIPAR const* const last = list.Table(false) + list.Size() - 3;
        EXPECT_EQ(last[0].key, list.Table(false)->key) << value;
        EXPECT_EQ(last[2].key, list.Table(false)->key) << value;
        EXPECT_EQ(last[0].value, last[1].value) << value;
        EXPECT_EQ(last[0].value, last[2].value) << value;
    }
    EXPECT_EQ(list.Table(false)[1].value, list.Table(false)[0].value);
}

TEST_F(Reader, Error_LeavesWhatWasReadBefore)
{
    EXPECT_FALSE(ReadBehindSignature("01 6B 41 01 41 02 62 61"));
    EXPECT_THAT(Records(), ElementsAre(Int("k", 1), Int("k", 2)));
}

TEST_F(Reader, WorkedExample_IsReadAsItWasWritten)
{
    EXPECT_TRUE(ReadBehindSignature(WorkedExample));
    EXPECT_THAT(Records(), ElementsAre(Int("Job/Copies", 3), Text("Job/Name", "A4"), Double("Job/Scale", 1.5),
                                       Int("Job/Tray", 300, 0), Int("Job/Tray", -1, 1), Delete("Job/X")));
}

TEST_F(Reader, WorkedExampleWithFixedPositions_BeginsTheVectorAtTheKey)
{
    EXPECT_TRUE(ReadBehindSignature(WorkedExample, true));
    EXPECT_THAT(Records(), ElementsAre(Int("Job/Copies", 3), Text("Job/Name", "A4"), Double("Job/Scale", 1.5),
                                       Int("Job/Tray", 300, -1), Int("Job/Tray", -1, 1), Delete("Job/X")));
}

// Every value, behind the key "k".

struct VALUE_FACT
{
    char const* name;
    char const* bytes;
    RECORD record;
};
void PrintTo(VALUE_FACT const& fact, std::ostream* out) { *out << fact.name; }

class ReadValue : public testing::TestWithParam<VALUE_FACT>
{
protected:
    static bool Read(SETMULTIPAR_LIST& list, std::string const& stream)
    {
        ExactBytes const bytes(stream);
        return STICKET_BINSTREAM::Read(list, bytes.Data(), bytes.Size(), false);
    }
    std::string const stream = BytesOf(std::string(Signature) + "01 6B" + GetParam().bytes);
};
TEST_P(ReadValue, GivesTheRecord)
{
    SETMULTIPAR_LIST list(false);
    EXPECT_TRUE(Read(list, stream));
    EXPECT_THAT(RecordsOf(list.Table(false)), ElementsAre(GetParam().record));
}
TEST_P(ReadValue, CutShort_GivesNone)
{
    for (std::size_t size = 13; size < stream.size(); ++size)
    {
        SETMULTIPAR_LIST list(false);
        EXPECT_FALSE(Read(list, stream.substr(0, size)));
        EXPECT_EQ(list.Size(), 0u);
    }
}
INSTANTIATE_TEST_SUITE_P(
    Facts, ReadValue,
    testing::Values(VALUE_FACT{"Zero", "40", Int("k", 0)}, VALUE_FACT{"LargestInt8", "41 7F", Int("k", 127)},
                    VALUE_FACT{"SmallestInt8", "41 80", Int("k", -128)},
                    VALUE_FACT{"ZeroInOneByte", "41 00", Int("k", 0)},
                    VALUE_FACT{"LargestInt16", "42 7F FF", Int("k", 32767)},
                    VALUE_FACT{"SmallestInt16", "42 80 00", Int("k", -32768)},
                    VALUE_FACT{"OneInTwoBytes", "42 00 01", Int("k", 1)},
                    VALUE_FACT{"LargestInt32", "44 7F FF FF FF", Int("k", 2147483647)},
                    VALUE_FACT{"SmallestInt32", "44 80 00 00 00", Int("k", -2147483647 - 1)},
                    VALUE_FACT{"TagOfTwoBytes", "50 02 01 2C", Int("k", 300)},
                    VALUE_FACT{"TagOfFourBytes", "58 00 00 02 01 2C", Int("k", 300)},
                    VALUE_FACT{"Single", "45 69 3F C0 00 00", Double("k", 1.5)},
                    VALUE_FACT{"SingleWithAnotherMarker_ByDesign", "45 00 3F C0 00 00", Double("k", 1.5)},
                    VALUE_FACT{"SingleOfAnInteger", "45 69 40 00 00 00", Double("k", 2.0)},
                    VALUE_FACT{"Double", "48 3F B9 99 99 99 99 99 9A", Double("k", 0.1)},
                    VALUE_FACT{"DoubleOfAnInteger", "48 40 00 00 00 00 00 00 00", Double("k", 2.0)},
                    VALUE_FACT{"Int64", "49 64 00 20 00 00 00 00 00 01", Int64("k", 9007199254740993)},
                    VALUE_FACT{"SmallInt64", "49 64 00 00 00 00 00 00 00 05", Int64("k", 5)},
                    VALUE_FACT{"NegativeInt64", "49 64 FF FF FF FF FF FF FF FF", Int64("k", -1)},
                    VALUE_FACT{"Unsigned64", "49 75 FF FF FF FF FF FF FF FF",
                               Unsigned64("k", 0xFFFFFFFFFFFFFFFF)},
                    VALUE_FACT{"SmallUnsigned64", "49 75 00 00 00 00 00 00 00 05", Unsigned64("k", 5)},
                    VALUE_FACT{"Text", "63 61 62 63", Text("k", "abc")},
                    VALUE_FACT{"EmptyText", "60", Text("k", "")},
                    VALUE_FACT{"TextWithAZeroByte_ByDesign", "65 61 62 00 63 64", Text("k", "ab")},
                    VALUE_FACT{"TextThatBeginsWithAZeroByte_ByDesign", "62 00 61", Text("k", "")},
                    VALUE_FACT{"Bytes", "83 00 FF 00", Bytes("k", std::string("\0\xFF\0", 3))},
                    VALUE_FACT{"EmptyBytes", "80", Bytes("k", "")}, VALUE_FACT{"Deletion", "C0", Delete("k")},
                    VALUE_FACT{"DeletionWithASize_ByDesign", "CF", Delete("k")},
                    VALUE_FACT{"DeletionWithALargeSize_ByDesign", "DF FF FF FF", Delete("k")}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST_F(Reader, EmptyText_IsNotNull)
{
    EXPECT_TRUE(ReadBehindSignature("01 6B 60"));
    EXPECT_NE(list.Table(false)->value, nullptr);
}

TEST_F(Reader, EmptyBytes_AreAnInvalidBinString)
{
    EXPECT_TRUE(ReadBehindSignature("01 6B 80"));
    ASSERT_NE(list.Table(false)->value, nullptr);
    EXPECT_FALSE(static_cast<BIN_STRING const*>(list.Table(false)->value)->valid());
}

TEST_F(Reader, WhatIsNoNumber_PointsAtTheOneConstant)
{
    EXPECT_TRUE(ReadBehindSignature("01 6B 48 7F F8 00 00 00 00 00 00 48 7F F0 00 00 00 00 00 00 "
                                    "48 FF F0 00 00 00 00 00 00 45 69 7F 80 00 00 45 69 FF C0 00 01"));
    ASSERT_EQ(list.Size(), 5u);
    for (unsigned long i = 0; i < list.Size(); ++i)
    {
        EXPECT_EQ(list.Table(false)[i].type, PARAM_DOUBLE);
        EXPECT_EQ(list.Table(false)[i].value, &MathLib::NOT_A_DOUBLE_NUMBER) << i;
    }
}

TEST_F(Reader, NumberOfAnUnknownSize_Fails)
{
    for (int const size : {3, 6, 7, 10, 11, 12, 13, 14, 15})
        EXPECT_FALSE(ReadBehindSignature("01 6B" + HexOf(std::string(1, static_cast<char>(0x40 + size))) +
                                         HexOf(std::string(20, '\0'))))
            << size;
    EXPECT_FALSE(ReadBehindSignature("01 6B 50 10" + HexOf(std::string(20, '\0'))));
    // Sixteen more than a good size, and a good size in the low bits of a large one.
    EXPECT_FALSE(ReadBehindSignature("01 6B 50 11" + HexOf(std::string(20, '\0'))));
    EXPECT_FALSE(ReadBehindSignature("01 6B 5C 00 00 01" + HexOf(std::string(20, '\0'))));
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, NumberOf64BitsWithAnotherMarker_Fails)
{
    EXPECT_FALSE(ReadBehindSignature("01 6B 49 69 00 00 00 00 00 00 00 05"));
    EXPECT_EQ(list.Size(), 0u);
}

TEST_F(Reader, ItemOfTheUnusedClass_Fails)
{
    for (char const* const item : {"E0", "E5 00 00 00 00 00", "F0 00", "FF FF FF FF"})
        EXPECT_FALSE(ReadBehindSignature("01 6B 41 01" + std::string(item))) << item;
    EXPECT_EQ(list.Size(), 4u);  // the value before each
}

// Keys.

TEST_F(Reader, FirstValueWithoutAKey_IsFiledUnderTheSignature_ByDesign)
{
    EXPECT_TRUE(ReadBehindSignature("41 05"));
    EXPECT_THAT(Records(), ElementsAre(Int("STICKET_1", 5)));
}

TEST_F(Reader, FirstKeyThatIsCompressed_BuildsOnTheSignature_ByDesign)
{
    EXPECT_TRUE(ReadBehindSignature("22 02 58 41 05"));
    EXPECT_THAT(Records(), ElementsAre(Int("STX", 5)));
}

TEST_F(Reader, EmptyKey_IsAKey)
{
    EXPECT_TRUE(ReadBehindSignature("00 41 05"));
    EXPECT_THAT(Records(), ElementsAre(Int("", 5)));
}

TEST_F(Reader, KeyWithAZeroByte_IsCutInTheListAlone_ByDesign)
{
    EXPECT_TRUE(ReadBehindSignature("03 61 00 62 41 01 22 03 63 41 02 21 01 41 03"));
    EXPECT_THAT(Records(), ElementsAre(Int("a", 1), Int("a", 2), Int("a", 3)));
}

TEST_F(Reader, KeyThatSharesLessThanTheZeroByte_IsWhole)
{
    // "ab\0c", then "ab" and "d", then all of that and a zero byte of its own.
    EXPECT_TRUE(ReadBehindSignature("04 61 62 00 63 41 01 22 02 64 41 02 23 03 00 65 41 03"));
    EXPECT_THAT(Records(), ElementsAre(Int("ab", 1), Int("abd", 2), Int("abd", 3)));
}

TEST_F(Reader, SharedBytesBehindAZeroByte_AreNotLost)
{
    // "a\0b", then nothing of it but its first byte, then that and a tail: the reader counts all bytes.
    EXPECT_TRUE(ReadBehindSignature("03 62 00 61 40 22 03 63 40 21 01 40"));
    EXPECT_THAT(Records(), ElementsAre(Int("b", 0), Int("b", 0), Int("b", 0)));
}

TEST_F(Reader, CompressedKeysWithoutValues_BuildOnEachOther)
{
    EXPECT_TRUE(ReadBehindSignature("03 61 62 63 22 02 58 22 03 59 41 01"));
    EXPECT_THAT(Records(), ElementsAre(Int("abXY", 1)));
}

TEST_F(Reader, CompressedKeyCutShort_Fails)
{
    for (char const* const key : {"20", "21 80", "22 C0 00", "23 C0 00 00"})
    {
        EXPECT_FALSE(ReadBehindSignature("01 6B 41 01" + std::string(key) + "41 02")) << key;
        EXPECT_THAT(Records(), ElementsAre(Int("k", 1)));
        list.Clear();
    }
}

// Positions.

TEST_F(Reader, Position_RunsOnFromZeroAndStaysBelow)
{
    EXPECT_TRUE(ReadBehindSignature("01 6B 40 40 A2 40 41 01 60 80 C0 48 00 00 00 00 00 00 00 00 A0 40 40"));
    EXPECT_THAT(Positions(), ElementsAre(-1, -1, 0, 1, 2, 3, 4, 5, -2, -2));
}

TEST_F(Reader, Position_OfANumberOf64Bits_RunsOnToo)
{
    EXPECT_TRUE(ReadBehindSignature("01 6B A2 49 64 00 00 00 00 00 00 00 05 45 69 00 00 00 00 40"));
    EXPECT_THAT(Positions(), ElementsAre(0, 1, 2));
}

TEST_F(Reader, Position_HasEveryFormOfATag)
{
    EXPECT_TRUE(
        ReadBehindSignature("01 6B A0 40 A1 40 AF 40 B0 10 40 B7 FF 40 B8 00 08 00 40 BF FF FF FF 40 40"));
    EXPECT_THAT(Positions(), ElementsAre(-2, -1, 13, 14, 2045, 2046, 134217725, 134217726));
}

TEST_F(Reader, Position_CarriesOverToTheNextKey_ByDesign)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A2 40 40 01 62 40"));
    EXPECT_THAT(Positions(), ElementsAre(0, 1, 2));
}

TEST_F(Reader, Position_TheLastOneTold_Counts)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A2 A7 A4 40 40"));
    EXPECT_THAT(Positions(), ElementsAre(2, 3));
}

TEST_F(Reader, Position_BeforeTheKey_CountsAsWell)
{
    EXPECT_TRUE(ReadBehindSignature("A2 01 61 40", true));
    EXPECT_THAT(Records(), ElementsAre(Int("a", 0, -1)));
}

TEST_F(Reader, FixedPosition_ZeroOrAppendingBehindAKey_BecomesTheKey_ByDesign)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A2 40 40 40 01 62 A0 40 40 01 63 A2 40", true));
    EXPECT_THAT(Positions(), ElementsAre(-1, 1, 2, -1, -2, -1));
}

TEST_F(Reader, FixedPosition_OtherPositions_StayBehindAKey)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A1 40 01 62 A3 40 40 01 63 40", true));
    EXPECT_THAT(Positions(), ElementsAre(-1, 1, 2, 3));
}

TEST_F(Reader, FixedPosition_OnlyTheFirstValueBehindAKey_IsFixed)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A1 40 A2 40 A2 40", true));
    EXPECT_THAT(Positions(), ElementsAre(-1, 0, 0));
}

TEST_F(Reader, FixedPosition_KeyThatIsToldAgain_IsAKeyAgain)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A2 40 01 61 A2 40", true));
    EXPECT_THAT(Positions(), ElementsAre(-1, -1));
}

TEST_F(Reader, FixedPosition_ValueBehindTheSignature_IsFixedToo)
{
    EXPECT_TRUE(ReadBehindSignature("A2 40 40", true));
    EXPECT_THAT(Records(), ElementsAre(Int("STICKET_1", 0, -1), Int("STICKET_1", 0, 1)));
}

TEST_F(Reader, FixedPosition_DeletionStandsWhereItSaysAndEndsTheFixing_ByDesign)
{
    EXPECT_TRUE(ReadBehindSignature("01 61 A2 C0 A2 40", true));
    EXPECT_THAT(Records(), ElementsAre(Delete("a", 0), Int("a", 0, 0)));
}

TEST_F(Reader, FixedPosition_EveryKindOfValue_IsFixed)
{
    for (char const* const value :
         {"40", "41 01", "42 01 2C", "44 00 00 80 00", "45 69 3F C0 00 00", "48 3F B9 99 99 99 99 99 9A",
          "49 64 00 20 00 00 00 00 00 01", "61 61", "81 61"})
    {
        EXPECT_TRUE(ReadBehindSignature("01 61 A2" + std::string(value) + value, true));
        EXPECT_THAT(Positions(), ElementsAre(-1, 1)) << value;
        list.Clear();
    }
}

TEST(FixPos, Table)
{
    struct
    {
        bool fixNext;
        int pos;
        int reported;
        int next;
    } const facts[] = {{false, -2, -2, -2}, {false, -1, -1, -1}, {false, 0, 0, 1},
                       {false, 5, 5, 6},    {true, -2, -1, -2},  {true, -1, -1, -1},
                       {true, 0, -1, 1},    {true, 1, 1, 2},     {true, 5, 5, 6}};
    for (auto const& fact : facts)
    {
        bool fixNext = fact.fixNext;
        int pos = fact.pos;
        EXPECT_EQ(STICKET_BINSTREAM::FixPos(fixNext, pos), fact.reported) << fact.fixNext << ' ' << fact.pos;
        EXPECT_EQ(pos, fact.next) << fact.fixNext << ' ' << fact.pos;
        EXPECT_FALSE(fixNext);
    }
}

// What comes back of a value that was written.

struct TYPE_FACT
{
    char const* name;
    RECORD written;
    RECORD read;
};
void PrintTo(TYPE_FACT const& fact, std::ostream* out) { *out << fact.name; }

class TypeOnTheWay : public testing::TestWithParam<TYPE_FACT>
{
};
TEST_P(TypeOnTheWay, IsTheSmallestThatHoldsTheValue_ByDesign)
{
    TABLE table({GetParam().written});
    std::string stream;
    STICKET_BINSTREAM::Write(stream, table.Records(), 0);
    ExactBytes const bytes(stream);
    SETMULTIPAR_LIST list(false);
    EXPECT_TRUE(STICKET_BINSTREAM::Read(list, bytes.Data(), bytes.Size(), false));
    EXPECT_THAT(RecordsOf(list.Table(false)), ElementsAre(GetParam().read));
}
INSTANTIATE_TEST_SUITE_P(
    Facts, TypeOnTheWay,
    testing::Values(
        TYPE_FACT{"UnsignedOf31Bits", Unsigned("k", 2147483647), Int("k", 2147483647)},
        TYPE_FACT{"UnsignedOf32Bits", Unsigned("k", 2147483648), Double("k", 2147483648.0)},
        TYPE_FACT{"SmallInt64", Int64("k", -5), Int("k", -5)},
        TYPE_FACT{"Int64Of53Bits", Int64("k", -9007199254740992), Double("k", -9007199254740992.0)},
        TYPE_FACT{"Int64Past53Bits", Int64("k", -9007199254740993), Int64("k", -9007199254740993)},
        TYPE_FACT{"SmallUnsigned64", Unsigned64("k", 5), Int("k", 5)},
        TYPE_FACT{"Unsigned64Of53Bits", Unsigned64("k", 9007199254740992), Double("k", 9007199254740992.0)},
        TYPE_FACT{"Unsigned64Past53Bits", Unsigned64("k", 9007199254740993), Int64("k", 9007199254740993)},
        TYPE_FACT{"Unsigned64Below63Bits", Unsigned64("k", 0x7FFFFFFFFFFFFFFF),
                  Int64("k", 0x7FFFFFFFFFFFFFFF)},
        TYPE_FACT{"Unsigned64Of64Bits", Unsigned64("k", 1ull << 63), Unsigned64("k", 1ull << 63)},
        TYPE_FACT{"IntegralDouble", Double("k", -7.0), Int("k", -7)},
        TYPE_FACT{"Fraction", Double("k", 0.1), Double("k", 0.1)},
        TYPE_FACT{"LargeDouble", Double("k", 1e300), Double("k", 1e300)},
        TYPE_FACT{"MinusZero", Double("k", -0.0), Int("k", 0)},
        TYPE_FACT{"Infinity", Double("k", std::numeric_limits<double>::infinity()), Double("k", NotANumber)},
        TYPE_FACT{"AppendedValue", Int("k", 5, -2), Int("k", 5, -2)},
        TYPE_FACT{"NoKey", Int("", 5), Int("STICKET_1", 5)}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST_F(Reader, NullTextOnTheWay_BecomesTheEmptyText)
{
    STICKET_BINSTREAM::WRITE writer(0);
    EXPECT_TRUE(writer.SetParameter("k", PARAM_STRING, nullptr, -1));
    std::string stream;
    writer.Swap(stream);
    EXPECT_TRUE(Read(HexOf(stream)));
    EXPECT_THAT(Records(), ElementsAre(Text("k", "")));
}

TEST(Fsize, CountsTheBytesAndGoesBackToTheStart)
{
    FILE* const file = std::tmpfile();
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(STICKET_BINSTREAM::fsize(file), 0u);
    std::fputs("twelve bytes", file);
    EXPECT_EQ(STICKET_BINSTREAM::fsize(file), 12u);
    EXPECT_EQ(std::fgetc(file), 't');
    EXPECT_EQ(STICKET_BINSTREAM::fsize(file), 12u);
    EXPECT_EQ(std::ftell(file), 0);
    std::fclose(file);
}

TEST(Fsize, OfAPipe_IsZero)
{
    FILE* const pipe = popen("echo text", "r");
    ASSERT_NE(pipe, nullptr);
    EXPECT_EQ(STICKET_BINSTREAM::fsize(pipe), 0u);
    pclose(pipe);
}
