// The records in which many parameters go to a ticket, or come from one, in a single call. A table has no
// length: the record whose key is null ends it, whatever its other fields hold. Both layouts cross to the
// plug-in, byte for byte.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <cstddef>
#include <cstring>
#include <type_traits>

struct SETMULTIPAR
{
    char const* key;  // UTF-8; null only in the terminator
    PARAM_TYPE type;
    int reserved12;      // zero
    void const* value;   // the text or pointer itself, else the value's address: see PARAM_TYPE.h
    int pos;             // -1 the key as a whole, 0 and up one value, -2 append
    bool ok;             // out: whether this record succeeded
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

// A read of the same shape. Here value is an address for every type, texts and pointers included, and a
// vector begins at pos 0, not at the -1 of a write.
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

namespace comgui::detail
{
// The ok of a record that came back across the boundary: the other side may have left any byte there, and
// only 0 is a failure.
template <typename Record>
bool IsOk(Record const& record)
{
    unsigned char byte;
    std::memcpy(&byte, &record.ok, sizeof byte);
    return byte != 0;
}
}  // namespace comgui::detail
