// The rules for single paths: separators, what may be a path in variable form, which paths lie in a folder.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace comgui::detail
{
// Turns every backslash into a slash, or every slash into a backslash.
void MakeSlash(std::string& s);
void MakeBackslash(std::string& s);

// Whether a text may be a path in variable form: four bytes or more that begin with "$(".
bool NeedsDecode(std::string_view s);

// How many bytes of path the folder covers: all of its own, or 0 if the path is neither the folder nor inside
// it. A backslash of the path counts as a slash, one of the folder as itself. Case counts, and so does every
// slash: an empty folder holds nothing.
std::size_t MatchLength(std::string_view folder, std::string_view path);
}  // namespace comgui::detail
