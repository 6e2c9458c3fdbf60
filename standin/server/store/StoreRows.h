// What the rows of every lasting store have in common: how a value lies in them, what is refused before it
// gets there, and what a program is listed as.
#pragma once

#include "standin/server/store/TicketChange.h"
#include "standin/server/tickets/StoredValue.h"
#include <functional>
#include <optional>
#include <string>
#include <string_view>

namespace standin
{
// What the parameter replaces goes, and nothing comes: a pointer is of use to its process alone.
inline bool IsDeletion(ParameterChange const& parameter)
{
    return parameter.value.type == PARAM_NONE || parameter.value.type == PARAM_POINTER;
}

// Throws StoreError, with the reason and the remedy alone, for an address that no ticket can have; NextId is
// one of a creation.
void CheckAddress(TicketChange const& change);

inline bool IsText(int type) { return type == PARAM_STRING || type == PARAM_BINSTRING; }

// A number as its column keeps it. A double is kept as bits.
long long ColumnOf(TicketValue const& value);

// A value put together from its columns, of which those are there that have a value; nothing if they do not
// fit the type. A database can be edited by hand. bytes live as long as theirs do.
std::optional<StoredValue> FittingValue(int type, std::optional<long long> number,
                                        std::optional<std::string_view> bytes);

// Puts tickets together from their rows, which come in the order of addresses, and hands each out as a
// creation with all its values. A ticket without values has one row without a key.
class TicketAssembly
{
public:
    explicit TicketAssembly(std::function<void(TicketChange&&)> const& take) : m_take(take) {}

    void Begin(TicketAddress address);  // also of a ticket that is begun already
    void Add(std::string_view key, int pos, StoredValue const& value);
    void End();

private:
    std::function<void(TicketChange&&)> const& m_take;
    std::optional<TicketChange> m_ticket;
};

std::string ProgramName();
std::string MachineName();
}  // namespace standin
