// The translator of the server's folders (clFOLDER_VARIABLES) by plain functions, for callers that do not
// know the class or share no string type with this library: those that find them by name.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <cstdint>

class clFOLDER_VARIABLES;

extern "C"
{
    // Gets a translated text, UTF-8, which dies when it returns.
    typedef std::intptr_t (*FOLDER_TEXT_ACTION)(void* user, char const* text);

    // A new translator, which may be used from any thread; the caller deletes it. It asks the container for
    // its folders at once, and once more at each Load(); so the container must outlive it. With null it
    // begins without folders, enabled, for those that SetFolderVariable brings. Loading does not end where a
    // folder begins with $( but not with the variable of one before it, in the order of the 28 keys, or where
    // nothing is decoded: that is for the server to get right.
    COMGUI_EXPORT clFOLDER_VARIABLES* CreateFolderVariables(MTICKET_ACCESS const* access);

    // Encode(path), Encode(key, relative) and Decode(path, backslashes) of the translator. The action is
    // called once, also for a text that comes back as it was, and its result is handed on. A null
    // translator, action or text (key may be null) gives 0 without a call.
    COMGUI_EXPORT std::intptr_t EncodeFolderFull(clFOLDER_VARIABLES* folders, FOLDER_TEXT_ACTION action,
                                                 void* user, char const* path);
    COMGUI_EXPORT std::intptr_t EncodeFolderRelative(clFOLDER_VARIABLES* folders, FOLDER_TEXT_ACTION action,
                                                     void* user, char const* key, char const* relative);
    COMGUI_EXPORT std::intptr_t DecodeFolder(clFOLDER_VARIABLES* folders, FOLDER_TEXT_ACTION action,
                                             void* user, char const* path, bool backslashes);

    // The key of a folder in the system ticket ("System/Folders/Temp") by its variable ("TEMP"), and the
    // other way round; of all folders there can be, whatever a server has. A constant; null for null and for
    // what is not known.
    COMGUI_EXPORT char const* GetFolderKey(char const* variable);
    COMGUI_EXPORT char const* GetFolderVariable(char const* key);
}
