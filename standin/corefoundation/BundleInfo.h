// What the Info.plist of a plug-in bundle says, as far as opening the plug-in needs it.
#pragma once

#include "standin/corefoundation/Uuid.h"
#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace comgui::detail
{
struct BundleInfo
{
    std::string executable;                       // a file's name; empty if CFBundleExecutable is a path
    std::map<Uuid, std::string> functions;        // CFPlugInFactories: what to call for a factory
    std::map<Uuid, std::vector<Uuid>> factories;  // CFPlugInTypes: those of a type that have a function
};

// Nothing if the folder has no Info.plist or one that is no property list with a dictionary. What is missing
// or of the wrong type in that dictionary is left out; without a text in CFBundleExecutable the executable is
// named like the folder, less the folder's extension.
std::optional<BundleInfo> ReadBundleInfo(std::filesystem::path const& bundle);
}  // namespace comgui::detail
