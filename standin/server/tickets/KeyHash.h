// The hash of a parameter key: eight bytes at a time, each mixed in by a multiplication to 128 bits whose
// halves are folded. Keys are short, and a read of a ticket hashes one.
#pragma once

#include <cstdint>
#include <cstring>
#include <string_view>

namespace standin
{
namespace detail
{
inline std::uint64_t Folded(std::uint64_t left, std::uint64_t right)
{
    __extension__ using Wide = unsigned __int128;
    Wide const product = static_cast<Wide>(left) * right;
    return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64);
}

inline std::uint64_t Word(char const* bytes, std::size_t count)
{
    std::uint64_t word = 0;
    std::memcpy(&word, bytes, count);
    return word;
}
}  // namespace detail

inline std::size_t HashOf(std::string_view key)
{
    constexpr std::uint64_t Odd = 0x9E3779B97F4A7C15u;
    constexpr std::uint64_t Other = 0xD6E8FEB86659FD93u;
    char const* bytes = key.data();
    std::size_t left = key.size();
    std::uint64_t hash = detail::Folded(left ^ Odd, Other);
    for (; left > 8; bytes += 8, left -= 8)
        hash = detail::Folded(hash ^ detail::Word(bytes, 8), Odd);
    // The last eight bytes, some of them perhaps once more; of a shorter key what there is.
    std::uint64_t const last =
        key.size() >= 8 ? detail::Word(bytes + left - 8, 8)
        : left >= 4     ? detail::Word(bytes, 4) << 32 | detail::Word(bytes + left - 4, 4)
        : left > 0      ? static_cast<unsigned char>(bytes[0]) |
                         static_cast<std::uint64_t>(static_cast<unsigned char>(bytes[left / 2])) << 8 |
                         static_cast<std::uint64_t>(static_cast<unsigned char>(bytes[left - 1])) << 16
                   : 0;
    return detail::Folded(hash ^ last, Other);
}
}  // namespace standin
