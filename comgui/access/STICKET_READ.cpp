#include "comgui/access/STICKET_READ.h"

#include "comgui/access/decode.h"

bool STICKET_READ::GetParameter(char const* key, wxString& value, int pos) const
{
    return comgui::detail::ReadText(Slots(), key, value, pos);
}

bool STICKET_READ::WhoAmI(STICKET_OPTION_WHOAMI& who) const
{
    // The lowest bit is what counts, so a module that answers 2 has failed.
    if (Access()->SOPTION(Access()->Instance, STICKET_OP_WHOAMI, &who) & 1)
        return true;
    who.word0 = 0;
    who.word8 = ~0ull;
    return false;
}

wxString STICKET_READ::Decode(char const* value) const { return comgui::detail::Decode(Slots(), value); }
