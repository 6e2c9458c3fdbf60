// The ticket server inside the client's process: users, sessions and tickets over one storage. Tickets are
// answered from memory and come there when first asked for; a change reaches the storage first, so what was
// acknowledged is safe and what failed has changed nothing.
//
// For any thread. Reads share a lock for one look-up each and wait for nothing but another record's change.
// Changes go one after another, and so does all use of the storage. What a session does after Logout is
// refused. Failures of the storage are told in one line on stderr, and the operation fails.
//
// A text or BIN_STRING that was read stays where it is until the session that read it logs out, also when
// its ticket has long got another value.
#pragma once

#include "comgui/ticket/SETMULTIPAR.h"
#include "standin/server/ReadWriteLock.h"
#include "standin/server/Session.h"
#include "standin/server/SessionRegister.h"
#include "standin/server/Storage.h"
#include "standin/server/Ticket.h"
#include <array>
#include <functional>
#include <memory>
#include <mutex>
#include <set>

namespace standin
{
inline constexpr int UserTicketType = 17;

class TicketWrites;

class TicketServer
{
public:
    // The storage outlives the server, which alone uses it from now on. systemTicketChanged is called after
    // every change of ticket 0/0, while no other change goes on: it may use the storage, not the server.
    // Throws StorageError.
    explicit TicketServer(Storage& storage, std::function<void()> systemTicketChanged = {});
    TicketServer(TicketServer const&) = delete;
    TicketServer& operator=(TicketServer const&) = delete;

    // Null for a wrong user or password, which is not told apart. Throws StorageError.
    std::shared_ptr<Session> Login(std::string const& user, std::string const& password);
    bool Logout(Session& session);  // false if it had ended before

    // The reads and writes are what PARAM_TYPE.h says of value words. Positions: -1 the key as a whole, 0 and
    // up one value, -2 appends. A failed read leaves *value untouched. GetTable is false only for a null
    // table and an ended session; a record's ok tells of the record.
    bool Get(Session const& session, TicketAddress address, char const* key, PARAM_TYPE type, void* value,
             int pos);
    bool GetTable(Session const& session, TicketAddress address, GETMULTIPAR* table);
    bool Set(Session const& session, TicketAddress address, char const* key, PARAM_TYPE type,
             void const* value, int pos);

    // All records that can be carried out are, in order and in one transaction; ok tells which. False, with
    // every ok false, for a ticket that is missing or not the user's to write, and when the storage fails.
    bool SetTable(Session const& session, TicketAddress address, SETMULTIPAR* table);

    // The server's own look at a ticket, with nobody logged in.
    std::optional<int> Int(TicketAddress address, char const* key);

    bool Exists(TicketAddress address) const;

    // The smallest id above after among the tickets of a type, -1 if there is none. Starts at after -1.
    int NextTicket(int type, int after) const;

    // False for a ticket that is there already, for an address out of range, without the right, and when the
    // storage fails.
    bool Create(Session const& session, TicketAddress address);

    // The same for a ticket that is missing; tickets of type 0 cannot be deleted.
    bool Delete(Session const& session, TicketAddress address);

    // Hands out a ticket's values as Storage::Load does, pointers included; false if there is no such
    // ticket. Changes wait until it returns, so take must not make any, nor read through the server.
    using Take = std::function<void(std::string_view key, int pos, StoredValue const& value)>;
    bool Visit(Session const& session, TicketAddress address, Take const& take);

    std::size_t RetiredTexts() const { return m_sessions.Kept(); }

private:
    bool Read(TicketAddress address, std::string_view key, PARAM_TYPE type, void* value, int pos);
    static bool MayWrite(Session const& session, TicketAddress address);
    Ticket* Find(TicketAddress address);
    Ticket* Loaded(TicketAddress address);  // m_change is held; null if missing or unreadable
    bool Store(std::vector<Change> const& changes);
    void CarryOut(Ticket& ticket, TicketWrites& writes);
    void Changed(TicketAddress address);

    Storage& m_storage;
    std::function<void()> const m_systemTicketChanged;

    std::mutex m_change;             // held for a change as a whole, and for every use of the storage
    mutable ReadWriteLock m_memory;  // the members below; written to only while m_change is held, too
    KeyPool m_keys;
    std::unordered_map<TicketAddress, Ticket> m_tickets;
    std::array<std::set<int>, 100> m_ids;  // of m_tickets, by type

    SessionRegister m_sessions;  // has a lock of its own, taken last
};
}  // namespace standin
