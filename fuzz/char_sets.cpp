// The recognition of UTF-8 and the escaping of XML against the rules taken literally: all sequences that
// there can be are tried at each place, and replacements are made in the text one by one.
#include "comgui/foundation/CharSets.h"

#include "fuzz/fuzz.h"
#include <algorithm>
#include <map>

namespace
{
bool IsBetween(char c, int low, int high)
{
    return static_cast<unsigned char>(c) >= low && static_cast<unsigned char>(c) <= high;
}

bool IsLeadOf(char c, int following)
{
    if (following == 1)
        return IsBetween(c, 0xC0, 0xDF);
    if (following == 2)
        return IsBetween(c, 0xE0, 0xEF);
    return IsBetween(c, 0xF0, 0xFF) && static_cast<unsigned char>(c) % 2 == 0;
}

bool HoldsASequence(std::string const& text)
{
    for (std::size_t i = 0; i < text.size(); ++i)
        for (int following = 1; following <= 3; ++following)
        {
            std::string const behind = text.substr(i + 1, static_cast<std::size_t>(following));
            if (IsLeadOf(text[i], following) && behind.size() == static_cast<std::size_t>(following) &&
                std::all_of(behind.begin(), behind.end(), [](char c) { return IsBetween(c, 0x80, 0xBF); }))
                return true;
        }
    return false;
}

std::string Escaped(std::string text)
{
    std::map<unsigned char, std::string> const replacements = {
        {'"', "&quot;"},  {'&', "&amp;"},   {'\'', "&apos;"}, {'<', "&lt;"},
        {'>', "&gt;"},    {0xC4, "&#196;"}, {0xD6, "&#214;"}, {0xDC, "&#220;"},
        {0xDF, "&#223;"}, {0xE4, "&#228;"}, {0xF6, "&#246;"}, {0xFC, "&#252;"}};
    std::size_t scan = 0;
    for (auto const& [byte, replacement] : replacements)
        for (std::size_t found; (found = text.find(static_cast<char>(byte), scan)) != std::string::npos;)
        {
            text.replace(found, 1, replacement);
            scan = found + 1;
        }
    return text;
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string text(reinterpret_cast<char const*>(data), size);
    std::string const untilZero = text.substr(0, text.find('\0'));
    COMGUI_MUST(CharSets::IsUtf8Coded(text) == HoldsASequence(untilZero));
    COMGUI_MUST(CharSets::IsUtf8Coded(text.c_str()) == HoldsASequence(untilZero));
    std::string const escaped = Escaped(text);
    CharSets::ReplaceConflictingXMLDataInString(text);
    COMGUI_MUST(text == escaped);
    return 0;
}
