#include "desk/model/TicketStream.h"

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/BIN_STRING.h"
#include "desk/model/FileContent.h"
#include <algorithm>
#include <cstdint>
#include <cstring>
#include <new>
#include <type_traits>

namespace desk
{
namespace
{
using comgui::Value;

// The class of an item, in the upper three bits of its tag.
enum ItemClass : unsigned char
{
    FullKey = 0x00,
    CompressedKey = 0x20,
    Number = 0x40,
    Text = 0x60,
    Binary = 0x80,
    Position = 0xA0,
    Deletion = 0xC0,
};

constexpr std::string_view Signature = "STICKET_1";

// Reads item after item, and knows where each begins, which the library's reader does not report. That one
// also takes a text as ended at its first zero byte without a word.
class StreamReader
{
public:
    StreamReader(std::string_view stream, std::string const& file)
        : m_stream(stream), m_file(file), m_cursor(stream.data(), stream.size())
    {
    }

    comgui::Snapshot Ticket()
    {
        try
        {
            TakeSignature();
            while (m_cursor.HasData())
                TakeItem();
        }
        catch (char const* reason)
        {
            Fail(FileTrouble::BrokenStream, reason);
        }
        return m_content.Take();
    }

private:
    [[noreturn]] void Fail(FileTrouble trouble, std::string detail = {}) const
    {
        throw FaultThrown({trouble, m_file, {}, m_item, std::move(detail)});
    }

    // Moves on to the next item and takes its tag.
    unsigned char TakeTag(unsigned long& size)
    {
        m_item = m_next;
        auto const first = static_cast<unsigned char>(m_stream[m_item]);
        unsigned char const itemClass = m_cursor.GetTag(size);
        m_next += (first & 0x10) == 0 ? 1 : (first & 0x08) == 0 ? 2 : 4;
        return itemClass;
    }

    void TakeSignature()
    {
        unsigned long size = 0;
        if (TakeTag(size) != FullKey)
            throw "Signature not found";
        TakeKey(size, false);
        if (m_key != Signature)
            throw "Wrong signature";
    }

    void TakeKey(unsigned long size, bool isCompressed)
    {
        m_cursor.GetKeyOpt(m_key, size, isCompressed);
        m_next += size;
        if (m_key.size() > LongestKey)  // before the next one is copied from it
            Fail(FileTrouble::BadKey, m_key.substr(0, 40));
        m_copied += m_key.size();
        if (m_copied > LargestContent)  // two bytes can stand for a long key, again and again
            Fail(FileTrouble::TooLarge);
    }

    void TakeItem()
    {
        unsigned long size = 0;
        switch (TakeTag(size))
        {
        case FullKey:
            return TakeKey(size, false);
        case CompressedKey:
            return TakeKey(size, true);
        case Number:
            return TakeNumber(size);
        case Text:
            return Put(TakeText(size), size);
        case Binary:
            return Put(comgui::Bytes{TakeBytes(size)}, size);
        case Position:
            m_pos = static_cast<int>(size) - 2;
            return;
        case Deletion:
            Fail(FileTrouble::HoldsDeletion, m_key.substr(0, 40));
        default:
            throw "Invalid tag";
        }
    }

    std::string TakeBytes(unsigned long size)
    {
        std::string bytes;
        m_cursor.GetString(bytes, size);
        m_next += size;
        return bytes;
    }

    std::string TakeText(unsigned long size)
    {
        std::string text = TakeBytes(size);
        if (text.find('\0') != std::string::npos)
            Fail(FileTrouble::BadText, m_key.substr(0, 40));
        return text;
    }

    void TakeNumber(unsigned long form)
    {
        Value number = NumberOf(form);
        m_next += form;  // the bytes behind the tag, for every form
        Put(std::move(number), 0);
    }

    Value NumberOf(unsigned long form)
    {
        short small = 0;
        int integer = 0;
        double real = 0;
        switch (form)
        {
        case 0:
            return 0;
        case 1:
            return int{static_cast<signed char>(m_cursor.GetByte())};
        case 2:
            m_cursor.GetShort(small);
            return int{small};
        case 4:
            m_cursor.GetInt(integer);
            return integer;
        case 5:
            m_cursor.GetFloat(real);
            return real;
        case 8:
            m_cursor.GetDouble(real);
            return real;
        case 9:
            return Integer64();
        default:
            throw "Invalid number size";
        }
    }

    Value Integer64()
    {
        PARAM_TYPE type = PARAM_NONE;
        unsigned long long bits = 0;
        m_cursor.GetPoly64(type, bits);
        return type == PARAM_INT64 ? Value(static_cast<long long>(bits)) : Value(bits);
    }

    // -1 is the key's only or first value.
    void Put(Value value, std::size_t bytes)
    {
        if (m_pos < -1 || m_pos > LargestPosition)
            Fail(FileTrouble::BadPosition, std::to_string(m_pos));
        if (!FileContent::IsKey(m_key))
            Fail(FileTrouble::BadKey, m_key.substr(0, 40));
        if (!m_content.Put(m_key, std::max(m_pos, 0), std::move(value), bytes))
            Fail(FileTrouble::TooLarge);
        STICKET_BINSTREAM::IncPos(m_pos);
    }

    std::string_view const m_stream;
    std::string const& m_file;
    STICKET_BINSTREAM::IMPORT_INTERN m_cursor;
    std::size_t m_item = 0;  // where the item begins
    std::size_t m_next = 0;  // where the cursor stands
    std::string m_key;
    std::size_t m_copied = 0;  // bytes of all keys
    int m_pos = -1;
    FileContent m_content;
};

// Writes values as a walk over a ticket delivers them: a value alone stands at position 0.
class StreamWriter
{
public:
    void Write(std::string const& key, Value const& value)
    {
        auto const* const list = std::get_if<comgui::List>(&value);
        if (!FileContent::IsKey(key))
            return;
        if (!list)
            return WriteOne(key, 0, value);
        int last = -1;
        for (comgui::Element const& element : *list)
        {
            if (element.pos <= last || element.pos > LargestPosition)
                continue;
            last = element.pos;
            WriteOne(key, element.pos, element.value);
        }
    }

    // False if it does not fit.
    bool Finish(std::string& stream)
    {
        m_writer.Swap(stream);
        return !m_isTooLarge && !m_writer.Failed() && stream.size() <= LargestFile;
    }

private:
    void WriteOne(std::string const& key, int pos, Value const& value)
    {
        std::visit(
            [&](auto const& held)
            {
                using Held = std::decay_t<decltype(held)>;
                if constexpr (std::is_same_v<Held, std::string>)
                    WriteBytes(key, pos, value.Type(), held, held.c_str());
                else if constexpr (std::is_same_v<Held, comgui::Bytes>)
                {
                    BIN_STRING const bytes(held.bytes.data(), held.bytes.size());
                    WriteBytes(key, pos, value.Type(), held.bytes, &bytes);
                }
                else if constexpr (std::is_arithmetic_v<Held>)
                    m_writer.SetParameter(key.c_str(), value.Type(), &held, pos);
            },
            static_cast<Value::variant const&>(value));
    }

    // What is larger than any file is not copied first.
    void WriteBytes(std::string const& key, int pos, PARAM_TYPE type, std::string const& bytes,
                    void const* word)
    {
        m_size += bytes.size();
        m_isTooLarge |= m_size > LargestFile;
        if (!m_isTooLarge)
            m_writer.SetParameter(key.c_str(), type, word, pos);
    }

    STICKET_BINSTREAM::WRITE m_writer{0};
    std::size_t m_size = 0;
    bool m_isTooLarge = false;
};
}  // namespace

FileResult<std::string> StreamOf(comgui::Snapshot const& ticket)
try
{
    StreamWriter writer;
    for (auto const& [key, value] : ticket.Entries())
        writer.Write(key, value);
    std::string stream;
    if (!writer.Finish(stream))
        return FileFault{FileTrouble::TooLarge, {}, {}, {}, {}};
    return stream;
}
catch (std::bad_alloc const&)
{
    return FileFault{FileTrouble::NoMemory, {}, {}, {}, {}};
}

FileResult<comgui::Snapshot> TicketOfStream(std::string_view stream, std::string const& file)
try
{
    if (stream.empty())
        return FileFault{FileTrouble::Empty, file, {}, {}, {}};
    return StreamReader(stream, file).Ticket();
}
catch (FaultThrown const& thrown)
{
    return thrown.Fault();
}
catch (std::bad_alloc const&)
{
    return FileFault{FileTrouble::NoMemory, file, {}, {}, {}};
}
}  // namespace desk
