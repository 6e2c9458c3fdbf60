// A temporary folder in memory if there is a place for it: the tests of the server end processes, not the
// power, and a slow disk would only leave fewer instants at which they can be ended.
#pragma once

#include "comgui/testing/TemporaryFolder.h"
#include <unistd.h>

using comgui::test::TemporaryFolder;

class MemoryFolder : public TemporaryFolder
{
public:
    MemoryFolder() : TemporaryFolder(Place()) {}

private:
    static std::filesystem::path Place()
    {
        std::filesystem::path const memory = "/dev/shm";
        return access(memory.c_str(), W_OK) == 0 ? memory : std::filesystem::temp_directory_path();
    }
};
