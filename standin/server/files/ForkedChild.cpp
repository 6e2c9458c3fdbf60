#include "standin/server/files/ForkedChild.h"

#include <atomic>

namespace standin
{
namespace
{
constinit std::atomic<bool> isForkedChild = false;
}

bool IsForkedChild() noexcept { return isForkedChild.load(std::memory_order_relaxed); }

void NoteForkedChild() noexcept { isForkedChild.store(true, std::memory_order_relaxed); }
}  // namespace standin
