#include "comgui/access/MTICKET_ADMIN.h"

STICKET_ACCESS const* MTICKET_ADMIN::CreateOrOpenTicket(int type, int id, char const* const* keys) const
{
    STICKET_ACCESS const* ticket = nullptr;
    if (Access()->MOPERATION(Access()->Instance, type, id, MTICKET_OP_OPEN, &ticket))
        return ticket;
    if (!Access()->MCREATETICKET)  // a module that creates no tickets leaves the slot empty
        return nullptr;
    return Access()->MCREATETICKET(Access()->Instance, type, id, keys);
}
