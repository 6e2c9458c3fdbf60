// What a read-only module puts where its table needs a write, a lock or a notification: 1, for success, and
// nothing else happens.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/TICKET_OP.h"

extern "C"
{
    COMGUI_EXPORT int DUMMY_MSETPARAMETER(void* Instance, int ticketType, int ticketId, char const* key,
                                          PARAM_TYPE type, void const* value, int pos);
    COMGUI_EXPORT int DUMMY_MSETMULTIPAR(void* Instance, int ticketType, int ticketId, SETMULTIPAR* table);
    COMGUI_EXPORT int DUMMY_MOPERATION(void* Instance, int ticketType, int ticketId, TICKET_OP op, void* arg);
    COMGUI_EXPORT int DUMMY_MENDISNOTIF(void* Instance, int ticketType, int ticketId, int notificationId,
                                        bool enable, char const* const* keys);

    // Their slots are the module's own affair, and so are the arguments that come with them.
    COMGUI_EXPORT int DUMMY_MLOCK(...);
    COMGUI_EXPORT int DUMMY_MSETNOTIFICATION(...);
    COMGUI_EXPORT int DUMMY_MSETNOTIFICATION2(...);
}
