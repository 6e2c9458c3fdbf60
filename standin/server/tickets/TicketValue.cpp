#include "standin/server/tickets/TicketValue.h"

#include <bit>
#include <cstring>

namespace standin
{
static_assert(std::endian::native == std::endian::little);  // a short number is the beginning of its word

TicketValue TicketValue::Number(PARAM_TYPE type, void const* bytes)
{
    TicketValue number;
    number.type = type;
    std::memcpy(&number.word, bytes, SizeOfNumber(type));
    return number;
}

TicketValue TicketValue::Text(PARAM_TYPE type, std::string_view bytes)
{
    TicketValue text;
    text.type = type;
    text.text = std::make_unique<TicketText>(bytes);
    return text;
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
        return Number(stored.type, &stored.integer);
    }
}

StoredValue ToStored(PARAM_TYPE type, unsigned long long word, TicketText const* text)
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

StoredValue TicketValue::ToStored() const { return standin::ToStored(type, word, text.get()); }
}  // namespace standin
