#include "comgui/foundation/SysLib.h"

#include <cstdio>
#include <dirent.h>
#include <memory>
#include <string_view>

namespace
{
// Other threads look at locker while its holder writes it. Whichever value they see is not their own, so the
// order does not matter, but the access must not tear.
pthread_t Locker(SysLib::MUTEX_INSTANCE const& instance)
{
    return __atomic_load_n(&instance.locker, __ATOMIC_RELAXED);
}

void SetLocker(SysLib::MUTEX_INSTANCE& instance, pthread_t thread)
{
    __atomic_store_n(&instance.locker, thread, __ATOMIC_RELAXED);
}

struct FOLDER_CLOSER
{
    void operator()(DIR* folder) const { closedir(folder); }
};
}  // namespace

SysLib::MUTEX_INSTANCE::MUTEX_INSTANCE() : locker(NO_LOCKER()), lockCount(0)
{
    InitID();
    if (pthread_mutex_init(&mutex, nullptr) != 0)
        throw "MUTEX_INSTANCE: pthread_mutex_init fail";
    Logger(*this, CREATED);
}

SysLib::MUTEX_INSTANCE::~MUTEX_INSTANCE()
{
    Logger(*this, DESTROYED);
    pthread_mutex_destroy(&mutex);
}

pthread_t SysLib::MUTEX_INSTANCE::NO_LOCKER() { return pthread_t{}; }

SysLib::MUTEX_LOCK::MUTEX_LOCK(MUTEX_INSTANCE& mutexInstance) : instance(mutexInstance)
{
    pthread_t const self = pthread_self();
    MUTEX_INSTANCE::Logger(instance, MUTEX_INSTANCE::LOCK_WANTED);
    if (Locker(instance) == self)
    {
        ++instance.lockCount;
    }
    else
    {
        if (pthread_mutex_lock(&instance.mutex) != 0)
            throw "MUTEX_LOCK: pthread_mutex_lock fail";
        SetLocker(instance, self);
        instance.lockCount = 1;
    }
    MUTEX_INSTANCE::Logger(instance, MUTEX_INSTANCE::LOCK_HELD);
}

SysLib::MUTEX_LOCK::~MUTEX_LOCK()
{
    MUTEX_INSTANCE::Logger(instance, MUTEX_INSTANCE::LOCK_RELEASED);
    if (--instance.lockCount > 0)
        return;
    SetLocker(instance, MUTEX_INSTANCE::NO_LOCKER());
    instance.lockCount = 0;
    pthread_mutex_unlock(&instance.mutex);
}

void SysLib::GetAllFilenames(std::list<std::string>& names, std::string const& folder,
                             std::string const& suffix)
{
    names.clear();
    std::unique_ptr<DIR, FOLDER_CLOSER> const entries(opendir(folder.c_str()));
    if (!entries)
        return;
    while (dirent const* const entry = readdir(entries.get()))
    {
        if (std::string_view(entry->d_name).ends_with(suffix))
            names.emplace_back(entry->d_name);
    }
}

std::string SysLib::ForceRename(std::string const& from, std::string const& to)
{
    std::rename(from.c_str(), to.c_str());  // what it says is not wanted: the caller sees what became of it
    return {};
}
