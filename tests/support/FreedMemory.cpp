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
void Freed(void* block) noexcept
{
    if (block)
        std::memset(block, 0xDD, malloc_usable_size(block));
    std::free(block);
}
}  // namespace

void operator delete(void* block) noexcept { Freed(block); }
void operator delete[](void* block) noexcept { Freed(block); }
void operator delete(void* block, std::size_t) noexcept { Freed(block); }
void operator delete[](void* block, std::size_t) noexcept { Freed(block); }
#endif
