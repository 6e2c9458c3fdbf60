// Messages for the person who runs the program.
#pragma once

#include <string>
#include <string_view>

namespace standin
{
// One line on stderr.
void Report(std::string const& line) noexcept;

// A text with its control characters replaced, for a message of one line.
std::string ForMessages(std::string_view text);
}  // namespace standin
