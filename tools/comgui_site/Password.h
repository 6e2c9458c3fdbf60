// A new password as a person gives it: typed twice at a terminal that does not show it, or as one line of a
// pipe.
#pragma once

#include <string>

namespace comgui_site
{
// The hash of a new password, asked for with the name of its user. Throws Trouble for one that is empty, has
// control characters or is too long, for two that differ, and where there is no input; Interrupted after
// Ctrl-C, with the terminal as it was.
std::string HashOfNewPassword(std::string const& user);
}  // namespace comgui_site
