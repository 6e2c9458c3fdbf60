// The tickets of a session, whose values an author reads and writes by the tickets' addresses. The kit turns
// the slots of the session's table, and of the tables of opened tickets, into these calls, checks what comes
// in, and keeps the texts that were read.
//
// Slots may be called from several threads at once, so an author's functions must cope with that.
#pragma once

#include "comgui/module/ContainerSlots.h"
#include "comgui/module/Kept.h"
#include "comgui/module/KeySelection.h"
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string_view>
#include <vector>

class clFOLDER_VARIABLES;

namespace comgui::plugin
{
class Session;

class Container : public ContainerSlots
{
public:
    // The session outlives it, or ends with it: a session holds its container as a member.
    explicit Container(Session& session);
    ~Container() override;

    // Gets addresses of tickets only (IsTicket).
    virtual bool Exists(Address ticket) = 0;

    // From here to All the ticket exists, or did a moment ago.

    // The value at that position of the key, from 0; none if there is none. A slot that asks for another type
    // fails.
    virtual Value Read(Address ticket, std::string_view key, int pos) = 0;

    // One more than the largest position that has a value.
    virtual int Count(Address ticket, std::string_view key);

    // pos: -1 the key as a whole, 0 and above one value, -2 behind the last. No value deletes. False if it is
    // not written.
    virtual bool Write(Address ticket, std::string_view key, Value const& value, int pos);

    // Every value whose key begins with the prefix. A walk hands out what was there at its beginning.
    virtual std::vector<Parameter> All(Address ticket, std::string_view prefix);

    // The tickets of that type, 0 to 99.
    virtual std::vector<int> Ids(int type);

    // What is not overridden refuses.
    virtual std::optional<int> CreateNext(int type);  // the id of a new ticket
    virtual bool Create(Address ticket);              // false if the ticket exists
    virtual bool Delete(Address ticket);
    virtual bool Limit(Address ticket, KeySelection const& keys);  // what this session sees of the ticket
    virtual bool OtherOperation(Address ticket, int code, void* arg);

    // The translator of folder paths, which the author keeps owning; null for none.
    virtual clFOLDER_VARIABLES* Folders() { return nullptr; }

    void Withdraw() noexcept override;
    bool Get(Address ticket, char const* key, PARAM_TYPE type, void* value, int pos) override;
    bool GetTable(Address ticket, GETMULTIPAR* table) override;
    bool WalkTickets(MWALKTICKETS_ACTION action, void* context, int type) override;
    bool Set(Address ticket, char const* key, PARAM_TYPE type, void const* value, int pos) override;
    bool SetTable(Address ticket, SETMULTIPAR* table) override;
    bool Operation(Address ticket, TICKET_OP op, void* arg) override;

    // Through the session's notifications. An author with a service of his own overrides it.
    bool Switch(Address tickets, int notification, bool enable, char const* const* keys) override;
    STICKET_ACCESS const* CreateTicket(Address ticket, char const* const* keys) override;

private:
    class Opened;  // the table of a ticket

    bool IsThere(Address ticket);
    STICKET_ACCESS const* Open(Address ticket);
    bool Close(Address ticket);
    bool OpenInto(Address ticket, void* arg);
    bool CreateNextInto(Address ticket, void* arg);

    Session& m_session;
    // What calls have handed out, for as long as one may use it: a call under way at the logout goes on. Null
    // after the logout.
    std::shared_ptr<KeptValues> Kept();

    std::mutex m_lock;  // of all below
    std::shared_ptr<KeptValues> m_kept = std::make_shared<KeptValues>();
    std::map<Address, std::unique_ptr<Opened>> m_opened;  // closed ones too: hosts may hold their tables
};
}  // namespace comgui::plugin
