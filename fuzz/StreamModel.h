// A second telling of the ticket stream, as plain as it can be: what bytes a row of records becomes, and what
// comes back. It shares nothing with the library but the names of the types.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include <cstdint>
#include <optional>
#include <string>
#include <variant>
#include <vector>

struct MODEL_RECORD
{
    std::string key;
    PARAM_TYPE type = PARAM_NONE;
    int pos = -1;

    // The value by its type. No text and no bytes (bytes: not valid, too) are told by the flag; for a type
    // that takes neither, the flag means a null value.
    bool isNull = false;
    std::int64_t integer = 0;  // also the bits of an unsigned one
    double number = 0;
    std::string text;
};

// What a reader reports. A null text is an invalid binary value.
struct MODEL_READ
{
    std::string key;
    PARAM_TYPE type;
    int pos;
    std::int64_t integer = 0;
    double number = 0;  // one that is none is the NaN of the stream
    std::string text{};
};

struct MODEL_STREAM
{
    std::vector<bool> ok;              // of each record
    std::optional<std::string> bytes;  // none if the writing failed

    // What the bytes give when they are read.
    std::vector<MODEL_READ> asTheyStand;
    std::vector<MODEL_READ> withFixedPositions;
};

MODEL_STREAM ModelOf(std::vector<MODEL_RECORD> const& records);
