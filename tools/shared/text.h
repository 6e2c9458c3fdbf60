// Texts, bytes and numbers as people and JSON read them.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tools
{
// In quotes, as JSON has it and with all that a terminal might obey escaped; none if it is not UTF-8.
std::optional<std::string> Quoted(std::string_view text);

std::string Hex(std::string_view bytes);
std::optional<std::string> BytesOfHex(std::string_view hex);

// The shortest decimal text that gives the number back, with a point or an exponent; "NaN" for none.
std::string NumberText(double number);

// For people: in quotes, or as hex where that is impossible. Longer ones than the limit are cut, and say how
// long they are.
std::string Shown(std::string_view text, unsigned long limit = std::string_view::npos);
std::string ShownBytes(std::string_view bytes, unsigned long limit = std::string_view::npos);

// The name of a file in a message: as it is, or in quotes if it would break the line or a terminal might obey
// it; "standard input" for -.
std::string ShownName(std::string const& name);
}  // namespace tools
