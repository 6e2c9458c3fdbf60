// One value of a ticket stream with the key and the position that stand before it.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include <optional>
#include <string>

namespace ticketstream
{
struct Value
{
    // A type that a reader gives: PARAM_NONE (a delete), PARAM_INT, PARAM_DOUBLE, PARAM_STRING,
    // PARAM_BINSTRING, PARAM_INT64 or PARAM_UNSIGNED64.
    PARAM_TYPE type = PARAM_NONE;

    long long integer = 0;              // of PARAM_INT and PARAM_INT64
    unsigned long long unsigned64 = 0;  // of PARAM_UNSIGNED64
    double number = 0;                  // of PARAM_DOUBLE; NaN is the only one that is no number
    std::string bytes;                  // of a text or of bytes, zero bytes and all
};

struct Record
{
    // None before the first key item of the stream. A reader takes the signature for it, a writer means the
    // empty key.
    std::optional<std::string> key;
    int pos = -1;
    Value value;
};
}  // namespace ticketstream
