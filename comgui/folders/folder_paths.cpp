#include "comgui/folders/folder_paths.h"

#include "comgui/foundation/CharSets.h"
#include <algorithm>

namespace
{
char Slashed(char c) { return c == '\\' ? '/' : c; }
}  // namespace

void comgui::detail::MakeSlash(std::string& s) { CharSets::DBCS::ReplaceAll(s, '\\', '/'); }

void comgui::detail::MakeBackslash(std::string& s) { CharSets::DBCS::ReplaceAll(s, '/', '\\'); }

bool comgui::detail::NeedsDecode(std::string_view s) { return s.size() >= 4 && s.starts_with("$("); }

std::size_t comgui::detail::MatchLength(std::string_view folder, std::string_view path)
{
    std::size_t const length = folder.size();
    if (length == 0 || length > path.size())
        return 0;
    // The end first: folders mostly begin alike, and few end where the path has a separator.
    if (length < path.size() && Slashed(path[length]) != '/')
        return 0;
    bool const isCovered = std::equal(folder.rbegin(), folder.rend(), path.rend() - std::ptrdiff_t(length),
                                      [](char f, char p) { return f == Slashed(p); });
    return isCovered ? length : 0;
}
