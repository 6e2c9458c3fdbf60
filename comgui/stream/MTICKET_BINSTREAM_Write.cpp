#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/stream/container_items.h"
#include "comgui/stream/ticket_items.h"
#include <algorithm>

using namespace comgui::detail;

MTICKET_BINSTREAM::Write::Write(unsigned long expected) : reserve(expected)
{
    if (reserve != 0)
        data.reserve(reserve);
}

void MTICKET_BINSTREAM::Write::GetAndClear(std::string& out)
{
    data.swap(out);
    data.clear();
    first = true;
    if (reserve != 0)
        data.reserve(reserve);
}

void MTICKET_BINSTREAM::Write::PutOperation(int ticketType, int ticketId, TICKET_OP op,
                                            std::string const& payload)
{
    // Room for all of it first: an operation gets in as a whole or not at all.
    unsigned long const end =
        (first ? ContainerSignature.size() : data.size()) + OperationHeader + payload.size();
    if (end > data.capacity())
        data.reserve(std::max(end, 2 * data.capacity()));
    if (first)
        data = ContainerSignature;
    first = false;
    PutUnsigned(static_cast<unsigned int>(ticketType));
    PutUnsigned(static_cast<unsigned int>(ticketId));
    PutUnsigned(static_cast<unsigned int>(op.GetInt()));
    PutUnsigned(static_cast<unsigned int>(payload.size()));
    data += payload;
}

void MTICKET_BINSTREAM::Write::PutVoidOperation(int ticketType, int ticketId, TICKET_OP op)
{
    PutOperation(ticketType, ticketId, op, std::string());
}

void MTICKET_BINSTREAM::Write::PutSetMultipar(int ticketType, int ticketId, SETMULTIPAR* table,
                                              unsigned long expected)
{
    std::string stream;
    STICKET_BINSTREAM::Write(stream, table, expected);
    PutSetMultipar(ticketType, ticketId, stream);
}

void MTICKET_BINSTREAM::Write::PutSetMultipar(int ticketType, int ticketId, std::string const& stream)
{
    if (!stream.empty())
        PutOperation(ticketType, ticketId, STICKET_OP_SET_MULTIPAR, stream);
}

void MTICKET_BINSTREAM::Write::PutPartialTableOperation(int ticketType, int ticketId, TICKET_OP op,
                                                        char const* const* keys)
{
    std::string payload(PartialHeader);
    payload += '\0';
    for (; keys && *keys; ++keys)
        payload.append(*keys) += '\0';
    PutOperation(ticketType, ticketId, op, payload);
}

void MTICKET_BINSTREAM::Write::PutUnsigned(unsigned int value)
{
    char bytes[4];
    data.append(bytes, PutBytes<std::uint32_t>(bytes, value));
}
