#include "tools/ticketstream/ItemWalk.h"

#include "tools/ticketstream/ItemClass.h"
#include "tools/ticketstream/Trouble.h"

namespace ticketstream
{
namespace
{
unsigned long TagSize(unsigned char first)
{
    bool const isShort = (first & 0x10) == 0;
    bool const isMedium = (first & 0x08) == 0;
    return isShort ? 1 : isMedium ? 2 : 4;
}
}  // namespace

ItemWalk::ItemWalk(std::string_view stream, unsigned long start)
    : m_stream(stream), m_start(start), m_cursor(stream.data(), stream.size()), m_offset(start), m_end(start)
{
}

bool ItemWalk::Next()
{
    if (!m_cursor.HasData())
        return false;
    if (m_kind == Item::Value)
        STICKET_BINSTREAM::IncPos(m_record.pos);
    m_offset = m_end;
    try
    {
        Take();
    }
    catch (char const* reason)
    {
        throw BrokenStream(m_offset, reason);
    }
    m_isFirst = false;
    return true;
}

void ItemWalk::Take()
{
    m_end += TagSize(static_cast<unsigned char>(m_stream[m_offset - m_start]));
    unsigned long size;
    unsigned char const itemClass = m_cursor.GetTag(size);
    if (m_isFirst && itemClass != FullKeyClass)
        throw "Signature not found";
    switch (itemClass)
    {
    case FullKeyClass:
    case CompressedKeyClass:
        return TakeKey(size, itemClass == CompressedKeyClass);
    case NumberClass:
        return TakeNumber(size);
    case TextClass:
        return TakeBytes(PARAM_STRING, size);
    case BinaryClass:
        return TakeBytes(PARAM_BINSTRING, size);
    case PositionClass:
        m_kind = Item::Position;
        m_record.pos = static_cast<int>(size) - 2;
        return;
    case DeleteClass:
        NewValue(PARAM_NONE);
        return;
    default:
        throw "Invalid tag";
    }
}

void ItemWalk::TakeKey(unsigned long size, bool isCompressed)
{
    std::string key = m_record.key ? std::move(*m_record.key) : std::string();
    m_cursor.GetKeyOpt(key, size, isCompressed);
    m_end += size;
    m_kind = m_isFirst ? Item::Signature : Item::Key;
    if (!m_isFirst)
        m_record.key = std::move(key);
    else if (key != TicketSignature)
        throw "Wrong signature";
}

Value& ItemWalk::NewValue(PARAM_TYPE type)
{
    m_kind = Item::Value;
    m_record.value.type = type;
    return m_record.value;
}

void ItemWalk::NewInteger(int value) { NewValue(PARAM_INT).integer = value; }

void ItemWalk::TakeNumber(unsigned long size)
{
    m_end += size;
    switch (size)
    {
    case 0:
        return NewInteger(0);
    case 1:
        return NewInteger(static_cast<signed char>(m_cursor.GetByte()));
    case 2:
    {
        short value;
        m_cursor.GetShort(value);
        return NewInteger(value);
    }
    case 4:
    {
        int value;
        m_cursor.GetInt(value);
        return NewInteger(value);
    }
    case 5:
        return m_cursor.GetFloat(NewValue(PARAM_DOUBLE).number);
    case 8:
        return m_cursor.GetDouble(NewValue(PARAM_DOUBLE).number);
    case 9:
        return TakeNumber64();
    default:
        throw "Invalid number size";
    }
}

void ItemWalk::TakeNumber64()
{
    PARAM_TYPE type;
    unsigned long long bits;
    m_cursor.GetPoly64(type, bits);
    Value& value = NewValue(type);
    value.integer = static_cast<long long>(bits);
    value.unsigned64 = bits;
}

void ItemWalk::TakeBytes(PARAM_TYPE type, unsigned long size)
{
    m_cursor.GetString(NewValue(type).bytes, size);
    m_end += size;
}
}  // namespace ticketstream
