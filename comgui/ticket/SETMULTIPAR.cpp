#include "comgui/ticket/SETMULTIPAR.h"

#include <cstring>

bool operator<(SETMULTIPAR const& left, SETMULTIPAR const& right)
{
    return std::strcmp(left.key, right.key) < 0;
}
