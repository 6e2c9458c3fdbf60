#include "fuzz/StreamModel.h"

#include <cmath>
#include <cstring>
#include <limits>

namespace
{
constexpr std::int64_t LargestExact = std::int64_t(1) << 53;

class STREAM
{
public:
    explicit STREAM(std::vector<MODEL_RECORD> const& records)
    {
        for (MODEL_RECORD const& record : records)
            result.ok.push_back(IsValid(record) && !m_failed && Put(record));
        if (!m_failed)
            result.bytes = m_bytes;
    }

    MODEL_STREAM result;

private:
    static bool IsValid(MODEL_RECORD const& record)
    {
        if (record.type == PARAM_NONE)
            return record.isNull;
        if (record.type == PARAM_STRING)
            return true;
        return record.type != PARAM_POINTER && record.type != PARAM_COUNT &&
               record.type <= PARAM_UNSIGNED64 && (!record.isNull || record.type == PARAM_BINSTRING);
    }

    bool Put(MODEL_RECORD const& record)
    {
        if (m_bytes.empty())
            m_bytes = "\x09STICKET_1";
        PutKey(record.key);
        if (record.pos != m_pos)
        {
            long long const size = static_cast<long long>(record.pos) + 2;
            if (size < 0 || size > 134217727)
            {
                m_failed = true;
                return false;
            }
            PutTag(5, static_cast<std::size_t>(size));
            m_pos = record.pos;
        }
        PutValue(record);
        if (m_pos >= 0)
            ++m_pos;
        return true;
    }

    void PutKey(std::string const& key)
    {
        if (key == m_key)
            return;
        std::size_t shared = 0;
        while (shared < key.size() && shared < m_key.size() && key[shared] == m_key[shared])
            ++shared;
        m_key = key;
        m_keyAsRead = key;
        m_isBehindKey = true;
        std::string const tail = key.substr(shared);
        if (shared == 0)
        {
            PutTag(0, tail.size());
            m_bytes += tail;
            return;
        }
        int const size = shared < 128 ? 1 : shared < 16384 ? 2 : 4;
        std::uint64_t const mark = size == 1 ? 0 : size == 2 ? 0x8000 : 0xC0000000;
        PutTag(1, tail.size() + static_cast<std::size_t>(size));
        PutNumber(shared + mark, size);
        m_bytes += tail;
    }

    void PutValue(MODEL_RECORD const& record)
    {
        switch (record.type)
        {
        case PARAM_NONE:
            PutTag(6, 0);
            return Report({"", PARAM_NONE, 0}, true);
        case PARAM_INT:
            return PutInteger(static_cast<std::int32_t>(record.integer));
        case PARAM_DOUBLE:
            return PutDouble(record.number);
        case PARAM_STRING:
        case PARAM_BINSTRING:
        {
            std::string const text = record.isNull ? "" : record.text;
            PutTag(record.type == PARAM_STRING ? 3 : 4, text.size());
            m_bytes += text;
            return Report({"", record.type, 0, 0, 0, text});
        }
        case PARAM_UNSIGNED:
            return PutDouble(static_cast<std::uint32_t>(record.integer));
        case PARAM_INT64:
            if (record.integer >= -LargestExact && record.integer <= LargestExact)
                return PutDouble(static_cast<double>(record.integer));
            return PutLong(record.integer, PARAM_INT64);
        default:
            if (record.integer >= 0 && record.integer <= LargestExact)
                return PutDouble(static_cast<double>(record.integer));
            return PutLong(record.integer, record.integer < 0 ? PARAM_UNSIGNED64 : PARAM_INT64);
        }
    }

    void PutInteger(std::int32_t value)
    {
        int const size = value == 0                     ? 0
                         : value == std::int8_t(value)  ? 1
                         : value == std::int16_t(value) ? 2
                                                        : 4;
        PutTag(2, static_cast<std::size_t>(size));
        PutNumber(static_cast<std::uint32_t>(value), size);
        Report({"", PARAM_INT, 0, value});
    }

    void PutDouble(double value)
    {
        if (!std::isfinite(value))
            value = std::numeric_limits<double>::quiet_NaN();
        else if (value == std::floor(value) && value >= -2147483648.0 && value <= 2147483647.0)
            return PutInteger(static_cast<std::int32_t>(value));
        Report({"", PARAM_DOUBLE, 0, 0, value});
        if (std::isfinite(value) && static_cast<double>(static_cast<float>(value)) == value)
        {
            float const single = static_cast<float>(value);
            std::uint32_t bits;
            std::memcpy(&bits, &single, sizeof bits);
            PutTag(2, 5);
            m_bytes += 'i';
            return PutNumber(bits, 4);
        }
        std::uint64_t bits;
        std::memcpy(&bits, &value, sizeof bits);
        PutTag(2, 8);
        PutNumber(bits, 8);
    }

    void PutLong(std::int64_t value, PARAM_TYPE type)
    {
        PutTag(2, 9);
        m_bytes += type == PARAM_INT64 ? 'd' : 'u';
        PutNumber(static_cast<std::uint64_t>(value), 8);
        Report({"", type, 0, value});
    }

    void PutTag(unsigned int itemClass, std::size_t size)
    {
        if (size < 16)
            PutNumber(itemClass << 5 | size, 1);
        else if (size < 2048)
            PutNumber(itemClass << 13 | 0x1000 | size, 2);
        else
            PutNumber(std::uint64_t(itemClass) << 29 | 0x18000000 | size, 4);
    }

    void PutNumber(std::uint64_t value, int size)
    {
        while (size-- > 0)
            m_bytes += static_cast<char>(value >> (8 * size) & 0xFF);
    }

    // The record as it is read: its key and position are known here.
    void Report(MODEL_READ record, bool isDelete = false)
    {
        record.key = m_keyAsRead;
        record.pos = m_pos;
        result.asTheyStand.push_back(record);
        if (!isDelete && m_isBehindKey && (m_pos == 0 || m_pos == -2))
            record.pos = -1;
        result.withFixedPositions.push_back(record);
        m_isBehindKey = false;
    }

    std::string m_bytes;
    std::string m_key;
    std::string m_keyAsRead = "STICKET_1";  // the signature counts as a key when it is read
    bool m_isBehindKey = true;              // no value stands between the last key and here
    int m_pos = -1;
    bool m_failed = false;
};
}  // namespace

MODEL_STREAM ModelOf(std::vector<MODEL_RECORD> const& records) { return STREAM(records).result; }
