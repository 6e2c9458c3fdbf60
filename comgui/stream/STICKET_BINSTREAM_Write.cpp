#include "comgui/foundation/utf8func.h"
#include "comgui/stream/BYTE_CHUNK.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/stream/ticket_items.h"
#include <algorithm>

using namespace comgui::detail;

namespace
{
constexpr char const* WholeTicket = "";  // prefix and limit of a walk
constexpr int WalkLimit = 8000;

// Eight bytes a step: the lowest byte that differs is the first, as the target is little-endian.
unsigned long SharedBytes(char const* left, char const* right, unsigned long limit)
{
    unsigned long shared = 0;
    for (; shared + sizeof(std::uint64_t) <= limit; shared += sizeof(std::uint64_t))
    {
        std::uint64_t leftWord;
        std::uint64_t rightWord;
        std::memcpy(&leftWord, left + shared, sizeof leftWord);
        std::memcpy(&rightWord, right + shared, sizeof rightWord);
        if (leftWord != rightWord)
            return shared + static_cast<unsigned long>(std::countr_zero(leftWord ^ rightWord)) / 8;
    }
    while (shared < limit && left[shared] == right[shared])
        ++shared;
    return shared;
}
}  // namespace

// Adds values to a writer, many in a row: key and position are carried along here, and bytes gathered in a
// chunk, until Finish() hands all to the writer.
class STICKET_BINSTREAM::WRITE::ENCODER
{
public:
    explicit ENCODER(WRITE& writer) : m_writer(writer), m_chunk(writer.data), m_key(writer.lastKey) {}

    // key and its text must stay until Finish().
    bool Add(char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        if (m_writer.failed || !Valid(type, value))
            return false;
        return Guarded(
            [&]
            {
                if (m_writer.first)
                    PutSignature();
                if (key != m_key.data())
                    PutKey(key);
                char* to = m_chunk.Room(2 * MaxItemHeader);
                if (pos != m_writer.pos)
                    to = PutPosition(to, m_writer.pos = pos);
                PutValue(to, type, value);
                IncPos(m_writer.pos);
            });
    }

    void Finish()
    {
        if (!m_writer.failed)
            Guarded(
                [&]
                {
                    m_chunk.Flush();
                    if (m_key.data() != m_writer.lastKey.data())
                        m_writer.lastKey = m_key;
                });
    }

private:
    // Whatever is thrown on the way (an overflow, no memory), there is no stream from here on.
    template <typename F>
    bool Guarded(F step)
    {
        try
        {
            step();
            return true;
        }
        catch (...)
        {
            m_writer.failed = true;
            return false;
        }
    }

    void PutText(char* to, unsigned char itemClass, void const* bytes, unsigned long size)
    {
        m_chunk.End(PutItemTag(to, itemClass, size));
        m_chunk.Put(bytes, size);
    }

    void PutSignature()
    {
        m_writer.first = false;
        PutText(m_chunk.Room(MaxItemHeader), ITEM_FULL_KEY, TicketSignature.data(), TicketSignature.size());
    }

    void PutKey(std::string_view key)
    {
        unsigned long const shared =
            SharedBytes(m_key.data(), key.data(), std::min(m_key.size(), key.size()));
        bool const isSame = shared == key.size() && shared == m_key.size();
        m_key = key;
        if (isSame)
            return;
        char* const to = m_chunk.Room(MaxItemHeader);
        std::string_view const tail = key.substr(shared);
        if (shared == 0)
            return PutText(to, ITEM_FULL_KEY, key.data(), key.size());
        m_chunk.End(PutKeyHeader(to, shared, tail.size()));
        m_chunk.Put(tail.data(), tail.size());
    }

    void PutValue(char* to, PARAM_TYPE type, void const* value)
    {
        switch (type)
        {
        case PARAM_INT:
            return m_chunk.End(PutInteger(to, *static_cast<int const*>(value)));
        case PARAM_DOUBLE:
            return m_chunk.End(PutOptimizedDouble(to, *static_cast<double const*>(value)));
        case PARAM_STRING:
        {
            std::string_view const text = value ? static_cast<char const*>(value) : "";
            return PutText(to, ITEM_STRING, text.data(), text.size());
        }
        case PARAM_BINSTRING:
        {
            BIN_STRING const& bytes = *static_cast<BIN_STRING const*>(value);
            return PutText(to, ITEM_BINARY, bytes.data, bytes.valid() ? bytes.size : 0);
        }
        case PARAM_INT64:
            return m_chunk.End(PutInt64(to, *static_cast<long long const*>(value)));
        case PARAM_UNSIGNED:
            return m_chunk.End(PutOptimizedDouble(to, *static_cast<unsigned int const*>(value)));
        case PARAM_UNSIGNED64:
            return m_chunk.End(PutUnsigned64(to, *static_cast<unsigned long long const*>(value)));
        default:  // PARAM_NONE alone, as all else is not valid
            return m_chunk.End(PutItemTag(to, ITEM_DELETE, 0));
        }
    }

    WRITE& m_writer;
    BYTE_CHUNK m_chunk;
    std::string_view m_key;  // the previous one, wherever it stands
};

STICKET_BINSTREAM::WRITE::WRITE(unsigned long reserve)
{
    if (reserve != 0)
        data.reserve(reserve);
}

bool STICKET_BINSTREAM::WRITE::SetParameter(char const* key, PARAM_TYPE type, void const* value, int position)
{
    ENCODER encoder(*this);
    bool const isWritten = encoder.Add(key, type, value, position);
    encoder.Finish();
    return isWritten && !failed;
}

void STICKET_BINSTREAM::WRITE::SetMultiParameter(SETMULTIPAR* table)
{
    if (table == nullptr)
        return;
    ENCODER encoder(*this);
    for (; table->key; ++table)
        table->ok = encoder.Add(table->key, table->type, table->value, table->pos);
    encoder.Finish();
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
    ticket->SWALKPARAMETERS(ticket->Instance, STICKET_BINSTREAM::ExportAction, &writer, WholeTicket,
                            WalkLimit);
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

bool STICKET_BINSTREAM::Valid(PARAM_TYPE type, void const* value)
{
    switch (type)
    {
    case PARAM_NONE:
        return value == nullptr;
    case PARAM_STRING:
        return true;
    case PARAM_INT:
    case PARAM_DOUBLE:
    case PARAM_BINSTRING:
    case PARAM_INT64:
    case PARAM_UNSIGNED:
    case PARAM_UNSIGNED64:
        return value != nullptr;
    default:
        return false;
    }
}

unsigned long STICKET_BINSTREAM::strsame(char const* previous, char const* key)
{
    return SharedBytes(previous, key, std::min(std::strlen(previous), std::strlen(key)));
}

void STICKET_BINSTREAM::IncPos(int& pos)
{
    // Unsigned, as a stream of 2^31 values would overflow.
    if (pos >= 0)
        pos = static_cast<int>(static_cast<unsigned int>(pos) + 1);
}
