// Which numbers name a ticket, a lock or a notification. The validators are for modules and hosts: the
// library passes on whatever it is given, apart from the type of a listing.
#pragma once

#include "comgui/foundation/export.h"

// Ids that name no ticket but mean something to the module. No validator accepts them.
enum : int
{
    TICKET_ID_NONE = -1,  // no ticket: an operation on the whole container, with type -1 too
    TICKET_ID_ALL = -3,   // every ticket of a type, when notifications are switched
    TICKET_ID_NEXT = -4,  // the module chooses the next free id
};

namespace comgui::detail
{
// The system ticket: server-wide parameters and the folder keys.
inline constexpr int SystemTicketType = 0;
inline constexpr int SystemTicketId = 0;
}  // namespace comgui::detail

extern "C"
{
    COMGUI_EXPORT bool TICKET_TYPE_Valid(int type);        // 0 to 99
    COMGUI_EXPORT bool TICKET_ID_Valid(int id);            // 24 bits: 0 to 16777215
    COMGUI_EXPORT bool TICKET_Valid(int type, int id);     // both of the above
    COMGUI_EXPORT bool TICKETLOCK_ID_Valid(int id);        // 0 to 19
    COMGUI_EXPORT bool TICKETLOCK_OWNER_Valid(int owner);  // 0 and above
    COMGUI_EXPORT bool TICKET_NOTIFICATION_Valid(int id);  // 0 and above
}
