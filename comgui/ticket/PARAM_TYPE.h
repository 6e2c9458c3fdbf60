// The value types of ticket parameters. The numbers cross to the plug-in and stand in ticket streams.
//
// What the value word of a slot or a record holds depends on the type:
//
//   type               on a write                    on a read, the address of
//   PARAM_NONE         null: deletes the parameter   an int, receives the stored PARAM_TYPE
//   PARAM_POINTER      the pointer itself            a void*
//   PARAM_INT          address of an int             an int
//   PARAM_DOUBLE       address of a double           a double
//   PARAM_STRING       the char const* itself        a char const*
//   PARAM_BINSTRING    address of a BIN_STRING       a BIN_STRING
//   PARAM_COUNT        not allowed                   an unsigned long, 64 bits wide
//   PARAM_INT64        address of a long long        a long long
//   PARAM_UNSIGNED     address of an unsigned int    an unsigned int
//   PARAM_UNSIGNED64   address of an unsigned long long, both ways
//
// So a write of a pointer or a text hands over the word itself, where every other type hands over an
// address; a read always hands over an address. A text or BIN_STRING that was read is the module's, and
// lives as long as that says: copy it before the next call if in doubt.
#pragma once

#include "comgui/foundation/export.h"

enum PARAM_TYPE : int
{
    PARAM_NONE = 0,        // a write deletes; a read asks for the stored type
    PARAM_POINTER = 1,     // opaque; of use only in the process it comes from
    PARAM_INT = 2,         // 32 bits, signed
    PARAM_DOUBLE = 3,      // IEEE 754, 64 bits
    PARAM_STRING = 4,      // UTF-8, ends at its first zero byte
    PARAM_BINSTRING = 5,   // bytes of a given length
    PARAM_COUNT = 6,       // number of values under a key; read only
    PARAM_INT64 = 7,       // 64 bits, signed
    PARAM_UNSIGNED = 8,    // 32 bits, unsigned
    PARAM_UNSIGNED64 = 9,  // 64 bits, unsigned
};

namespace comgui::detail
{
// Whether a record of that type holds a parameter: a walk may deliver other records too, to be passed over.
inline bool IsParameter(PARAM_TYPE type)
{
    return type > PARAM_NONE && type <= PARAM_UNSIGNED64 && type != PARAM_COUNT;
}
}  // namespace comgui::detail

// The type under which a ticket stores values of T. Exists for void*, int, double, char const*, long long,
// unsigned int and unsigned long long; any other T does not link.
template <typename T>
PARAM_TYPE GetParamType();

template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<void*>();
template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<int>();
template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<double>();
template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<char const*>();
template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<long long>();
template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<unsigned int>();
template <>
COMGUI_EXPORT PARAM_TYPE GetParamType<unsigned long long>();
