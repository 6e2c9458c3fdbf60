#include "tools/ticketstream/Trouble.h"

#include <cstring>

namespace ticketstream
{
BrokenStream::BrokenStream(unsigned long offset, std::string const& reason)
    : std::runtime_error("broken at offset " + std::to_string(offset) + ": " + reason), m_offset(offset),
      m_reasonAt(std::strlen(what()) - reason.size())
{
}

WrongJson::WrongJson(std::string const& place, std::string const& reason)
    : std::runtime_error((place.empty() ? "the document" : place) + ": " + reason)
{
}
}  // namespace ticketstream
