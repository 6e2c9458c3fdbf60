#include "standin/module/ValueWords.h"

#include <bit>
#include <cstring>

namespace standin
{
namespace
{
void const* WordOf(PARAM_TYPE type, unsigned long long const& word, TicketText const* text,
                   BIN_STRING& binary)
{
    if (type == PARAM_POINTER)
        return std::bit_cast<void const*>(word);
    if (!text)
        return &word;  // a short number's bytes come first
    if (type == PARAM_STRING)
        return text->bytes.c_str();
    binary = {text->bytes.data(), text->bytes.size()};
    return &binary;
}

void CopyTo(void* out, TicketElement const& element, TextReader& reader)
{
    if (!element.IsText())
    {
        std::memcpy(out, &element.word, SizeOfNumber(element.type));
        return;
    }
    element.text->HandOut(reader.Mark());
    reader.NoteRead();
    if (element.type == PARAM_STRING)
        *static_cast<char const**>(out) = element.text->bytes.c_str();
    else
        *static_cast<BIN_STRING*>(out) = {element.text->bytes.data(), element.text->bytes.size()};
}

std::optional<TicketValue> ValueOf(PARAM_TYPE type, void const* word)
{
    if (type == PARAM_NONE)
        return word ? std::nullopt : std::optional(TicketValue());
    if (type == PARAM_POINTER)  // the word itself is the pointer, and may well be null
        return TicketValue::Number(type, &word);
    if (!word)
        return std::nullopt;
    if (type == PARAM_STRING)
        return TicketValue::String(static_cast<char const*>(word));
    if (type == PARAM_BINSTRING)
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(word);
        if (!bytes.data || !bytes.size)
            return std::nullopt;
        return TicketValue::Text(type, {static_cast<char const*>(bytes.data), bytes.size});
    }
    return SizeOfNumber(type) ? std::optional(TicketValue::Number(type, word)) : std::nullopt;
}
}  // namespace

bool ReadValue(KeyValues const& values, PARAM_TYPE type, void* out, int pos, TextReader& reader)
{
    if (!out || pos < -1)
        return false;
    if (type == PARAM_COUNT)
    {
        if (pos != -1)
            return false;
        *static_cast<unsigned long*>(out) = static_cast<unsigned long>(values.Count());
        return true;
    }
    if (type == PARAM_NONE && pos == -1 && values.Count() > 1)
    {
        *static_cast<int*>(out) = PARAM_COUNT;
        return true;
    }
    TicketElement const* const element = values.At(pos == -1 ? 0 : pos);  // a vector's first stands for it
    if (!element)
        return false;
    if (type == PARAM_NONE)
        *static_cast<int*>(out) = element->type;
    else if (type == element->type)
        CopyTo(out, *element, reader);
    else
        return false;
    return true;
}

void const* WordOf(TicketElement const& element, BIN_STRING& binary)
{
    return WordOf(element.type, element.word, element.IsText() ? element.text : nullptr, binary);
}

void const* WordOfWalked(TicketElement const& element, WalkedNumbers& numbers, BIN_STRING& binary)
{
    bool const isNumber = SizeOfNumber(element.type) && element.type != PARAM_POINTER;
    return isNumber ? numbers.AddressOf(element.word) : WordOf(element, binary);
}

void const* WordOf(TicketValue const& value, BIN_STRING& binary)
{
    return WordOf(value.type, value.word, value.text.get(), binary);
}

TicketWrite WriteOf(SETMULTIPAR const& record)
{
    return {record.key, record.pos, ValueOf(record.type, record.value)};
}

std::vector<TicketWrite> WritesOf(SETMULTIPAR const* table)
{
    std::size_t count = 0;
    while (table[count].key)
        ++count;
    std::vector<TicketWrite> writes;
    writes.reserve(count);
    for (std::size_t i = 0; i < count; ++i)
        writes.push_back(WriteOf(table[i]));
    return writes;
}

void Answer(std::span<TicketWrite const> writes, SETMULTIPAR* table)
{
    for (std::size_t i = 0; i < writes.size(); ++i)
        table[i].ok = writes[i].ok;
}
}  // namespace standin
