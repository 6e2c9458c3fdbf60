// What touches the operating system directly: a mutex that its holder may enter again, the lock that holds it
// for a scope, what is in a folder, and how a file gets another name.
#pragma once

#include "comgui/foundation/export.h"
#include <cstddef>
#include <list>
#include <pthread.h>
#include <string>
#include <type_traits>

namespace SysLib
{
// The mutex; it is entered through MUTEX_LOCK only. The fields are there to be looked at: locker at any time,
// by relaxed atomic access, lockCount by the thread that holds the lock. It must outlive all its locks.
class COMGUI_EXPORT MUTEX_INSTANCE
{
public:
    // What Logger is told of.
    enum eWHAT : int
    {
        CREATED = 0,
        DESTROYED = 1,
        LOCK_WANTED = 2,
        LOCK_HELD = 3,
        LOCK_RELEASED = 4,
    };

    // Throws a char const* if the system has no mutex to give.
    MUTEX_INSTANCE();
    ~MUTEX_INSTANCE();
    MUTEX_INSTANCE(MUTEX_INSTANCE const&) = delete;
    MUTEX_INSTANCE& operator=(MUTEX_INSTANCE const&) = delete;

    // The value of locker that means no thread.
    static pthread_t NO_LOCKER();

    // Hooks for tracing, empty here. Logger is called without the lock, too. What they throw where an
    // instance or a lock ends, ends the process.
    void InitID();
    static void Logger(MUTEX_INSTANCE const& instance, eWHAT what);

    pthread_mutex_t mutex;  // of the default kind; locked once, however often its holder enters
    pthread_t locker;       // the thread that holds the lock, or NO_LOCKER()
    int lockCount;          // how often locker has entered
};
static_assert(std::is_standard_layout_v<MUTEX_INSTANCE> && sizeof(MUTEX_INSTANCE::lockCount) == 4);
static_assert(offsetof(MUTEX_INSTANCE, mutex) == 0);
static_assert(offsetof(MUTEX_INSTANCE, locker) == sizeof(pthread_mutex_t));
static_assert(offsetof(MUTEX_INSTANCE, lockCount) == sizeof(pthread_mutex_t) + sizeof(pthread_t));

// Holds an instance as long as it lives. Locks of one thread nest and end in the thread that made them.
class COMGUI_EXPORT MUTEX_LOCK
{
public:
    // Waits until no other thread holds the instance. Throws a char const*, holding nothing, if the system
    // refuses the lock.
    explicit MUTEX_LOCK(MUTEX_INSTANCE& instance);
    ~MUTEX_LOCK();
    MUTEX_LOCK(MUTEX_LOCK const&) = delete;
    MUTEX_LOCK& operator=(MUTEX_LOCK const&) = delete;

private:
    MUTEX_INSTANCE& instance;
};
static_assert(sizeof(MUTEX_LOCK) == sizeof(void*));

// Replaces names by the bare names of the folder's entries that end with suffix, byte for byte, unsorted.
// With an empty suffix nothing is left out, not even "." and "..". A folder that cannot be opened leaves the
// list empty.
COMGUI_EXPORT void GetAllFilenames(std::list<std::string>& names, std::string const& folder,
                                   std::string const& suffix);

// Renames a file, over an older one of the new name. Always the empty text: look for the file to learn
// whether it worked.
COMGUI_EXPORT std::string ForceRename(std::string const& from, std::string const& to);
}  // namespace SysLib
