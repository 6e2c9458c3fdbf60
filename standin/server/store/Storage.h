// What the server needs of the place where its tickets last. The embedded server keeps them in a database
// file; one that talks to a remote store implements this and nothing else.
#pragma once

#include "standin/server/tickets/StoredValue.h"
#include "standin/server/tickets/TicketAddress.h"
#include <functional>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace standin
{
// Thrown by every operation below when the store fails (disk full, damaged ...); what() is one clear line
// that names the file, the reason and the remedy. Nothing of the failed operation has taken effect.
class StorageError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

// One step of a change. Keys and bytes are borrowed until Storage::Apply returns.
struct Change
{
    enum Kind
    {
        CreateTicket,  // address only; nothing if the ticket is there
        DeleteTicket,  // address only: the ticket with all its values; nothing if it is not there
        DeleteKey,     // every value under the key
        DeleteValue,   // the value at pos
        PutValue,      // value at pos (0 and up), in place of what was there; fails without the ticket.
                       // PARAM_NONE and PARAM_POINTER are not stored, but what was there goes
    };
    Kind kind;
    TicketAddress address;
    std::string_view key{};
    int pos = 0;
    StoredValue value{};
};

struct User
{
    std::string name;
    std::string passwordHash;  // as crypt(3) writes it
    int role = 0;              // 16: administrator
    int ticketId = 0;          // the user's own ticket
};

class Storage
{
public:
    virtual ~Storage() = default;

    // The addresses of all tickets, in ascending order.
    virtual std::vector<TicketAddress> Tickets() = 0;

    // Hands out every value of a ticket, ordered by key (bytewise) and position. What is handed out lives
    // until the function returns. A ticket that does not exist has no values.
    virtual void
    Load(TicketAddress address,
         std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take) = 0;

    // The tickets of that type that have a value under the key, in ascending order.
    virtual std::vector<TicketAddress> TicketsWith(int type, std::string_view key) = 0;

    // Makes all changes, in order, or none. When it returns they survive the end of the process at any
    // instant.
    virtual void Apply(std::vector<Change> const& changes) = 0;

    virtual std::optional<User> FindUser(std::string_view name) = 0;
};
}  // namespace standin
