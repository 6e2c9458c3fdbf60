// Values as the server moves them, made and compared by tests.
#pragma once

#include "standin/server/tickets/StoredValue.h"
#include <bit>
#include <cstdint>
#include <string_view>

inline standin::StoredValue Integer(PARAM_TYPE type, long long number)
{
    standin::StoredValue value;
    value.type = type;
    value.integer = number;
    return value;
}

inline standin::StoredValue Double(double number)
{
    standin::StoredValue value;
    value.type = PARAM_DOUBLE;
    value.number = number;
    return value;
}

// Of a text too. bytes outlive the value.
inline standin::StoredValue Bytes(PARAM_TYPE type, std::string_view bytes)
{
    standin::StoredValue value;
    value.type = type;
    value.bytes = bytes;
    return value;
}

// Equal as bits, so that -0.0 differs from 0.0 and a NaN equals itself.
inline bool SameValue(standin::StoredValue const& left, standin::StoredValue const& right)
{
    return left.type == right.type && left.integer == right.integer &&
           std::bit_cast<std::int64_t>(left.number) == std::bit_cast<std::int64_t>(right.number) &&
           left.bytes == right.bytes;
}
