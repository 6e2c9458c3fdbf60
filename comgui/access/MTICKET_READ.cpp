#include "comgui/access/MTICKET_READ.h"

#include "comgui/access/decode.h"

bool MTICKET_READ::GetParameter(int type, int id, char const* key, wxString& value, int pos) const
{
    return comgui::detail::ReadText(Slots(type, id), key, value, pos);
}

wxString MTICKET_READ::Decode(char const* value) const
{
    return comgui::detail::Decode(Slots(TICKET_ID_NONE, TICKET_ID_NONE), value);
}

// True: a listing wants all of them.
static bool WalkGetTickets(void* user, int, int id, STICKET_ACCESS const*)
{
    static_cast<std::vector<int>*>(user)->push_back(id);
    return true;
}

bool MTICKET_READ::GetTickets(int type, std::vector<int>& ids) const
{
    ids.clear();
    if (TICKET_TYPE_Valid(type))
        WalkTickets(WalkGetTickets, &ids, type);
    return !ids.empty();
}
