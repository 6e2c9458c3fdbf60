#include "comgui/access/FromUtf8.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace comgui::detail
{
namespace
{
constexpr std::size_t Most = 256;  // bytes; a longer text takes long anyway

// As many bytes as a WORD has, stored as they are. Their word: ASCII if no byte of it has its highest bit.
template <typename WORD>
WORD WidenWord(wchar_t* to, char const* from)
{
    for (std::size_t i = 0; i < sizeof(WORD); ++i)  // a few instructions, since the size is known
        to[i] = static_cast<unsigned char>(from[i]);
    WORD word;
    std::memcpy(&word, from, sizeof word);
    return word;
}

// Word by word, the last of which may overlap the one before.
template <typename WORD>
bool WidenWords(wchar_t* to, char const* from, std::size_t size)
{
    constexpr WORD HighestBits = static_cast<WORD>(0x8080808080808080);
    WORD seen = WidenWord<WORD>(to + size - sizeof(WORD), from + size - sizeof(WORD));
    for (std::size_t at = 0; at + sizeof(WORD) < size; at += sizeof(WORD))
        seen |= WidenWord<WORD>(to + at, from + at);
    return (seen & HighestBits) == 0;
}

// False if it is not all ASCII; what is in to is then of no use. size: not 0.
bool WidenAscii(wchar_t* to, char const* from, std::size_t size)
{
    return size >= sizeof(std::uint64_t)   ? WidenWords<std::uint64_t>(to, from, size)
           : size >= sizeof(std::uint32_t) ? WidenWords<std::uint32_t>(to, from, size)
                                           : WidenWords<unsigned char>(to, from, size);
}
}  // namespace

wxString FromUtf8(char const* text)
{
    if (text == nullptr || *text == '\0')
        return wxString();
    std::size_t const size = std::strlen(text);
    wchar_t wide[Most];
    if (size > Most || !WidenAscii(wide, text, size))
        return wxString::FromUTF8(text, size);
    return wxString(wide, size);
}
}  // namespace comgui::detail
