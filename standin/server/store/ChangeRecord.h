// The parameters of a change as bytes: what a store keeps of a change in its journal, beside the change's
// kind and address, which have columns of their own. Owner, incarnation and revision are not kept.
//
//     record    = version count parameter*         version: the byte 01; count: a varint
//     parameter = head [pos] key [value]           pos: a varint, not there if bit 5 of head is set
//     head      = one byte: bits 0 to 3 the type, bit 4 hadOthers, bit 5 "the whole key" (pos is -1)
//     key       = size byte*                       size: a varint
//     value     = nothing for PARAM_NONE; 4 bytes for 32-bit and 8 bytes for 64-bit numbers, little-endian;
//                 size byte* for texts
//
// A varint has seven bits a byte, the lowest first; the top bit marks that more follow. Only the shortest
// form is valid. A pointer is written as PARAM_NONE, since it means nothing to whoever reads the journal.
#pragma once

#include "standin/server/store/Store.h"
#include <string>
#include <string_view>

namespace standin
{
// Appends the byte form of the change's parameters. Throws StoreError for what no ticket can hold: a type
// that is none, a position below -1.
void AppendChangeRecord(std::string& record, TicketChange const& change);

// Puts a change together again. Throws StoreError unless kind is one and the record is whole and exact;
// its text gives the reason alone, to be completed by the store that knows which journal it is.
TicketChange ReadChangeRecord(int kind, TicketAddress address, std::string_view record);
}  // namespace standin
