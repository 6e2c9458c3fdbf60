#include "standin/server/tickets/TicketValue.h"

#include <bit>
#include <cstring>

namespace standin
{
namespace
{
// Bytes behind the value word of a number; 0 for a type that is none.
std::size_t SizeOf(PARAM_TYPE type)
{
    switch (type)
    {
    case PARAM_INT:
    case PARAM_UNSIGNED:
        return 4;
    case PARAM_DOUBLE:
    case PARAM_INT64:
    case PARAM_UNSIGNED64:
    case PARAM_POINTER:
        return 8;
    default:
        return 0;
    }
}

TicketValue Number(PARAM_TYPE type, void const* bytes)
{
    TicketValue number;
    number.type = type;
    std::memcpy(&number.word, bytes, SizeOf(type));
    return number;
}

TicketValue Text(PARAM_TYPE type, std::string_view bytes)
{
    TicketValue text;
    text.type = type;
    text.text = std::make_unique<TicketText>(bytes);
    return text;
}
}  // namespace

std::optional<TicketValue> TicketValue::FromWrite(PARAM_TYPE type, void const* value)
{
    if (type == PARAM_POINTER)  // the word itself is the pointer, and may well be null
        return Number(type, &value);
    if (!value)
        return std::nullopt;
    if (type == PARAM_STRING)
        return Text(type, static_cast<char const*>(value));
    if (type == PARAM_BINSTRING)
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(value);
        if (!bytes.data || !bytes.size)
            return std::nullopt;
        return Text(type, {static_cast<char const*>(bytes.data), bytes.size});
    }
    return SizeOf(type) ? std::optional(Number(type, value)) : std::nullopt;
}

TicketValue TicketValue::FromStored(StoredValue const& stored)
{
    switch (stored.type)
    {
    case PARAM_STRING:
    case PARAM_BINSTRING:
        return Text(stored.type, stored.bytes);
    case PARAM_DOUBLE:
        return Number(stored.type, &stored.number);
    case PARAM_POINTER:
        return Number(stored.type, &stored.pointer);
    default:
        return Number(stored.type, &stored.integer);  // little-endian: the low bytes come first
    }
}

StoredValue TicketValue::ToStored() const
{
    StoredValue stored;
    stored.type = type;
    if (text)
        stored.bytes = text->bytes;
    else if (type == PARAM_DOUBLE)
        stored.number = std::bit_cast<double>(word);
    else if (type == PARAM_POINTER)
        stored.pointer = std::bit_cast<void*>(word);
    else if (type == PARAM_INT)
        stored.integer = static_cast<int>(word);
    else
        stored.integer = static_cast<long long>(word);
    return stored;
}

void TicketValue::CopyTo(void* out) const
{
    if (!text)
    {
        std::memcpy(out, &word, SizeOf(type));
        return;
    }
    text->handedOut.store(true, std::memory_order_relaxed);
    if (type == PARAM_STRING)
        *static_cast<char const**>(out) = text->bytes.c_str();
    else
        *static_cast<BIN_STRING*>(out) = {text->bytes.data(), text->bytes.size()};
}

void const* TicketValue::Word(BIN_STRING& binary) const
{
    if (type == PARAM_POINTER)
        return std::bit_cast<void const*>(word);
    if (!text)
        return &word;  // little-endian: a short number's bytes come first
    text->handedOut.store(true, std::memory_order_relaxed);
    if (type == PARAM_STRING)
        return text->bytes.c_str();
    binary = {text->bytes.data(), text->bytes.size()};
    return &binary;
}
}  // namespace standin
