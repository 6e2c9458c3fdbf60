// Failures of files and folders, as texts for the person who runs the program.
#pragma once

#include <filesystem>
#include <stdexcept>
#include <string>

namespace standin
{
// A file or folder of the server's own cannot be read or written; what() is one line with the remedy.
class FileError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

// One line that names the file, what failed, the reason of that errno and the remedy.
std::string FileFault(std::filesystem::path const& file, std::string const& failed, int error);
}  // namespace standin
