// Servers as people write them: "press-7", "press-7:50001", "10.0.0.7:50000", "[fe80::1]:50000".
#pragma once

#include "comgui/client/Connection.h"
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace desk
{
// Nothing if it names none: no host, or a port outside 1 to 65535. Without a port, the usual one.
std::optional<comgui::Server> ServerFromText(std::string_view text);

// The port only where it is not the usual one.
std::string TextOf(comgui::Server const& server);

// Puts it in front; each once, the ten newest.
void Remember(std::vector<std::string>& servers, std::string const& server);
}  // namespace desk
