// Which of the paths that a user has dropped or chosen can be sent. A plain value.
#pragma once

#include <string>
#include <vector>

namespace desk
{
enum class Refusal
{
    Folder,
    NotThere,  // or not to be seen by this user
    NoFile,    // a device, a pipe ...
    Empty,     // has no bytes, which no server takes as a job
};

struct RefusedPath
{
    std::string path;
    Refusal why;
};

struct DroppedFiles
{
    std::vector<std::string> files;
    std::vector<RefusedPath> refused;
};

// paths: UTF-8. Links are followed; opens nothing. In the order given, each path once.
DroppedFiles Sifted(std::vector<std::string> const& paths);
}  // namespace desk
