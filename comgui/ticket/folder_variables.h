// The folders that a server can have: where the system ticket keeps each, and what it is called in a path;
// and which texts may be such a path.
#pragma once

#include <string_view>

namespace comgui::detail
{
struct FOLDER_VARIABLE
{
    char const* key;
    char const* variable;
};

// Ends at a row of two nulls. The order counts: a folder may be defined in terms of those before it. The
// names are the servers': UPDATES for Update, SpotColor beside Spotcolor, two folders outside Folders/.
inline constexpr FOLDER_VARIABLE Variables[] = {
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
    {nullptr, nullptr},
};

// Whether a text may be a path in variable form: four bytes or more that begin with "$(".
constexpr bool NeedsDecode(std::string_view text)
{
    return text.size() >= 4 && text[0] == '$' && text[1] == '(';
}
}  // namespace comgui::detail
