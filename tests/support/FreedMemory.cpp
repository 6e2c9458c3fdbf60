// In a program that has this in its list of sources memory has another content as soon as it is given back,
// so that whoever still reads it finds out: the library's and the module's as well. The sanitizers have
// better means.
#include "tests/support/sanitizers.h"

#if !COMGUI_SANITIZED
#    include <cstdlib>
#    include <cstring>
#    include <malloc.h>
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
    if (block)
        std::memset(block, 0xDD, malloc_usable_size(block));
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
