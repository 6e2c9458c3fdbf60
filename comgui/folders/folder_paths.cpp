#include "comgui/folders/folder_paths.h"

#include "comgui/foundation/CharSets.h"

void comgui::detail::MakeSlash(std::string& s) { CharSets::DBCS::ReplaceAll(s, '\\', '/'); }

void comgui::detail::MakeBackslash(std::string& s) { CharSets::DBCS::ReplaceAll(s, '/', '\\'); }

bool comgui::detail::NeedsDecode(std::string_view s) { return s.size() >= 4 && s.starts_with("$("); }
