// One value of a ticket. Numbers and pointers are kept bit by bit in one word, so that a read is a copy;
// texts are kept apart, since a client may still hold the address of one that is gone from its ticket.
#pragma once

#include "standin/server/tickets/StoredValue.h"
#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace standin
{
struct TicketText
{
    explicit TicketText(std::string_view text) : bytes(text) {}

    // Notes that somebody outside has the address. Who reads a text once more writes nothing.
    void HandOut(std::uint64_t reader)
    {
        if ((readers.load(std::memory_order_relaxed) & reader) != reader)
            readers.fetch_or(reader, std::memory_order_relaxed);
    }

    std::string const bytes;
    std::atomic<std::uint64_t> readers{0};  // the marks of those who may have its address
};

// Texts that a change took out of their ticket.
using TicketTexts = std::vector<std::unique_ptr<TicketText>>;

// Bytes behind the address of a number; 0 for a type that is none. A pointer counts as a number here.
constexpr std::size_t SizeOfNumber(PARAM_TYPE type)
{
    switch (type)
    {
    case PARAM_INT:
    case PARAM_UNSIGNED:
        return 4;
    case PARAM_DOUBLE:
    case PARAM_INT64:
    case PARAM_UNSIGNED64:
    case PARAM_POINTER:
        return 8;
    default:
        return 0;
    }
}

// A value with its owner.
struct TicketValue
{
    PARAM_TYPE type = PARAM_NONE;
    unsigned long long word = 0;         // every type but the two below; the low bytes of a short number
    std::unique_ptr<TicketText> text{};  // STRING, BINSTRING

    // bytes: as many as the type has.
    static TicketValue Number(PARAM_TYPE type, void const* bytes);
    static TicketValue Text(PARAM_TYPE type, std::string_view bytes);
    static TicketValue Int(int number) { return Number(PARAM_INT, &number); }
    static TicketValue Int64(long long number) { return Number(PARAM_INT64, &number); }
    static TicketValue String(std::string_view text) { return Text(PARAM_STRING, text); }

    static TicketValue FromStored(StoredValue const& stored);
    StoredValue ToStored() const;  // bytes points into this value
    TicketValue Copy() const { return FromStored(ToStored()); }
};

// The same from the parts of a value that has no owner here.
StoredValue ToStored(PARAM_TYPE type, unsigned long long word, TicketText const* text);
}  // namespace standin
