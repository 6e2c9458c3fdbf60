#include "comgui/client/LiveTicket.h"

#include "comgui/client/Client.h"
#include <map>
#include <utility>

namespace comgui
{
namespace
{
using Keys = std::vector<std::string>;

constexpr std::chrono::milliseconds Interval(20);  // between two looks at what has changed
constexpr std::size_t MostLate = 100'000;          // changes that wait for a slow reading

// A change more of a key that may have changed before.
void Add(std::map<std::string, SnapshotDifference>& differences, SnapshotDifference next)
{
    auto const [place, isFirst] = differences.try_emplace(next.key, next);
    if (isFirst)
        return;
    place->second.after = std::move(next.after);
    if (place->second.before == place->second.after)
        differences.erase(place);
}

// A key that is gone meanwhile has no value.
Result<std::vector<KeyChange>> ReadKeys(Tickets const& tickets, TicketAddress ticket, Keys const& keys)
{
    std::vector<KeyChange> read;
    for (std::string const& key : keys)
    {
        Result<Value> value = tickets.Read(ticket, key, WholeKey, Paths::AsStored);
        if (!value && value.GetError().code != NoSuchKey)
            return value.GetError();
        read.push_back({key, value ? *std::move(value) : Value()});
    }
    return read;
}
}  // namespace

// One reading at a time. What is heard meanwhile may be newer than what was read, so it waits and counts
// more.
struct LiveTicket::STATE : std::enable_shared_from_this<STATE>
{
    STATE(Connection const& connection, Worker const& worker, TicketAddress ticket, Handler handler)
        : m_tickets(connection.GetTickets()), m_worker(worker), m_ticket(ticket),
          m_handler(std::move(handler))
    {
    }

    void Read()
    {
        if (std::exchange(m_isReading, true))
            m_isStale = true;
        else
            m_worker.Do([tickets = m_tickets, ticket = m_ticket]
                        { return tickets.ReadAll(ticket, Paths::AsStored); },
                        [weak = weak_from_this()](Result<Snapshot> const& read)
                        {
                            if (auto const self = weak.lock())
                                self->Took(read);
                        });
    }
    void Read(Keys const& keys)
    {
        m_isReading = true;
        m_worker.Do([tickets = m_tickets, ticket = m_ticket, keys]
                    { return ReadKeys(tickets, ticket, keys); },
                    [weak = weak_from_this()](Result<std::vector<KeyChange>> const& read)
                    {
                        if (auto const self = weak.lock())
                            self->Took(read);
                    });
    }

    void Took(Result<Snapshot> const& read)
    {
        Snapshot before = read ? std::exchange(m_now, *read) : std::exchange(m_now, {});
        Keys const unknown = read ? Apply(std::exchange(m_late, {})).unknown : Keys();
        if (!read && !m_late.empty())
            m_isStale = true;  // it has changed since, so it may be there again
        m_late.clear();
        Continue(unknown);
        Tell(read ? Outcome() : Outcome(read.GetError()), Difference(before, m_now));
    }
    void Took(Result<std::vector<KeyChange>> const& read)
    {
        if (!read)
            m_isStale = true;
        auto changes = read.ValueOr({});
        for (KeyChange& change : m_late)
            changes.push_back(std::move(change));
        m_late.clear();
        TakeAll(changes);
    }
    void TakeAll(std::vector<KeyChange> const& changes)
    {
        Applied applied = Apply(changes);
        Continue(applied.unknown);
        std::vector<SnapshotDifference> differences;
        for (auto& [key, difference] : applied.differences)
            differences.push_back(std::move(difference));
        Tell({}, std::move(differences));
    }

    struct Applied
    {
        std::map<std::string, SnapshotDifference> differences;
        Keys unknown;  // whose values are to be read
    };
    Applied Apply(std::vector<KeyChange> const& changes)
    {
        Applied applied;
        for (KeyChange const& change : changes)
            if (!change.value)
                applied.unknown.push_back(change.key);
            else if (auto difference = m_now.Set(change.key, *change.value))
                Add(applied.differences, std::move(*difference));
        return applied;
    }

    void Continue(Keys const& unknown)
    {
        m_isReading = false;
        if (std::exchange(m_isStale, false))
            Read();
        else if (!unknown.empty())
            Read(unknown);
    }

    void Tell(Outcome outcome, std::vector<SnapshotDifference> differences)
    {
        int const code = outcome ? 0 : outcome.GetError().code;
        if (std::exchange(m_told, code) == code && differences.empty())
            return;
        auto const keep = shared_from_this();  // the handler may destroy the LiveTicket
        m_handler({std::move(outcome), std::move(differences)});
    }

    void Heard(TicketChanged const& change)
    {
        // After a failed read, too: a change needs a ticket that it is one of.
        if (change.isWhole || (!m_isReading && m_told != 0))
            Read();
        else if (m_isReading && m_late.size() + change.keys.size() > MostLate)
            m_isStale = true;
        else if (m_isReading)
            m_late.insert(m_late.end(), change.keys.begin(), change.keys.end());
        else
            TakeAll(change.keys);
    }
    void Heard(TicketCreated) { Read(); }
    void Heard(TicketDeleted) { Read(); }
    void Heard(ManyTicketsChanged) { Read(); }
    void Heard(ServerBack) { Read(); }
    template <typename Other>
    void Heard(Other const&)
    {
    }

    Tickets const m_tickets;
    Worker const& m_worker;
    TicketAddress const m_ticket;
    Handler const m_handler;
    Snapshot m_now;
    std::optional<int> m_told;  // the code of the last outcome
    std::vector<KeyChange> m_late;
    bool m_isReading = false;
    bool m_isStale = false;  // to be read once more as a whole
    Subscription m_subscription;
};

LiveTicket::LiveTicket(Connection& connection, Worker const& worker, TicketAddress ticket, Handler handler)
    : m_state(std::make_shared<STATE>(connection, worker, ticket, std::move(handler)))
{
    auto [subscriber, turn] = connection.m_client->Subscribe(
        Interest::InTickets({ticket}), worker.Results(),
        [state = m_state.get()](Event const& event)
        {
            auto const keep = state->shared_from_this();
            std::visit([state](auto const& what) { state->Heard(what); }, event);
        },
        Interval);
    m_state->m_subscription = Subscription(std::move(subscriber));
    // What is read before the plug-in reports would have to be read once more.
    worker.Do(
        [weak = std::weak_ptr(connection.m_client), turn = turn]
        {
            if (auto const client = weak.lock())
                client->AwaitReports(turn);
        },
        [] {});
    m_state->Read();
}

// What is read still comes back, and finds no handler to call.
LiveTicket::~LiveTicket() { m_state->m_subscription.End(); }

TicketAddress LiveTicket::Address() const { return m_state->m_ticket; }

Snapshot const& LiveTicket::Now() const { return m_state->m_now; }

void LiveTicket::Refresh() { m_state->Read(); }
}  // namespace comgui
