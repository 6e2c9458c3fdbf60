#include "comgui/session/LocalTicket.h"

#include "comgui/session/ComGUIGlobals.h"

STICKET_ACCESS const* CreateTicket(char const* path)
{
    return hSTicketInstance ? hSTicketInstance->CreateTicket(path) : nullptr;
}

void DestroyTicket(STICKET_ACCESS const*& ticket)
{
    if (hSTicketInstance)
        hSTicketInstance->DestroyTicket(&ticket);
}
