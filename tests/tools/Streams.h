// Streams that several tests look at. The bytes of the first one stand in docs/stream-formats.md too.
#pragma once

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "tests/support/HexText.h"
#include "tests/support/StreamOracle.h"
#include <string>
#include <vector>

namespace Streams
{
inline std::string Job()
{
    return BytesOf("09 53 54 49 43 4B 45 54 5F 31"
                   "0A 4A 6F 62 2F 43 6F 70 69 65 73 41 03"
                   "25 04 4E 61 6D 65 62 41 34"
                   "26 04 53 63 61 6C 65 45 69 3F C0 00 00"
                   "25 04 54 72 61 79 A2 42 01 2C 41 FF"
                   "22 04 58 A1 C0");
}

inline std::string Signature() { return BytesOf("09 53 54 49 43 4B 45 54 5F 31"); }

inline std::string Written(std::vector<StreamOracle::RECORD> const& records)
{
    std::string stream;
    StreamOracle::TABLE table(records);
    STICKET_BINSTREAM::Write(stream, table.Records(), 0);
    return stream;
}

inline TICKET_OP Code(int code)
{
    TICKET_OP op = STICKET_OP_INVALID;
    op.SetInt(code);
    return op;
}

// An operation of each kind of payload.
inline std::string Container()
{
    MTICKET_BINSTREAM::Write writer(0);
    char const* const keys[] = {"Job/*", "", "System/Use", nullptr};
    writer.PutSetMultipar(3, 1, Job());
    writer.PutPartialTableOperation(3, -1, STICKET_OP_SET_PARTIAL, keys);
    writer.PutPartialTableOperation(3, 2, Code(105), nullptr);
    writer.PutVoidOperation(3, 2, MTICKET_OP_DELETE);
    writer.PutOperation(3, 2, Code(7), std::string("\0\xFF", 2));
    std::string stream;
    writer.GetAndClear(stream);
    return stream;
}
}  // namespace Streams
