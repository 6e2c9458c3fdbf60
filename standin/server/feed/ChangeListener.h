// Who hears of the changes of a site, from whichever program they come.
#pragma once

#include "standin/server/store/TicketChange.h"
#include "standin/server/tickets/KeyPool.h"

namespace standin
{
// A value as one change left it; PARAM_NONE: deleted. pos is -1 for a key that was written anew or deleted.
struct ChangedParameter
{
    HeldKey key{};
    int pos = 0;
    TicketValue value{};
};
using ChangedParameters = std::vector<ChangedParameter>;

class ChangeListener
{
public:
    virtual ~ChangeListener() = default;

    // Whether changes of that ticket are to be heard of. The feed spares itself work for others.
    virtual bool Wants(TicketAddress ticket) const = 0;

    // Whether it can take a change now. If not, the feed goes on without it, and tells it later what is in
    // the journal until then.
    virtual bool HasRoom() const = 0;

    // Of some tickets everything is noticed, room or not: as soon as a change is made, before anybody is told
    // of it. For the server's own knowledge, under the same conditions as what follows.
    virtual bool Notices(TicketAddress) const { return false; }
    virtual void Noticed(TicketAddress, ChangedParameters const&) noexcept {}

    // Called for one change after the other, in the order of the commits, under the feed's lock: neither may
    // wait for anything, nor use the feed. Of a creation the parameters come apart, as a write behind it.
    virtual void Created(TicketAddress ticket) noexcept = 0;
    virtual void Written(TicketAddress ticket, ChangedParameters&& parameters) noexcept = 0;
    virtual void Deleted(TicketAddress ticket) noexcept = 0;
};
}  // namespace standin
