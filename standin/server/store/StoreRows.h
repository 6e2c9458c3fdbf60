// What the rows of every lasting store have in common: how a value lies in them, what is refused before it
// gets there, and what a program is listed as.
#pragma once

#include "standin/server/store/TicketChange.h"
#include "standin/server/tickets/StoredValue.h"
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

std::string ProgramName();
std::string MachineName();
}  // namespace standin
