#include "comgui/foundation/utf8func.h"
#include "comgui/stream/BYTE_CHUNK.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/stream/shared_bytes.h"
#include "comgui/stream/ticket_items.h"
#include <algorithm>
#include <exception>

using namespace comgui::detail;

namespace
{
// The types that a stream holds, a bit each: no pointers and no counts. Of a null value it holds only that a
// parameter is deleted, and a text, as the empty one.
constexpr unsigned int WithValue = 1u << PARAM_INT | 1u << PARAM_DOUBLE | 1u << PARAM_STRING |
                                   1u << PARAM_BINSTRING | 1u << PARAM_INT64 | 1u << PARAM_UNSIGNED |
                                   1u << PARAM_UNSIGNED64;
constexpr unsigned int WithNull = 1u << PARAM_NONE | 1u << PARAM_STRING;

inline bool IsOneOf(unsigned int types, PARAM_TYPE type)
{
    auto const bit = static_cast<unsigned int>(type);
    return bit <= PARAM_UNSIGNED64 && (types >> bit & 1) != 0;
}

inline bool IsWritable(PARAM_TYPE type, void const* value)
{
    return IsOneOf(value ? WithValue : WithNull, type);
}

// Adds the records of a table to a stream. Key and position are carried along here, and bytes gathered in a
// chunk, until Finish() hands all on. Whatever puts bytes takes the place where they go and returns where
// they end, which is cheaper to hand around than to keep. Throws if there is no memory, and what the items
// throw.
class ENCODER
{
public:
    // The state of a WRITE, which outlives the encoder. The chunk stands apart, since its functions are
    // called out of line: nobody else gets at the encoder, so that all of it can stay in registers.
    ENCODER(BYTE_CHUNK& chunk, bool& first, std::string& lastKey, int& position)
        : m_chunk(chunk), m_first(first), m_lastKey(lastKey), m_key(lastKey), m_lastPosition(position),
          m_pos(position)
    {
    }

    // Puts the record, or passes it over; with it those that follow without any further word. Leaves record
    // at the first that is not dealt with. The keys must stay until Finish(). What is put without asking for
    // room: 10 bytes of signature, 8 of the key's header, 4 of position, 4 of the value's header, and 16 each
    // of key and value.
    char* Put(char* to, SETMULTIPAR*& record)
    {
        // As IsWritable, in an order that is quick for nearly all records.
        if (record->value == nullptr) [[unlikely]]
        {
            if (!IsOneOf(WithNull, record->type))
                return Refuse(to, record);
        }
        else if (!IsOneOf(WithValue, record->type)) [[unlikely]]
            return Refuse(to, record);
        to = m_chunk.Room(to);
        if (record->key != m_key.data())
            to = PutKey(to, record->key);
        if (record->pos != m_pos)
            to = PutPosition(to, m_pos = record->pos);
        return PutValue(to, record);
    }

    void Finish(char* to)
    {
        m_chunk.Flush(to);
        if (m_key.data() != m_lastKey.data())
            m_lastKey = m_key;
        m_lastPosition = m_pos;
    }

private:
    static char* Refuse(char* to, SETMULTIPAR*& record)
    {
        record++->ok = false;
        return to;
    }

    char* PutKey(char* to, std::string_view key)
    {
        unsigned long const shared =
            SharedBytes(m_key.data(), key.data(), std::min(m_key.size(), key.size()));
        bool const isSame = shared == key.size() && shared == m_key.size();
        m_key = key;
        if (shared == 0)
            return PutFullKey(m_chunk, m_first, to, key, isSame);
        if (isSame)
            return to;
        std::string_view const tail(key.data() + shared, key.size() - shared);
        return m_chunk.Put(PutKeyHeader(to, shared, tail.size()), tail);
    }

    // A key that has nothing to build on, as the first of all. isSame: both are empty, so none is told.
    [[gnu::noinline]] static char* PutFullKey(BYTE_CHUNK& chunk, bool& first, char* to, std::string_view key,
                                              bool isSame)
    {
        if (first)
            to = PutBytes(chunk, to, ITEM_FULL_KEY, TicketSignature);
        first = false;
        return isSame ? to : PutBytes(chunk, to, ITEM_FULL_KEY, key);
    }

    char* PutValue(char* to, SETMULTIPAR*& record)
    {
        switch (record->type)
        {
        case PARAM_INT:
            return PutNumbers<int>(to, record, PutInteger);
        case PARAM_DOUBLE:
            return PutNumbers<double>(to, record, PutOptimizedDouble);
        case PARAM_STRING:
            to = PutBytes(m_chunk, to, ITEM_STRING,
                          record->value ? static_cast<char const*>(record->value) : "");
            return Done(to, record);
        case PARAM_BINSTRING:
            to = PutBytes(m_chunk, to, ITEM_BINARY, Bytes(*static_cast<BIN_STRING const*>(record->value)));
            return Done(to, record);
        case PARAM_INT64:
            return PutNumbers<long long>(to, record, PutInt64);
        case PARAM_UNSIGNED:
            return PutNumbers<unsigned int>(to, record, PutOptimizedDouble);
        case PARAM_UNSIGNED64:
            return PutNumbers<unsigned long long>(to, record, PutUnsigned64);
        case PARAM_NONE:
            return Done(PutItemTag(to, ITEM_DELETE, 0), record);
        default:
            __builtin_unreachable();  // not writable
        }
    }

    // A vector: as long as key, type and position are the expected ones, there is nothing to put but numbers.
    template <typename T, typename F>
    char* PutNumbers(char* to, SETMULTIPAR*& begin, F put)
    {
        SETMULTIPAR* record = begin;
        char const* const key = record->key;
        PARAM_TYPE const type = record->type;
        int position = m_pos;
        for (;; to = m_chunk.Room(to))
        {
            to = put(to, *static_cast<T const*>(record->value));
            record->ok = true;
            begin = ++record;
            position = NextPosition(position);
            if (record->key != key || record->type != type || record->pos != position || !record->value)
                break;
        }
        m_pos = position;
        return to;
    }

    char* Done(char* to, SETMULTIPAR*& record)
    {
        m_pos = NextPosition(m_pos);
        record++->ok = true;
        return to;
    }

    static char* PutBytes(BYTE_CHUNK& chunk, char* to, unsigned char itemClass, std::string_view bytes)
    {
        return chunk.Put(PutItemTag(to, itemClass, bytes.size()), bytes);
    }

    static std::string_view Bytes(BIN_STRING const& value)
    {
        return value.valid() ? std::string_view(static_cast<char const*>(value.data), value.size) : "";
    }

    BYTE_CHUNK& m_chunk;
    bool& m_first;
    std::string& m_lastKey;
    std::string_view m_key;  // the previous one, wherever it stands
    int& m_lastPosition;
    int m_pos;
};
}  // namespace

STICKET_BINSTREAM::WRITE::WRITE(unsigned long reserve)
{
    try
    {
        if (reserve != 0)
            data.reserve(reserve);
    }
    catch (std::exception const&)
    {
        // Only a hint: the stream may turn out smaller.
    }
}

bool STICKET_BINSTREAM::WRITE::SetParameter(char const* key, PARAM_TYPE type, void const* value, int position)
{
    SETMULTIPAR table[] = {{key, type, 0, value, position, false, {}}, {}};
    SetMultiParameter(table);
    return table->ok;
}

void STICKET_BINSTREAM::WRITE::SetMultiParameter(SETMULTIPAR* table)
{
    if (table == nullptr)
        return;
    SETMULTIPAR* const begin = table;
    try
    {
        if (!failed && table->key)
        {
            BYTE_CHUNK chunk(data);
            ENCODER encoder(chunk, first, lastKey, pos);
            char* to = chunk.Begin();
            while (table->key)
                to = encoder.Put(to, table);
            encoder.Finish(to);
        }
    }
    catch (...)  // an overflow, or no memory: there is no stream from here on
    {
        failed = true;
        if (table->key == nullptr)  // it failed behind them all, so the last that was put has failed
            while (table != begin && !(--table)->ok)
                continue;
    }
    for (; table->key; ++table)  // from the one that failed on
        table->ok = false;
}

bool STICKET_BINSTREAM::WRITE::SetParameter(STICKET* writer, char const* key, PARAM_TYPE type,
                                            void const* value, int pos)
{
    return writer && reinterpret_cast<WRITE*>(writer)->SetParameter(key, type, value, pos);
}

void STICKET_BINSTREAM::WRITE::SetMultiParameter(STICKET* writer, SETMULTIPAR* table)
{
    if (writer)
        reinterpret_cast<WRITE*>(writer)->SetMultiParameter(table);
}

bool STICKET_BINSTREAM::WRITE::ToFile(char const* filename) const
{
    FILE* const file = utf8func::fopen(filename, "wb");
    if (file == nullptr)
        return false;
    bool const isWritten = std::fwrite(data.data(), 1, data.size(), file) == data.size();
    std::fclose(file);  // a failure here is not told
    return isWritten;
}

template <typename... T>
void STICKET_BINSTREAM::WRITE::Append(char* (*put)(char*, T...), T... value)
{
    char item[MaxItemHeader];
    data.append(item, static_cast<std::size_t>(put(item, value...) - item));
}

void STICKET_BINSTREAM::WRITE::PutTag(unsigned char tag, unsigned long size)
{
    Append(PutItemTag, tag, size);
}

void STICKET_BINSTREAM::WRITE::PutString(unsigned char tag, char const* text)
{
    std::string_view const bytes = text;
    PutTag(tag, bytes.size());
    data += bytes;
}

void STICKET_BINSTREAM::WRITE::PutKeyOpt(unsigned long shared, char const* tail)
{
    std::string_view const bytes = tail;
    Append(PutKeyHeader, shared, bytes.size());
    data += bytes;
}

void STICKET_BINSTREAM::WRITE::PutTBinString(BIN_STRING const& value)
{
    unsigned long const size = value.valid() ? value.size : 0;
    PutTag(ITEM_BINARY, size);
    if (size != 0)
        data.append(static_cast<char const*>(value.data), size);
}

void STICKET_BINSTREAM::WRITE::PutTInteger(int value) { Append(PutInteger, value); }
void STICKET_BINSTREAM::WRITE::PutOptimizedTDouble(double value) { Append(PutOptimizedDouble, value); }
void STICKET_BINSTREAM::WRITE::PutTInt64(long long value) { Append(PutInt64, value); }
void STICKET_BINSTREAM::WRITE::PutTUnsigned64(unsigned long long value) { Append(PutUnsigned64, value); }
void STICKET_BINSTREAM::WRITE::PutTFloat(float value) { Append(PutSingle, value); }
void STICKET_BINSTREAM::WRITE::PutTDouble(double value) { Append(PutDouble, value); }
void STICKET_BINSTREAM::WRITE::PutUShort(unsigned short value) { Append(PutBytes<std::uint16_t>, value); }
void STICKET_BINSTREAM::WRITE::PutUnsigned(unsigned int value) { Append(PutBytes<std::uint32_t>, value); }

void STICKET_BINSTREAM::WRITE::PutTPoly64(unsigned long long value, char marker)
{
    Append(PutPoly64, value, marker);
}

bool STICKET_BINSTREAM::ExportAction(void* writer, char const* key, PARAM_TYPE type, void const* value,
                                     int pos)
{
    WRITE& target = *static_cast<WRITE*>(writer);
    target.SetParameter(key, type, value, pos);
    return !target.Failed();
}

namespace
{
STICKET_BINSTREAM::WRITE Written(SETMULTIPAR* table, unsigned long reserve)
{
    STICKET_BINSTREAM::WRITE writer(reserve);
    writer.SetMultiParameter(table);
    return writer;
}

STICKET_BINSTREAM::WRITE Written(STICKET_ACCESS const* ticket, unsigned long reserve)
{
    STICKET_BINSTREAM::WRITE writer(reserve);
    Walk(ticket, STICKET_BINSTREAM::ExportAction, &writer);
    return writer;
}

// The size told is that of the caller's string, old contents included if the writing failed.
unsigned long IntoString(STICKET_BINSTREAM::WRITE writer, std::string& out)
{
    if (!writer.Failed())
        writer.Swap(out);
    return out.size();
}

bool IntoFile(STICKET_BINSTREAM::WRITE const& writer, char const* filename)
{
    return !writer.Failed() && writer.ToFile(filename);
}
}  // namespace

unsigned long STICKET_BINSTREAM::Write(std::string& out, SETMULTIPAR* table, unsigned long reserve)
{
    return IntoString(Written(table, reserve), out);
}

unsigned long STICKET_BINSTREAM::Write(std::string& out, STICKET_ACCESS const* ticket, unsigned long reserve)
{
    return IntoString(Written(ticket, reserve), out);
}

bool STICKET_BINSTREAM::Write(char const* filename, SETMULTIPAR* table, unsigned long reserve)
{
    return IntoFile(Written(table, reserve), filename);
}

bool STICKET_BINSTREAM::Write(char const* filename, STICKET_ACCESS const* ticket, unsigned long reserve)
{
    return IntoFile(Written(ticket, reserve), filename);
}

bool STICKET_BINSTREAM::Valid(PARAM_TYPE type, void const* value) { return IsWritable(type, value); }

unsigned long STICKET_BINSTREAM::strsame(char const* previous, char const* key)
{
    return SharedBytes(previous, key, std::min(std::strlen(previous), std::strlen(key)));
}

void STICKET_BINSTREAM::IncPos(int& pos) { pos = NextPosition(pos); }
