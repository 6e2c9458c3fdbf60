#include "tools/ticketstream/whole.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tools/ticketstream/ItemWalk.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/Trouble.h"

namespace ticketstream
{
namespace
{
void WalkItems(std::string_view stream, unsigned long start)
{
    ItemWalk walk(stream, start);
    while (walk.Next())
    {
    }
}

void WalkOperations(std::string_view stream)
{
    OperationWalk walk(stream);
    while (walk.Next())
    {
        Operation const& operation = walk.Current();
        if (operation.code == STICKET_OP_SET_MULTIPAR)
            WalkItems(operation.payload, operation.payloadOffset);
        if (operation.code == STICKET_OP_SET_PARTIAL && !IsKeyTable(TextsOf(operation.payload)))
            throw BrokenStream(operation.payloadOffset, "no table of keys: it begins with another text");
    }
}
}  // namespace

bool IsContainer(std::string_view stream)
{
    return MTICKET_BINSTREAM::Detect(stream.data(), stream.size()) == 2;
}

void MustBeWhole(std::string_view stream)
{
    bool const isContainer = IsContainer(stream);
    if (isContainer ? MTICKET_BINSTREAM::Check(stream.data(), stream.size())
                    : STICKET_BINSTREAM::Check(stream.data(), stream.size()))
        return;
    if (isContainer)
        WalkOperations(stream);
    else
        WalkItems(stream, 0);
    throw BrokenStream(stream.size(), "the library refuses it, which is likely to be for want of memory");
}
}  // namespace ticketstream
