#include "tools/ticketstream/StreamBuilder.h"

#include "tools/ticketstream/ItemClass.h"
#include <algorithm>
#include <cmath>
#include <utility>

namespace ticketstream
{
void StreamBuilder::Add(Record const& record)
{
    char const* part = "key";
    try
    {
        PutKey(record.key);
        part = "pos";
        PutPosition(record.pos);
        part = "value";
        PutValue(record.value);
    }
    catch (char const* reason)  // of the item writers
    {
        throw Unwritable(part, std::string("no stream can hold it: ") + reason);
    }
    STICKET_BINSTREAM::IncPos(m_pos);
}

std::string StreamBuilder::Take()
{
    std::string stream;
    m_writer.Swap(stream);
    *this = StreamBuilder();
    return stream;
}

void StreamBuilder::PutKey(std::optional<std::string> const& key)
{
    if (!key && m_key)
        throw Unwritable("key", "only records before the first key can have none");
    if (std::exchange(m_isFirst, false))
        PutBytes(FullKeyClass, TicketSignature);
    if (key == m_key)
        return;
    std::string const previous = m_key.value_or("");
    auto const differs = std::mismatch(key->begin(), key->end(), previous.begin(), previous.end()).first;
    auto const shared = static_cast<unsigned long>(differs - key->begin());
    // A writer takes a tail that ends at its first zero byte; no key of a ticket has one.
    if (shared == 0 || key->find('\0') != std::string::npos)
        PutBytes(FullKeyClass, *key);
    else
        m_writer.PutKeyOpt(shared, key->c_str() + shared);
    m_key = key;
}

void StreamBuilder::PutPosition(int pos)
{
    if (pos == m_pos)
        return;
    // Below -2 this wraps to a size that no tag can hold.
    m_writer.PutTag(PositionClass, static_cast<unsigned int>(pos) + 2);
    m_pos = pos;
}

void StreamBuilder::PutValue(Value const& value)
{
    switch (value.type)
    {
    case PARAM_INT:
        return m_writer.PutTInteger(static_cast<int>(value.integer));
    case PARAM_DOUBLE:
        return PutNumber(value.number);
    case PARAM_STRING:
        return PutBytes(TextClass, value.bytes);
    case PARAM_BINSTRING:
        return PutBytes(BinaryClass, value.bytes);
    case PARAM_INT64:
        return m_writer.PutTPoly64(static_cast<unsigned long long>(value.integer), 'd');
    case PARAM_UNSIGNED64:
        return m_writer.PutTPoly64(value.unsigned64, 'u');
    default:  // PARAM_NONE
        return m_writer.PutTag(DeleteClass, 0);
    }
}

// A double stays one, also where an integer would do: whoever says double wants to read one.
void StreamBuilder::PutNumber(double number)
{
    if (std::isfinite(number) && std::fabs(number) <= 0x1.fffffep127 && static_cast<float>(number) == number)
        return m_writer.PutTFloat(static_cast<float>(number));
    m_writer.PutTDouble(number);
}

void StreamBuilder::PutBytes(unsigned char itemClass, std::string_view bytes)
{
    m_writer.PutTag(itemClass, bytes.size());
    std::string stream;
    m_writer.Swap(stream);
    stream.append(bytes);
    m_writer.Swap(stream);
}
}  // namespace ticketstream
