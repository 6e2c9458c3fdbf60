// Whether a text occurs in another, whatever the case of its letters. Texts are UTF-8; bytes that are none
// count as U+FFFD each. Letters beyond ASCII have a case only in a locale that knows them, which a program
// with windows sets up at its start. A plain value.
#pragma once

#include <string>
#include <string_view>

namespace desk
{
// The text in lower case.
std::string Folded(std::string_view text);

class TextMatch
{
public:
    explicit TextMatch(std::string_view wanted) : m_wanted(Folded(wanted)) {}

    bool IsEmpty() const { return m_wanted.empty(); }
    bool IsIn(std::string_view text) const;

    // Whether the whole of it says "key=value"; either may have a "=" of its own.
    bool IsEquation(std::string_view key, std::string_view value) const;
    bool HasEquation() const { return m_wanted.find('=', 1) != std::string::npos; }

private:
    std::string m_wanted;  // in lower case
};
}  // namespace desk
