// Bytes as text and back, so that a wrong byte reads as a listing: "09 53 FF".
#pragma once

#include <cstddef>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>

inline std::string HexOf(std::string_view bytes)
{
    std::string text;
    for (char const byte : bytes)
    {
        if (!text.empty())
            text += ' ';
        text += "0123456789ABCDEF"[static_cast<unsigned char>(byte) >> 4];
        text += "0123456789ABCDEF"[static_cast<unsigned char>(byte) & 15];
    }
    return text;
}

// Blanks between the digits are passed over; anything else throws.
inline std::string BytesOf(std::string_view hex)
{
    std::string bytes;
    bool isHalf = false;
    for (char const digit : hex)
    {
        if (digit == ' ')
            continue;
        std::size_t const value = std::string_view("0123456789ABCDEF").find(digit);
        if (value == std::string_view::npos)
            throw std::invalid_argument("no hexadecimal digit");
        if (isHalf)
            bytes.back() = static_cast<char>(static_cast<std::size_t>(bytes.back()) << 4 | value);
        else
            bytes += static_cast<char>(value);
        isHalf = !isHalf;
    }
    if (isHalf)
        throw std::invalid_argument("half a byte");
    return bytes;
}

// Bytes in a heap block of exactly their size: an address sanitizer sees one read too many.
class ExactBytes
{
public:
    explicit ExactBytes(std::string_view bytes) : m_size(bytes.size()), m_bytes(new char[bytes.size()])
    {
        bytes.copy(m_bytes.get(), m_size);
    }

    void const* Data() const { return m_bytes.get(); }
    std::size_t Size() const { return m_size; }

private:
    std::size_t m_size;
    std::unique_ptr<char[]> m_bytes;
};
