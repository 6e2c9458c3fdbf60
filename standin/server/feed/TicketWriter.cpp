#include "standin/server/feed/TicketWriter.h"

#include "standin/server/files/RefusableCall.h"
#include "standin/server/files/Report.h"
#include "standin/server/store/Outcome.h"

namespace standin
{
namespace
{
void Refuse(std::span<TicketWrite> writes)
{
    for (TicketWrite& write : writes)
        write.ok = false;
}
}  // namespace

// Calls attempt until it is done or has failed.
template <typename Try>
bool TicketWriter::UntilDoneOrThrow(Try const& attempt)
{
    for (;;)
    {
        Result const result = attempt();
        if (result != Result::Again)
            return result == Result::Done;
    }
}

template <typename Try>
bool TicketWriter::UntilDone(Try const& attempt)
{
    try
    {
        return UntilDoneOrThrow(attempt);
    }
    catch (StoreError const& error)
    {
        Report(error.what());
        return false;
    }
}

// Calls plan with the newest snapshot, in a reading section; false if there is no such ticket.
template <typename Plan>
bool TicketWriter::OnSnapshot(Ticket ticket, Plan const& plan)
{
    for (;;)
    {
        TicketCache const& cache = m_feed.Fresh();
        {
            Epochs::Guard const guard;
            TicketSnapshot const* const snapshot = cache.Find(ticket.address);
            Incarnation const now =
                snapshot ? snapshot->Which().incarnation : cache.IncarnationOf(ticket.address);
            if (now == 0 || (ticket.incarnation != 0 && now != ticket.incarnation))
            {
                RefusableCall::Note({"ticket ", std::to_string(ticket.address.type), "/",
                                     std::to_string(ticket.address.id), " is not there"});
                return false;
            }
            if (snapshot)
                return plan(*snapshot), true;
        }
        if (!m_feed.Load(ticket.address))
            return false;
    }
}

bool TicketWriter::Write(Ticket ticket, std::span<TicketWrite> writes, Conditions const& conditions)
{
    bool const isDone = UntilDone(
        [&]
        {
            Sequence const plannedAt = m_feed.Heard();
            TicketChange change;
            change.owner = conditions.owner;
            change.address = ticket.address;
            if (conditions.others)
                change.others = conditions.others();
            bool const isThere =
                OnSnapshot(ticket,
                           [&](TicketSnapshot const& snapshot)
                           {
                               auto folders = ticket.address == SystemTicket
                                                  ? std::optional(FoldersOf(&snapshot))
                                                  : std::nullopt;
                               WritePlan plan(&snapshot, writes, conditions.limit, std::move(folders));
                               change.parameters = std::move(plan.Changes());
                               change.incarnation = snapshot.Which().incarnation;
                               change.revision = snapshot.Which().revision;
                           });
            if (!isThere)
                return Result::Failed;
            if (change.parameters.empty() && conditions.owner == TicketChange::Owner::Unchanged)
                return Result::Done;  // nothing becomes different
            CommitOutcome outcome;
            Result const result = Commit(std::move(change), plannedAt, outcome);
            if (result == Result::Done && ticket.address == SystemTicket)
                m_after.SystemTicketChanged();
            return result;
        });
    if (!isDone)
        Refuse(writes);
    return isDone;
}

std::optional<TicketWriter::Ticket> TicketWriter::Create(Creation const& creation,
                                                         std::span<TicketWrite> writes)
{
    std::optional<Ticket> made;
    UntilDone(
        [&]
        {
            bool const isTaken = m_feed.Fresh().IncarnationOf(creation.address) != 0;
            if (isTaken)
                return Result::Failed;
            Sequence const plannedAt = m_feed.Heard();
            TicketChange change;
            change.kind = TicketChange::Create;
            change.address = creation.address;
            change.aboveId = creation.aboveId;
            change.owner = creation.owner;
            change.parameters = std::move(WritePlan(nullptr, writes).Changes());
            CommitOutcome outcome;
            Result const result = Commit(std::move(change), plannedAt, outcome);
            if (result == Result::Done)
                made = Ticket{outcome.address, outcome.sequence};
            return result;
        });
    if (!made)
        Refuse(writes);
    return made;
}

bool TicketWriter::Delete(Ticket ticket)
{
    return UntilDone([&] { return DeleteOrThrow(ticket) ? Result::Done : Result::Failed; });
}

bool TicketWriter::DeleteOrThrow(Ticket ticket, Sequence revision)
{
    return UntilDoneOrThrow(
        [&]
        {
            Sequence const plannedAt = m_feed.Heard();
            TicketChange change;
            change.kind = TicketChange::Delete;
            change.address = ticket.address;
            std::function<void()> whenDeleted;
            bool const isThere = OnSnapshot(ticket,
                                            [&](TicketSnapshot const& snapshot)
                                            {
                                                change.incarnation = snapshot.Which().incarnation;
                                                change.revision = snapshot.Which().revision;
                                                whenDeleted = m_after.WhenDeleted(ticket.address, snapshot);
                                            });
            if (!isThere || (revision != TicketChange::AnyRevision && change.revision != revision))
                return Result::Failed;
            CommitOutcome outcome;
            Result const result = Commit(std::move(change), plannedAt, outcome);
            if (result == Result::Done && whenDeleted)
                whenDeleted();
            return result;
        });
}

// plannedAt: what had been heard before the change was planned. One whose answer was lost and that was not
// made is no conflict: what it was planned on may hold as before.
TicketWriter::Result TicketWriter::Commit(TicketChange change, Sequence plannedAt, CommitOutcome& outcome)
{
    if (m_troubles.IsDiskFull())
        throw StoreError("the disk of the site's database is full: " + std::string(TroubleKey) + " says so");
    Feed::OwnChange own(m_feed, std::move(change));
    outcome = m_store.Commit(own.Get(), own.Number());
    if (outcome.kind == CommitOutcome::Unknown)
    {
        auto const found = AwaitOutcome(m_store, own.Number(), own.Get().address, OutcomeLimit, &m_isStopped);
        if (!found)
            return Result::Again;
        outcome = *found;
    }
    switch (outcome.kind)
    {
    case CommitOutcome::Committed:
        own.Deliver(outcome);
        return Result::Done;
    case CommitOutcome::Conflict:
        if (outcome.sequence <= plannedAt)  // no change explains it, and waiting for one would be for ever
            TakeOverWhatHolds(own.Get());
        return m_feed.CatchUp(outcome.sequence) ? Result::Again : Result::Failed;
    default:
        return Result::Failed;
    }
}

void TicketWriter::TakeOverWhatHolds(TicketChange const& change)
{
    m_feed.Reload(change.address);
    for (TicketChange::Basis const& other : change.others)
        m_feed.Reload(other.address);
}
}  // namespace standin
