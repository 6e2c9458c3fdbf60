#include "comgui/client/Text.h"

namespace comgui
{
namespace
{
// The length of the character at the beginning of text, 0 if that is no UTF-8: overlong forms, surrogates and
// what lies beyond U+10FFFF are none.
std::size_t LengthOfFirst(std::string_view text)
{
    auto const byte = [&text](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    unsigned char const first = byte(0);
    std::size_t const length = first < 0x80   ? 1
                               : first < 0xC2 ? 0
                               : first < 0xE0 ? 2
                               : first < 0xF0 ? 3
                               : first < 0xF5 ? 4
                                              : 0;
    if (length == 0 || text.size() < length)
        return 0;
    for (std::size_t i = 1; i < length; ++i)
        if ((byte(i) & 0xC0) != 0x80)
            return 0;
    bool const isOverlong = (first == 0xE0 && byte(1) < 0xA0) || (first == 0xF0 && byte(1) < 0x90);
    bool const isNone = (first == 0xED && byte(1) >= 0xA0) || (first == 0xF4 && byte(1) >= 0x90);
    return isOverlong || isNone ? 0 : length;
}
}  // namespace

wxString ToWx(std::string_view utf8)
{
    std::string valid;
    valid.reserve(utf8.size());
    while (!utf8.empty())
    {
        std::size_t const length = LengthOfFirst(utf8);
        valid += length == 0 ? std::string_view("\xEF\xBF\xBD") : utf8.substr(0, length);
        utf8.remove_prefix(length == 0 ? 1 : length);
    }
    return wxString::FromUTF8(valid.data(), valid.size());
}

std::string ToUtf8(wxString const& text) { return text.utf8_string(); }
}  // namespace comgui
