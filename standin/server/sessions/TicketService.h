// What a session may do with the tickets of a site: its rights, and the keys to which it has limited itself,
// which it reads and writes as if the others were not there.
//
// For any thread. Reads take no lock and allocate nothing, unless they are the first of a ticket. What a
// session does after its end is refused.
#pragma once

#include "standin/server/feed/TicketWriter.h"
#include "standin/server/sessions/Session.h"

namespace standin
{
// Values of a ticket at one moment. Their texts are the ticket's own, and count as handed out.
class WalkedValues
{
public:
    struct Value
    {
        std::size_t key;  // where it begins in m_keys
        TicketElement element;
    };
    std::span<Value const> Values() const { return m_values; }
    char const* KeyOf(Value const& value) const { return m_keys.c_str() + value.key; }

    void Add(KeyValues const& values);

private:
    std::string m_keys;  // one behind the other, each ended by a zero byte: a key may go during the walk
    std::vector<Value> m_values;
};

class TicketService
{
public:
    TicketService(Feed& feed, TicketWriter& writer) : m_feed(feed), m_writer(writer) {}

    // Calls use with the ticket as it is now and the session's limit, null for none; gives what use gives.
    // False if there is no such ticket (incarnation 0: whichever has the address), or no session any more.
    // use may not block, nor call the server, and what it is given dies when it returns.
    template <typename Use>
    bool Look(Session const& session, TicketAddress address, Incarnation incarnation, Use const& use)
    {
        if (session.Ended())
            return false;
        if (!session.IsLimited()) [[likely]]
            return LookAt(address, incarnation,
                          [&](TicketSnapshot const& ticket) { return use(ticket, nullptr); });
        auto const limit = session.LimitOf(address);
        return LookAt(address, incarnation,
                      [&](TicketSnapshot const& ticket) { return use(ticket, limit.get()); });
    }

    // The same for the values of one key; false also if there is none that the session may see.
    template <typename Use>
    bool LookAtKey(Session const& session, TicketAddress address, Incarnation incarnation,
                   std::string_view key, Use const& use)
    {
        return Look(session, address, incarnation,
                    [&](TicketSnapshot const& ticket, KeyFilter const* limit)
                    {
                        KeyValues const* const values = ticket.Find(key);
                        return values && (!limit || limit->Selects(key)) && use(*values);
                    });
    }

    // Every value of the keys that begin with the prefix, by key, bytewise, and by position; nothing if there
    // is no such ticket.
    std::optional<WalkedValues> Values(Session const& session, TicketAddress address, Incarnation incarnation,
                                       std::string_view prefix);

    // A text of no ticket for a session that holds its texts; it stays as one does that has left its ticket.
    char const* HandOut(Session const& session, std::string_view text);

    // As TicketWriter::Write; false, with every ok false, also without the right.
    bool Write(Session const& session, TicketAddress address, Incarnation incarnation,
               std::span<TicketWrite> writes);

    // Nothing for a ticket that is there already, for an address out of range, and without the right.
    std::optional<Incarnation> Create(Session const& session, TicketAddress address);

    // Makes a ticket of a type and gives its id, as Store::Commit chooses it; -1 where Create would refuse.
    int CreateNext(Session const& session, int type);

    // False where Create would refuse, for a ticket that is missing, and for type 0, which is never deleted.
    // A job's folder goes with its ticket.
    bool Delete(Session const& session, TicketAddress address);

    void CatchUp() { m_feed.Fresh(); }  // with all that was acknowledged to anybody
    bool CatchUp(Sequence sequence) { return m_feed.CatchUp(sequence); }
    Incarnation IncarnationOf(TicketAddress address) { return m_feed.Fresh().IncarnationOf(address); }
    int NextTicket(int type, int after) { return m_feed.Fresh().NextId(type, after); }
    int LargestId(int type) { return m_feed.Fresh().LargestId(type); }  // 0 if there is no ticket of the type

    // Rises with every change of ticket 0/0.
    Sequence SystemTicketRevision() { return m_feed.Fresh().RevisionOf(SystemTicket); }

    // The server's own looks, with nobody logged in.
    template <typename Use>
    bool LookAt(TicketAddress address, Incarnation incarnation, Use const& use)
    {
        for (;;)
        {
            TicketCache const& cache = m_feed.Fresh();
            {
                Epochs::Guard const guard;
                TicketSnapshot const* const ticket = cache.Find(address);
                if (ticket) [[likely]]
                    return (incarnation == 0 || ticket->Which().incarnation == incarnation) && use(*ticket);
                Incarnation const now = cache.IncarnationOf(address);
                if (now == 0 || (incarnation != 0 && now != incarnation))
                    return false;
            }
            if (!m_feed.Load(address))
                return false;
        }
    }

    std::optional<int> Int(TicketAddress address, std::string_view key);

    // which: gets the version of the system ticket that has them.
    FolderSettings Folders(TicketSnapshot::Version* which = nullptr);

private:
    static bool MayWrite(Session const& session, TicketAddress address);

    Feed& m_feed;
    TicketWriter& m_writer;
};

// The text of a key that has one value; empty for everything else.
std::string TextOf(TicketSnapshot const& ticket, std::string_view key);
}  // namespace standin
