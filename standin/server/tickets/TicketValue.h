// One value as a ticket holds it in memory. Numbers and pointers stand bit by bit in one word, so that a
// read is a copy; texts are kept apart, since a client may still hold the address of one that is gone from
// the ticket.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "standin/server/tickets/StoredValue.h"
#include <atomic>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace standin
{
struct TicketText
{
    explicit TicketText(std::string_view text) : bytes(text) {}

    std::string const bytes;
    std::atomic<bool> handedOut{false};  // some session has its address: set by readers, under a shared lock
};

// Texts that a change took out of their ticket.
using TicketTexts = std::vector<std::unique_ptr<TicketText>>;

struct TicketValue
{
    PARAM_TYPE type = PARAM_NONE;
    unsigned long long word = 0;       // every type but the two below
    std::unique_ptr<TicketText> text;  // STRING, BINSTRING

    // From the value word of a write. Nothing for what cannot be written: an unknown type, PARAM_COUNT,
    // PARAM_NONE, a null word where an address is due, a BIN_STRING without bytes.
    static std::optional<TicketValue> FromWrite(PARAM_TYPE type, void const* value);

    static TicketValue FromStored(StoredValue const& stored);

    // bytes points into this value.
    StoredValue ToStored() const;

    // Puts the value to where a read of its type wants it.
    void CopyTo(void* out) const;

    // The value word of a write of this value. It points into this value, for a BINSTRING at binary, which
    // is filled in.
    void const* Word(BIN_STRING& binary) const;
};
}  // namespace standin
