#include "comgui/foundation/stracpy.h"

#include <cstring>

void stracpy(char* dst, char const* src, unsigned long size)
{
    if (size == 0)
        return;
    unsigned long const length = src ? strnlen(src, size - 1) : 0;
    if (length != 0)
        std::memmove(dst, src, length);
    std::memset(dst + length, 0, size - length);
}
