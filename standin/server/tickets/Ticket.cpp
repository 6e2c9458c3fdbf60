#include "standin/server/tickets/Ticket.h"

#include <algorithm>

namespace standin
{
std::vector<Key> Ticket::SortedKeys(std::string_view prefix) const
{
    std::vector<Key> sorted;
    sorted.reserve(prefix.empty() ? keys.size() : 0);
    for (auto const& [key, values] : keys)
        if (key->starts_with(prefix))
            sorted.push_back(key);
    std::sort(sorted.begin(), sorted.end(), [](Key left, Key right) { return *left < *right; });
    return sorted;
}

bool ReadValue(KeyValues const& values, PARAM_TYPE type, void* out, int pos)
{
    if (!out || pos < -1)
        return false;
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
