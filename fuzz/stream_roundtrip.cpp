// From a table of records to a stream and back. The bytes must be those of the model, and so must be what is
// read from them: the types and positions that change on the way, and the key of a first value without one.
#include "comgui/foundation/MathLib.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "fuzz/StreamModel.h"
#include "fuzz/fuzz.h"
#include <algorithm>
#include <deque>

namespace
{
// Mostly a key near the one before. The first few may be far longer than the input: past every form of a tag,
// and of the number of bytes that a key shares.
std::string NextKey(INPUT& input, std::string const& previous, std::size_t longest)
{
    auto const choice = input.Take<std::uint8_t>();
    std::string key = choice & 1 ? previous : previous.substr(0, previous.size() * (choice >> 4) / 15);
    if (choice & 2)
        key += input.Bytes(input.Take<std::uint8_t>() % 24);
    if ((choice & 12) == 12)
        key.append(input.Take<std::uint16_t>() % 17000, 'k');
    std::replace(key.begin(), key.end(), '\0', '0');  // keys are C texts
    return key.substr(0, longest);
}

int NextPosition(INPUT& input, int previous)
{
    switch (input.Take<std::uint8_t>() % 8)
    {
    case 0:
    case 1:
    case 2:
        return previous >= 0 && previous < 1000000000 ? previous + 1 : previous;
    case 3:
        return -1;
    case 4:
        return 0;
    case 5:
        return input.Take<std::int8_t>();
    case 6:
        return input.Take<std::uint16_t>();
    default:
        return static_cast<int>(input.Take<std::uint32_t>() % 134217800) - 2;
    }
}

std::int64_t NextInteger(INPUT& input)
{
    switch (input.Take<std::uint8_t>() % 4)
    {
    case 0:
        return input.Take<std::int8_t>();
    case 1:
        return input.Take<std::int32_t>();
    case 2:  // near a power of two
        return static_cast<std::int64_t>((std::uint64_t(1) << input.Take<std::uint8_t>() % 64) +
                                         static_cast<std::uint64_t>(input.Take<std::int8_t>()));
    default:
        return input.Take<std::int64_t>();
    }
}

double NextNumber(INPUT& input)
{
    switch (input.Take<std::uint8_t>() % 4)
    {
    case 0:
        return input.Take<double>();
    case 1:
        return static_cast<double>(input.Take<float>());
    case 2:
        return static_cast<double>(NextInteger(input));
    default:
        return input.Take<std::int16_t>() / 8.0;
    }
}

std::string NextText(INPUT& input)
{
    auto const size = input.Take<std::uint16_t>();
    return input.Bytes(size % 40) + std::string(size % 16 == 0 ? size % 5000 : 0, 't');
}

std::vector<MODEL_RECORD> Records(INPUT& input)
{
    std::vector<MODEL_RECORD> records;
    MODEL_RECORD record;
    while (!input.IsEmpty() && records.size() < 60)
    {
        auto const choice = input.Take<std::uint8_t>();
        record.type = static_cast<PARAM_TYPE>(choice % 16);
        record.isNull = ((choice & 0x70) == 0x70) != (record.type == PARAM_NONE);
        if (choice & 0x80)
            record.key = NextKey(input, record.key, records.size() < 3 ? 20000 : 300);
        record.pos = NextPosition(input, record.pos);
        record.integer = NextInteger(input);
        record.number = NextNumber(input);
        record.text = NextText(input);
        if (record.type == PARAM_STRING)
            record.text = record.text.substr(0, record.text.find('\0'));
        record.isNull = record.isNull || (record.type == PARAM_BINSTRING && record.text.empty());
        records.push_back(record);
    }
    return records;
}

// The records as a table, with the values that its pointers point at.
class TABLE
{
public:
    // isShared: equal keys in a row stand at one address, as in the table of a list.
    TABLE(std::vector<MODEL_RECORD> const& records, bool isShared)
    {
        for (MODEL_RECORD const& record : records)
        {
            bool const isSame = isShared && !m_records.empty() && m_records.back().key == record.key;
            char const* const key = isSame ? m_records.back().key : record.key.c_str();
            m_records.push_back({key, record.type, 0, Value(record), record.pos, true, {}});
        }
        m_records.push_back({});
    }

    SETMULTIPAR* Records() { return m_records.data(); }

private:
    void const* Value(MODEL_RECORD const& record)
    {
        // Bytes that are missing are no null word but a view that is not valid.
        if (record.type == PARAM_BINSTRING)
            return &m_binaries.emplace_back(record.isNull ? nullptr : record.text.data(),
                                            record.isNull ? 0 : record.text.size());
        if (record.isNull)
            return nullptr;
        if (record.type == PARAM_STRING)
            return record.text.c_str();
        if (record.type == PARAM_DOUBLE)
            return &record.number;
        return &record.integer;  // little-endian: its first half is the 32-bit value
    }

    std::deque<BIN_STRING> m_binaries;
    std::vector<SETMULTIPAR> m_records;
};

void MustEqual(SETMULTIPAR const& record, MODEL_READ const& expected)
{
    COMGUI_MUST(record.key == expected.key);
    COMGUI_MUST(record.type == expected.type);
    COMGUI_MUST(record.pos == expected.pos);
    switch (record.type)
    {
    case PARAM_NONE:
        return COMGUI_MUST(record.value == nullptr);
    case PARAM_INT:
        return COMGUI_MUST(*static_cast<int const*>(record.value) == expected.integer);
    case PARAM_DOUBLE:
        if (MathLib::IsNotANumber(expected.number))
            return COMGUI_MUST(record.value == &MathLib::NOT_A_DOUBLE_NUMBER);
        return COMGUI_MUST(*static_cast<double const*>(record.value) == expected.number);
    case PARAM_STRING:
        return COMGUI_MUST(record.value && static_cast<char const*>(record.value) == expected.text);
    case PARAM_BINSTRING:
    {
        BIN_STRING const& bytes = *static_cast<BIN_STRING const*>(record.value);
        COMGUI_MUST(bytes.valid() == !expected.text.empty());
        return COMGUI_MUST(std::string(bytes.begin(), bytes.end()) == expected.text);
    }
    default:
        return COMGUI_MUST(*static_cast<std::int64_t const*>(record.value) == expected.integer);
    }
}

void MustRead(std::string const& stream, bool fixPositions, std::vector<MODEL_READ> const& expected)
{
    SETMULTIPAR_LIST list(false);
    COMGUI_MUST(STICKET_BINSTREAM::Read(list, stream.data(), stream.size(), fixPositions));
    COMGUI_MUST(list.Size() == expected.size());
    for (std::size_t i = 0; i < expected.size(); ++i)
        MustEqual(list.Table(false)[i], expected[i]);
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    INPUT input(data, size);
    std::vector<MODEL_RECORD> const records = Records(input);
    MODEL_STREAM const model = ModelOf(records);
    for (bool const isShared : {false, true})
    {
        TABLE table(records, isShared);
        std::string stream = "untouched";
        COMGUI_MUST(STICKET_BINSTREAM::Write(stream, table.Records(), size) == stream.size());
        for (std::size_t i = 0; i < records.size(); ++i)
            COMGUI_MUST(table.Records()[i].ok == model.ok[i]);
        COMGUI_MUST(stream == model.bytes.value_or("untouched"));
    }
    if (!model.bytes)
        return 0;
    MustRead(*model.bytes, false, model.asTheyStand);
    MustRead(*model.bytes, true, model.withFixedPositions);
    return 0;
}
