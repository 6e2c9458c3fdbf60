// One value of a ticket as the server moves it between memory, database and XML. Owns nothing: bytes points
// into whatever it was made from.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include <bit>
#include <cstdint>
#include <string_view>

namespace standin
{
struct StoredValue
{
    PARAM_TYPE type = PARAM_NONE;  // never PARAM_COUNT; PARAM_NONE is "no value here"
    long long integer = 0;         // INT, INT64, UNSIGNED, UNSIGNED64 (bit pattern)
    double number = 0;             // DOUBLE
    void* pointer = nullptr;       // POINTER; lives in memory only, is never stored
    std::string_view bytes;        // STRING (no zero byte inside), BINSTRING
};

// Equal as bits, so that -0.0 differs from 0.0 and a NaN equals itself.
inline bool IsSame(StoredValue const& left, StoredValue const& right)
{
    return left.type == right.type && left.integer == right.integer &&
           std::bit_cast<std::uint64_t>(left.number) == std::bit_cast<std::uint64_t>(right.number) &&
           left.pointer == right.pointer && left.bytes == right.bytes;
}
}  // namespace standin
