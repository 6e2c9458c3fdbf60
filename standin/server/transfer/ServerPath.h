// A place on the server as clients name it: $(VARIABLE)/folder/name. Nothing outside the variable's folder
// can be named that way, and no symbolic link below it is followed.
#pragma once

#include "standin/server/files/Descriptor.h"
#include "standin/server/tickets/FolderTable.h"

namespace standin
{
// Can a file on the server have that name? 1 to 255 bytes with no separator of either kind and no control
// character; neither "." nor ".." nor what unfinished transfers are called.
bool IsFileName(std::string_view name);

struct ServerPath
{
    std::string variable;
    std::vector<std::string> folders;  // below the variable's
    std::string name;

    // Backslashes count as slashes. A text that is the variable alone, or ends in a slash, names a folder:
    // the file in it is called as the source is, whose name is leaf. Throws TransferError.
    static ServerPath Parse(std::string text, std::string_view leaf);
};

enum class Purpose
{
    Read,
    Write,
};

// Opens the folder in which the file lies. Throws TransferError: also for the folder of the site itself,
// where the server's own files are, be it site, unless that is empty, or $(INSTALL), and for writing into
// $(JOB), where jobs come in another way.
Descriptor OpenFolderOf(ServerPath const& path, FolderTable const& table, Purpose purpose,
                        std::string const& site = {});
}  // namespace standin
