// The rules for single paths: separators, and what may be a path in variable form.
#pragma once

#include <string>
#include <string_view>

namespace comgui::detail
{
// Turns every backslash into a slash, or every slash into a backslash.
void MakeSlash(std::string& s);
void MakeBackslash(std::string& s);

// Whether a text may be a path in variable form: four bytes or more that begin with "$(".
bool NeedsDecode(std::string_view s);
}  // namespace comgui::detail
