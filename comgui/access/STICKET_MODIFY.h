// Typed writes of one ticket. A view: a STICKET_ACCESS pointer is one, see STICKET_READ.h for what holds of
// keys, positions and threads; and -2 as a position appends behind the last value. Results are the slot's,
// unchanged: not zero is success. A path is stored as it is given: who wants $(VARIABLE) form encodes it.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include "comgui/access/TICKET_VIEW.h"
#include "comgui/foundation/export.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <type_traits>
#include <wx/string.h>

class STICKET_MODIFY : public comgui::detail::TICKET_VIEW<STICKET_MODIFY, STICKET_ACCESS>
{
public:
    int SetParameter(char const* key, int value, int pos) const
    {
        return comgui::detail::Write(Slots(), key, PARAM_INT, value, pos);
    }

    // Stored as an int, 1 or 0.
    int SetParameter(char const* key, bool value, int pos) const
    {
        return comgui::detail::Write(Slots(), key, PARAM_INT, value ? 1 : 0, pos);
    }

    int SetParameter(char const* key, double value, int pos) const
    {
        return comgui::detail::Write(Slots(), key, PARAM_DOUBLE, value, pos);
    }

    int SetParameter(char const* key, void* value, int pos) const
    {
        return Slots().Set(key, PARAM_POINTER, value, pos);
    }

    // The slot gets a pointer into value, so no other thread may touch that meanwhile.
    COMGUI_EXPORT int SetParameter(char const* key, wxString const& value, int pos) const;

    // Text literals, UTF-8 or wide as wxT() makes them: without these forms they would be taken for a bool.
    template <typename Char, std::enable_if_t<std::is_same_v<Char, char>, int> = 0>
    int SetParameter(char const* key, Char const* value, int pos) const
    {
        return Slots().Set(key, PARAM_STRING, value, pos);
    }
    template <typename Char, std::enable_if_t<std::is_same_v<Char, wchar_t>, int> = 0>
    int SetParameter(char const* key, Char const* value, int pos) const
    {
        return SetParameter(key, wxString(value), pos);
    }

    // Removes one value, or at -1 the key as a whole.
    int DelParameter(char const* key, int pos) const { return Slots().Set(key, PARAM_NONE, nullptr, pos); }

    // Writes a table; each record's ok tells whether it was carried out.
    int SetMultiParameter(SETMULTIPAR* table) const
    {
        return Access()->SSETMULTIPAR(Access()->Instance, table);
    }

private:
    comgui::detail::STICKET_SLOTS Slots() const { return {Access()}; }
};
