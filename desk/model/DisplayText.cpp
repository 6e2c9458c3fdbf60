#include "desk/model/DisplayText.h"

#include "comgui/client/Text.h"
#include <algorithm>
#include <cstdio>
#include <iterator>
#include <wx/string.h>

namespace desk
{
namespace
{
constexpr wxUint32 Ellipsis = 0x2026;
constexpr wxUint32 Joiner = 0x200D;

// So many accents and joined characters stay with one; a longer row of them is no writing.
constexpr std::size_t MostJoined = 16;

struct RANGE
{
    wxUint32 first;
    wxUint32 last;
};

// Invisible, or obeyed rather than shown. The joiners are not among them: scripts and pictures need them.
constexpr RANGE Hidden[] = {{0x80, 0x9F},     {0xAD, 0xAD},     {0x61C, 0x61C},   {0x180E, 0x180E},
                            {0x200B, 0x200B}, {0x200E, 0x200F}, {0x2028, 0x202E}, {0x2060, 0x206F},
                            {0xFEFF, 0xFEFF}, {0xFFF9, 0xFFFB}, {0xFFFE, 0xFFFF}, {0xE0000, 0xE007F}};

// Shown in or on the character before: accents, signs of vowels, joiners, variants, colours of skin.
constexpr RANGE Attached[] = {{0x300, 0x36F},    {0x483, 0x489},   {0x591, 0x5BD},   {0x610, 0x61A},
                              {0x64B, 0x65F},    {0x6D6, 0x6ED},   {0x900, 0x903},   {0x93A, 0x93C},
                              {0x93E, 0x94F},    {0xE31, 0xE31},   {0xE34, 0xE3A},   {0xE47, 0xE4E},
                              {0x1AB0, 0x1AFF},  {0x1DC0, 0x1DFF}, {0x200C, 0x200D}, {0x20D0, 0x20FF},
                              {0x3099, 0x309A},  {0xFE00, 0xFE0F}, {0xFE20, 0xFE2F}, {0x1F3FB, 0x1F3FF},
                              {0xE0100, 0xE01EF}};

template <std::size_t Count>
bool IsIn(RANGE const (&ranges)[Count], wxUint32 character)
{
    return std::any_of(std::begin(ranges), std::end(ranges),
                       [character](RANGE range)
                       { return character >= range.first && character <= range.last; });
}

wxString Shown(wxUint32 character)
{
    if (character < ' ')
        return wxUniChar(0x2400 + character);
    if (character == 0x7F)
        return wxUniChar(0x2421);
    if (!IsIn(Hidden, character))
        return wxUniChar(character);
    char escaped[16];
    std::snprintf(escaped, sizeof escaped, "\\u%04X", static_cast<unsigned>(character));
    return wxString::FromAscii(escaped);
}

// The beginning that so many bytes can hold, without half a character at its end.
std::string_view BeginningOf(std::string_view text, std::size_t bytes)
{
    if (text.size() <= bytes)
        return text;
    std::size_t end = bytes;
    while (end + 3 > bytes && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80)
        --end;
    return text.substr(0, end);
}

// The text from any character up to the next that stands for itself; takes it off the range.
wxString NextJoined(wxString::const_iterator& next, wxString::const_iterator end)
{
    wxString joined = Shown((*next).GetValue());
    bool isJoined = false;
    for (++next; next != end && joined.length() <= MostJoined; ++next)
    {
        wxUint32 const character = (*next).GetValue();
        if (!isJoined && !IsIn(Attached, character))
            break;
        isJoined = character == Joiner;
        joined += Shown(character);
    }
    return joined;
}

comgui::Value BeginningOf(comgui::Value const& value, std::size_t characters)
{
    // Half a UTF-8 character at the end does not matter: it lies behind the cut.
    std::size_t const bytes = 4 * (characters + MostJoined + 1);
    if (auto const* const text = std::get_if<std::string>(&value))
        return text->substr(0, bytes);
    if (auto const* const binary = std::get_if<comgui::Bytes>(&value))
        return comgui::Bytes{binary->bytes.substr(0, bytes)};
    auto const* const list = std::get_if<comgui::List>(&value);
    if (!list)
        return value;
    // Each position takes two characters at least, its comma and space, whether it has an element or not.
    comgui::List beginning;
    int const last = static_cast<int>(std::min<std::size_t>(characters, 1U << 20));
    for (comgui::Element const& element : *list)
    {
        beginning.push_back({std::min(element.pos, last), BeginningOf(element.value, characters)});
        if (element.pos >= last || beginning.size() > characters)
            break;
    }
    return beginning;
}
}  // namespace

std::string DisplayText(std::string_view text, std::size_t characters)
{
    wxString const read = comgui::ToWx(BeginningOf(text, 4 * (characters + MostJoined + 1)));
    wxString shown;
    std::size_t fitting = 0;  // of shown, with room for an ellipsis
    for (auto next = read.begin(); next != read.end() && shown.length() <= characters;)
    {
        shown += NextJoined(next, read.end());
        if (shown.length() < characters)
            fitting = shown.length();
    }
    if (shown.length() > characters)
        shown = characters == 0 ? wxString() : shown.substr(0, fitting) + wxUniChar(Ellipsis);
    return comgui::ToUtf8(shown);
}

std::string DisplayTextOf(comgui::Value const& value, std::size_t characters)
{
    return DisplayText(comgui::ToText(BeginningOf(value, characters)), characters);
}
}  // namespace desk
