#include "comgui/testing/Records.h"

#include "comgui/ticket/BIN_STRING.h"
#include <climits>
#include <cstdio>
#include <cstring>
#include <type_traits>

namespace comgui::plugin
{
void PrintTo(Parameter const& parameter, std::ostream* out)
{
    *out << parameter.key << '[' << parameter.pos << "]=" << test::TextOf(parameter.value);
}
}  // namespace comgui::plugin

namespace comgui::test
{
namespace
{
template <typename Number>
Number At(void const* place)
{
    Number number;
    std::memcpy(&number, place, sizeof number);
    return number;
}

// The value behind the word of a write; a null word has none.
Value ValueOf(PARAM_TYPE type, void const* word)
{
    if (type == PARAM_POINTER)
        return const_cast<void*>(word);
    if (!word)
        return {};
    switch (type)
    {
    case PARAM_INT:
        return At<int>(word);
    case PARAM_DOUBLE:
        return At<double>(word);
    case PARAM_STRING:
        return std::string(static_cast<char const*>(word));
    case PARAM_BINSTRING:
    {
        auto const& binary = *static_cast<BIN_STRING const*>(word);
        return plugin::Bytes{{static_cast<char const*>(binary.data), binary.size}};
    }
    case PARAM_INT64:
        return At<long long>(word);
    case PARAM_UNSIGNED:
        return At<unsigned int>(word);
    case PARAM_UNSIGNED64:
        return At<unsigned long long>(word);
    default:
        return {};
    }
}

// Texts and bytes of a read lie where a pointer says that the slot has written.
Value ValueRead(PARAM_TYPE type, void const* place)
{
    bool const isBehindAPointer = type == PARAM_STRING || type == PARAM_POINTER;
    return ValueOf(type, isBehindAPointer ? At<void const*>(place) : place);
}

std::string HexOf(std::string const& bytes)
{
    std::string text;
    for (char const byte : bytes)
    {
        char digits[3];
        std::snprintf(digits, sizeof digits, "%02X", static_cast<unsigned char>(byte));
        text += digits;
    }
    return text;
}

struct Text
{
    std::string operator()(std::monostate) const { return "none"; }
    std::string operator()(void* pointer) const { return pointer ? "pointer" : "null pointer"; }
    std::string operator()(int number) const { return "int " + std::to_string(number); }
    std::string operator()(double number) const
    {
        char text[32];
        std::snprintf(text, sizeof text, "%.17g", number);
        return std::string("double ") + text;
    }
    std::string operator()(std::string const& text) const { return "text '" + text + "'"; }
    std::string operator()(plugin::Bytes const& bytes) const { return "bytes " + HexOf(bytes.bytes); }
    std::string operator()(plugin::NeverStored) const { return "count"; }
    std::string operator()(long long number) const { return "int64 " + std::to_string(number); }
    std::string operator()(unsigned int number) const { return "unsigned " + std::to_string(number); }
    std::string operator()(unsigned long long number) const { return "unsigned64 " + std::to_string(number); }
};
}  // namespace

std::vector<Parameter> RecordsOf(SETMULTIPAR const* table)
{
    std::vector<Parameter> records;
    for (SETMULTIPAR const* record = table; record && record->key; ++record)
        records.push_back({record->key, ValueOf(record->type, record->value), record->pos});
    return records;
}

std::vector<Parameter> RecordsOf(GETMULTIPAR const* table)
{
    std::vector<Parameter> records;
    for (GETMULTIPAR const* record = table; record && record->key; ++record)
    {
        bool const hasValue = record->ok && record->value;
        records.push_back(
            {record->key, hasValue ? ValueRead(record->type, record->value) : Value(), record->pos});
    }
    return records;
}

std::vector<Parameter> RecordsOf(STICKET_ACCESS const* ticket)
{
    std::vector<Parameter> records;
    auto const add = [](void* context, char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        if (type != PARAM_NONE && type != PARAM_COUNT)
            static_cast<std::vector<Parameter>*>(context)->push_back({key, ValueOf(type, value), pos});
        return true;
    };
    ticket->SWALKPARAMETERS(ticket->Instance, add, &records, "", INT_MAX);
    return records;
}

std::string TextOf(Value const& value) { return std::visit(Text(), value); }
}  // namespace comgui::test
