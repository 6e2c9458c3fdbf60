#include "standin/corefoundation/Utf8.h"

namespace comgui::detail
{
namespace
{
// The length of the UTF-8 sequence at the start of text, 0 if there is no valid one.
std::size_t SequenceLength(std::string_view text)
{
    auto const byte = [&](std::size_t at) { return static_cast<unsigned char>(text[at]); };
    unsigned char const lead = byte(0);
    if (lead < 0x80)
        return 1;
    std::size_t const length = lead < 0xC2 ? 0 : lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : lead < 0xF5 ? 4 : 0;
    if (length == 0 || length > text.size())
        return 0;
    // The second byte alone tells overlong forms, surrogates and code points past the last one.
    unsigned char const lowest = lead == 0xE0 ? 0xA0 : lead == 0xF0 ? 0x90 : 0x80;
    unsigned char const highest = lead == 0xED ? 0x9F : lead == 0xF4 ? 0x8F : 0xBF;
    if (byte(1) < lowest || byte(1) > highest)
        return 0;
    for (std::size_t at = 2; at < length; ++at)
    {
        if ((byte(at) & 0xC0) != 0x80)
            return 0;
    }
    return length;
}
}  // namespace

bool IsUtf8(std::string_view text)
{
    while (!text.empty())
    {
        std::size_t const length = SequenceLength(text);
        if (length == 0)
            return false;
        text.remove_prefix(length);
    }
    return true;
}
}  // namespace comgui::detail
