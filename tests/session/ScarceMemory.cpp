#include "tests/session/ScarceMemory.h"

#include <cstdlib>
#include <new>

namespace
{
constexpr int Plenty = -1;
thread_local int allocationsLeft = Plenty;
}  // namespace

ScarceMemory::ScarceMemory(int allocations) { allocationsLeft = allocations; }

ScarceMemory::~ScarceMemory() { allocationsLeft = Plenty; }

// The whole program's, the library included. All forms, since a sanitizer brings its own for those that are
// not here. Blocks of a stricter alignment do not count.
void* operator new(std::size_t size)
{
    if (allocationsLeft == 0)
        throw std::bad_alloc();
    if (allocationsLeft != Plenty)
        --allocationsLeft;
    if (void* const memory = std::malloc(size ? size : 1))
        return memory;
    throw std::bad_alloc();
}

void* operator new(std::size_t size, std::nothrow_t const&) noexcept
try
{
    return operator new(size);
}
catch (std::bad_alloc const&)
{
    return nullptr;
}

void* operator new[](std::size_t size) { return operator new(size); }

void* operator new[](std::size_t size, std::nothrow_t const&) noexcept
{
    return operator new(size, std::nothrow);
}

void operator delete(void* memory) noexcept { std::free(memory); }

void operator delete(void* memory, std::size_t) noexcept { std::free(memory); }

void operator delete[](void* memory) noexcept { std::free(memory); }

void operator delete[](void* memory, std::size_t) noexcept { std::free(memory); }
