#include "standin/server/Ticket.h"

namespace standin
{
bool ReadValue(KeyValues const& values, PARAM_TYPE type, void* out, int pos)
{
    if (type == PARAM_COUNT)
    {
        if (pos != -1)
            return false;
        *static_cast<unsigned long*>(out) = static_cast<unsigned long>(values.Count());
        return true;
    }
    if (type == PARAM_NONE && pos == -1 && values.Count() > 1)
    {
        *static_cast<int*>(out) = PARAM_COUNT;
        return true;
    }
    TicketValue const* const value = values.At(pos == -1 ? 0 : pos);  // a vector's first value stands for it
    if (!value)
        return false;
    if (type == PARAM_NONE)
        *static_cast<int*>(out) = value->type;
    else if (type == value->type)
        value->CopyTo(out);
    else
        return false;
    return true;
}
}  // namespace standin
