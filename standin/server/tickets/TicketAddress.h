// Names a ticket inside the server: its type and its id.
#pragma once

#include <cstddef>
#include <functional>

namespace standin
{
struct TicketAddress
{
    int type;
    int id;

    friend bool operator==(TicketAddress const&, TicketAddress const&) = default;
    friend bool operator<(TicketAddress const& left, TicketAddress const& right)
    {
        return left.type != right.type ? left.type < right.type : left.id < right.id;
    }
};

inline constexpr TicketAddress SystemTicket{0, 0};
inline constexpr int JobTicketType = 3;
inline constexpr int QueueTicketType = 7;
inline constexpr int UserTicketType = 17;
inline constexpr int LargestId = 0xFFFFFF;

// Can a ticket have it? The reserved ids are no tickets.
constexpr bool IsValid(TicketAddress address)
{
    return address.type >= 0 && address.type < 100 && address.id >= 0 && address.id <= LargestId;
}
}  // namespace standin

template <>
struct std::hash<standin::TicketAddress>
{
    std::size_t operator()(standin::TicketAddress const& address) const noexcept
    {
        // Types fill seven bits and ids twenty-four, so this is the address itself, spread by a multiplier.
        auto const word = static_cast<std::size_t>(static_cast<unsigned>(address.type)) << 24 ^
                          static_cast<std::size_t>(static_cast<unsigned>(address.id));
        return word * 0x9E3779B97F4A7C15u;
    }
};
