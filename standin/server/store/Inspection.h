// What every lasting store looks for in its rows when its owner asks whether they are sound; each brings its
// rows here.
#pragma once

#include "standin/server/store/SiteStore.h"
#include "standin/server/tickets/StoredValue.h"
#include <optional>

namespace standin
{
class Inspection
{
public:
    // total: so many steps there will be, in the unit of Advance.
    Inspection(SiteStore::Progress const& progress, long long total) : m_progress(progress), m_total(total)
    {
        Advance(0);
    }

    void Advance(long long done);
    void Add(std::string problem);

    // last: the newest change. isOwnerKnown: nobody owns it, or a program that is registered.
    void LookAtTicket(TicketAddress address, TicketState const& state, Sequence last, bool isOwnerKnown);

    // value: nothing if its columns do not fit the type.
    void LookAtParameter(TicketAddress address, int pos, int type, std::optional<StoredValue> const& value,
                         bool isOfTicket);

    // Of one record after the other; expected: the number that is due, which moves on.
    void LookAtRecord(Sequence found, Sequence& expected, int kind, TicketAddress address,
                      std::string_view record);

    std::vector<std::string> Problems() && { return std::move(m_problems); }

private:
    SiteStore::Progress const& m_progress;
    long long const m_total;
    long long m_done = 0;
    std::vector<std::string> m_problems;
};
}  // namespace standin
