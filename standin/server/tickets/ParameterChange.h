// What a change does to one key of a ticket.
#pragma once

#include "standin/server/tickets/TicketValue.h"
#include <string>

namespace standin
{
struct ParameterChange
{
    std::string key;
    int pos = -1;  // -1: the whole key, which then has this value at 0 and no other; 0 and up: one value
    TicketValue value{};    // PARAM_NONE: deleted
    bool hadOthers = true;  // of pos -1: the key may have had values at other positions, which go
};
}  // namespace standin
