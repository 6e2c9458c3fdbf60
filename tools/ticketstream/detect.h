// The kind of a file, from its first bytes.
#pragma once

#include <string_view>

namespace ticketstream
{
inline constexpr unsigned long BytesToDetect = 10;

struct Kind
{
    char const* name;
    bool isStream;  // so is an empty file
};

// beginning: BytesToDetect bytes, or all that there are.
Kind Detect(std::string_view beginning);
}  // namespace ticketstream
