// Values of tickets as texts.
#pragma once

#include "tools/shared/text.h"
#include "tools/ticketstream/Record.h"
#include <optional>
#include <string>
#include <string_view>

namespace ticketstream
{
using tools::BytesOfHex;
using tools::Hex;
using tools::NumberText;
using tools::Quoted;
using tools::Shown;
using tools::ShownBytes;
using tools::ShownName;

// "int", "double", "string", "binstring", "int64", "unsigned64", "none".
char const* TypeName(PARAM_TYPE type);
std::optional<PARAM_TYPE> TypeOfName(std::string_view name);

// For people. Longer ones than the limit are cut, and say how long they are.
std::string Shown(Value const& value, unsigned long limit = std::string_view::npos);
}  // namespace ticketstream
