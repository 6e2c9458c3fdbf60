#include "Shown.h"

#include <cstdio>
#include <optional>

namespace
{
// How many bytes of UTF-8 begin with that one; 0: it begins nothing.
std::size_t SizeBehind(unsigned char first)
{
    if (first < 0x80)
        return 1;
    if (first < 0xC2 || first > 0xF4)
        return 0;
    return first < 0xE0 ? 2 : first < 0xF0 ? 3 : 4;
}

// The character at the beginning of the text, and its size; nothing if it is no UTF-8.
std::optional<unsigned long> FirstOf(std::string_view text, std::size_t& size)
{
    constexpr unsigned long Least[] = {0, 0, 0x80, 0x800, 0x10000};
    auto const first = static_cast<unsigned char>(text[0]);
    size = SizeBehind(first);
    if (size == 0 || size > text.size())
        return std::nullopt;
    unsigned long code = size == 1 ? first : first & (0x7FU >> size);
    for (std::size_t i = 1; i < size; ++i)
    {
        auto const next = static_cast<unsigned char>(text[i]);
        if ((next & 0xC0) != 0x80)
            return std::nullopt;
        code = code << 6 | (next & 0x3FU);
    }
    bool const isSurrogate = code >= 0xD800 && code <= 0xDFFF;
    return code < Least[size] || code > 0x10FFFF || isSurrogate ? std::nullopt : std::optional(code);
}

// Terminals obey it, or it ends the line or turns it round.
bool IsObeyed(unsigned long code)
{
    return code < ' ' || (code >= 0x7F && code <= 0x9F) || code == 0x61C || code == 0x200E ||
           code == 0x200F || (code >= 0x2028 && code <= 0x202E) || (code >= 0x2066 && code <= 0x2069);
}

std::string Escaped(char const* format, unsigned long code)
{
    char text[16];
    std::snprintf(text, sizeof text, format, code);
    return text;
}

std::string Escaped(unsigned long code)
{
    switch (code)
    {
    case '\n':
        return "\\n";
    case '\r':
        return "\\r";
    case '\t':
        return "\\t";
    default:
        return Escaped(code < ' ' ? "\\x%02lX" : "\\u%04lX", code);
    }
}
}  // namespace

std::string Shown(std::string_view text)
{
    std::string shown;
    while (!text.empty())
    {
        std::size_t size = 0;
        auto const code = FirstOf(text, size);
        if (!code)
        {
            size = 1;
            shown += Escaped("\\x%02lX", static_cast<unsigned char>(text[0]));
        }
        else if (IsObeyed(*code))
            shown += Escaped(*code);
        else
            shown += text.substr(0, size);
        text.remove_prefix(size);
    }
    return shown;
}
