#include "standin/server/files/FileError.h"

#include "standin/server/files/Report.h"
#include <cerrno>
#include <system_error>

namespace standin
{
namespace
{
char const* RemedyOf(int error)
{
    switch (error)
    {
    case ENOSPC:
    case EDQUOT:
    case EFBIG:
        return "free some space, then try again";
    case EACCES:
    case EPERM:
        return "give this user the right to it and to its folder";
    case EROFS:
        return "choose a folder that can be written to";
    case ENOTDIR:
        return "move away the file that stands where a folder is needed, or choose another folder";
    case ENOENT:
        return "make the file or folder, or correct its path";
    case EMFILE:
    case ENFILE:
        return "close other files, then try again";
    default:
        return "check the path and the disk, then try again";
    }
}
}  // namespace

std::string FileFault(std::filesystem::path const& file, std::string const& failed, int error)
{
    return ForMessages(file.string() + ": " + failed) + ": " + std::generic_category().message(error) + "; " +
           RemedyOf(error);
}
}  // namespace standin
