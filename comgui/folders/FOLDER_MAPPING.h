// What one folder of the server is called in a path.
#pragma once

#include <string>
#include <utility>

namespace comgui::detail
{
struct FOLDER_MAPPING
{
    FOLDER_MAPPING(std::string itsKey, std::string itsVariable, std::string itsFolder)
        : key(std::move(itsKey)), variable(std::move(itsVariable)), folder(std::move(itsFolder))
    {
    }

    std::string key;       // in the system ticket; empty if SetFolderVariable made the mapping
    std::string variable;  // its bare name
    std::string folder;    // as Load() tidied it up, or as SetFolderVariable got it
};
}  // namespace comgui::detail
