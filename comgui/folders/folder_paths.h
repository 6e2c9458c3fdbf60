// The separators of paths.
#pragma once

#include <string>

namespace comgui::detail
{
// Turns every backslash into a slash, or every slash into a backslash.
void MakeSlash(std::string& s);
void MakeBackslash(std::string& s);
}  // namespace comgui::detail
