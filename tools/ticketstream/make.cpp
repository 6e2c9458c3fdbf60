#include "tools/ticketstream/make.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "tools/ticketstream/ItemClass.h"
#include "tools/ticketstream/JsonPlace.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/StreamBuilder.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/text.h"
#include <limits>
#include <nlohmann/json.hpp>

namespace ticketstream
{
namespace
{
using nlohmann::json;

// An object of the document, and where it stands.
class Members
{
public:
    Members(json const& object, JsonPlace const& place) : m_object(object), m_place(place) {}

    bool Has(char const* name) const { return m_object.contains(name); }

    json const& Get(char const* name) const
    {
        if (!Has(name))
            throw WrongJson(m_place.Text(), "\"" + std::string(name) + "\" is missing");
        return m_object[name];
    }

    int Int(char const* name) const { return Integer<int>(name, "an integer of 32 bits"); }

    // Also as a text, which is how readers of JSON without such integers carry it.
    template <typename T>
    T Integer(char const* name, char const* wanted) const
    {
        json const& value = Get(name);
        json const number = value.is_string() && sizeof(T) == 8 ? Parsed(value) : value;
        bool const isUnsigned = number.is_number_unsigned();
        auto const bits = number.is_number_integer() ? number.get<unsigned long long>() : 0;
        bool const fits =
            isUnsigned ? bits <= static_cast<unsigned long long>(std::numeric_limits<T>::max())
                       : number.is_number_integer() && std::numeric_limits<T>::is_signed &&
                             number.get<long long>() >= static_cast<long long>(std::numeric_limits<T>::min());
        if (!fits)
            Refuse(name, wanted);
        return static_cast<T>(bits);
    }

    std::string Word(char const* name) const
    {
        json const& value = Get(name);
        if (!value.is_string())
            Refuse(name, "a text");
        return value.get<std::string>();
    }

    std::string TextOrBytes(char const* name) const
    {
        json const& value = Get(name);
        return value.is_string() ? value.get<std::string>() : Bytes(name);
    }

    std::string Bytes(char const* name) const
    {
        auto bytes = BytesOf(Get(name));
        if (!bytes)
            RefuseBytes(Place(name));
        return *std::move(bytes);
    }

    static std::optional<std::string> BytesOf(json const& value)
    {
        bool const isObject = value.is_object() && value.contains("hex") && value["hex"].is_string();
        return isObject ? BytesOfHex(value["hex"].get_ref<std::string const&>()) : std::nullopt;
    }

    [[noreturn]] static void RefuseBytes(std::string const& place)
    {
        throw WrongJson(place, "bytes are told as {\"hex\": \"00ff\"}, two digits a byte");
    }

    std::string Place(char const* name) const { return m_place.Text() + '/' + name; }

    [[noreturn]] void Refuse(char const* name, std::string const& wanted) const
    {
        throw WrongJson(Place(name), wanted + " is needed here");
    }

private:
    static json Parsed(json const& text)
    {
        return json::parse(text.get_ref<std::string const&>(), nullptr, false);
    }

    json const& m_object;
    JsonPlace const& m_place;
};

double DoubleOf(Members const& members)
{
    json const& value = members.Get("value");
    if (value == "NaN")
        return std::numeric_limits<double>::quiet_NaN();
    if (!value.is_number())
        members.Refuse("value", "a number or \"NaN\"");
    return value.get<double>();
}

Value ValueOf(Members const& members)
{
    auto const type = TypeOfName(members.Word("type"));
    if (!type)
        members.Refuse("type", "int, double, string, binstring, int64, unsigned64 or none");
    Value value;
    value.type = *type;
    switch (*type)
    {
    case PARAM_INT:
        value.integer = members.Int("value");
        break;
    case PARAM_INT64:
        value.integer = members.Integer<long long>("value", "an integer of 64 bits");
        break;
    case PARAM_UNSIGNED64:
        value.unsigned64 =
            members.Integer<unsigned long long>("value", "an integer of 64 bits that is not negative");
        break;
    case PARAM_DOUBLE:
        value.number = DoubleOf(members);
        break;
    case PARAM_STRING:
        value.bytes = members.TextOrBytes("value");
        break;
    case PARAM_BINSTRING:
        value.bytes = members.Bytes("value");
        break;
    default:
        if (members.Has("value"))
            throw WrongJson(members.Place("value"), "a record of type none has no value");
        break;
    }
    return value;
}

Record RecordOf(Members const& members)
{
    Record record;
    if (!members.Get("key").is_null())
        record.key = members.TextOrBytes("key");
    if (members.Has("pos"))
        record.pos = members.Int("pos");
    record.value = ValueOf(members);
    return record;
}

// The parser's errors begin with a name and a number of its own.
std::string ParserWords(std::string const& what)
{
    std::size_t const end = what.find("] ");
    return end == std::string::npos ? what : what.substr(end + 2);
}

// Takes the document in while it is parsed: what became bytes is dropped, so that a large document takes no
// more memory than its text and the stream.
class Maker
{
public:
    std::string Make(std::string_view text)
    {
        try
        {
            json const document = json::parse(text, [this](int, json::parse_event_t event, json& parsed)
                                              { return Take(event, parsed); });
            return Finished(Members(document, m_place));
        }
        catch (json::exception const& e)
        {
            throw WrongJson("", ParserWords(e.what()));
        }
    }

private:
    // Whether the parser is to keep what it parsed.
    bool Take(json::parse_event_t event, json& parsed)
    {
        switch (event)
        {
        case json::parse_event_t::object_start:
        case json::parse_event_t::array_start:
            m_place.Begin(event == json::parse_event_t::array_start);
            return true;
        case json::parse_event_t::key:
            m_place.Member(parsed.get_ref<std::string const&>());
            return true;
        case json::parse_event_t::value:
            m_place.Scalar();
            m_place.Next();
            return true;
        default:
            break;
        }
        bool const isKept = Ended(m_place.End(), parsed);
        m_place.Next();
        return isKept;
    }

    bool Ended(Part part, json const& parsed)
    {
        if (part == Part::Record)
            Add(Members(parsed, m_place));
        if (part == Part::Operation)
            AddOperation(Members(parsed, m_place));
        return part != Part::Record && part != Part::Operation;
    }

    void Add(Members const& members)
    {
        try
        {
            m_records.Add(RecordOf(members));
        }
        catch (Unwritable const& e)
        {
            throw WrongJson(members.Place(e.Part()), e.what());
        }
    }

    void AddOperation(Members const& members)
    {
        int const type = members.Int("ticketType");
        int const id = members.Int("ticketId");
        int const code = members.Int("operation");
        if (members.Has("records") + members.Has("keys") + members.Has("payload") > 1)
            throw WrongJson(m_place.Text(), "only one of \"records\", \"keys\" and \"payload\" may be there");
        if (!IsGood(code, {}))
            throw WrongJson(members.Place("operation"), "this code does not travel in container streams");
        TICKET_OP op = STICKET_OP_INVALID;
        op.SetInt(code);
        std::string const payload = PayloadOf(members, op);
        if (!IsGood(code, payload))
            throw WrongJson(m_place.Text(), "no payload for this code");
        m_operations.PutOperation(type, id, op, payload);
        m_hasOperations = true;
    }

    std::string PayloadOf(Members const& members, TICKET_OP op)
    {
        if (members.Has("payload"))
            return members.Bytes("payload");
        return members.Has("keys") ? KeyTable(members, op) : m_records.Take();
    }

    static std::string KeyTable(Members const& members, TICKET_OP op)
    {
        std::vector<std::string> keys;
        for (json const& key : members.Get("keys"))
        {
            std::string const place = members.Place("keys") + '/' + std::to_string(keys.size());
            auto text = key.is_string() ? key.get<std::string>() : Members::BytesOf(key);
            if (!text)
                Members::RefuseBytes(place);
            keys.push_back(*std::move(text));
            if (keys.back().find('\0') != std::string::npos)
                throw WrongJson(place, "a key ends at its zero byte in such a table");
        }
        std::vector<char const*> table;
        table.reserve(keys.size() + 1);
        for (std::string const& key : keys)
            table.push_back(key.c_str());
        table.push_back(nullptr);
        MTICKET_BINSTREAM::Write writer(0);
        writer.PutPartialTableOperation(0, 0, op, table.data());
        std::string stream;
        writer.GetAndClear(stream);
        OperationWalk walk(stream);
        walk.Next();
        return std::string(walk.Current().payload);
    }

    std::string Finished(Members const& document)
    {
        std::string const stream = document.Word("stream");
        bool const isContainer = stream == ContainerSignature;
        if (!isContainer && stream != TicketSignature)
            document.Refuse("stream", "STICKET_1 or MTICKET_1");
        document.Get(isContainer ? "operations" : "records");
        char const* const other = isContainer ? "records" : "operations";
        if (document.Has(other))
            throw WrongJson(document.Place(other), "a stream of the kind " + stream + " has none");
        if (!isContainer)
            return m_records.Take();
        if (!m_hasOperations)
            return ContainerSignature;  // the library writes none, but there may be one that was read
        std::string bytes;
        m_operations.GetAndClear(bytes);
        return bytes;
    }

    JsonPlace m_place;
    StreamBuilder m_records;  // of the document or of the current operation
    MTICKET_BINSTREAM::Write m_operations{0};
    bool m_hasOperations = false;
};
}  // namespace

std::string MakeStream(std::string_view json) { return Maker().Make(json); }
}  // namespace ticketstream
