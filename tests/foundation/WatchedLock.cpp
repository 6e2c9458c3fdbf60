#include "tests/foundation/WatchedLock.h"

#include <cerrno>

WATCHED_LOCK* watchedLock;

static void Note(SysLib::MUTEX_INSTANCE const& instance, std::string const& step)
{
    if (watchedLock == nullptr)
        return;
    watchedLock->steps.push_back(step);
    if (watchedLock->atStep)
        watchedLock->atStep(instance, step);
}

void SysLib::MUTEX_INSTANCE::InitID() { Note(*this, "InitID"); }

void SysLib::MUTEX_INSTANCE::Logger(MUTEX_INSTANCE const& instance, eWHAT what)
{
    Note(instance, std::to_string(what));
}

// Notes the call, and makes it unless it is to fail. The mutex is the first field of its instance.
template <typename Call>
static int Called(pthread_mutex_t* mutex, char const* step, Call call)
{
    Note(*reinterpret_cast<SysLib::MUTEX_INSTANCE*>(mutex), step);
    return watchedLock && watchedLock->failing == step ? EINVAL : call(mutex);
}

extern "C"
{
    int WatchedMutexInit(pthread_mutex_t* mutex, pthread_mutexattr_t const* attributes)
    {
        return Called(mutex, attributes ? "init with attributes" : "init",
                      [](pthread_mutex_t* m) { return pthread_mutex_init(m, nullptr); });
    }

    int WatchedMutexDestroy(pthread_mutex_t* mutex)
    {
        return Called(mutex, "destroy", pthread_mutex_destroy);
    }

    int WatchedMutexLock(pthread_mutex_t* mutex) { return Called(mutex, "lock", pthread_mutex_lock); }

    int WatchedMutexUnlock(pthread_mutex_t* mutex) { return Called(mutex, "unlock", pthread_mutex_unlock); }
}
