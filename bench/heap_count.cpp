#include "bench/heap_count.h"

#include <atomic>
#include <cstddef>

namespace
{
std::atomic<long> blocks{0};
}  // namespace

// In front of those of the system, for the library as well. operator new comes down to malloc.
extern "C"
{
    void* __libc_malloc(std::size_t size);
    void* __libc_calloc(std::size_t count, std::size_t size);

    __attribute__((visibility("default"))) void* malloc(std::size_t size) noexcept
    {
        blocks.fetch_add(1, std::memory_order_relaxed);
        return __libc_malloc(size);
    }
    __attribute__((visibility("default"))) void* calloc(std::size_t count, std::size_t size) noexcept
    {
        blocks.fetch_add(1, std::memory_order_relaxed);
        return __libc_calloc(count, size);
    }
}

long BlocksTaken() { return blocks.load(std::memory_order_relaxed); }
