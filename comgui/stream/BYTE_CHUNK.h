// A small buffer in front of a growing string, for many small appends: room is asked for once in a while
// instead of once a byte, and the string grows by the chunk. The place where the next byte goes is the
// caller's to carry; behind what Begin(), Room() and Flush() give, Spare bytes may be put without asking.
#pragma once

#include "comgui/foundation/short_copy.h"
#include <string>
#include <string_view>

namespace comgui::detail
{
class BYTE_CHUNK
{
public:
    static constexpr std::size_t Spare = 64;

    explicit BYTE_CHUNK(std::string& data) : m_data(data) {}

    char* Begin() { return m_bytes; }

    // The place to go on at with Spare bytes behind it: this one, if it has them.
    char* Room(char* to) { return to <= m_bytes + Size - Spare ? to : Flush(to); }

    // Puts bytes of any number. Up to ShortCopy of them come out of what is spare; behind more there is room
    // again.
    char* Put(char* to, std::string_view bytes)
    {
        if (bytes.size() > ShortCopy)
            return PutMany(to, bytes);
        CopyShort(to, bytes.data(), bytes.size());
        return to + bytes.size();
    }

    // Hands on to the string; what is not handed on is lost with the chunk.
    [[gnu::noinline]] char* Flush(char* to)
    {
        m_data.append(m_bytes, static_cast<std::size_t>(to - m_bytes));
        return m_bytes;
    }

private:
    static constexpr std::size_t Size = 4096;

    [[gnu::noinline]] char* PutMany(char* to, std::string_view bytes)
    {
        if (bytes.size() > Size / 2)
        {
            to = Flush(to);
            m_data.append(bytes);
            return to;
        }
        if (bytes.size() > static_cast<std::size_t>(m_bytes + Size - to))
            to = Flush(to);
        std::memcpy(to, bytes.data(), bytes.size());
        return Room(to + bytes.size());
    }

    std::string& m_data;
    char m_bytes[Size];
};
}  // namespace comgui::detail
