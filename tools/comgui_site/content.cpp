#include "tools/comgui_site/content.h"

#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/words.h"
#include <algorithm>

namespace comgui_site
{
namespace
{
using standin::SiteStore;
using standin::Store;
using standin::StoredValue;
using standin::TicketAddress;
using standin::TicketChange;
using standin::User;

constexpr std::size_t MostDifferences = 100;

auto Counting(Progress& progress)
{
    return [&progress](long long done, long long total)
    { progress(static_cast<unsigned long long>(done), static_cast<unsigned long long>(total)); };
}

// Of which values, in order, have not been found so far; the ticket's are in the order of keys and positions,
// as those of a load are.
bool IsSameTicket(Store& to, TicketChange const& ticket)
{
    auto next = ticket.parameters.begin();
    bool isSame = true;
    auto const compare = [&](std::string_view key, int pos, StoredValue const& value)
    {
        isSame = isSame && next != ticket.parameters.end() && next->key == key && next->pos == pos &&
                 IsSame(next->value.ToStored(), value);
        if (isSame)
            ++next;
    };
    return to.Load(ticket.address, compare) && isSame && next == ticket.parameters.end();
}

bool IsSameUser(Store& to, User const& user)
{
    auto const found = to.FindUser(user.name);
    return found && found->passwordHash == user.passwordHash && found->role == user.role &&
           found->ticketId == user.ticketId;
}
}  // namespace

void CopyContent(SiteStore& from, Store& to)
{
    Progress progress("copying tickets");
    std::uint64_t number = 0;
    from.ReadContent(
        [&](TicketChange&& ticket)
        {
            if (to.Commit(ticket, ++number).kind != standin::CommitOutcome::Committed)
                throw standin::StoreError("ticket " + TextOf(ticket.address) +
                                          " cannot be copied: the connection broke; try again");
        },
        [&](User&& user) { to.PutUser(user); }, Counting(progress));
}

std::vector<std::string> DifferencesBetween(SiteStore& from, SiteStore& to)
{
    std::vector<std::string> differences;
    auto const add = [&](std::string difference)
    {
        if (differences.size() < MostDifferences)
            differences.push_back(std::move(difference));
    };
    Progress progress("comparing tickets");
    std::vector<TicketAddress> tickets;
    std::size_t users = 0;
    from.ReadContent(
        [&](TicketChange&& ticket)
        {
            tickets.push_back(ticket.address);
            if (!IsSameTicket(to, ticket))
                add("ticket " + TextOf(ticket.address) + " is not the same");
        },
        [&](User&& user)
        {
            ++users;
            if (!IsSameUser(to, user))
                add("user " + Cleaned(user.name) + " is not the same");
        },
        Counting(progress));
    to.Tickets(
        [&](TicketAddress address, auto const&)
        {
            if (!std::binary_search(tickets.begin(), tickets.end(), address))
                add("ticket " + TextOf(address) + " should not be there");
        });
    if (to.Users().size() != users)
        add("the number of users is not the same");
    return differences;
}
}  // namespace comgui_site
