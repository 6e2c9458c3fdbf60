// A small disk in memory, mounted on a folder, which can be filled at a moment's notice. Only root has it,
// and only this process and those that it starts see it: it goes with them.
#pragma once

#include <filesystem>

class SmallDisk
{
public:
    SmallDisk(std::filesystem::path folder, bool isWanted);  // the folder is made in any case
    ~SmallDisk();
    SmallDisk(SmallDisk const&) = delete;
    SmallDisk& operator=(SmallDisk const&) = delete;

    bool IsThere() const { return m_isThere; }  // otherwise it is an ordinary folder

    void Fill() const;  // to the last byte
    void Free() const;

    // Moves what is on it to the folder that it was mounted on; it is there no more.
    void Unload();

private:
    std::filesystem::path const m_folder;
    bool m_isThere = false;
};
