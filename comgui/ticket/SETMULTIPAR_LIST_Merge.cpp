#include "comgui/ticket/PARTIAL_MODE.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "comgui/ticket/STICKET_ACCESS.h"

using comgui::detail::Walk;

namespace
{
template <typename ACTION>
void WalkWith(ACTION action, STICKET_ACCESS const* ticket)
{
    Walk(ticket, ACTION::CollectAction, &action);
}

bool HasPatterns(char const* const* keys) { return keys && *keys; }
}  // namespace

void SETMULTIPAR_LIST::Merge(STICKET_ACCESS const* ticket, PARTIAL_MODE const& mode)
{
    if (ticket == nullptr)
        return;
    if (mode.partial())
        WalkWith(PARTIAL_COLLECT_ACTION(this, mode), ticket);
    else
        Walk(ticket, CollectAction, this);
}

// A table that only removes leaves a mode without patterns: here that selects nothing, where the mode itself
// would have meant the whole ticket.
void SETMULTIPAR_LIST::Merge(STICKET_ACCESS const* ticket, char const* const* keys)
{
    if (ticket == nullptr)
        return;
    if (HasPatterns(keys))
        WalkWith(PARTIAL_COLLECT_ACTION(this, PARTIAL_MODE(keys)), ticket);
    else
        Walk(ticket, CollectAction, this);
}

void SETMULTIPAR_LIST::FilteredMerge(STICKET_ACCESS const* ticket, char const* const* keys)
{
    if (ticket == nullptr)
        return;
    if (HasPatterns(keys))
        WalkWith(FILTERED_PARTIAL_COLLECT_ACTION(this, PARTIAL_MODE(keys)), ticket);
    else
        Walk(ticket, CollectAction, this);
}
