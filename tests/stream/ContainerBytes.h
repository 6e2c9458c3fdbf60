// Container streams put together by hand, so that a test sees the bytes that the reader sees.
#pragma once

#include <string>

using namespace std::string_literals;

inline std::string const Signature = "MTICKET_1";
inline std::string const PartialHeader = "TICKET_PARTIAL_1\0"s;

inline std::string Number(unsigned int value)
{
    std::string bytes;
    for (int shift = 24; shift >= 0; shift -= 8)
        bytes += static_cast<char>(value >> shift & 0xFF);
    return bytes;
}

// An operation on ticket 5/1 whose payload size tells what it is told to.
inline std::string Operation(int code, std::string const& payload, int size)
{
    return Number(5) + Number(1) + Number(static_cast<unsigned int>(code)) +
           Number(static_cast<unsigned int>(size)) + payload;
}

inline std::string Operation(int code, std::string const& payload = "")
{
    return Operation(code, payload, static_cast<int>(payload.size()));
}
