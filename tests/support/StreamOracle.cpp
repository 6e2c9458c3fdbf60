#include "tests/support/StreamOracle.h"

#include <cmath>
#include <cstring>
#include <ostream>
#include <utility>

namespace StreamOracle
{
namespace
{
constexpr unsigned long long Missing = 0x7FF8000000000000;
constexpr long long LargestExact = 9007199254740992;  // 2 to the power 53

double DoubleOf(unsigned long long bits)
{
    double value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

unsigned long long BitsOf(double value)
{
    unsigned long long bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

bool IsIntegerOf32Bits(double value)
{
    return std::trunc(value) == value && value >= -2147483648.0 && value <= 2147483647.0;
}

RECORD Number(std::string key, PARAM_TYPE type, unsigned long long number, int pos)
{
    RECORD record;
    record.key = std::move(key);
    record.type = type;
    record.pos = pos;
    record.number = number;
    return record;
}

RECORD OfBytes(std::string key, PARAM_TYPE type, std::string bytes, int pos)
{
    RECORD record;
    record.key = std::move(key);
    record.type = type;
    record.pos = pos;
    record.bytes = std::move(bytes);
    return record;
}

std::string CutAtZero(std::string const& text)
{
    std::string cut;
    for (char const byte : text)
    {
        if (byte == 0)
            break;
        cut.push_back(byte);
    }
    return cut;
}
}  // namespace

void PrintTo(RECORD const& record, std::ostream* out)
{
    *out << '"' << record.key << "\" type " << record.type << " pos " << record.pos << " number " << std::hex
         << record.number << std::dec << " bytes \"" << record.bytes << '"' << (record.isNull ? " null" : "");
}

RECORD Int(std::string key, int value, int pos)
{
    return Number(std::move(key), PARAM_INT, static_cast<unsigned long long>(value), pos);
}

RECORD Double(std::string key, double value, int pos)
{
    return Number(std::move(key), PARAM_DOUBLE, BitsOf(value), pos);
}

RECORD Text(std::string key, std::string value, int pos)
{
    return OfBytes(std::move(key), PARAM_STRING, std::move(value), pos);
}

RECORD Bytes(std::string key, std::string value, int pos)
{
    return OfBytes(std::move(key), PARAM_BINSTRING, std::move(value), pos);
}

RECORD Int64(std::string key, long long value, int pos)
{
    return Number(std::move(key), PARAM_INT64, static_cast<unsigned long long>(value), pos);
}

RECORD Unsigned(std::string key, unsigned int value, int pos)
{
    return Number(std::move(key), PARAM_UNSIGNED, value, pos);
}

RECORD Unsigned64(std::string key, unsigned long long value, int pos)
{
    return Number(std::move(key), PARAM_UNSIGNED64, value, pos);
}

RECORD Delete(std::string key, int pos)
{
    RECORD record = Number(std::move(key), PARAM_NONE, 0, pos);
    record.isNull = true;
    return record;
}

// Between records and the library's tables.

std::vector<RECORD> RecordsOf(SETMULTIPAR const* table)
{
    std::vector<RECORD> records;
    for (; table && table->key; ++table)
    {
        RECORD record = Number(table->key, table->type, 0, table->pos);
        record.isNull = table->value == nullptr;
        if (!record.isNull)
            switch (table->type)
            {
            case PARAM_INT:
                record.number = static_cast<unsigned long long>(*static_cast<int const*>(table->value));
                break;
            case PARAM_UNSIGNED:
                record.number = *static_cast<unsigned int const*>(table->value);
                break;
            case PARAM_DOUBLE:
            case PARAM_INT64:
            case PARAM_UNSIGNED64:
                std::memcpy(&record.number, table->value, sizeof record.number);
                break;
            case PARAM_STRING:
                record.bytes = static_cast<char const*>(table->value);
                break;
            case PARAM_BINSTRING:
            {
                char const* data;
                unsigned long size;
                std::memcpy(&data, table->value, sizeof data);
                std::memcpy(&size, static_cast<char const*>(table->value) + sizeof data, sizeof size);
                if (data)
                    record.bytes.assign(data, size);
                break;
            }
            default:
                break;
            }
        records.push_back(record);
    }
    return records;
}

TABLE::TABLE(std::vector<RECORD> records, KEYS keys)
    : m_records(std::move(records)), m_values(m_records.size()), m_table(m_records.size() + 1)
{
    for (std::size_t i = 0; i < m_records.size(); ++i)
    {
        RECORD const& record = m_records[i];
        VALUE& value = m_values[i];
        value = {static_cast<int>(record.number),
                 static_cast<unsigned int>(record.number),
                 DoubleOf(record.number),
                 static_cast<long long>(record.number),
                 record.number,
                 {record.bytes.empty() ? nullptr : record.bytes.data(), record.bytes.size()}};
        void const* word = &value;
        switch (record.type)
        {
        case PARAM_INT:
            word = &value.asInt;
            break;
        case PARAM_UNSIGNED:
            word = &value.asUnsigned;
            break;
        case PARAM_DOUBLE:
            word = &value.asDouble;
            break;
        case PARAM_INT64:
            word = &value.asInt64;
            break;
        case PARAM_UNSIGNED64:
            word = &value.asUnsigned64;
            break;
        case PARAM_STRING:
            word = record.bytes.c_str();
            break;
        case PARAM_BINSTRING:
            word = &value.asBytes;
            break;
        default:
            break;
        }
        bool const isShared = keys == KEYS::SHARED && i != 0 && record.key == m_records[i - 1].key;
        m_table[i].key = isShared ? m_table[i - 1].key : record.key.c_str();
        m_table[i].type = record.type;
        m_table[i].value = record.isNull ? nullptr : word;
        m_table[i].pos = record.pos;
    }
}

// The writer.

bool IsWritable(RECORD const& record)
{
    if (record.type == PARAM_NONE)
        return record.isNull;
    if (record.type == PARAM_STRING)
        return true;
    if (record.type == PARAM_POINTER || record.type == PARAM_COUNT)
        return false;
    if (static_cast<int>(record.type) < 0 || static_cast<int>(record.type) > 9)
        return false;
    return !record.isNull;
}

namespace
{
class ENCODING
{
public:
    std::vector<unsigned char> stream;
    bool hasFailed = false;

    void Add(RECORD const& record)
    {
        if (m_isFirst)
        {
            m_isFirst = false;
            Tag(0, 9);
            Append("STICKET_1");
        }
        if (record.key != m_key)
            Key(record.key);
        if (record.pos != m_pos)
        {
            if (record.pos < -2)
                hasFailed = true;
            Tag(5, static_cast<unsigned long long>(static_cast<long long>(record.pos) + 2));
            m_pos = record.pos;
        }
        Value(record);
        if (m_pos >= 0)
            m_pos = m_pos + 1;
    }

private:
    // Classes are counted from 0 to 7, as their three bits do.
    void Tag(unsigned int itemClass, unsigned long long size)
    {
        unsigned int const top = itemClass * 32;
        if (size <= 15)
        {
            Byte(top + size);
        }
        else if (size <= 2047)
        {
            Byte(top + 16 + size / 256);
            Byte(size % 256);
        }
        else if (size <= 134217727)
        {
            Byte(top + 16 + 8 + size / 16777216);
            Byte(size / 65536 % 256);
            Byte(size / 256 % 256);
            Byte(size % 256);
        }
        else
            hasFailed = true;
    }

    void Key(std::string const& key)
    {
        std::size_t same = 0;
        while (same < key.size() && same < m_key.size() && key[same] == m_key[same])
            ++same;
        std::string const tail = key.substr(same);
        if (same == 0)
        {
            Tag(0, key.size());
        }
        else if (same <= 127)
        {
            Tag(1, tail.size() + 1);
            Byte(same);
        }
        else if (same <= 16383)
        {
            Tag(1, tail.size() + 2);
            Byte(128 + same / 256);
            Byte(same % 256);
        }
        else
        {
            Tag(1, tail.size() + 4);
            Byte(128 + 64 + same / 16777216);
            Byte(same / 65536 % 256);
            Byte(same / 256 % 256);
            Byte(same % 256);
        }
        Append(tail);
        m_key = key;
    }

    void Value(RECORD const& record)
    {
        auto const asSigned = static_cast<long long>(record.number);
        switch (record.type)
        {
        case PARAM_INT:
            return Integer(asSigned);
        case PARAM_DOUBLE:
            return Real(DoubleOf(record.number));
        case PARAM_UNSIGNED:
            return Real(static_cast<double>(record.number));
        case PARAM_INT64:
            if (asSigned >= -LargestExact && asSigned <= LargestExact)
                return Real(static_cast<double>(asSigned));
            return Integer64('d', record.number);
        case PARAM_UNSIGNED64:
            if (record.number <= static_cast<unsigned long long>(LargestExact))
                return Real(static_cast<double>(asSigned));
            return Integer64(asSigned >= 0 ? 'd' : 'u', record.number);
        case PARAM_STRING:
        {
            std::string const text = record.isNull ? "" : CutAtZero(record.bytes);
            Tag(3, text.size());
            return Append(text);
        }
        case PARAM_BINSTRING:
            Tag(4, record.bytes.size());
            return Append(record.bytes);
        default:
            return Tag(6, 0);
        }
    }

    void Integer(long long value)
    {
        unsigned int bytes = 4;
        if (value == 0)
            bytes = 0;
        else if (value >= -128 && value <= 127)
            bytes = 1;
        else if (value >= -32768 && value <= 32767)
            bytes = 2;
        Tag(2, bytes);
        BigEndian(static_cast<unsigned long long>(value), bytes);
    }

    void Real(double value)
    {
        auto const single = static_cast<float>(value);
        if (!std::isfinite(value))
        {
            Tag(2, 8);
            BigEndian(Missing, 8);
        }
        else if (IsIntegerOf32Bits(value))
        {
            Integer(static_cast<long long>(value));
        }
        else if (static_cast<double>(single) == value)
        {
            unsigned int bits;
            std::memcpy(&bits, &single, sizeof bits);
            Tag(2, 5);
            Byte('i');
            BigEndian(bits, 4);
        }
        else
        {
            Tag(2, 8);
            BigEndian(BitsOf(value), 8);
        }
    }

    void Integer64(char marker, unsigned long long value)
    {
        Tag(2, 9);
        Byte(static_cast<unsigned char>(marker));
        BigEndian(value, 8);
    }

    void BigEndian(unsigned long long value, unsigned int bytes)
    {
        for (unsigned int left = bytes; left > 0; --left)
        {
            unsigned long long shifted = value;
            for (unsigned int i = 1; i < left; ++i)
                shifted /= 256;
            Byte(shifted % 256);
        }
    }

    void Append(std::string const& bytes)
    {
        for (char const byte : bytes)
            Byte(static_cast<unsigned char>(byte));
    }

    void Byte(unsigned long long value) { stream.push_back(static_cast<unsigned char>(value)); }

    bool m_isFirst = true;
    std::string m_key;
    int m_pos = -1;
};
}  // namespace

std::optional<std::string> Encode(std::vector<RECORD> const& records)
{
    ENCODING encoding;
    for (RECORD const& record : records)
        if (IsWritable(record))
            encoding.Add(record);
    if (encoding.hasFailed)
        return std::nullopt;
    return std::string(encoding.stream.begin(), encoding.stream.end());
}

// The reader.

namespace
{
struct BROKEN
{
};

class DECODING
{
public:
    DECODING(std::string const& stream, bool fixPositions, std::vector<RECORD>& records)
        : m_stream(stream.begin(), stream.end()), m_fixPositions(fixPositions), m_records(records)
    {
    }

    void All()
    {
        bool isFirst = true;
        while (m_at < m_stream.size())
        {
            Item(isFirst);
            isFirst = false;
        }
    }

private:
    unsigned long long Number(unsigned long long bytes)
    {
        unsigned long long value = 0;
        for (unsigned long long i = 0; i < bytes; ++i)
        {
            if (m_at >= m_stream.size())
                throw BROKEN();
            value = value * 256 + m_stream[m_at];
            ++m_at;
        }
        return value;
    }

    std::string Text(unsigned long long size)
    {
        if (m_stream.size() - m_at < size)
            throw BROKEN();
        std::string text;
        for (unsigned long long i = 0; i < size; ++i)
        {
            text.push_back(static_cast<char>(m_stream[m_at]));
            ++m_at;
        }
        return text;
    }

    void Item(bool isFirst)
    {
        unsigned long long const head = Number(1);
        unsigned long long const itemClass = head / 32;
        unsigned long long size = head % 16;
        if (head / 16 % 2 == 1)
        {
            bool const isLong = head / 8 % 2 == 1;
            size = head % 8;
            for (int further = isLong ? 3 : 1; further > 0; --further)
                size = size * 256 + Number(1);
        }
        if (isFirst)
        {
            if (itemClass != 0)
                throw BROKEN();
            Key(Text(size));
            if (m_key != "STICKET_1")
                throw BROKEN();
            return;
        }
        switch (itemClass)
        {
        case 0:
            return Key(Text(size));
        case 1:
            return Key(Expanded(Text(size)));
        case 2:
            return Numeric(size);
        case 3:
            return Add(StreamOracle::Text("", CutAtZero(Text(size))));
        case 4:
            return Add(StreamOracle::Bytes("", Text(size)));
        case 5:
            m_pos = static_cast<int>(static_cast<long long>(size) - 2);
            return;
        case 6:
            m_isFirstBehindKey = false;
            return Add(StreamOracle::Delete(""));
        default:
            throw BROKEN();
        }
    }

    std::string Expanded(std::string const& item) const
    {
        std::vector<unsigned long long> bytes;
        for (char const byte : item)
            bytes.push_back(static_cast<unsigned char>(byte));
        if (bytes.empty())
            throw BROKEN();
        std::size_t countBytes = 1;
        unsigned long long same = bytes[0];
        if (bytes[0] >= 128)
        {
            countBytes = 2;
            if (bytes.size() < 2)
                throw BROKEN();
            same = (bytes[0] - 128) * 256 + bytes[1];
        }
        if (bytes[0] >= 128 + 64)
        {
            countBytes = 4;
            if (bytes.size() < 4)
                throw BROKEN();
            same = (((bytes[0] - 128 - 64) * 256 + bytes[1]) * 256 + bytes[2]) * 256 + bytes[3];
        }
        std::string key;
        for (std::size_t i = 0; i < same && i < m_key.size(); ++i)
            key.push_back(m_key[i]);
        return key + item.substr(countBytes);
    }

    void Key(std::string const& key)
    {
        m_key = key;
        if (m_fixPositions)
            m_isFirstBehindKey = true;
    }

    void Numeric(unsigned long long size)
    {
        if (size == 0)
            return Add(Int("", 0));
        if (size == 1)
            return Add(Int("", static_cast<signed char>(Number(1))));
        if (size == 2)
            return Add(Int("", static_cast<short>(Number(2))));
        if (size == 4)
            return Add(Int("", static_cast<int>(Number(4))));
        if (size == 5)
        {
            Number(1);
            auto const bits = static_cast<unsigned int>(Number(4));
            float single;
            std::memcpy(&single, &bits, sizeof single);
            return Real(single);
        }
        if (size == 8)
            return Real(DoubleOf(Number(8)));
        if (size != 9)
            throw BROKEN();
        unsigned long long const marker = Number(1);
        unsigned long long const value = Number(8);
        if (marker == 'd')
            return Add(Int64("", static_cast<long long>(value)));
        if (marker == 'u')
            return Add(Unsigned64("", value));
        throw BROKEN();
    }

    void Real(double value) { Add(Double("", std::isfinite(value) ? value : DoubleOf(Missing))); }

    void Add(RECORD record)
    {
        record.key = CutAtZero(m_key);
        record.pos = m_pos;
        if (m_isFirstBehindKey && (m_pos == 0 || m_pos == -2))
            record.pos = -1;
        m_isFirstBehindKey = false;
        if (m_pos >= 0)
            ++m_pos;
        m_records.push_back(record);
    }

    std::vector<unsigned char> m_stream;
    std::size_t m_at = 0;
    bool m_fixPositions;
    bool m_isFirstBehindKey = false;
    std::string m_key;
    int m_pos = -1;
    std::vector<RECORD>& m_records;
};
}  // namespace

READING Decode(std::string const& stream, bool fixPositions)
{
    READING reading;
    try
    {
        DECODING(stream, fixPositions, reading.records).All();
        reading.isGood = true;
    }
    catch (BROKEN const&)
    {
    }
    return reading;
}

// The road there and back.

namespace
{
RECORD NumberReadBack(RECORD const& record, double value)
{
    if (!std::isfinite(value))
        return Number(record.key, PARAM_DOUBLE, Missing, record.pos);
    if (IsIntegerOf32Bits(value))
        return Int(record.key, static_cast<int>(value), record.pos);
    return Double(record.key, value, record.pos);
}

RECORD ReadBack(RECORD const& record)
{
    auto const asSigned = static_cast<long long>(record.number);
    switch (record.type)
    {
    case PARAM_DOUBLE:
        return NumberReadBack(record, DoubleOf(record.number));
    case PARAM_UNSIGNED:
        return NumberReadBack(record, static_cast<double>(record.number));
    case PARAM_INT64:
        if (asSigned >= -LargestExact && asSigned <= LargestExact)
            return NumberReadBack(record, static_cast<double>(asSigned));
        return record;
    case PARAM_UNSIGNED64:
        if (asSigned < 0)
            return record;
        if (asSigned > LargestExact)
            return Int64(record.key, asSigned, record.pos);
        return NumberReadBack(record, static_cast<double>(asSigned));
    case PARAM_STRING:
        return Text(record.key, record.isNull ? "" : CutAtZero(record.bytes), record.pos);
    default:
        return record;
    }
}
}  // namespace

std::vector<RECORD> ReadBack(std::vector<RECORD> const& records, bool fixPositions)
{
    std::vector<RECORD> back;
    std::string lastKey;
    bool isNamed = false;  // a key was told since the signature
    bool isFirst = fixPositions;
    for (RECORD const& record : records)
    {
        if (!IsWritable(record))
            continue;
        if (record.key != lastKey)
        {
            isNamed = true;
            isFirst = fixPositions;
        }
        lastKey = record.key;
        back.push_back(ReadBack(record));
        if (!isNamed)
            back.back().key = "STICKET_1";
        if (isFirst && record.type != PARAM_NONE && (record.pos == 0 || record.pos == -2))
            back.back().pos = -1;
        isFirst = false;
    }
    return back;
}
}  // namespace StreamOracle
