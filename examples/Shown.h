// Texts of a server, or of a person, as the examples print them.
#pragma once

#include <string>
#include <string_view>

// As it can stand within a line and on a terminal: \n, \t, \r and \x1B for control characters, \u202E for
// later ones and for those that turn a line round, \xFF for bytes that are no UTF-8. All else stays, a
// backslash too, so that what is shown already stays as it is, and JSON stays JSON.
std::string Shown(std::string_view text);
