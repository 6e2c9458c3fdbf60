// What the value word of a slot or a record holds, as PARAM_TYPE.h says, and the server's values.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "standin/module/WalkedNumbers.h"
#include "standin/server/tickets/TextReader.h"
#include "standin/server/tickets/WritePlan.h"
#include <span>
#include <vector>

namespace standin
{
// Answers a read of a key's values as the slots promise; *out is untouched when it gives false. False for a
// null out, too.
bool ReadValue(KeyValues const& values, PARAM_TYPE type, void* out, int pos, TextReader& reader);

// The value word of a write of an element. It points into the element, for a BINSTRING at binary, which is
// filled in.
void const* WordOf(TicketElement const& element, BIN_STRING& binary);
void const* WordOf(TicketValue const& value, BIN_STRING& binary);

// The same as a walk gives it: a number's stays good for a while.
void const* WordOfWalked(TicketElement const& element, WalkedNumbers& numbers, BIN_STRING& binary);

// A record's write. Without a value if that cannot be written: an unknown type, PARAM_COUNT, a null word
// where an address is due, a deletion with a value, a BIN_STRING without bytes. Keys are borrowed.
TicketWrite WriteOf(SETMULTIPAR const& record);
std::vector<TicketWrite> WritesOf(SETMULTIPAR const* table);

// Sets the ok of the records.
void Answer(std::span<TicketWrite const> writes, SETMULTIPAR* table);
}  // namespace standin
