// Random tables, written and read by the library and by the oracle.
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/support/HexText.h"
#include "tests/support/StreamOracle.h"
#include <bit>
#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <random>

using StreamOracle::KEYS;
using StreamOracle::RECORD;

namespace
{
class Dice
{
public:
    explicit Dice(unsigned int seed) : m_random(seed) {}

    unsigned int Below(unsigned int limit) { return static_cast<unsigned int>(m_random() % limit); }
    bool OneIn(unsigned int n) { return Below(n) == 0; }
    unsigned long long Bits() { return m_random(); }

    // Next to a power of two, of either sign, or anything.
    long long Integer()
    {
        if (OneIn(3))
            return static_cast<long long>(Bits() >> Below(64));
        static constexpr unsigned int borders[] = {0, 1, 7, 8, 15, 16, 24, 31, 32, 52, 53, 54, 62, 63};
        unsigned long long const border = 1ull << borders[Below(std::size(borders))];
        unsigned long long const near = border + Below(5) - 2;
        return static_cast<long long>(OneIn(2) ? near : 0 - near);
    }

    double Real()
    {
        using LIMITS = std::numeric_limits<double>;
        static constexpr double special[] = {0.0,
                                             -0.0,
                                             0.1,
                                             0.5,
                                             -1.5,
                                             LIMITS::quiet_NaN(),
                                             LIMITS::infinity(),
                                             -LIMITS::infinity(),
                                             LIMITS::max(),
                                             LIMITS::lowest(),
                                             LIMITS::min(),
                                             LIMITS::denorm_min(),
                                             std::numeric_limits<float>::max(),
                                             std::numeric_limits<float>::denorm_min(),
                                             16777217.0,
                                             2147483647.5,
                                             -2147483648.5};
        if (OneIn(3))
            return special[Below(std::size(special))];
        if (OneIn(3))
            return static_cast<double>(Integer());
        if (OneIn(2))
            return static_cast<double>(std::bit_cast<float>(static_cast<unsigned int>(Bits())));
        return std::bit_cast<double>(Bits());
    }

    // From a small alphabet, so that beginnings are often shared. Now and then long enough for the next form
    // of a tag or of a number of shared bytes.
    std::string Text(unsigned int size)
    {
        std::string text;
        while (text.size() < size)
            text += static_cast<char>('a' + Below(2));
        return text;
    }

    std::string Key(std::string const& previous)
    {
        std::string const beginning =
            previous.substr(0, Below(static_cast<unsigned int>(previous.size()) + 1));
        unsigned int const size = OneIn(200) ? 100 + Below(100) : OneIn(10) ? 0 : Below(6);
        return (OneIn(4) ? "" : beginning) + Text(size);
    }

    std::vector<RECORD> Table()
    {
        std::vector<RECORD> records;
        std::string key;
        int pos = -1;
        for (unsigned int left = Below(9); left > 0; --left)
        {
            if (!OneIn(3))
                key = Key(key);
            if (!OneIn(3))
                pos = OneIn(20) ? 13 + static_cast<int>(Below(3)) : static_cast<int>(Below(5)) - 2;
            records.push_back(Record(key, pos));
            if (OneIn(3) && pos >= 0)
                ++pos;
        }
        return records;
    }

private:
    RECORD Record(std::string const& key, int pos)
    {
        RECORD record = OfType(Below(13), key, pos);
        if (OneIn(15))
            record.isNull = !record.isNull;
        return record;
    }

    RECORD OfType(unsigned int type, std::string const& key, int pos)
    {
        switch (type)
        {
        case PARAM_NONE:
            return StreamOracle::Delete(key, pos);
        case PARAM_DOUBLE:
            return StreamOracle::Double(key, Real(), pos);
        case PARAM_STRING:
            return StreamOracle::Text(key, Text(OneIn(50) ? 2040 + Below(16) : Below(20)), pos);
        case PARAM_BINSTRING:
        {
            std::string bytes(OneIn(50) ? 2040 + Below(16) : Below(20), '\0');
            for (char& byte : bytes)
                byte = static_cast<char>(Below(3));
            return StreamOracle::Bytes(key, bytes, pos);
        }
        case PARAM_INT64:
            return StreamOracle::Int64(key, Integer(), pos);
        case PARAM_UNSIGNED:
            return StreamOracle::Unsigned(key, static_cast<unsigned int>(Integer()), pos);
        case PARAM_UNSIGNED64:
            return StreamOracle::Unsigned64(key, static_cast<unsigned long long>(Integer()), pos);
        default:  // and the types that no stream can hold
            RECORD record = StreamOracle::Int(key, static_cast<int>(Integer()), pos);
            record.type = static_cast<PARAM_TYPE>(type);
            return record;
        }
    }

    std::mt19937_64 m_random;
};

std::vector<RECORD> Read(std::string const& stream, bool fixPositions)
{
    ExactBytes const bytes(stream);
    SETMULTIPAR_LIST list(false);
    EXPECT_TRUE(STICKET_BINSTREAM::Read(list, bytes.Data(), bytes.Size(), fixPositions));
    return StreamOracle::RecordsOf(list.Table(false));
}

void ExpectWritten(std::vector<RECORD> const& records, KEYS keys, std::string const& expected)
{
    StreamOracle::TABLE table(records, keys);
    std::string stream;
    unsigned long const size = STICKET_BINSTREAM::Write(stream, table.Records(), 0);
    ASSERT_EQ(size, stream.size());
    for (std::size_t i = 0; i < records.size(); ++i)
        ASSERT_EQ(table.Records()[i].ok, StreamOracle::IsWritable(records[i])) << i;
    ASSERT_TRUE(stream == expected) << HexOf(stream) << "\ninstead of\n" << HexOf(expected);
}

void ExpectTheSame(std::vector<RECORD> const& records)
{
    std::string const stream = StreamOracle::Encode(records).value();
    ASSERT_NO_FATAL_FAILURE(ExpectWritten(records, KEYS::APART, stream));
    ASSERT_NO_FATAL_FAILURE(ExpectWritten(records, KEYS::SHARED, stream));
    for (bool const fixPositions : {false, true})
    {
        std::vector<RECORD> const expected = StreamOracle::ReadBack(records, fixPositions);
        ASSERT_EQ(Read(stream, fixPositions), expected) << HexOf(stream);
        ASSERT_EQ(StreamOracle::Decode(stream, fixPositions).records, expected) << HexOf(stream);
    }
}
}  // namespace

TEST(RoundTrip, RandomTables_AreWrittenAndReadAsTheOracleDoes)
{
    Dice dice(1);
    for (int number = 0; number < 100000; ++number)
    {
        ExpectTheSame(dice.Table());
        if (HasFatalFailure())
            FAIL() << "table " << number;
    }
}

TEST(RoundTrip, LongTable_IsWrittenAndReadAsTheOracleDoes)
{
    std::vector<RECORD> records;
    Dice dice(1);
    for (int i = 0; i < 2000; ++i)
        for (RECORD& record : dice.Table())
            records.push_back(std::move(record));
    ExpectTheSame(records);
}

TEST(RoundTrip, KeysThatShareVeryMuch_AreWrittenAndReadAsTheOracleDoes)
{
    std::vector<RECORD> records;
    for (std::size_t const shared : {126u, 127u, 128u, 129u, 16382u, 16383u, 16384u, 16385u})
        for (std::size_t const tail :
             {0u, 1u, 10u, 11u, 12u, 13u, 14u, 15u, 2043u, 2044u, 2045u, 2046u, 2047u})
        {
            records.push_back(StreamOracle::Int(std::string(shared, 'a') + "X", 1));
            records.push_back(StreamOracle::Int(std::string(shared, 'a') + std::string(tail, 'b'), 2));
        }
    ExpectTheSame(records);
}
