#include "tools/ticketstream/text.h"

#include <algorithm>
#include <cmath>
#include <nlohmann/json.hpp>

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

bool IsControl(char byte) { return static_cast<unsigned char>(byte) < 0x20 || byte == 0x7F; }

// JSON leaves DEL and the control characters from U+0080 on as they are, and some terminals obey them.
std::string WithoutLateControls(std::string const& json)
{
    std::string text;
    for (std::size_t i = 0; i < json.size(); ++i)
    {
        bool const isDelete = json[i] == 0x7F;
        bool const isC1 = json[i] == '\xC2' && static_cast<unsigned char>(json[i + 1]) < 0xA0;
        if (!isDelete && !isC1)
        {
            text += json[i];
            continue;
        }
        i += isC1 ? 1 : 0;
        text += "\\u00" + Hex(std::string_view(json).substr(i, 1));
    }
    return text;
}

// The longest beginning of at most that many bytes that does not end within a character.
std::string_view Beginning(std::string_view text, unsigned long limit)
{
    std::string_view beginning = text.substr(0, limit);
    for (int i = 0; i < 3 && beginning.size() < text.size() && !beginning.empty(); ++i)
    {
        if ((static_cast<unsigned char>(text[beginning.size()]) & 0xC0) != 0x80)
            break;
        beginning.remove_suffix(1);
    }
    return beginning;
}

std::string CutMark(std::string_view text, std::string_view shown)
{
    return shown.size() == text.size() ? "" : " ... " + std::to_string(text.size()) + " bytes";
}

}  // namespace

std::optional<std::string> Quoted(std::string_view text)
{
    try
    {
        std::string json = nlohmann::json(text).dump();
        bool const hasLate = json.find_first_of("\x7F\xC2") != std::string::npos;
        return hasLate ? WithoutLateControls(json) : std::move(json);
    }
    catch (nlohmann::json::type_error const&)
    {
        return {};
    }
}

std::string Hex(std::string_view bytes)
{
    std::string hex;
    hex.reserve(2 * bytes.size());
    for (char const byte : bytes)
    {
        hex += "0123456789abcdef"[static_cast<unsigned char>(byte) >> 4];
        hex += "0123456789abcdef"[static_cast<unsigned char>(byte) & 15];
    }
    return hex;
}

std::optional<std::string> BytesOfHex(std::string_view hex)
{
    constexpr std::string_view digits = "0123456789abcdef0123456789ABCDEF";
    std::string bytes;
    bytes.reserve(hex.size() / 2);
    if (hex.size() % 2 != 0)
        return {};
    for (std::size_t i = 0; i < hex.size(); i += 2)
    {
        std::size_t const high = digits.find(hex[i]);
        std::size_t const low = digits.find(hex[i + 1]);
        if (high == std::string_view::npos || low == std::string_view::npos)
            return {};
        bytes += static_cast<char>((high & 15) << 4 | (low & 15));
    }
    return bytes;
}

std::string NumberText(double number) { return std::isnan(number) ? "NaN" : nlohmann::json(number).dump(); }

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

std::string Shown(std::string_view text, unsigned long limit)
{
    std::string_view const beginning = Beginning(text, limit);
    auto const quoted = Quoted(beginning);
    return quoted ? *quoted + CutMark(text, beginning) : ShownBytes(text, limit);
}

std::string ShownBytes(std::string_view bytes, unsigned long limit)
{
    std::string_view const shown = bytes.substr(0, limit);
    return "hex:" + Hex(shown) + CutMark(bytes, shown);
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

std::string ShownName(std::string const& name)
{
    if (name == "-")
        return "standard input";
    bool const breaksTheLine = name.empty() || std::any_of(name.begin(), name.end(), IsControl);
    return breaksTheLine || !Quoted(name) ? Shown(name) : name;
}
}  // namespace ticketstream
