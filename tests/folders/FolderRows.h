// The folders that a server can have, in the order in which they are loaded.
#pragma once

#include <array>

struct FOLDER_ROW
{
    char const* key;
    char const* variable;
};

inline constexpr std::array<FOLDER_ROW, 28> FolderRows = {{
    {"System/InstallFolder", "INSTALL"},
    {"System/Folders/Temp", "TEMP"},
    {"System/Folders/Thumbnail", "THUMBNAIL"},
    {"System/Folders/Print", "PRINT"},
    {"System/Folders/RemoteIn", "REMOTE_IN"},
    {"System/Folders/RemoteWCC", "REMOTE_WCC"},
    {"System/Folders/RemoteOut", "REMOTE_OUT"},
    {"System/Folders/Log", "LOG"},
    {"System/Folders/Embedded", "EMBEDDED"},
    {"System/Folders/Export", "EXPORT"},
    {"System/Folders/Preview", "PREVIEW"},
    {"System/Folders/Job", "JOB"},
    {"System/Folders/PaperProfiles", "PAPER"},
    {"System/Folders/ReferenceProfiles", "REFERENCE"},
    {"System/Folders/Linearisation/Visual", "LIN_VISUAL"},
    {"System/Folders/Linearisation/Measured", "LIN_MEASURED"},
    {"System/Folders/Linearisation/Plate", "LIN_PLATE"},
    {"System/Folders/Linearisation/SpotColor", "LIN_SPOTCOLOR"},
    {"System/Folders/SpotcolorTable", "SPOTCOLORTAB"},
    {"System/Folders/ControlStrip", "CONTROLSTRIP"},
    {"System/Folders/Update", "UPDATES"},
    {"System/Folders/Backup", "BACKUP"},
    {"System/Folders/SPT", "SPT"},
    {"System/Linearisation/LAB", "LABCORRECTION"},
    {"System/Folders/Environments", "ENVIRONMENTS"},
    {"System/Folders/Logo", "LOGO"},
    {"System/Folders/HotFolder", "HOT"},
    {"System/Folders/Analytics", "ANALYTICS"},
}};
