// Which text names a ticket to people, who know a job by its name and not by its number.
#pragma once

#include "comgui/client/Value.h"
#include <cstddef>
#include <optional>
#include <string>

namespace desk
{
// The key whose value is the title of tickets of that type; null where no such key is known.
char const* TitleKeyOf(int type);

constexpr std::size_t LongestTitle = 256;  // bytes; the rest is left to the editor

// The title that the value of that key gives, cut to LongestTitle at the end of a character; none if it says
// nothing.
std::optional<std::string> TitleOf(comgui::Value const& value);
}  // namespace desk
