// Many readers or one writer, for std::shared_lock and std::lock_guard. A writer that waits goes before
// readers that come later: std::shared_mutex lets a steady stream of readers keep it out for good on Linux.
// So a thread must not take it twice, not even for reading.
#pragma once

#include <pthread.h>

namespace standin
{
class ReadWriteLock
{
public:
    ReadWriteLock()
    {
        pthread_rwlockattr_t preference;
        pthread_rwlockattr_init(&preference);
#ifdef __GLIBC__
        pthread_rwlockattr_setkind_np(&preference, PTHREAD_RWLOCK_PREFER_WRITER_NONRECURSIVE_NP);
#endif
        pthread_rwlock_init(&m_lock, &preference);
        pthread_rwlockattr_destroy(&preference);
    }
    ~ReadWriteLock() { pthread_rwlock_destroy(&m_lock); }
    ReadWriteLock(ReadWriteLock const&) = delete;
    ReadWriteLock& operator=(ReadWriteLock const&) = delete;

    void lock() { pthread_rwlock_wrlock(&m_lock); }
    void unlock() { pthread_rwlock_unlock(&m_lock); }
    void lock_shared() { pthread_rwlock_rdlock(&m_lock); }
    bool try_lock_shared() { return pthread_rwlock_tryrdlock(&m_lock) == 0; }
    void unlock_shared() { pthread_rwlock_unlock(&m_lock); }

private:
    pthread_rwlock_t m_lock;
};
}  // namespace standin
