#include "standin/server/store/ChangeRecord.h"

#include <algorithm>
#include <climits>
#include <cstring>
#include <utility>

namespace standin
{
namespace
{
constexpr char Version = 1;
constexpr unsigned TypeBits = 0x0F;
constexpr unsigned HadOthersBit = 0x10;
constexpr unsigned WholeKeyBit = 0x20;
constexpr std::size_t SmallestParameter = 2;  // a head and the size of an empty key

enum class Form
{
    None,
    Word4,
    Word8,
    Text,
    Invalid,
};

Form FormOf(unsigned type)
{
    switch (type)
    {
    case PARAM_NONE:
        return Form::None;
    case PARAM_INT:
    case PARAM_UNSIGNED:
        return Form::Word4;
    case PARAM_DOUBLE:
    case PARAM_INT64:
    case PARAM_UNSIGNED64:
        return Form::Word8;
    case PARAM_STRING:
    case PARAM_BINSTRING:
        return Form::Text;
    default:
        return Form::Invalid;
    }
}

void PutVarint(std::string& record, unsigned long long number)
{
    for (; number >= 0x80; number >>= 7)
        record.push_back(static_cast<char>(number | 0x80));
    record.push_back(static_cast<char>(number));
}

void PutWord(std::string& record, unsigned long long word, std::size_t size)
{
    char bytes[8];
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<char>(word >> (8 * i));
    record.append(bytes, size);
}

void PutText(std::string& record, std::string_view text)
{
    PutVarint(record, text.size());
    record.append(text);
}

void PutParameter(std::string& record, ParameterChange const& parameter)
{
    auto const type =
        parameter.value.type == PARAM_POINTER ? 0u : static_cast<unsigned>(parameter.value.type);
    Form const form = FormOf(type);
    if (form == Form::Invalid)
        throw StoreError("a value of type " + std::to_string(parameter.value.type) +
                         " cannot be stored; write one of a known type");
    if (parameter.pos < -1)
        throw StoreError("a value at position " + std::to_string(parameter.pos) +
                         " cannot be stored; use -1 for the whole key, or 0 and up");
    unsigned const wholeKey = parameter.pos == -1 ? WholeKeyBit : 0;
    record.push_back(static_cast<char>(type | wholeKey | (parameter.hadOthers ? HadOthersBit : 0)));
    if (parameter.pos != -1)
        PutVarint(record, static_cast<unsigned>(parameter.pos));
    PutText(record, parameter.key);
    if (form == Form::Word4)
        PutWord(record, parameter.value.word, 4);
    else if (form == Form::Word8)
        PutWord(record, parameter.value.word, 8);
    else if (form == Form::Text)
        PutText(record, parameter.value.text ? std::string_view(parameter.value.text->bytes) : "");
}

class Reader
{
public:
    explicit Reader(std::string_view record) : m_left(record) {}

    bool IsAtEnd() const { return m_left.empty(); }

    // The only bounds check, and the only place that moves on.
    std::string_view Take(unsigned long long size)
    {
        if (size > m_left.size())
            throw StoreError("a record of the journal is cut short");
        std::string_view const taken = m_left.substr(0, static_cast<std::size_t>(size));
        m_left.remove_prefix(taken.size());
        return taken;
    }

    unsigned Byte() { return static_cast<unsigned char>(Take(1)[0]); }

    unsigned long long Varint()
    {
        unsigned long long number = 0;
        for (unsigned shift = 0; shift < 64; shift += 7)
        {
            unsigned long long const byte = Byte();
            unsigned long long const bits = byte & 0x7F;
            bool const isTooLarge = shift == 63 && bits > 1;
            bool const isTooLong = shift > 0 && byte == 0;
            if (isTooLarge || isTooLong)
                break;
            number |= bits << shift;
            if (byte < 0x80)
                return number;
        }
        throw StoreError("a record of the journal has a number in no valid form");
    }

    unsigned long long Word(std::size_t size)
    {
        std::string_view const bytes = Take(size);
        unsigned long long word = 0;
        for (std::size_t i = size; i-- > 0;)
            word = word << 8 | static_cast<unsigned char>(bytes[i]);
        return word;
    }

    std::string_view Text() { return Take(Varint()); }

    std::size_t AtMost(unsigned long long count) const
    {
        return static_cast<std::size_t>(
            std::min<unsigned long long>(count, m_left.size() / SmallestParameter));
    }

private:
    std::string_view m_left;
};

ParameterChange ReadParameter(Reader& reader)
{
    unsigned const head = reader.Byte();
    unsigned const type = head & TypeBits;
    Form const form = FormOf(type);
    if (head > (TypeBits | HadOthersBit | WholeKeyBit) || form == Form::Invalid)
        throw StoreError("a record of the journal has a value of an unknown type");
    ParameterChange parameter;
    parameter.hadOthers = (head & HadOthersBit) != 0;
    if ((head & WholeKeyBit) == 0)
    {
        unsigned long long const pos = reader.Varint();
        if (pos > INT_MAX)
            throw StoreError("a record of the journal has a position that is too large");
        parameter.pos = static_cast<int>(pos);
    }
    parameter.key = reader.Text();
    parameter.value.type = static_cast<PARAM_TYPE>(type);
    if (form == Form::Word4)
        parameter.value.word = reader.Word(4);
    else if (form == Form::Word8)
        parameter.value.word = reader.Word(8);
    else if (form == Form::Text)
        parameter.value.text = std::make_unique<TicketText>(reader.Text());
    return parameter;
}
}  // namespace

void AppendChangeRecord(std::string& record, TicketChange const& change)
{
    record.push_back(Version);
    PutVarint(record, change.parameters.size());
    for (ParameterChange const& parameter : change.parameters)
        PutParameter(record, parameter);
}

TicketChange ReadChangeRecord(int kind, TicketAddress address, std::string_view record)
{
    if (kind != TicketChange::Write && kind != TicketChange::Create && kind != TicketChange::Delete)
        throw StoreError("a record of the journal is of the unknown kind " + std::to_string(kind));
    TicketChange change;
    change.kind = static_cast<TicketChange::Kind>(kind);
    change.address = address;
    Reader reader(record);
    if (reader.Byte() != Version)
        throw StoreError("a record of the journal has an unknown form");
    unsigned long long const count = reader.Varint();
    change.parameters.reserve(reader.AtMost(count));  // a false count must not allocate
    for (unsigned long long i = 0; i < count; ++i)
        change.parameters.push_back(ReadParameter(reader));
    if (!reader.IsAtEnd())
        throw StoreError("a record of the journal is longer than what it holds");
    return change;
}
}  // namespace standin
