// What a subscriber hears. Plain values; texts are UTF-8.
#pragma once

#include "comgui/client/TicketAddress.h"
#include "comgui/client/TransferProgress.h"
#include "comgui/client/Value.h"
#include <optional>
#include <string>
#include <variant>
#include <vector>

namespace comgui
{
// What became of one key. value: std::monostate if it was deleted; nothing if only some positions of a list
// changed, or if the change did not carry it: then read the key. Folder paths are as stored.
struct KeyChange
{
    std::string key;
    std::optional<Value> value;
};

// Keys of a ticket have changed: once for each key, with its latest value. isWhole: too many to list, or not
// known which: read the ticket anew.
struct TicketChanged
{
    TicketAddress ticket;
    std::vector<KeyChange> keys;
    bool isWhole = false;
};

struct TicketCreated
{
    TicketAddress ticket;
};

struct TicketDeleted
{
    TicketAddress ticket;
};

// So many tickets of the type have changed, come or gone that they are not reported one by one: list the type
// anew.
struct ManyTicketsChanged
{
    int type;
};

// A job or file on its way; at most ten times a second for each transfer.
struct TransferProgressed
{
    int transfer;  // Transfer::Number()
    TransferProgress progress;
};

struct TransferEnded
{
    int transfer;
    Outcome outcome;
    std::optional<int> job;  // its ticket's id, if a job was sent
};

// The server does not answer any more, or not this session. Reads may still work; writes fail. Once more,
// with the reason, if a new session is refused.
struct ServerLost
{
    Error error;
};

// It answers again. Whatever was subscribed to goes on. isNewSession: the old session was gone, and the kit
// has logged in once more; changes made meanwhile were not reported: read anew.
struct ServerBack
{
    bool isNewSession;
};

using Event = std::variant<TicketChanged, TicketCreated, TicketDeleted, ManyTicketsChanged,
                           TransferProgressed, TransferEnded, ServerLost, ServerBack>;
}  // namespace comgui
