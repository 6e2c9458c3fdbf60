// The files of a site's database that this process has open. Its locks on two of them, site.db and
// site.db-shm, are given up by the system as soon as the process closes any descriptor of them; another
// program then takes itself for the only one and clears away what it must not. So nothing else in the process
// may open them, whatever name a client gives them; and nothing but the server may replace any of the four. A
// file that was opened before its site is not noticed.
#pragma once

#include "standin/server/files/Descriptor.h"
#include "standin/server/files/FileError.h"
#include <filesystem>
#include <string>
#include <sys/stat.h>
#include <vector>

namespace standin
{
class DatabaseFiles
{
public:
    // Until the object's end. The files may come and go meanwhile.
    explicit DatabaseFiles(std::vector<std::filesystem::path> files);
    ~DatabaseFiles();
    DatabaseFiles(DatabaseFiles const&) = delete;
    DatabaseFiles& operator=(DatabaseFiles const&) = delete;

    // Throws FileError if that is one of those; shown is for the message.
    static void RefuseIfOpen(struct stat const& file, std::string const& shown);

private:
    std::vector<std::filesystem::path> const m_files;
};

// Opens a file to read, as openat does; -1 and errno if that fails. Throws FileError, and has not opened it,
// if it is one of a database.
Descriptor OpenToRead(int folder, std::filesystem::path const& file, int flags);
}  // namespace standin
