#include "desk/model/TextMatch.h"

#include "comgui/client/Text.h"
#include <algorithm>

namespace desk
{
namespace
{
bool IsAscii(char c) { return static_cast<unsigned char>(c) < 0x80; }
char LowerOf(char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; }
}  // namespace

std::string Folded(std::string_view text)
{
    if (!std::all_of(text.begin(), text.end(), IsAscii))
        return comgui::ToUtf8(comgui::ToWx(text).Lower());
    std::string lower(text);
    std::transform(lower.begin(), lower.end(), lower.begin(), LowerOf);
    return lower;
}

bool TextMatch::IsIn(std::string_view text) const { return Folded(text).find(m_wanted) != std::string::npos; }

bool TextMatch::IsEquation(std::string_view key, std::string_view value) const
{
    // Folding may change the number of bytes, so only what is folded is compared.
    std::string const left = Folded(key) + '=';
    return m_wanted.starts_with(left) && std::string_view(m_wanted).substr(left.size()) == Folded(value);
}
}  // namespace desk
