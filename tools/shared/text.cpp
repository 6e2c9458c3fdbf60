#include "tools/shared/text.h"

#include <cmath>
#include <nlohmann/json.hpp>

namespace tools
{
namespace
{
bool IsC1(std::string_view text, std::size_t at)  // U+0080 to U+009F
{
    return text[at] == '\xC2' && at + 1 < text.size() && static_cast<unsigned char>(text[at + 1]) < 0xA0;
}

bool HasControl(std::string_view text)
{
    for (std::size_t i = 0; i < text.size(); ++i)
        if (static_cast<unsigned char>(text[i]) < 0x20 || text[i] == 0x7F || IsC1(text, i))
            return true;
    return false;
}

// JSON leaves DEL and the control characters from U+0080 on as they are, and some terminals obey them.
std::string WithoutLateControls(std::string const& json)
{
    std::string text;
    for (std::size_t i = 0; i < json.size(); ++i)
    {
        bool const isDelete = json[i] == 0x7F;
        bool const isC1 = IsC1(json, i);
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

std::string ShownName(std::string const& name)
{
    if (name == "-")
        return "standard input";
    return name.empty() || HasControl(name) || !Quoted(name) ? Shown(name) : name;
}
}  // namespace tools
