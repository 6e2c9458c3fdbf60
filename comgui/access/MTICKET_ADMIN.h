// Tickets of a container as wholes: creating, closing, notifications. A view: an MTICKET_ACCESS pointer is
// one. type and id go to the slot as they are; results are the slot's unless told otherwise.
#pragma once

#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/TICKET_ID.h"

class MTICKET_ADMIN : public comgui::detail::TICKET_VIEW<MTICKET_ADMIN, MTICKET_ACCESS>
{
public:
    // Creates a ticket of that type under an id that the module chooses; the id, -1 on failure.
    int CreateNextTicket(int type) const
    {
        int id = -1;
        return Access()->MOPERATION(Access()->Instance, type, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &id)
                   ? id
                   : -1;
    }

    // Opens the ticket; if that fails, creates it as a partial ticket of the keys in that null-ended table.
    // Null if the module refuses both, or creates no tickets. The table belongs to the module.
    COMGUI_EXPORT STICKET_ACCESS const* CreateOrOpenTicket(int type, int id, char const* const* keys) const;

    // Gives an opened ticket back. What the flag means is the module's to say.
    int CloseTicket(int type, int id, bool flag) const
    {
        return Access()->MOPERATION(Access()->Instance, type, id, MTICKET_OP_CLOSE, &flag);
    }

    // Switches notifications of a ticket, or with TICKET_ID_ALL of a whole type, on and off. notification: an
    // id that the module has given out; keys: a null-ended table.
    int EnableNotification(int type, int id, int notification, char const* const* keys) const
    {
        return Access()->MENDISNOTIF(Access()->Instance, type, id, notification, true, keys);
    }
    int DisableNotification(int type, int id, int notification) const
    {
        return Access()->MENDISNOTIF(Access()->Instance, type, id, notification, false, nullptr);
    }
};
