#include "tools/ticketstream/json.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tools/ticketstream/ItemWalk.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/StreamBuilder.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/text.h"
#include "tools/ticketstream/whole.h"

namespace ticketstream
{
using tools::Output;

namespace
{
std::string JsonHex(std::string_view bytes) { return "{\"hex\": \"" + Hex(bytes) + "\"}"; }

std::string JsonText(std::string_view text)
{
    auto quoted = Quoted(text);
    return quoted ? *std::move(quoted) : JsonHex(text);
}

// JSON has no NaN, and most readers of JSON have no integers of 64 bits: both are texts.
std::string JsonValue(Value const& value)
{
    switch (value.type)
    {
    case PARAM_INT:
        return std::to_string(value.integer);
    case PARAM_INT64:
        return '"' + std::to_string(value.integer) + '"';
    case PARAM_UNSIGNED64:
        return '"' + std::to_string(value.unsigned64) + '"';
    case PARAM_DOUBLE:
        return value.number == value.number ? NumberText(value.number) : "\"NaN\"";
    case PARAM_STRING:
        return JsonText(value.bytes);
    default:
        return JsonHex(value.bytes);
    }
}

std::string JsonRecord(Record const& record)
{
    std::string json = "{\"key\": " + (record.key ? JsonText(*record.key) : "null") + ", \"type\": \"" +
                       TypeName(record.value.type) + "\", \"pos\": " + std::to_string(record.pos);
    if (record.value.type != PARAM_NONE)
        json += ", \"value\": " + JsonValue(record.value);
    return json + '}';
}

void PrintRecords(std::string_view stream, Output& out)
{
    char const* separator = "\n";
    ItemWalk walk(stream);
    out.Add("[");
    while (walk.Next())
        if (walk.Kind() == Item::Value)
        {
            out.Add(separator + JsonRecord(walk.Current()));
            separator = ",\n";
        }
    out.Add("\n]");
}

void PrintKeys(std::string_view payload, Output& out)
{
    auto texts = TextsOf(payload);
    char const* separator = "";
    out.Add("[");
    for (std::size_t i = 1; i < texts.size(); ++i)  // behind the header
    {
        out.Add(separator + JsonText(texts[i].text));
        separator = ", ";
    }
    out.Add("]");
}

std::string RewrittenRecords(std::string_view payload)
{
    StreamBuilder builder;
    ItemWalk walk(payload);
    while (walk.Next())
        if (walk.Kind() == Item::Value)
            builder.Add(walk.Current());
    return builder.Take();
}

// A payload of a code that does not say what it is may look like records or keys, and mean something else: it
// is shown so only where every byte of it comes back.
bool IsExact(Payload kind, std::string_view payload)
try
{
    if (kind == Payload::Records)
        return RewrittenRecords(payload) == payload;
    return kind == Payload::Keys && payload.back() == '\0';
}
catch (std::runtime_error const&)  // broken, or with a key that no item holds
{
    return false;
}

void PrintPayload(Operation const& operation, Output& out)
{
    Payload kind = KindOf(operation);
    bool const isKnown =
        operation.code == STICKET_OP_SET_MULTIPAR || operation.code == STICKET_OP_SET_PARTIAL;
    if (kind != Payload::None && !isKnown && !IsExact(kind, operation.payload))
        kind = Payload::Bytes;
    switch (kind)
    {
    case Payload::None:
        return;
    case Payload::Records:
        out.Add(", \"records\": ");
        return PrintRecords(operation.payload, out);
    case Payload::Keys:
        out.Add(", \"keys\": ");
        return PrintKeys(operation.payload, out);
    case Payload::Bytes:
        return out.Add(", \"payload\": " + JsonHex(operation.payload));
    }
}

void PrintOperations(std::string_view stream, Output& out)
{
    char const* separator = "\n";
    OperationWalk walk(stream);
    out.Add("[");
    while (walk.Next())
    {
        Operation const& operation = walk.Current();
        out.Add(separator + std::string("{\"ticketType\": ") + std::to_string(operation.ticketType) +
                ", \"ticketId\": " + std::to_string(operation.ticketId) +
                ", \"operation\": " + std::to_string(operation.code));
        PrintPayload(operation, out);
        out.Add("}");
        separator = ",\n";
    }
    out.Add("\n]");
}
}  // namespace

void PrintJson(std::string_view stream, Output& out)
{
    MustBeWhole(stream);
    if (IsContainer(stream))
    {
        out.Add("{\"stream\": \"MTICKET_1\", \"operations\": ");
        PrintOperations(stream, out);
    }
    else
    {
        out.Add("{\"stream\": \"STICKET_1\", \"records\": ");
        PrintRecords(stream, out);
    }
    out.Add("}\n");
}
}  // namespace ticketstream
