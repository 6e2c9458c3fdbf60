#include "comgui/folders/FolderVariables.h"

#include "comgui/folders/clFOLDER_VARIABLES_IMP.h"
#include "comgui/ticket/folder_variables.h"
#include <cstring>

using comgui::detail::FOLDER_VARIABLE;

namespace
{
// The field of the first row whose other field is that text.
char const* Find(char const* FOLDER_VARIABLE::*wanted, char const* FOLDER_VARIABLE::*known, char const* text)
{
    if (text == nullptr)
        return nullptr;
    FOLDER_VARIABLE const* row = comgui::detail::Variables;
    while (row->key && std::strcmp(row->*known, text) != 0)
        ++row;
    return row->*wanted;  // of the last row: null
}
}  // namespace

clFOLDER_VARIABLES* CreateFolderVariables(MTICKET_ACCESS const* access)
{
    return new comgui::detail::clFOLDER_VARIABLES_IMP(access);
}

std::intptr_t EncodeFolderFull(clFOLDER_VARIABLES* folders, FOLDER_TEXT_ACTION action, void* user,
                               char const* path)
{
    return folders && action && path ? action(user, folders->Encode(path).c_str()) : 0;
}

std::intptr_t EncodeFolderRelative(clFOLDER_VARIABLES* folders, FOLDER_TEXT_ACTION action, void* user,
                                   char const* key, char const* relative)
{
    return folders && action && relative ? action(user, folders->Encode(key, relative).c_str()) : 0;
}

std::intptr_t DecodeFolder(clFOLDER_VARIABLES* folders, FOLDER_TEXT_ACTION action, void* user,
                           char const* path, bool backslashes)
{
    return folders && action && path ? action(user, folders->Decode(path, backslashes).c_str()) : 0;
}

char const* GetFolderKey(char const* variable)
{
    return Find(&FOLDER_VARIABLE::key, &FOLDER_VARIABLE::variable, variable);
}

char const* GetFolderVariable(char const* key)
{
    return Find(&FOLDER_VARIABLE::variable, &FOLDER_VARIABLE::key, key);
}
