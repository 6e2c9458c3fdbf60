#include "standin/server/files/ForkedChild.h"

#include <atomic>
#include <pthread.h>

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
}  // namespace standin
