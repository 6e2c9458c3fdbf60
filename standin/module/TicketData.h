// The data of a ticket as a whole, for a client that wants it in one piece.
#pragma once

#include "standin/module/Container.h"

namespace standin
{
inline constexpr int TicketDataXml = 0;  // the only format so far: the XML of a ticket file, UTF-8

// *size: going in the room in buffer, coming out what the data takes, in bytes; there is no final zero byte.
// With too little room (or a null buffer) only *size is set. Answers a ModuleCode.
int CopyTicketData(Container const& container, TicketAddress address, int format, int* size, void* buffer);
}  // namespace standin
