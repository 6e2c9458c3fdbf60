// The classes of items in a ticket stream, as they stand in the top three bits of a tag.
#pragma once

namespace ticketstream
{
inline constexpr unsigned char FullKeyClass = 0x00;
inline constexpr unsigned char CompressedKeyClass = 0x20;
inline constexpr unsigned char NumberClass = 0x40;
inline constexpr unsigned char TextClass = 0x60;
inline constexpr unsigned char BinaryClass = 0x80;
inline constexpr unsigned char PositionClass = 0xA0;
inline constexpr unsigned char DeleteClass = 0xC0;

inline constexpr char TicketSignature[] = "STICKET_1";
inline constexpr char ContainerSignature[] = "MTICKET_1";
}  // namespace ticketstream
