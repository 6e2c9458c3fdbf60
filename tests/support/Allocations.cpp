#include "tests/support/Allocations.h"

#include "tests/support/FreedMemory.h"
#include <atomic>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace
{
std::atomic<long> live = 0;
std::atomic<std::size_t> liveBytes = 0;
std::atomic<int> failIn = -1;
std::atomic<bool> hasFailed = false;

constexpr std::size_t Usual = __STDCPP_DEFAULT_NEW_ALIGNMENT__;

void* Allocated(std::size_t size, std::size_t alignment = Usual) noexcept
{
    if (failIn >= 0 && failIn-- == 0)
    {
        hasFailed = true;
        return nullptr;
    }
    std::size_t const room = size != 0 ? size : 1;
    void* const block = alignment == Usual
                            ? std::malloc(room)
                            : std::aligned_alloc(alignment, (room + alignment - 1) / alignment * alignment);
    if (block)
    {
        ++live;
        liveBytes += malloc_usable_size(block);
    }
    return block;
}

void* AllocatedOrThrown(std::size_t size, std::size_t alignment = Usual)
{
    void* const block = Allocated(size, alignment);
    if (block == nullptr)
        throw std::bad_alloc();
    return block;
}

void Freed(void* block) noexcept
{
    if (block)
    {
        --live;
        liveBytes -= malloc_usable_size(block);
    }
    Spoil(block);
    std::free(block);
}
}  // namespace

// All of them, as a sanitizer brings its own for those that are left out.
void* operator new(std::size_t size) { return AllocatedOrThrown(size); }
void* operator new[](std::size_t size) { return AllocatedOrThrown(size); }
void* operator new(std::size_t size, std::nothrow_t const&) noexcept { return Allocated(size); }
void* operator new[](std::size_t size, std::nothrow_t const&) noexcept { return Allocated(size); }
void operator delete(void* block) noexcept { Freed(block); }
void operator delete[](void* block) noexcept { Freed(block); }
void operator delete(void* block, std::size_t) noexcept { Freed(block); }
void operator delete[](void* block, std::size_t) noexcept { Freed(block); }
void operator delete(void* block, std::nothrow_t const&) noexcept { Freed(block); }
void operator delete[](void* block, std::nothrow_t const&) noexcept { Freed(block); }
void* operator new(std::size_t size, std::align_val_t alignment)
{
    return AllocatedOrThrown(size, static_cast<std::size_t>(alignment));
}
void* operator new[](std::size_t size, std::align_val_t alignment)
{
    return AllocatedOrThrown(size, static_cast<std::size_t>(alignment));
}
void* operator new(std::size_t size, std::align_val_t alignment, std::nothrow_t const&) noexcept
{
    return Allocated(size, static_cast<std::size_t>(alignment));
}
void* operator new[](std::size_t size, std::align_val_t alignment, std::nothrow_t const&) noexcept
{
    return Allocated(size, static_cast<std::size_t>(alignment));
}
void operator delete(void* block, std::align_val_t) noexcept { Freed(block); }
void operator delete[](void* block, std::align_val_t) noexcept { Freed(block); }
void operator delete(void* block, std::size_t, std::align_val_t) noexcept { Freed(block); }
void operator delete[](void* block, std::size_t, std::align_val_t) noexcept { Freed(block); }
void operator delete(void* block, std::align_val_t, std::nothrow_t const&) noexcept { Freed(block); }
void operator delete[](void* block, std::align_val_t, std::nothrow_t const&) noexcept { Freed(block); }

long LiveAllocations() { return live; }

std::size_t LiveBytes() { return liveBytes; }

FailingAllocation::FailingAllocation(int n)
{
    hasFailed = false;
    failIn = n;
}

FailingAllocation::~FailingAllocation() { Stop(); }

void FailingAllocation::Stop() { failIn = -1; }

bool FailingAllocation::HasHappened() const { return hasFailed; }
