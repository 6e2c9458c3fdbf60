// Memory that is given back gets another content at once, so that whoever still reads it finds out: the
// library and the module as well. The sanitizers have better means.
#pragma once

#include "tests/support/sanitizers.h"
#include <cstring>
#include <malloc.h>

inline void Spoil([[maybe_unused]] void* block)
{
#if !COMGUI_SANITIZED
    if (block)
        std::memset(block, 0xDD, malloc_usable_size(block));
#endif
}
