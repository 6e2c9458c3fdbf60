// Messages for the person who runs the program. What is reported in a client's call is also the reason of the
// call, if that is refused; see RefusableCall.
#pragma once

#include <initializer_list>
#include <string>
#include <string_view>

namespace standin
{
// One line on stderr.
void Report(std::string const& line) noexcept;

// One line of several parts. It is reported, too, when no memory is left to put it together. program: what
// stderr gets in front of it.
void Report(std::initializer_list<std::string_view> parts, std::string_view program = {}) noexcept;

std::string Joined(std::initializer_list<std::string_view> parts);

// A text with its control characters replaced, for a message of one line.
std::string ForMessages(std::string_view text);
}  // namespace standin
