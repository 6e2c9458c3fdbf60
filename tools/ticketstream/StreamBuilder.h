// Puts a ticket stream together so that a reader finds the very records that were added, types included:
// where STICKET_BINSTREAM takes the shortest number that has the value, this keeps to the type. Of what a
// reader made of a stream of STICKET_BINSTREAM it makes the same bytes again.
#pragma once

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "tools/ticketstream/Record.h"
#include <stdexcept>
#include <string>
#include <string_view>

namespace ticketstream
{
// A record that no stream can hold.
class Unwritable : public std::runtime_error
{
public:
    Unwritable(char const* part, std::string const& reason) : std::runtime_error(reason), m_part(part) {}

    char const* Part() const { return m_part; }  // "key", "pos" or "value"

private:
    char const* m_part;
};

class StreamBuilder
{
public:
    // Throws Unwritable; what was added before stands.
    void Add(Record const& record);

    // Gives the stream out and begins a new one. No bytes without a record.
    std::string Take();

private:
    void PutKey(std::optional<std::string> const& key);
    void PutPosition(int pos);
    void PutValue(Value const& value);
    void PutNumber(double number);
    void PutBytes(unsigned char itemClass, std::string_view bytes);

    STICKET_BINSTREAM::WRITE m_writer{0};
    bool m_isFirst = true;
    std::optional<std::string> m_key;
    int m_pos = -1;
};
}  // namespace ticketstream
