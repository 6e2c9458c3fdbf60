// What stops a command. The texts are one line each and made to be shown.
#pragma once

#include "tools/shared/Trouble.h"
#include <cstddef>
#include <stdexcept>
#include <string>

namespace ticketstream
{
using tools::ClosedPipe;
using tools::Trouble;

// A stream that cannot be read any further.
class BrokenStream : public std::runtime_error
{
public:
    // offset: of the first byte of what cannot be read.
    BrokenStream(unsigned long offset, std::string const& reason);

    unsigned long Offset() const { return m_offset; }
    char const* Reason() const { return what() + m_reasonAt; }

private:
    unsigned long m_offset;
    std::size_t m_reasonAt;  // in the text as a whole
};

// JSON that no stream can be made of.
class WrongJson : public std::runtime_error
{
public:
    // place: a JSON pointer, empty for the document as a whole.
    WrongJson(std::string const& place, std::string const& reason);
};
}  // namespace ticketstream
