#include "standin/server/tickets/TicketXmlText.h"

namespace standin
{
namespace
{
constexpr std::string_view Digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

// The length of the character at the head of the text, 0 if there is none that XML allows.
std::size_t CharacterLength(std::string_view text)
{
    auto const byte = [&text](std::size_t i) -> unsigned { return static_cast<unsigned char>(text[i]); };
    unsigned const first = byte(0);
    if (first < 0x80)
        return first >= 0x20 || first == '\t' || first == '\n' || first == '\r' ? 1 : 0;
    std::size_t const length = first < 0xC2 ? 0 : first < 0xE0 ? 2 : first < 0xF0 ? 3 : first < 0xF5 ? 4 : 0;
    if (length == 0 || text.size() < length)
        return 0;
    unsigned code = first & (0x7Fu >> length);
    for (std::size_t i = 1; i < length; ++i)
    {
        if ((byte(i) & 0xC0) != 0x80)
            return 0;
        code = code << 6 | (byte(i) & 0x3F);
    }
    bool const isOverlong = (length == 3 && code < 0x800) || (length == 4 && code < 0x10000);
    bool const isNoCharacter =
        (code >= 0xD800 && code < 0xE000) || code > 0x10FFFF || code == 0xFFFE || code == 0xFFFF;
    return isOverlong || isNoCharacter ? 0 : length;
}
}  // namespace

std::size_t FirstForbiddenInXml(std::string_view text)
{
    for (std::size_t offset = 0; offset < text.size();)
    {
        std::size_t const length = CharacterLength(text.substr(offset));
        if (length == 0)
            return offset;
        offset += length;
    }
    return std::string_view::npos;
}

std::string EncodeBase64(std::string_view bytes)
{
    std::string text;
    text.reserve((bytes.size() + 2) / 3 * 4);
    for (std::size_t i = 0; i < bytes.size(); i += 3)
    {
        std::size_t const count = bytes.size() - i < 3 ? bytes.size() - i : 3;
        unsigned group = 0;
        for (std::size_t k = 0; k < 3; ++k)
            group = group << 8 | (k < count ? static_cast<unsigned char>(bytes[i + k]) : 0u);
        for (std::size_t k = 0; k < 4; ++k)
            text.push_back(k <= count ? Digits[group >> (18 - 6 * k) & 0x3F] : '=');
    }
    return text;
}

std::optional<std::string> DecodeBase64(std::string_view text)
{
    std::string bytes;
    unsigned group = 0;
    std::size_t digits = 0;
    std::size_t padding = 0;
    for (char const sign : text)
    {
        if (sign == ' ' || sign == '\t' || sign == '\n' || sign == '\r')
            continue;
        std::size_t const digit = Digits.find(sign);
        bool const isPadding = sign == '=' && digits % 4 >= 2;
        if ((digit == std::string_view::npos && !isPadding) || (padding > 0 && !isPadding))
            return std::nullopt;
        padding += isPadding ? 1 : 0;
        group = group << 6 | (isPadding ? 0u : static_cast<unsigned>(digit));
        if (++digits % 4 != 0)
            continue;
        for (std::size_t k = 0; k + padding < 3; ++k)
            bytes.push_back(static_cast<char>(group >> (16 - 8 * k) & 0xFF));
        group = 0;
    }
    // After a padded group digits % 4 is 0 again, so a second one cannot begin with padding.
    if (digits % 4 != 0)
        return std::nullopt;
    return bytes;
}
}  // namespace standin
