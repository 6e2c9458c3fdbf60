// Which ticket.
#pragma once

#include <tuple>

namespace comgui
{
// The ticket types that the plug-in of this package has. Others may exist.
enum TICKET_TYPE : int
{
    SystemTickets = 0,
    DeviceTickets = 2,
    JobTickets = 3,
    QueueTickets = 7,
    PaperTickets = 12,
    UserTickets = 17,
};

constexpr int TicketTypes = 100;  // 0 to 99

struct TicketAddress
{
    int type = 0;
    int id = 0;  // 0 to 16777215
};

inline bool operator==(TicketAddress left, TicketAddress right)
{
    return left.type == right.type && left.id == right.id;
}
inline bool operator!=(TicketAddress left, TicketAddress right) { return !(left == right); }
inline bool operator<(TicketAddress left, TicketAddress right)
{
    return std::tie(left.type, left.id) < std::tie(right.type, right.id);
}
}  // namespace comgui
