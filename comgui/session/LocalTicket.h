// Single tickets outside any container, from the plug-in's factory: ticket files, and tickets in memory.
// Without a plug-in (hSTicketInstance is null) there are none. Threads are the factory's affair.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/STICKET_ACCESS.h"

extern "C"
{
    // Opens the ticket file of that path (UTF-8, passed on as it stands), or for null makes a ticket in
    // memory. Null if it cannot. The ticket is the factory's; give it back with DestroyTicket.
    COMGUI_EXPORT STICKET_ACCESS const* CreateTicket(char const* path);

    // Gives a ticket back, at the latest now its changes are in its file. The factory may clear the
    // caller's pointer.
    COMGUI_EXPORT void DestroyTicket(STICKET_ACCESS const*& ticket);
}
