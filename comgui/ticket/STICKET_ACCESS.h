// One ticket as the module shows it to a host: a handle and the functions that take it as their first
// argument. The module owns the table; the host looks at it and changes nothing in it. A function answers not
// zero when it did what it was asked, unless its own comment says otherwise; why it did not (no such key, no
// such position, another type) cannot be told. Keys and texts are UTF-8 and end with a zero; what a function
// gets is the caller's, and the module keeps no pointer to it. A host may call from any thread, for one
// ticket from one at a time; nothing here catches an exception. docs/module-contract.md numbers these rules.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include <cstddef>
#include <type_traits>

// Reads one value to where value points, see PARAM_TYPE.h; after a failure that place is as it was. Texts and
// bytes stay the module's, valid until the next call for this ticket. pos: -1 the key as a whole, from 0 up
// one value of a list; the single value of a key stands at -1 and at 0.
typedef int (*SGETPARAMETER)(void* Instance, char const* key, PARAM_TYPE type, void* value, int pos);

// Reads the records up to the one whose key is null, in their order, and goes on behind one that failed. Sets
// each record's ok, where alone success stands: the result is not looked at. Texts and bytes of all records
// are valid together until the next call for this ticket.
typedef int (*SGETMULTIPAR)(void* Instance, GETMULTIPAR* table);

// Called for each parameter of a walk, with the value word as on a write; false ends the walk. Records of
// PARAM_NONE and PARAM_COUNT may come and have to be put up with. key and value live until it returns.
typedef bool (*SWALKPARAMETERS_ACTION)(void* context, char const* key, PARAM_TYPE type, void const* value,
                                       int pos);

// Calls action once for each value, on the caller's thread and before it returns; written in that order into
// an empty ticket they make the same one. This library always walks with comgui::detail::Walk, below.
typedef int (*SWALKPARAMETERS)(void* Instance, SWALKPARAMETERS_ACTION action, void* context,
                               char const* prefix, int limit);

// Writes one value. pos: -1 in place of all that stands under the key, from 0 up in place of that one of a
// list, -2 behind its last. PARAM_NONE with a null value deletes at -1 or from 0 up; PARAM_COUNT fails.
typedef int (*SSETPARAMETER)(void* Instance, char const* key, PARAM_TYPE type, void const* value, int pos);

// Writes the records up to the one whose key is null, in their order, and goes on behind one that failed.
// Sets each record's ok and changes nothing else in the table.
typedef int (*SSETMULTIPAR)(void* Instance, SETMULTIPAR* table);

// Answers an option by its code. 1 success, 0 failure and for any other code.
// STICKET_OP_FOLDER_VARIABLES: out is the address of a clFOLDER_VARIABLES*; the translator stays the
// module's. STICKET_OP_WHOAMI: out is a STICKET_OPTION_WHOAMI.
typedef int (*SOPTION)(void* Instance, int code, void* out);

// Two words that the module fills for STICKET_OP_WHOAMI; nothing here looks into them.
struct STICKET_OPTION_WHOAMI
{
    unsigned long long word0;
    unsigned long long word8;
};
static_assert(std::is_standard_layout_v<STICKET_OPTION_WHOAMI> && sizeof(STICKET_OPTION_WHOAMI) == 16);

struct STICKET_ACCESS
{
    void* reserved0[2];
    void* Instance;  // the module's handle of this ticket
    ::SGETPARAMETER SGETPARAMETER;
    ::SGETMULTIPAR SGETMULTIPAR;
    ::SWALKPARAMETERS SWALKPARAMETERS;
    void* reserved48[20];
    ::SSETPARAMETER SSETPARAMETER;
    ::SSETMULTIPAR SSETMULTIPAR;
    void* reserved224;
    ::SOPTION SOPTION;
};
static_assert(std::is_standard_layout_v<STICKET_ACCESS> && sizeof(STICKET_ACCESS) == 240);
static_assert(offsetof(STICKET_ACCESS, Instance) == 16);
static_assert(offsetof(STICKET_ACCESS, SGETPARAMETER) == 24);
static_assert(offsetof(STICKET_ACCESS, SGETMULTIPAR) == 32);
static_assert(offsetof(STICKET_ACCESS, SWALKPARAMETERS) == 40);
static_assert(offsetof(STICKET_ACCESS, reserved48) == 48);
static_assert(offsetof(STICKET_ACCESS, SSETPARAMETER) == 208);
static_assert(offsetof(STICKET_ACCESS, SSETMULTIPAR) == 216);
static_assert(offsetof(STICKET_ACCESS, reserved224) == 224);
static_assert(offsetof(STICKET_ACCESS, SOPTION) == 232);

namespace comgui::detail
{
// Walks over the whole ticket: every walk of this library.
inline int Walk(STICKET_ACCESS const* ticket, SWALKPARAMETERS_ACTION action, void* context)
{
    return ticket->SWALKPARAMETERS(ticket->Instance, action, context, "", 8000);
}
}  // namespace comgui::detail
