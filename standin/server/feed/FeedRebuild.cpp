// What the feed does when the journal has been pruned past what it has heard: it lists all tickets anew, and
// tells the listener the difference between what that was told and what is now.
#include "standin/server/feed/Feed.h"

#include <algorithm>

namespace standin
{
struct Feed::Listing
{
    struct Ticket
    {
        TicketState state;
        bool isLoaded = false;
        Values values{};
    };
    Sequence sequence = 0;
    std::map<TicketAddress, Ticket> tickets;
};

// All tickets, with the values of those that have changed and that somebody has read or wants to hear of.
Feed::Listing Feed::List()
{
    Listing listing;
    listing.sequence = m_store.Tickets([&](TicketAddress address, TicketState const& state)
                                       { listing.tickets.emplace(address, Listing::Ticket{state}); });
    for (auto& [address, ticket] : listing.tickets)
    {
        bool const isNews = m_cache.IncarnationOf(address) != ticket.state.incarnation ||
                            m_cache.RevisionOf(address) != ticket.state.revision;
        bool const isLooked = m_listener.Wants(address) || m_listener.Notices(address);
        if (!isNews || (!m_cache.Find(address) && !isLooked))
            continue;
        auto const loaded = Read(address, ticket.values);
        ticket.isLoaded = loaded && loaded->state.incarnation == ticket.state.incarnation;
        if (ticket.isLoaded)
            ticket.state = loaded->state;  // perhaps of later than the listing; the feed then passes it over
    }
    return listing;
}

void Feed::Rebuild(Lock& lock)
{
    Listing listing = List();
    lock.lock();
    GiveUpTelling();
    m_toldAhead.clear();
    for (auto const& [address, ticket] : listing.tickets)
        if (ticket.state.revision > listing.sequence)
            m_toldAhead.emplace(address, ticket.state.revision);
    TakeOver(listing);
    m_heard.store(listing.sequence, std::memory_order_release);
    MakeReady();
}

void Feed::TakeOver(Listing& listing)
{
    std::vector<TicketAddress> gone;
    m_cache.ForEach(
        [&](TicketAddress address, TicketState const& state)
        {
            auto const now = listing.tickets.find(address);
            if (now == listing.tickets.end() || now->second.state.incarnation != state.incarnation)
                gone.push_back(address);
        });
    for (TicketAddress const address : gone)
    {
        m_cache.Forget(address);
        if (m_listener.Wants(address))
            m_listener.Deleted(address);
    }
    for (auto& [address, ticket] : listing.tickets)
    {
        if (m_cache.RevisionOf(address) == ticket.state.revision &&
            m_cache.IncarnationOf(address) == ticket.state.incarnation)
            continue;
        bool const isNew = m_cache.IncarnationOf(address) == 0;
        bool const isWanted = m_listener.Wants(address);
        bool const isNoticed = m_listener.Notices(address);
        ChangedParameters news;
        if ((isWanted || isNoticed) && ticket.isLoaded)
            news =
                Difference(m_cache.Find(address), ticket.values);  // nobody else replaces it under the lock
        if (isNoticed)
            m_listener.Noticed(address, news);
        m_cache.Note(address, ticket.state);
        if (ticket.isLoaded)
            m_cache.Publish(address, ticket.state, ticket.values);
        if (isNew && isWanted)
            m_listener.Created(address);
        if (isWanted && !news.empty())
            m_listener.Written(address, std::move(news));
    }
}

// What has to be told to whom knows before, null for nothing, so that he knows after.
ChangedParameters Feed::Difference(TicketSnapshot const* before, Values const& after)
{
    ChangedParameters news;
    std::set<std::pair<Key, int>> now;
    std::set<Key> keys;
    for (auto const& each : after)
    {
        Key const key = m_cache.Intern(each.key);
        now.insert({key, each.pos});
        keys.insert(key);
        KeyValues const* const known = before ? before->Find(key) : nullptr;
        TicketElement const* const element = known ? known->At(each.pos) : nullptr;
        if (!element || !IsSame(element->ToStored(), each.value.ToStored()))
            news.push_back({key, each.pos, each.value.Copy()});
    }
    if (!before)
        return news;
    before->ForEachKey(
        [&](KeyValues const& values)
        {
            if (!keys.contains(values.Name()))
                news.push_back({values.Name(), -1, {}});
            else
                for (TicketElement const& element : values.Elements())
                    if (!now.contains({values.Name(), element.pos}))
                        news.push_back({values.Name(), element.pos, {}});
        });
    return news;
}
}  // namespace standin
