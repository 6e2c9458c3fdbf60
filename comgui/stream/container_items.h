// What writer and reader of a container stream must agree on, said once.
#pragma once

#include <string_view>

namespace comgui::detail
{
inline constexpr std::string_view ContainerSignature = "MTICKET_1";    // bare: it is no item
inline constexpr std::string_view PartialHeader = "TICKET_PARTIAL_1";  // then a zero byte, as behind each key
inline constexpr unsigned long OperationHeader = 16;                   // four numbers, of which the last ...
inline constexpr unsigned long PayloadSizeOffset = 12;                 // ... is the size of the payload
}  // namespace comgui::detail
