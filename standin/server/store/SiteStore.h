// A store that lasts, with what whoever opens it as a site needs beside the tickets, and tools of its owner.
// For any thread, as the store is.
#pragma once

#include "standin/server/store/Store.h"
#include <memory>

namespace standin
{
class SiteStore : public Store
{
public:
    // What messages call it: its folder, or its database, server and user, and never a password.
    virtual std::string Name() const = 0;

    // --- opening

    // Whether what belongs to the site and not to the store is in order: nobody has ended in another way than
    // in order since somebody said so. It may not have been, and not be now, while the first program is one
    // that does not care.
    virtual bool IsTidy() const noexcept = 0;
    virtual void NoteTidy() noexcept = 0;

    // If it was opened so that others who open it wait: lets them. May be called always.
    virtual void EndOpening() = 0;

    // Whether others who open it wait, as they have all the time: a connection that breaks lets them.
    virtual bool KeepsOpening() = 0;

    // --- while it is open

    // For who looks at several users and changes some of them then: others who take the turn wait until the
    // object goes. Null if nobody gave it up for that long.
    class UsersTurn
    {
    public:
        virtual ~UsersTurn() = default;
    };
    virtual std::unique_ptr<UsersTurn> TakeUsersTurn(std::chrono::milliseconds limit) = 0;

    // --- for tools of the owner, while programs work on the site

    // done of total, in a unit of its own.
    using Progress = std::function<void(long long done, long long total)>;

    // Looks at everything that is stored, as of one moment, and returns a line for each problem, but for at
    // most a hundred.
    virtual std::vector<std::string> Check(Progress const& progress) = 0;

    // Hands out every ticket that no program owns as a creation with all its values, in ascending order of
    // addresses, and every user, as of one moment. The callbacks must not use the store.
    virtual void ReadContent(std::function<void(TicketChange&&)> const& takeTicket,
                             std::function<void(User&&)> const& takeUser, Progress const& progress) = 0;

    struct Sizes
    {
        long long tickets = 0;
        long long users = 0;
        long long records = 0;        // of the journal
        long long databaseBytes = 0;  // without the engine's own journal
        long long walBytes = 0;       // of that; 0 if several databases share it
    };
    virtual Sizes Measure() = 0;
};
}  // namespace standin
