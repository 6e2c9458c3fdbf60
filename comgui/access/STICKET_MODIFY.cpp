#include "comgui/access/STICKET_MODIFY.h"

int STICKET_MODIFY::SetParameter(char const* key, wxString const& value, int pos) const
{
    return Slots().Set(key, PARAM_STRING, value.utf8_str(), pos);
}
