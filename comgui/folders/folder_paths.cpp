#include "comgui/folders/folder_paths.h"

#include "comgui/foundation/CharSets.h"

void comgui::detail::MakeSlash(std::string& s) { CharSets::DBCS::ReplaceAll(s, '\\', '/'); }

void comgui::detail::MakeBackslash(std::string& s) { CharSets::DBCS::ReplaceAll(s, '/', '\\'); }
