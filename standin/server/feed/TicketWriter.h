// Changes tickets: plans a change on the newest snapshot of its ticket, commits it, and plans anew if another
// thread or program was faster. So what several make at once is as if one after the other had made it. A
// change that was committed is in the cache when its call returns.
//
// A commit whose outcome is not known at once is asked after, for a minute if need be: so long a call may
// take.
//
// For any thread, with no lock held. Failures of the store are reported on stderr, and the change fails; of
// DeleteOrThrow they pass through.
#pragma once

#include "standin/server/feed/Feed.h"
#include "standin/server/tickets/WritePlan.h"
#include "standin/server/trouble/Troubles.h"

namespace standin
{
// What the program that made a change does after it. Called on the thread of the writer, with no lock held.
class AfterChange
{
public:
    virtual ~AfterChange() = default;

    virtual void SystemTicketChanged() noexcept = 0;

    // Work for when the ticket is gone; null for none. Called with the ticket's last snapshot, which dies
    // when this returns, and perhaps more than once.
    virtual std::function<void()> WhenDeleted(TicketAddress ticket, TicketSnapshot const& last) = 0;
};

class TicketWriter
{
public:
    TicketWriter(Store& store, Feed& feed, AfterChange& after, Troubles& troubles = Troubles::None())
        : m_store(store), m_feed(feed), m_after(after), m_troubles(troubles)
    {
    }

    struct Ticket
    {
        TicketAddress address;
        Incarnation incarnation;  // 0: whichever ticket has the address
    };

    // Carries out in one transaction what can be, in order; ok tells which. False, with every ok false, for
    // a ticket that is missing, and when the store fails.
    struct Conditions
    {
        KeyFilter const* limit = nullptr;  // the keys that may be written
        TicketChange::Owner owner = TicketChange::Owner::Unchanged;
        // What other tickets the change leans on, as they are now. Called for every attempt; what it throws
        // passes through.
        std::function<std::vector<TicketChange::Basis>()> others{};
    };
    bool Write(Ticket ticket, std::span<TicketWrite> writes, Conditions const& conditions);

    // Makes a ticket that begins with what can be carried out of the writes. Nothing if the address is taken,
    // and where no id is free. id and aboveId: as in TicketChange.
    struct Creation
    {
        TicketAddress address;
        int aboveId = 0;
        TicketChange::Owner owner = TicketChange::Owner::Unchanged;
    };
    std::optional<Ticket> Create(Creation const& creation, std::span<TicketWrite> writes = {});

    // False for a ticket that is missing.
    bool Delete(Ticket ticket);

    // The same for who tries again and again: what the store throws passes through. revision: of the last
    // change that the ticket may have had; false if it is another one here.
    bool DeleteOrThrow(Ticket ticket, Sequence revision = TicketChange::AnyRevision);

    // For the end of the process: from now on nobody waits for a store that does not answer what has become
    // of a change.
    void Stop() noexcept { m_isStopped = true; }

private:
    enum class Result
    {
        Done,
        Again,
        Failed,
    };
    template <typename Try>
    bool UntilDoneOrThrow(Try const& attempt);
    template <typename Try>
    bool UntilDone(Try const& attempt);
    template <typename Plan>
    bool OnSnapshot(Ticket ticket, Plan const& plan);
    Result Commit(TicketChange change, Sequence plannedAt, CommitOutcome& outcome);
    void TakeOverWhatHolds(TicketChange const& change);

    Store& m_store;
    Feed& m_feed;
    AfterChange& m_after;
    Troubles& m_troubles;
    std::atomic<bool> m_isStopped{false};
};
}  // namespace standin
