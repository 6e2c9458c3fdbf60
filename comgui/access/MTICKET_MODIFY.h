// Typed writes of the tickets in a container. A view: an MTICKET_ACCESS pointer is one. type and id name the
// ticket and go to the slot as they are; all else is as in STICKET_MODIFY.h. There is no form for an int and
// none for a table: whoever needs them opens the ticket.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <type_traits>
#include <wx/string.h>

class MTICKET_MODIFY : public comgui::detail::TICKET_VIEW<MTICKET_MODIFY, MTICKET_ACCESS>
{
public:
    int SetParameter(int type, int id, char const* key, bool value, int pos) const
    {
        return comgui::detail::Write(Slots(type, id), key, PARAM_INT, value ? 1 : 0, pos);
    }

    int SetParameter(int type, int id, char const* key, double value, int pos) const
    {
        return comgui::detail::Write(Slots(type, id), key, PARAM_DOUBLE, value, pos);
    }

    int SetParameter(int type, int id, char const* key, void* value, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_POINTER, value, pos);
    }

    int SetParameter(int type, int id, char const* key, wxString const& value, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_STRING, value.utf8_str(), pos);
    }

    template <typename Char, std::enable_if_t<std::is_same_v<Char, char>, int> = 0>
    int SetParameter(int type, int id, char const* key, Char const* value, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_STRING, value, pos);
    }
    template <typename Char, std::enable_if_t<std::is_same_v<Char, wchar_t>, int> = 0>
    int SetParameter(int type, int id, char const* key, Char const* value, int pos) const
    {
        return SetParameter(type, id, key, wxString(value), pos);
    }

    int DelParameter(int type, int id, char const* key, int pos) const
    {
        return Slots(type, id).Set(key, PARAM_NONE, nullptr, pos);
    }

    // Makes it a partial ticket of the keys in that null-ended table, which goes to the slot itself.
    int SetPartial(int type, int id, char const* const* keys) const
    {
        return Access()->MOPERATION(Access()->Instance, type, id, STICKET_OP_SET_PARTIAL,
                                    const_cast<char const**>(keys));
    }

private:
    comgui::detail::MTICKET_SLOTS Slots(int type, int id) const { return {Access(), type, id}; }
};
