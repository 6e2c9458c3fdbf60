// Identifiers of tickets, locks and notifications: 32-bit signed at the interface, judged as told at each
// validator. The library itself asks only TICKET_TYPE_Valid; the others serve modules and hosts.
#pragma once

#include "comgui/foundation/export.h"

// Reserved ticket ids. They travel through the tables although TICKET_ID_Valid refuses them; only the
// module knows what to do with them. Position -1, the key as a whole, is a different thing.
enum : int
{
    TICKET_ID_NONE = -1,  // no ticket: an operation on the whole container, with type -1 too
    TICKET_ID_ALL = -3,   // every ticket of a type, when notifications are switched
    TICKET_ID_NEXT = -4,  // the module chooses the next free id
};

// The system ticket: server-wide parameters and the folder keys.
enum : int
{
    SYSTEM_TICKET_TYPE = 0,
    SYSTEM_TICKET_ID = 0,
};

extern "C"
{
    COMGUI_EXPORT bool TICKET_TYPE_Valid(int type);        // 0 to 99
    COMGUI_EXPORT bool TICKET_ID_Valid(int id);            // 24 bits: 0 to 16777215
    COMGUI_EXPORT bool TICKET_Valid(int type, int id);     // both of the above
    COMGUI_EXPORT bool TICKETLOCK_ID_Valid(int id);        // 0 to 19
    COMGUI_EXPORT bool TICKETLOCK_OWNER_Valid(int owner);  // 0 and above
    COMGUI_EXPORT bool TICKET_NOTIFICATION_Valid(int id);  // 0 and above
}
