// Goes through a ticket stream item by item and knows where each one stands.
#pragma once

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "tools/ticketstream/Record.h"
#include <string_view>

namespace ticketstream
{
enum class Item
{
    Signature,
    Key,
    Position,
    Value,
};

class ItemWalk
{
public:
    // stream: must outlive the walk. start: where it stands in its file, from where offsets are counted.
    explicit ItemWalk(std::string_view stream, unsigned long start = 0);

    // Goes on to the next item; false at the end. Throws BrokenStream, and is of no further use then.
    bool Next();

    Item Kind() const { return m_kind; }
    unsigned long Offset() const { return m_offset; }  // of the item's first byte
    unsigned long End() const { return m_end; }        // of the byte behind it

    // What holds behind the item: the key and the position, and behind a value that value.
    Record const& Current() const { return m_record; }

private:
    void Take();
    void TakeKey(unsigned long size, bool isCompressed);
    void TakeNumber(unsigned long size);
    void TakeNumber64();
    void TakeBytes(PARAM_TYPE type, unsigned long size);
    Value& NewValue(PARAM_TYPE type);
    void NewInteger(int value);

    std::string_view m_stream;
    unsigned long m_start;
    STICKET_BINSTREAM::IMPORT_INTERN m_cursor;
    bool m_isFirst = true;
    Item m_kind = Item::Signature;
    unsigned long m_offset;
    unsigned long m_end;
    Record m_record;
};
}  // namespace ticketstream
