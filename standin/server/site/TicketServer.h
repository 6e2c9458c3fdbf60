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
//
// What a session has limited to some keys of a ticket it reads and writes as if the others were not there.
// Every change is told to the sessions that want to know, once it is safe and in memory.
#pragma once

#include "comgui/ticket/SETMULTIPAR.h"
#include "standin/server/sessions/NotificationService.h"
#include "standin/server/sessions/Session.h"
#include "standin/server/sessions/SessionRegister.h"
#include "standin/server/site/ReadWriteLock.h"
#include "standin/server/store/Storage.h"
#include "standin/server/tickets/FolderTable.h"
#include "standin/server/tickets/Ticket.h"
#include <array>
#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <set>

namespace standin
{
inline constexpr int JobTicketType = 3;
inline constexpr int UserTicketType = 17;

class JobIntake;
class TicketWrites;
class TransferService;

// Tells a ticket from another that had, or will have, its address. None is given twice in a server's life.
using Birth = unsigned long long;
inline constexpr Birth AnyBirth = 0;     // whichever ticket has the address
inline constexpr Birth NoBirth = ~0ULL;  // of no ticket at all

// A value of a ticket at one moment. The text is the ticket's own, kept as one that was read.
struct WalkedValue
{
    Key key;
    int pos;
    PARAM_TYPE type;
    unsigned long long word;
    TicketText const* text;  // STRING, BINSTRING
};

class TicketServer
{
public:
    // The storage outlives the server, which alone uses it from now on. systemTicketChanged is called after
    // every change of ticket 0/0, while no other change goes on: it may use the storage, not the server.
    // Throws StorageError.
    explicit TicketServer(Storage& storage, std::function<void()> systemTicketChanged = {});
    ~TicketServer();  // not while a call is on its way
    TicketServer(TicketServer const&) = delete;
    TicketServer& operator=(TicketServer const&) = delete;

    // Null for a wrong user or password, which is not told apart. Throws StorageError.
    std::shared_ptr<Session> Login(std::string const& user, std::string const& password);

    // False if it had ended before. Waits for the end of a notification callback that runs for the session,
    // and of its transfers, which are cut. Jobs that it has prepared and not sent go.
    bool Logout(Session& session);

    // The reads and writes are what PARAM_TYPE.h says of value words. Positions: -1 the key as a whole, 0 and
    // up one value, -2 appends. A failed read leaves *value untouched. GetTable is false only for a null
    // table and an ended session; a record's ok tells of the record.
    bool Get(Session const& session, TicketAddress address, char const* key, PARAM_TYPE type, void* value,
             int pos, Birth birth = AnyBirth);
    bool GetTable(Session const& session, TicketAddress address, GETMULTIPAR* table, Birth birth = AnyBirth);
    bool Set(Session const& session, TicketAddress address, char const* key, PARAM_TYPE type,
             void const* value, int pos, Birth birth = AnyBirth);

    // All records that can be carried out are, in order and in one transaction; ok tells which. False, with
    // every ok false, for a ticket that is missing or not the user's to write, and when the storage fails.
    bool SetTable(Session const& session, TicketAddress address, SETMULTIPAR* table, Birth birth = AnyBirth);

    // Every value of the keys that begin with the prefix, by key, bytewise, and by position; nothing if there
    // is no such ticket.
    std::optional<std::vector<WalkedValue>> Values(Session const& session, TicketAddress address,
                                                   std::string_view prefix, Birth birth = AnyBirth);

    // The server's own look at a ticket, with nobody logged in.
    std::optional<int> Int(TicketAddress address, char const* key);

    FolderTable Folders();

    // What the server itself does to a ticket, whoever may write it. Make gives the id as CreateNext does and
    // fills the ticket in one transaction; Write is false also when a record is refused.
    struct MadeTicket
    {
        TicketAddress address;
        Birth birth;
    };
    std::optional<MadeTicket> Make(int type, SETMULTIPAR* table);
    bool Write(MadeTicket const& ticket, SETMULTIPAR* table);
    bool Remove(MadeTicket const& ticket);

    // Work that nobody may delete the ticket or change the folders under; false, and nothing done, if the
    // ticket is gone. Changes wait meanwhile, so work must not use the server.
    bool WhileItLasts(MadeTicket const& ticket, std::function<void(FolderTable const& folders)> const& work);

    bool Exists(TicketAddress address) const { return BirthOf(address) != NoBirth; }
    Birth BirthOf(TicketAddress address) const;  // NoBirth if there is no such ticket

    // How often ticket 0/0 has changed, counted once all of a change is in memory.
    unsigned long long SystemTicketChanges() const
    {
        return m_systemTicketChanges.load(std::memory_order_acquire);
    }

    // The smallest id above after among the tickets of a type, -1 if there is none. Starts at after -1.
    int NextTicket(int type, int after) const;

    // False for a ticket that is there already, for an address out of range, without the right, and when the
    // storage fails.
    bool Create(Session const& session, TicketAddress address);

    // Makes a ticket of a type and gives its id: the one above the largest in use, 1 for the first of a type;
    // the smallest free one when the largest possible is taken. -1 where Create would refuse.
    int CreateNext(Session const& session, int type);

    // False where Create would refuse, for a ticket that is missing, and for type 0, which is never deleted.
    // A job's folder goes with its ticket.
    bool Delete(Session const& session, TicketAddress address);

    // Hands out a ticket's values as Storage::Load does, pointers included; false if there is no such
    // ticket. Changes wait until it returns, so take must not make any, nor read through the server.
    using Take = std::function<void(std::string_view key, int pos, StoredValue const& value)>;
    bool Visit(Session const& session, TicketAddress address, Take const& take);

    NotificationService& Notifications() { return m_notifications; }
    TransferService& Transfers() { return *m_transfers; }
    JobIntake& Jobs() { return *m_jobs; }

    std::size_t RetiredTexts() const { return m_sessions.Kept(); }

private:
    struct ServedTicket : Ticket
    {
        Birth birth = NoBirth;
    };

    bool Read(TicketAddress address, Birth birth, std::string_view key, PARAM_TYPE type, void* value,
              int pos);
    static bool MayWrite(Session const& session, TicketAddress address);
    ServedTicket* Find(TicketAddress address, Birth birth = AnyBirth);

    // m_change is held for these. Loaded: null if missing or unreadable.
    Ticket* Loaded(TicketAddress address, Birth birth = AnyBirth);
    bool Store(std::vector<Change> const& changes);
    bool WriteHere(TicketAddress address, Ticket& ticket, SETMULTIPAR* table, KeyFilter const* limit);
    void CarryOut(Ticket& ticket, TicketWrites& writes, ChangedParameters& news);
    int NextId(int type) const;  // may be no id at all
    bool CreateHere(TicketAddress address);
    ServedTicket& Insert(TicketAddress address);
    bool RemoveHere(TicketAddress address);
    FolderSettings FoldersHere();
    std::string JobMarkHere(TicketAddress job);

    void Changed(TicketAddress address);

    Storage& m_storage;
    std::function<void()> const m_systemTicketChanged;
    std::atomic<unsigned long long> m_systemTicketChanges{0};

    std::mutex m_change;             // held for a change as a whole, and for every use of the storage
    mutable ReadWriteLock m_memory;  // the members below; written to only while m_change is held, too
    KeyPool m_keys;
    std::unordered_map<TicketAddress, ServedTicket> m_tickets;
    std::array<std::set<int>, 100> m_ids;  // of m_tickets, by type
    Birth m_newestBirth = 0;

    // These have locks of their own, taken last.
    SessionRegister m_sessions;
    NotificationService m_notifications;

    std::unique_ptr<TransferService> const m_transfers;  // these two use the server, and go before it
    std::unique_ptr<JobIntake> const m_jobs;
};
}  // namespace standin
