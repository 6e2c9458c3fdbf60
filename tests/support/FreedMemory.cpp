// A program that has this in its list of sources notices who reads memory that was given back.
#include "tests/support/FreedMemory.h"

#if !COMGUI_SANITIZED
#    include <cstdlib>
#    include <new>

namespace
{
void* Allocated(std::size_t size)
{
    if (void* const block = std::malloc(size ? size : 1))
        return block;
    throw std::bad_alloc();
}

void Freed(void* block) noexcept
{
    Spoil(block);
    std::free(block);
}
}  // namespace

void* operator new(std::size_t size) { return Allocated(size); }
void* operator new[](std::size_t size) { return Allocated(size); }
void operator delete(void* block) noexcept { Freed(block); }
void operator delete[](void* block) noexcept { Freed(block); }
void operator delete(void* block, std::size_t) noexcept { Freed(block); }
void operator delete[](void* block, std::size_t) noexcept { Freed(block); }
#endif
