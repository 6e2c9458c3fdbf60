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
    std::string executable;                       // CFBundleExecutable: the name of a file
    std::map<Uuid, std::string> functions;        // CFPlugInFactories: what to call for a factory
    std::map<Uuid, std::vector<Uuid>> factories;  // CFPlugInTypes: those of a type that have a function
};

// Nothing if the folder has no Info.plist, or one that does not describe a plug-in: no property list,
// without a plain file name as executable, without factories, a key of the wrong type. A single factory or
// type that cannot be read is left out.
std::optional<BundleInfo> ReadBundleInfo(std::filesystem::path const& bundle);
}  // namespace comgui::detail
