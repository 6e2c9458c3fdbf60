// The file site.lock in a site's folder: one page that all programs of the site map, see SharedPage, and
// locks on single bytes of it by which they know of each other. The locks belong to this object and not to
// the process, so that two handles in one process are two programs, and they go with the process however it
// ends.
//
// In a child that was made by fork the descriptors are closed at once: the child neither keeps the site open
// nor seems to be the program. Its copy of the object is of no use, see IsForeign.
#pragma once

#include "standin/server/files/Descriptor.h"
#include <atomic>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <sys/types.h>

namespace standin
{
class LockFile
{
public:
    enum class Hold
    {
        Shared,
        Exclusive,
    };
    // Bytes to lock. The file need not be so long.
    static constexpr off_t Opening = 1;  // exclusive for who opens or is the last to leave
    static constexpr off_t Site = 2;     // shared for who has the site open: who gets it exclusively is alone
    static constexpr off_t Turn = 3;     // exclusive for who writes, where there is no better means
    static constexpr off_t Users = 4;    // exclusive for who changes users, see SiteStore
    static off_t Life(std::int64_t program) { return 1000 + program; }  // exclusive while alive
    static off_t Burial(std::int64_t program)
    {
        return (off_t{1} << 40) + program;
    }  // exclusive for who clears up

    // Opens the file, and makes it if it is missing. Throws StoreError, also when a program of the version
    // that knew only one owner has the site open, or when the parent of this process had any site open.
    explicit LockFile(std::filesystem::path const& folder);
    ~LockFile();
    LockFile(LockFile const&) = delete;
    LockFile& operator=(LockFile const&) = delete;

    // A lock that is held already is turned into the other kind. False if another object's is in the way.
    bool TryLock(off_t byte, Hold hold);
    bool LockWithin(off_t byte, Hold hold, std::chrono::milliseconds limit);
    void Unlock(off_t byte);
    bool IsLockedElsewhere(off_t byte) const;

    // Everybody who has the site open holds a shared lock on the folder too, which cannot be removed under
    // them as the file can. For who has the right to open.
    void HoldFolder();
    bool IsFolderHeldElsewhere();  // and goes on being so, for a moment

    // Whether the file still is the one of that name.
    bool IsAtItsPath() const;

    // Lets go of every lock.
    void Close();

    // Whether this is a copy in a child of the process that opened it.
    bool IsForeign() const noexcept { return m_isForeign.load(std::memory_order_relaxed); }

    std::filesystem::path const& Path() const { return m_path; }
    std::int64_t Inode() const { return m_inode; }

private:
    class Registry;

    bool Set(short type, off_t byte);
    [[noreturn]] void Fail(char const* failed, int error) const;

    std::filesystem::path const m_path;
    Descriptor m_folder;
    Descriptor m_file;
    std::int64_t m_inode = 0;
    std::atomic<bool> m_isForeign{false};
    LockFile* m_next = nullptr;  // in the registry
};
}  // namespace standin
