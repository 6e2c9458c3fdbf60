#include "standin/server/files/ForkedChild.h"

#include <fcntl.h>
#include <mutex>
#include <pthread.h>
#include <unistd.h>

namespace standin
{
namespace
{
constinit std::atomic<bool> isForkedChild = false;
constinit std::atomic<int> watches = 0;

void LookAfterFork() noexcept
{
    if (watches > 0)
        NoteForkedChild();
}
}  // namespace

bool IsForkedChild() noexcept { return isForkedChild.load(std::memory_order_relaxed); }

ForkWatch::ForkWatch()
{
    [[maybe_unused]] static int const once = pthread_atfork(nullptr, nullptr, LookAfterFork);
    ++watches;
}

ForkWatch::~ForkWatch() { --watches; }

void NoteForkedChild() noexcept { isForkedChild.store(true, std::memory_order_relaxed); }

class KeptFromChildren::Registry
{
public:
    static void Add(KeptFromChildren& kept)
    {
        [[maybe_unused]] static int const once = pthread_atfork(&Lock, &Unlock, &CloseInChild);
        std::lock_guard const lock(mutex);
        kept.m_next = first;
        first = &kept;
    }

    static void Remove(KeptFromChildren& kept)
    {
        std::lock_guard const lock(mutex);
        KeptFromChildren** link = &first;
        while (*link != &kept)
            link = &(*link)->m_next;
        *link = kept.m_next;
    }

private:
    static void Lock() { mutex.lock(); }
    static void Unlock() { mutex.unlock(); }

    // The number stays in use: the owner believes that it has it, and closes it perhaps.
    static void CloseInChild()
    {
        int const nowhere = open("/dev/null", O_RDWR | O_CLOEXEC);
        for (KeptFromChildren const* kept = first; kept != nullptr; kept = kept->m_next)
        {
            void const* const owner = kept->m_owner;
            int const number = owner == nullptr ? -1 : kept->m_numberOf(owner);
            if (number >= 0 && (nowhere < 0 || dup3(nowhere, number, O_CLOEXEC) < 0))
                close(number);
        }
        if (nowhere >= 0)
            close(nowhere);
        mutex.unlock();
    }

    static constinit std::mutex mutex;
    static constinit KeptFromChildren* first;
};
constinit std::mutex KeptFromChildren::Registry::mutex;
constinit KeptFromChildren* KeptFromChildren::Registry::first = nullptr;

KeptFromChildren::KeptFromChildren(int (*numberOf)(void const* owner)) : m_numberOf(numberOf)
{
    Registry::Add(*this);
}

KeptFromChildren::~KeptFromChildren() { Registry::Remove(*this); }
}  // namespace standin
