// Texts of a server as one cell can show them: one line that stays within its cell and turns nothing round.
// Plain functions, for any thread.
#pragma once

#include "comgui/client/Value.h"
#include <cstddef>
#include <string>
#include <string_view>

namespace desk
{
// What a cell takes unless it says otherwise; the rest is for the editor.
constexpr std::size_t CellCharacters = 200;

// At most so many characters, the last one an ellipsis if the text has more. Only as much of the text is
// looked at, whatever its size. Control characters become their pictures (a newline U+240A), later ones and
// those that are invisible or turn a line round become \u202E and the like, and bytes that are no UTF-8
// U+FFFD each. A cut never parts a character from its accents or from what it is joined with. What was made
// by it stays as it is. UTF-8.
std::string DisplayText(std::string_view text, std::size_t characters = CellCharacters);

// The same of ToText(value), without all of a large value becoming a text first.
std::string DisplayTextOf(comgui::Value const& value, std::size_t characters = CellCharacters);
}  // namespace desk
