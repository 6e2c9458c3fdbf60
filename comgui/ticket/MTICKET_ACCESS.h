// How a session reaches all of its tickets: slots as in STICKET_ACCESS, each with the type and id of the
// ticket it is meant for behind the Instance. The module owns the table, which is valid until the logout.
// Keys, texts and tables that a slot gets are the caller's and are not kept; what a slot of the same purpose
// promises there it promises here, for each ticket by itself. Nobody checks an address before it comes here:
// a slot refuses one that names no ticket. Several threads may call at once, for different tickets.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include "comgui/ticket/TICKET_OP.h"
#include <cstddef>
#include <type_traits>

// As SGETPARAMETER.
typedef int (*MGETPARAMETER)(void* Instance, int ticketType, int ticketId, char const* key, PARAM_TYPE type,
                             void* value, int pos);

// As SGETMULTIPAR: success stands in each record's ok, and nowhere else.
typedef int (*MGETMULTIPAR)(void* Instance, int ticketType, int ticketId, GETMULTIPAR* table);

// Called for each ticket of a walk; false ends it. The ticket's table lives until it returns.
typedef bool (*MWALKTICKETS_ACTION)(void* context, int ticketType, int ticketId,
                                    STICKET_ACCESS const* ticket);

// Calls action once for each ticket of the type, on the caller's thread and before it returns.
typedef int (*MWALKTICKETS)(void* Instance, MWALKTICKETS_ACTION action, void* context, int ticketType);

// As SSETPARAMETER.
typedef int (*MSETPARAMETER)(void* Instance, int ticketType, int ticketId, char const* key, PARAM_TYPE type,
                             void const* value, int pos);

// As SSETMULTIPAR: sets each record's ok; the result speaks of the table as a whole.
typedef int (*MSETMULTIPAR)(void* Instance, int ticketType, int ticketId, SETMULTIPAR* table);

// Carries out an operation; what arg is stands with each code in TICKET_OP.h. Codes of single tickets come
// here, too.
typedef int (*MOPERATION)(void* Instance, int ticketType, int ticketId, TICKET_OP op, void* arg);

// Switches notifications of a ticket, or with TICKET_ID_ALL of a whole type, on (keys: a null-ended table;
// only changes of these are told) or off (keys: null) under an id that the module has given out to the
// command local.set.callback. Once it has switched off, no callback begins any more; to switch off what is
// not on does no harm. Changes are told in the order in which they were made, each as records up to a null
// key, in which one key has one pointer.
typedef int (*MENDISNOTIF)(void* Instance, int ticketType, int ticketId, int notificationId, bool enable,
                           char const* const* keys);

// Creates a ticket with that key table, ended by a null pointer, and gives its table, which the module owns;
// null if it refuses. MAY BE NULL: a module that creates no tickets leaves the slot empty.
typedef STICKET_ACCESS const* (*MCREATETICKET)(void* Instance, int ticketType, int ticketId,
                                               char const* const* keys);

struct MTICKET_ACCESS
{
    void* reserved0[2];
    void* Instance;  // the module's handle of this container
    void* reserved24;
    ::MGETPARAMETER MGETPARAMETER;
    ::MGETMULTIPAR MGETMULTIPAR;
    void* reserved48;
    ::MWALKTICKETS MWALKTICKETS;
    void* reserved64[20];
    ::MSETPARAMETER MSETPARAMETER;
    ::MSETMULTIPAR MSETMULTIPAR;
    void* reserved240;
    ::MOPERATION MOPERATION;
    void* reserved256[22];
    ::MENDISNOTIF MENDISNOTIF;
    void* reserved440[2];
    ::MCREATETICKET MCREATETICKET;
};
static_assert(std::is_standard_layout_v<MTICKET_ACCESS> && sizeof(MTICKET_ACCESS) == 464);
static_assert(offsetof(MTICKET_ACCESS, Instance) == 16);
static_assert(offsetof(MTICKET_ACCESS, reserved24) == 24);
static_assert(offsetof(MTICKET_ACCESS, MGETPARAMETER) == 32);
static_assert(offsetof(MTICKET_ACCESS, MGETMULTIPAR) == 40);
static_assert(offsetof(MTICKET_ACCESS, reserved48) == 48);
static_assert(offsetof(MTICKET_ACCESS, MWALKTICKETS) == 56);
static_assert(offsetof(MTICKET_ACCESS, reserved64) == 64);
static_assert(offsetof(MTICKET_ACCESS, MSETPARAMETER) == 224);
static_assert(offsetof(MTICKET_ACCESS, MSETMULTIPAR) == 232);
static_assert(offsetof(MTICKET_ACCESS, reserved240) == 240);
static_assert(offsetof(MTICKET_ACCESS, MOPERATION) == 248);
static_assert(offsetof(MTICKET_ACCESS, reserved256) == 256);
static_assert(offsetof(MTICKET_ACCESS, MENDISNOTIF) == 432);
static_assert(offsetof(MTICKET_ACCESS, reserved440) == 440);
static_assert(offsetof(MTICKET_ACCESS, MCREATETICKET) == 456);

// A module writes either the single or the table form of a write and gets the other one from here.
extern "C"
{
    // A table write by single writes: calls set for every record, also behind a failed one, and leaves each
    // result in the record's ok. 0 for a null table, else 1 even if records failed: only ok tells.
    COMGUI_EXPORT int MSETMULTIPAR_TO_MSETPARAMETER(void* Instance, int ticketType, int ticketId,
                                                    SETMULTIPAR* table, MSETPARAMETER set);

    // A single write by a table of one record. 1 only if set succeeded and also set the record's ok, else 0.
    COMGUI_EXPORT int MSETPARAMETER_TO_MSETMULTIPAR(void* Instance, int ticketType, int ticketId,
                                                    char const* key, PARAM_TYPE type, void const* value,
                                                    int pos, MSETMULTIPAR set);
}
