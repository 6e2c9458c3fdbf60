// A small buffer in front of a growing string, for many small appends: room is tested once an item instead of
// once a byte, and the string grows by the chunk. The place where the next byte goes is the caller's to
// carry.
#pragma once

#include <cstddef>
#include <cstring>
#include <string>
#include <string_view>

namespace comgui::detail
{
class BYTE_CHUNK
{
public:
    explicit BYTE_CHUNK(std::string& data) : m_data(data) {}

    char* Begin() { return m_bytes; }

    // The place to go on at, with room for that many bytes, which must be at most half a chunk.
    char* Room(char* to, std::size_t size)
    {
        return size <= static_cast<std::size_t>(m_bytes + sizeof m_bytes - to) ? to : Flush(to);
    }

    // Bytes of any number.
    char* Put(char* to, std::string_view bytes)
    {
        if (bytes.size() > sizeof m_bytes / 2)
        {
            to = Flush(to);
            m_data.append(bytes);
            return to;
        }
        to = Room(to, bytes.size());
        std::memcpy(to, bytes.data(), bytes.size());
        return to + bytes.size();
    }

    // Hands on to the string; what is not handed on is lost with the chunk.
    [[gnu::noinline]] char* Flush(char* to)
    {
        m_data.append(m_bytes, static_cast<std::size_t>(to - m_bytes));
        return m_bytes;
    }

private:
    std::string& m_data;
    char m_bytes[4096];
};
}  // namespace comgui::detail
