// A small buffer in front of a growing string, for many small appends: room is tested once an item instead of
// once a byte, and the string grows by the chunk.
#pragma once

#include <cstddef>
#include <cstring>
#include <string>

namespace comgui::detail
{
class BYTE_CHUNK
{
public:
    explicit BYTE_CHUNK(std::string& data) : m_data(data) {}

    // A place for an item of that many bytes at most, which must be far fewer than a chunk has; End() tells
    // where it ended.
    char* Room(std::size_t size)
    {
        if (size > static_cast<std::size_t>(m_bytes + sizeof m_bytes - m_end))
            Flush();
        return m_end;
    }
    void End(char* end) { m_end = end; }

    // Bytes of any number.
    void Put(void const* bytes, std::size_t size)
    {
        if (size > sizeof m_bytes / 2)
        {
            Flush();
            m_data.append(static_cast<char const*>(bytes), size);
            return;
        }
        char* const place = Room(size);
        if (size != 0)
            std::memcpy(place, bytes, size);
        End(place + size);
    }

    // Hands on to the string; what is not handed on is lost with the chunk.
    void Flush()
    {
        m_data.append(m_bytes, static_cast<std::size_t>(m_end - m_bytes));
        m_end = m_bytes;
    }

private:
    std::string& m_data;
    char m_bytes[4096];
    char* m_end = m_bytes;
};
}  // namespace comgui::detail
