// The records of a table of parameter writes, and of a table of parameter reads. A table is an array that
// ends at a record with a null key; whoever walks one looks at the key only. The layouts are shared with
// the plug-in and must not change.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <cstddef>
#include <type_traits>

struct SETMULTIPAR
{
    char const* key;  // UTF-8; null only in the terminator
    PARAM_TYPE type;
    int reserved12;      // zero
    void const* value;   // the text or pointer itself, else the value's address: see PARAM_TYPE.h
    int pos;             // -1 the key as a whole, 0 and up one value, -2 append
    bool ok;             // result, set by whoever carried the record out
    char reserved29[3];  // zero
};
static_assert(std::is_standard_layout_v<SETMULTIPAR> && std::is_trivial_v<SETMULTIPAR>);
static_assert(sizeof(SETMULTIPAR) == 32);
static_assert(offsetof(SETMULTIPAR, key) == 0);
static_assert(offsetof(SETMULTIPAR, type) == 8);
static_assert(offsetof(SETMULTIPAR, reserved12) == 12);
static_assert(offsetof(SETMULTIPAR, value) == 16);
static_assert(offsetof(SETMULTIPAR, pos) == 24);
static_assert(offsetof(SETMULTIPAR, ok) == 28);
static_assert(offsetof(SETMULTIPAR, reserved29) == 29);

// Laid out as SETMULTIPAR. value is always the address where the result goes, for texts and pointers too,
// and the first value of a vector is read at pos 0, where it is written at -1.
struct GETMULTIPAR
{
    char const* key;
    PARAM_TYPE type;
    int reserved12;
    void* value;
    int pos;
    bool ok;
    char reserved29[3];
};
static_assert(std::is_standard_layout_v<GETMULTIPAR> && std::is_trivial_v<GETMULTIPAR>);
static_assert(sizeof(GETMULTIPAR) == 32);
static_assert(offsetof(GETMULTIPAR, key) == 0);
static_assert(offsetof(GETMULTIPAR, type) == 8);
static_assert(offsetof(GETMULTIPAR, reserved12) == 12);
static_assert(offsetof(GETMULTIPAR, value) == 16);
static_assert(offsetof(GETMULTIPAR, pos) == 24);
static_assert(offsetof(GETMULTIPAR, ok) == 28);
static_assert(offsetof(GETMULTIPAR, reserved29) == 29);

// By key, bytewise, and by nothing else: records of one key are equal whatever they hold.
COMGUI_EXPORT bool operator<(SETMULTIPAR const& left, SETMULTIPAR const& right);
