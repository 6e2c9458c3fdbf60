#include "standin/server/store/ChangeRecord.h"

#include "tests/store/Changes.h"
#include "tests/support/HexText.h"
#include <climits>
#include <gtest/gtest.h>
#include <limits>
#include <random>

using namespace standin;

namespace
{
constexpr TicketAddress Job{3, 1};
int anything = 0;

std::string RecordOf(TicketChange const& change)
{
    std::string record;
    AppendChangeRecord(record, change);
    return record;
}

CHANGE Nothing() { return WriteTo(Job, {}); }

// Reads bytes that lie in a heap block of exactly their size. True if they were taken, false if they were
// refused; what was taken has to be the one form of its change.
bool IsTaken(std::string_view bytes)
{
    ExactBytes const record(bytes);
    try
    {
        TicketChange const change = ReadChangeRecord(
            TicketChange::Write, Job, {static_cast<char const*>(record.Data()), record.Size()});
        EXPECT_EQ(HexOf(RecordOf(change)), HexOf(bytes));
        return true;
    }
    catch (StoreError const&)
    {
        return false;
    }
}

void ExpectSame(TicketChange const& left, TicketChange const& right)
{
    EXPECT_EQ(left.kind, right.kind);
    EXPECT_EQ(left.address, right.address);
    ASSERT_EQ(left.parameters.size(), right.parameters.size());
    for (std::size_t i = 0; i < left.parameters.size(); ++i)
        ASSERT_TRUE(SameParameter(left.parameters[i], right.parameters[i])) << i;
}

class RandomChange
{
public:
    explicit RandomChange(unsigned seed) : m_random(seed) {}

    CHANGE Next(int most)
    {
        CHANGE change = Nothing();
        for (int left = Below(most + 1); left > 0; --left)
            std::move(change).Put(Text(12), Below(5) == 0 ? -1 : Pos(), Value(), Below(2) == 0);
        return change;
    }

private:
    int Below(int limit) { return static_cast<int>(m_random() % static_cast<unsigned>(limit)); }
    int Pos() { return static_cast<int>(m_random() >> (33 + Below(31))); }
    std::string_view Text(int most)
    {
        m_text.clear();
        for (int size = Below(most + 1); size > 0; --size)
            m_text.push_back(static_cast<char>(m_random()));
        return m_text;
    }
    StoredValue Value()
    {
        auto const bits = static_cast<long long>(m_random() >> Below(64));
        switch (Below(8))
        {
        case 0:
            return Integer(PARAM_INT, static_cast<int>(bits));
        case 1:
            return Integer(PARAM_INT64, bits);
        case 2:
            return Integer(PARAM_UNSIGNED, static_cast<unsigned>(bits));
        case 3:
            return Integer(PARAM_UNSIGNED64, bits);
        case 4:
            return Double(std::bit_cast<double>(m_random()));
        case 5:
            return {};
        default:
            m_value.assign(static_cast<std::size_t>(Below(300)), static_cast<char>(bits));
            return Bytes(Below(2) == 0 ? PARAM_STRING : PARAM_BINSTRING, m_value);
        }
    }

    std::mt19937_64 m_random;
    std::string m_text;
    std::string m_value;
};
}  // namespace

// name: of the test; change: what it is about; bytes: its record.
struct RECORD_FACT
{
    char const* name;
    CHANGE (*change)();
    char const* bytes;
};
class ChangeRecordBytes : public testing::TestWithParam<RECORD_FACT>
{
};

TEST_P(ChangeRecordBytes, AreWritten) { EXPECT_EQ(HexOf(RecordOf(GetParam().change())), GetParam().bytes); }

TEST_P(ChangeRecordBytes, AreRead)
{
    TicketChange const read = ReadChangeRecord(TicketChange::Write, Job, BytesOf(GetParam().bytes));
    ExpectSame(read, ReadChangeRecord(TicketChange::Write, Job, RecordOf(GetParam().change())));
    EXPECT_EQ(HexOf(RecordOf(read)), GetParam().bytes);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, ChangeRecordBytes,
    testing::Values(
        RECORD_FACT{"Nothing", [] { return Nothing(); }, "01 00"},
        RECORD_FACT{"Int", [] { return Nothing().Put("K", 0, -2); }, "01 01 12 00 01 4B FE FF FF FF"},
        RECORD_FACT{"WholeKey", [] { return Nothing().Put("K", -1, 5); }, "01 01 32 01 4B 05 00 00 00"},
        RECORD_FACT{"WholeKeyAlone", [] { return Nothing().Put("K", -1, Integer(PARAM_INT, 5), false); },
                    "01 01 22 01 4B 05 00 00 00"},
        RECORD_FACT{"Deletion", [] { return Nothing().Drop("Key"); }, "01 01 30 03 4B 65 79"},
        RECORD_FACT{"DeletedValue", [] { return Nothing().Drop("K", 7); }, "01 01 10 07 01 4B"},
        RECORD_FACT{"PointerBecomesDeletion", [] { return Nothing().Put("K", 7, Pointer(&anything)); },
                    "01 01 10 07 01 4B"},
        RECORD_FACT{"LargestPosInOneByte", [] { return Nothing().Drop("", 127); }, "01 01 10 7F 00"},
        RECORD_FACT{"SmallestPosInTwoBytes", [] { return Nothing().Drop("", 128); }, "01 01 10 80 01 00"},
        RECORD_FACT{"LargestPos", [] { return Nothing().Drop("", INT_MAX); }, "01 01 10 FF FF FF FF 07 00"},
        RECORD_FACT{"Unsigned", [] { return Nothing().Put("", 0, Integer(PARAM_UNSIGNED, 0xFFFFFFFF)); },
                    "01 01 18 00 00 FF FF FF FF"},
        RECORD_FACT{"Int64", [] { return Nothing().Put("", 0, Integer(PARAM_INT64, LLONG_MIN)); },
                    "01 01 17 00 00 00 00 00 00 00 00 00 80"},
        RECORD_FACT{"Unsigned64", [] { return Nothing().Put("", 0, Integer(PARAM_UNSIGNED64, -1)); },
                    "01 01 19 00 00 FF FF FF FF FF FF FF FF"},
        RECORD_FACT{"NegativeZero", [] { return Nothing().Put("", 0, Double(-0.0)); },
                    "01 01 13 00 00 00 00 00 00 00 00 00 80"},
        RECORD_FACT{"NanWithPayload",
                    [] { return Nothing().Put("", 0, Double(std::bit_cast<double>(0xFFF8000000000123u))); },
                    "01 01 13 00 00 23 01 00 00 00 00 F8 FF"},
        RECORD_FACT{"EmptyText", [] { return Nothing().Put("", 0, Bytes(PARAM_STRING, "")); },
                    "01 01 14 00 00 00"},
        RECORD_FACT{"ZeroBytes",
                    []
                    { return Nothing().Put("K", 0, Bytes(PARAM_BINSTRING, std::string_view("\0a\0", 3))); },
                    "01 01 15 00 01 4B 03 00 61 00"},
        RECORD_FACT{"TwoInOrder", [] { return Nothing().Drop("B").Put("A", 0, 1); },
                    "01 02 30 01 42 12 00 01 41 01 00 00 00"}),
    [](auto const& fact) { return std::string(fact.param.name); });

// What follows the version byte; each differs from a sound record in one thing.
struct BAD_RECORD
{
    char const* name;
    char const* bytes;
};
class BadChangeRecord : public testing::TestWithParam<BAD_RECORD>
{
};

TEST_P(BadChangeRecord, IsRefused) { EXPECT_FALSE(IsTaken(BytesOf(GetParam().bytes))); }

INSTANTIATE_TEST_SUITE_P(
    Facts, BadChangeRecord,
    testing::Values(BAD_RECORD{"Empty", ""}, BAD_RECORD{"OtherVersion", "02 00"}, BAD_RECORD{"NoCount", "01"},
                    BAD_RECORD{"BytesBehind", "01 00 00"}, BAD_RECORD{"CountTooLarge", "01 02 30 00"},
                    BAD_RECORD{"CountTooSmall", "01 01 30 00 30 00"},
                    BAD_RECORD{"HugeCount", "01 FF FF FF FF FF FF FF FF FF 01"},
                    BAD_RECORD{"HugeKey", "01 01 30 FF FF FF FF FF FF FF FF FF 01"},
                    BAD_RECORD{"HugeText", "01 01 14 00 00 FF FF FF FF 7F"},
                    BAD_RECORD{"NumberPast64Bits", "01 FF FF FF FF FF FF FF FF FF 02"},
                    BAD_RECORD{"NumberWithoutEnd", "01 80 80 80 80 80 80 80 80 80 80 80"},
                    BAD_RECORD{"NumberInALongerForm", "01 80 00"},
                    BAD_RECORD{"PosPastTheLargest", "01 01 10 80 80 80 80 08 00"},
                    BAD_RECORD{"Pointer", "01 01 11 00 00"}, BAD_RECORD{"Count", "01 01 16 00 00 00"},
                    BAD_RECORD{"UnknownType", "01 01 1A 00 00"}, BAD_RECORD{"UnknownBit", "01 01 70 00"},
                    BAD_RECORD{"ShortInt", "01 01 12 00 00 01 02 03"},
                    BAD_RECORD{"ShortDouble", "01 01 13 00 00 01 02 03 04 05 06 07"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(ChangeRecord, KindAndAddress_AreTheCallers)
{
    for (auto const kind : {TicketChange::Write, TicketChange::Create, TicketChange::Delete})
    {
        TicketChange const change = ReadChangeRecord(kind, {17, 0xFFFFFF}, BytesOf("01 00"));
        EXPECT_EQ(change.kind, kind);
        EXPECT_EQ(change.address, (TicketAddress{17, 0xFFFFFF}));
        EXPECT_EQ(change.owner, TicketChange::Owner::Unchanged);
    }
}

TEST(ChangeRecord, UnknownKind_IsRefused)
{
    for (int const kind : {-1, 0, 2, 3, 6})
        EXPECT_THROW(ReadChangeRecord(kind, Job, BytesOf("01 00")), StoreError) << kind;
}

TEST(ChangeRecord, WhatNoTicketCanHold_IsNotWritten)
{
    EXPECT_THROW(RecordOf(Nothing().Put("K", 0, Integer(PARAM_COUNT, 1))), StoreError);
    EXPECT_THROW(RecordOf(Nothing().Put("K", 0, Integer(static_cast<PARAM_TYPE>(10), 1))), StoreError);
    EXPECT_THROW(RecordOf(Nothing().Put("K", 0, Integer(static_cast<PARAM_TYPE>(-1), 1))), StoreError);
    EXPECT_THROW(RecordOf(Nothing().Put("K", -2, 1)), StoreError);
}

TEST(ChangeRecord, IsAppended)
{
    std::string record = "x";
    AppendChangeRecord(record, Nothing());
    EXPECT_EQ(HexOf(record), "78 01 00");
}

TEST(ChangeRecord, RandomChanges_ComeBack)
{
    RandomChange random(20250114);
    std::size_t parameters = 0;
    for (int round = 0; round < 2000; ++round)
    {
        CHANGE const change = random.Next(20);
        parameters += change.parameters.size();
        ExpectSame(ReadChangeRecord(TicketChange::Write, Job, RecordOf(change)), change);
    }
    EXPECT_GT(parameters, 10000u);
}

TEST(ChangeRecord, EveryPrefix_IsRefused)
{
    RandomChange random(1);
    for (int round = 0; round < 50; ++round)
    {
        std::string const record = RecordOf(random.Next(8));
        for (std::size_t size = 0; size < record.size(); ++size)
            ASSERT_FALSE(IsTaken(std::string_view(record).substr(0, size))) << round << " " << size;
        ASSERT_TRUE(IsTaken(record));
    }
}

TEST(ChangeRecord, EveryFlippedBit_IsRefusedOrReadsAsAnotherChange)
{
    RandomChange random(2);
    int taken = 0;
    int refused = 0;
    for (int round = 0; round < 50; ++round)
    {
        std::string record = RecordOf(random.Next(5));
        for (std::size_t bit = 0; bit < record.size() * 8; ++bit)
        {
            auto const mask = static_cast<char>(1 << (bit % 8));
            record[bit / 8] = static_cast<char>(record[bit / 8] ^ mask);
            ++(IsTaken(record) ? taken : refused);
            record[bit / 8] = static_cast<char>(record[bit / 8] ^ mask);
        }
    }
    EXPECT_GT(taken, 0);
    EXPECT_GT(refused, 0);
}
