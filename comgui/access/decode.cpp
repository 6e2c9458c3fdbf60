#include "comgui/access/decode.h"

#include "comgui/access/FromUtf8.h"
#include "comgui/ticket/folder_variables.h"

namespace comgui::detail
{
template <typename Slots>
wxString Decode(Slots const& ticket, char const* value)
{
    if (!value)
        return wxString();
    if (NeedsDecode(value))
        if (clFOLDER_VARIABLES const* const folders = ticket.GetFolderVariables())
            return FromUtf8(folders->Decode(value, false).c_str());
    return FromUtf8(value);
}

template <typename Slots>
bool ReadText(Slots const& ticket, char const* key, wxString& value, int pos)
{
    char const* text = nullptr;
    if (!ticket.Get(key, PARAM_STRING, &text, pos))
    {
        value.clear();  // what a caller overlooks must not look like a value of this ticket
        return false;
    }
    Decode(ticket, text).swap(value);
    return true;
}

template wxString Decode(STICKET_SLOTS const&, char const*);
template wxString Decode(MTICKET_SLOTS const&, char const*);
template bool ReadText(STICKET_SLOTS const&, char const*, wxString&, int);
template bool ReadText(MTICKET_SLOTS const&, char const*, wxString&, int);
}  // namespace comgui::detail
