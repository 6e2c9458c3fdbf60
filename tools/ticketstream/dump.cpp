#include "tools/ticketstream/dump.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tools/ticketstream/ItemClass.h"
#include "tools/ticketstream/ItemWalk.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/text.h"
#include "tools/ticketstream/whole.h"
#include <algorithm>

namespace ticketstream
{
using tools::Colour;
using tools::Output;

namespace
{
constexpr unsigned long TextLimit = 200;  // bytes of a value or a key that are shown
constexpr std::size_t OffsetWidth = 8;
constexpr std::size_t ItemWidth = 11;

std::string RightAligned(unsigned long number)
{
    std::string const text = std::to_string(number);
    return std::string(OffsetWidth - std::min(text.size(), OffsetWidth), ' ') + text;
}

char const* ItemName(PARAM_TYPE type)
{
    switch (type)
    {
    case PARAM_NONE:
        return "delete";
    case PARAM_STRING:
        return "text";
    case PARAM_BINSTRING:
        return "binary";
    default:
        return "number";
    }
}

char const* CodeMeaning(int code)
{
    switch (code)
    {
    case STICKET_OP_SET_PARTIAL:
        return " (set partial)";
    case STICKET_OP_SET_MULTIPAR:
        return " (set parameters)";
    case MTICKET_OP_DELETE:
        return " (delete ticket)";
    default:
        return "";
    }
}

std::string ShownKey(Record const& record)
{
    return record.key ? Shown(*record.key, TextLimit) : "(no key yet)";
}

class Dumper
{
public:
    explicit Dumper(Output& out) : m_out(out) {}

    std::optional<BrokenStream> firstBreak;

    void Items(std::string_view stream, unsigned long start)
    {
        Guarded(
            [&]
            {
                ItemWalk walk(stream, start);
                while (walk.Next())
                    OneItem(walk);
            });
    }

    void Container(std::string_view stream)
    {
        if (!MTICKET_BINSTREAM::Check(stream.data(), stream.size()))
            m_out.Add(
                m_out.Painted(Colour::Bad, "Check refuses this stream; it is shown as far as it is safe") +
                '\n');
        Line(0, "signature", Shown(ContainerSignature));
        Guarded(
            [&]
            {
                OperationWalk walk(stream);
                while (walk.Next())
                    OneOperation(walk.Current());
            });
    }

private:
    template <typename F>
    void Guarded(F dump)
    {
        try
        {
            dump();
        }
        catch (BrokenStream const& broken)
        {
            Line(broken.Offset(), "broken", broken.Reason(), Colour::Bad);
            if (!firstBreak)
                firstBreak = broken;
        }
    }

    void OneItem(ItemWalk const& walk)
    {
        Record const& record = walk.Current();
        switch (walk.Kind())
        {
        case Item::Signature:
            return Line(walk.Offset(), "signature", Shown(TicketSignature));
        case Item::Key:
            return Line(walk.Offset(), "key", ShownKey(record));
        case Item::Position:
            return Line(walk.Offset(), "position", std::to_string(record.pos));
        case Item::Value:
            break;
        }
        std::string const value = Shown(record.value, TextLimit);
        Line(walk.Offset(), ItemName(record.value.type),
             ShownKey(record) + "  " + TypeName(record.value.type) + "  " + std::to_string(record.pos) +
                 (value.empty() ? "" : "  ") + value);
    }

    void OneOperation(Operation const& operation)
    {
        Line(operation.offset, "operation",
             "ticket " + std::to_string(operation.ticketType) + '/' + std::to_string(operation.ticketId) +
                 "  code " + std::to_string(operation.code) + CodeMeaning(operation.code) + "  payload " +
                 std::to_string(operation.payload.size()) + " bytes");
        m_indent = "  ";
        switch (KindOf(operation))
        {
        case Payload::Records:
            Items(operation.payload, operation.payloadOffset);
            break;
        case Payload::Keys:
            Guarded([&] { Keys(operation); });
            break;
        case Payload::Bytes:
            Line(operation.payloadOffset, "bytes", ShownBytes(operation.payload, TextLimit));
            break;
        case Payload::None:
            break;
        }
        m_indent = "";
    }

    void Keys(Operation const& operation)
    {
        auto const texts = TextsOf(operation.payload);
        if (!IsKeyTable(texts))
            throw BrokenStream(operation.payloadOffset, "no table of keys: it begins with another text");
        char const* item = "signature";
        unsigned long end = 0;
        for (TableText const& text : texts)
        {
            Line(operation.payloadOffset + text.offset, item, Shown(text.text, TextLimit));
            item = "key";
            end = text.offset + text.text.size() + 1;
        }
        if (end != operation.payload.size())
            Line(operation.payloadOffset + end, "ignored", "what no zero byte ends counts for nothing");
    }

    void Line(unsigned long offset, std::string item, std::string const& rest, Colour colour = Colour::Item)
    {
        item.resize(std::max(item.size(), ItemWidth), ' ');
        m_out.Add(m_out.Painted(Colour::Quiet, RightAligned(offset)) + "  " + m_indent +
                  m_out.Painted(colour, item) + ' ' + rest + '\n');
    }

    Output& m_out;
    char const* m_indent = "";
};
}  // namespace

std::optional<BrokenStream> Dump(std::string_view stream, Output& out)
{
    Dumper dumper(out);
    if (IsContainer(stream))
        dumper.Container(stream);
    else
        dumper.Items(stream, 0);
    return dumper.firstBreak;
}
}  // namespace ticketstream
