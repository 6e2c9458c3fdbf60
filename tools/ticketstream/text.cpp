#include "tools/ticketstream/text.h"

#include <algorithm>

namespace ticketstream
{
namespace
{
struct TypeWord
{
    PARAM_TYPE type;
    char const* word;
};
constexpr TypeWord TypeWords[] = {
    {PARAM_NONE, "none"},
    {PARAM_INT, "int"},
    {PARAM_DOUBLE, "double"},
    {PARAM_STRING, "string"},
    {PARAM_BINSTRING, "binstring"},
    {PARAM_INT64, "int64"},
    {PARAM_UNSIGNED64, "unsigned64"},
};
}  // namespace

char const* TypeName(PARAM_TYPE type)
{
    auto const* const found = std::find_if(std::begin(TypeWords), std::end(TypeWords),
                                           [&](auto& word) { return word.type == type; });
    return found == std::end(TypeWords) ? "?" : found->word;
}

std::optional<PARAM_TYPE> TypeOfName(std::string_view name)
{
    auto const* const found = std::find_if(std::begin(TypeWords), std::end(TypeWords),
                                           [&](auto& word) { return word.word == name; });
    return found == std::end(TypeWords) ? std::nullopt : std::optional(found->type);
}

std::string Shown(Value const& value, unsigned long limit)
{
    switch (value.type)
    {
    case PARAM_INT:
    case PARAM_INT64:
        return std::to_string(value.integer);
    case PARAM_UNSIGNED64:
        return std::to_string(value.unsigned64);
    case PARAM_DOUBLE:
        return NumberText(value.number);
    case PARAM_STRING:
        return Shown(value.bytes, limit);
    case PARAM_BINSTRING:
        return ShownBytes(value.bytes, limit);
    default:  // a delete has none
        return "";
    }
}
}  // namespace ticketstream
