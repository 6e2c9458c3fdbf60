// Tickets as people write them: "3/17", or "17" where the type is clear.
#pragma once

#include "comgui/client/TicketAddress.h"
#include <optional>
#include <string_view>

namespace desk
{
// Nothing if it is none: a type outside 0 to 99, a number outside 0 to 16777215, anything else around them.
std::optional<comgui::TicketAddress> TicketFromText(std::string_view text, int type);
}  // namespace desk
