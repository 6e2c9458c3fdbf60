#include "FormCommands.h"

#include "FormValue.h"
#include "Output.h"
#include "Shown.h"
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <poll.h>
#include <string_view>
#include <thread>
#include <unistd.h>
#include <utility>

using namespace comgui;

namespace
{
// Bold and dim where a person looks.
std::string Styled(char const* style, std::string const& text)
{
    static bool const isTerminal = isatty(STDOUT_FILENO) == 1 && std::getenv("NO_COLOR") == nullptr;
    return isTerminal ? std::string("\033[") + style + "m" + text + "\033[0m" : text;
}

std::string Bold(std::string const& text) { return Styled("1", text); }
std::string Dim(std::string const& text) { return Styled("2", text); }

// Output that has nowhere to go ends the program.
void Print(std::string const& line)
{
    std::puts(line.c_str());
    if (!FlushOutput())
        std::quick_exit(Trouble);
}

// A text without the quotes and backslashes of JSON.
std::string Plain(Json const& value)
{
    return value.is_string() ? Shown(value.get_ref<std::string const&>()) : Line(value);
}
}  // namespace

void ListTickets(Connection& connection, OPTIONS const& options)
{
    Tickets const tickets = connection.GetTickets();
    int const asked = options.ticket.type;
    Json all = Json::array();
    for (int const type : asked == EveryType ? Given(tickets.Types()) : std::vector<int>{asked})
        for (TicketAddress const ticket : Given(tickets.List(type)))
            if (auto const keys = tickets.Keys(ticket))  // somebody may delete it meanwhile
                all.push_back({{"type", type}, {"id", ticket.id}, {"keys", keys->size()}});
    if (all.empty())
        throw Refusal(asked == EveryType ? "there are no tickets"
                                         : "there are no tickets of type " + std::to_string(asked) +
                                               "; ticket_form list tells which there are");
    if (options.json)
        return Print(Line(all));
    for (Json const& ticket : all)
        Print(Bold(Line(ticket["type"]) + " " + Line(ticket["id"])) + "  " +
              Dim(Line(ticket["keys"]) + " keys"));
}

namespace
{
Json Described(SnapshotEntry const& entry)
{
    Json result = {{"key", entry.key}, {"type", NameOf(entry.value.Type())}};
    if (auto const* const list = std::get_if<List>(&entry.value))
        result["of"] = NameOf(list->front().value.Type());
    result["value"] = ToJson(entry.value);
    return result;
}

void PrintFields(Json const& fields)
{
    std::size_t widest = 0;
    for (Json const& field : fields)
        widest = std::max(widest, Plain(field["key"]).size());
    for (Json const& field : fields)
    {
        std::string key = Plain(field["key"]);
        std::string type = field.contains("of") ? Plain(field["of"]) + " list" : Plain(field["type"]);
        key.resize(widest, ' ');
        type.resize(std::max<std::size_t>(type.size(), 15), ' ');
        Print(Bold(key) + "  " + Dim(type) + "  " + Line(field["value"]));
    }
}
}  // namespace

void Keys(Connection& connection, OPTIONS const& options)
{
    Snapshot const all = Given(connection.GetTickets().ReadAll(options.ticket));
    Json fields = Json::array();
    for (SnapshotEntry const& entry : all.Entries())
        if (entry.key.rfind(options.key, 0) == 0)
            fields.push_back(Described(entry));
    if (fields.empty() && !options.key.empty())
        throw Refusal("the ticket has no keys that begin with " + options.key);
    if (options.json)
        Print(Line(fields));
    else
        PrintFields(fields);
}

void Get(Connection& connection, OPTIONS const& options)
{
    Json const value = ToJson(Given(connection.GetTickets().Read(options.ticket, options.key, options.pos)));
    if (options.json || !value.is_array())
        return Print(options.json ? Line(value) : Plain(value));
    for (Json const& element : value)
        Print(element.is_null() ? "" : Plain(element));
}

namespace
{
// The type for a new value: the one that was asked for, or the one that is there.
PARAM_TYPE TypeFor(Tickets const& tickets, OPTIONS const& options, std::string const& key, bool isList)
{
    auto before = tickets.Read(options.ticket, key, options.pos);
    if (!before && options.pos != WholeKey)
        before = tickets.Read(options.ticket, key);  // beside the others of the list
    bool const isNew = !before && before.GetError().code == NoSuchKey;
    if (isNew && options.typeName.empty())
        throw Refusal(before.GetError().Text() + "; to make it, say --type");
    Value const value = isNew ? Value() : Given(std::move(before));
    auto const* const list = std::get_if<List>(&value);
    if (list && !isList && options.pos == WholeKey)
        throw Refusal(key + " is a list; write one of its values with --pos, or all of them with set-list");
    if (!options.typeName.empty())
        return TypeOf(options.typeName);
    return list ? list->front().value.Type() : value.Type();
}

// All of them are checked before one is written.
void Write(Tickets const& tickets, OPTIONS const& options, bool isList)
{
    std::vector<KeyValue> values;
    for (std::string const& field : options.fields)
    {
        auto const [key, text] = SplitField(field);
        PARAM_TYPE const type = TypeFor(tickets, options, key, isList);
        values.push_back({key, ValueOf(key, text, isList ? PARAM_COUNT : type, type)});
    }
    std::vector<Outcome> outcomes;
    if (options.pos == WholeKey)
        outcomes = tickets.WriteAll(options.ticket, values);
    else
        for (auto const& [key, value] : values)
            outcomes.push_back(tickets.Write(options.ticket, key, value, options.pos));
    std::string refused;
    for (Outcome const& outcome : outcomes)
        if (!outcome)
            refused += (refused.empty() ? "" : "; ") + outcome.GetError().Text();
    if (!refused.empty())
        throw Refusal(refused);
}
}  // namespace

void Set(Connection& connection, OPTIONS const& options) { Write(connection.GetTickets(), options, false); }

void SetList(Connection& connection, OPTIONS const& options)
{
    Write(connection.GetTickets(), options, true);
}

void Delete(Connection& connection, OPTIONS const& options)
{
    Tickets const tickets = connection.GetTickets();
    Given(tickets.Read(options.ticket, options.key, options.pos));  // or say that it is not there
    Given(tickets.Write(options.ticket, options.key, Value(), options.pos));
}

namespace
{
// Prints events, one for each key.
class Printer
{
public:
    Printer(Tickets tickets, OPTIONS const& options) : m_tickets(std::move(tickets)), m_options(options) {}

    void Print(Event const& event)
    {
        std::visit([this](auto const& what) { Take(what); }, event);
    }

private:
    void Take(TicketCreated const& created) { Print(created.ticket, "ticket created"); }
    void Take(TicketDeleted const& deleted) { Print(deleted.ticket, "ticket deleted"); }
    void Take(ManyTicketsChanged many) { Print({many.type, EveryTicket}, "tickets changed"); }
    void Take(TicketChanged const& changed)
    {
        if (changed.isWhole)
            Print(changed.ticket, "ticket changed");
        for (auto const& [key, value] : changed.keys)
            Print(changed.ticket, value && value->IsNone() ? "deleted" : "changed", key,
                  value ? *value
                        : m_tickets.Read(changed.ticket, key, WholeKey, Paths::AsStored).ValueOr({}));
    }
    void Take(TransferProgressed const&) {}
    void Take(TransferEnded const&) {}
    void Take(ServerLost const& lost) { Fail(lost.error.Text()); }
    void Take(ServerBack) { Fail("the server is back"); }

    void Print(TicketAddress ticket, char const* what, std::string const& key = {}, Value const& value = {})
    {
        if (m_options.events != 0 && m_printed == m_options.events)
            return;
        Json const json = ToJson(value);
        if (m_options.json)
            ::Print(Line(
                {{"type", ticket.type}, {"id", ticket.id}, {"event", what}, {"key", key}, {"value", json}}));
        else
            ::Print(std::to_string(ticket.type) + " " + std::to_string(ticket.id) + "  " + Bold(Shown(key)) +
                    "  " + Dim(what) + (json.is_null() ? "" : "  " + Line(json)));
        if (++m_printed == m_options.events)
            EndSignals::Raise();
    }

    Tickets const m_tickets;
    OPTIONS const& m_options;
    int m_printed = 0;
};

void WriteLine(Tickets const& tickets, OPTIONS options, std::string const& line)
try
{
    options.fields = {line};
    Write(tickets, options, false);
}
catch (Refusal const& refusal)
{
    Fail(refusal.what());
}

// Takes what comes on standard input within a moment, and calls write(line) for each line. rest: of a line
// whose end is still to come; the last one may lack it. False if the input has ended.
template <typename Write>
bool TakeInput(std::string& rest, Write write)
{
    pollfd input = {STDIN_FILENO, POLLIN, 0};
    if (poll(&input, 1, 100) <= 0)
        return true;
    char bytes[4096];
    ssize_t const size = read(STDIN_FILENO, bytes, sizeof bytes);
    if (size <= 0 && !rest.empty())
        write(rest);
    if (size <= 0)
        return false;
    for (char const byte : std::string_view(bytes, static_cast<std::size_t>(size)))
        if (byte != '\n')
            rest += byte;
        else
            write(std::exchange(rest, {}));
    return true;
}
}  // namespace

void Watch(Connection& connection, OPTIONS const& options, EndSignals const& end)
{
    Tickets const tickets = connection.GetTickets();
    bool const isOne = options.ticket.id != EveryTicket;
    if (isOne)
        Given(tickets.Keys(options.ticket));  // or say that there is none
    Printer printer(tickets, options);
    TaskQueue events;
    Subscription const subscription = connection.Subscribe(
        isOne ? Interest::InTickets({options.ticket}) : Interest::InTypes({options.ticket.type}),
        events.GetExecutor(), [&printer](Event const& event) { printer.Print(event); });
    std::thread printing([&events] { events.Run(); });
    std::fprintf(stderr, "%s: watching; Ctrl-C ends it\n", ProgramName);
    std::string line;
    bool isEdited = options.edit;
    while (!end.WaitFor(std::chrono::seconds(isEdited ? 0 : 1)))
        isEdited = isEdited &&
                   TakeInput(line, [&](std::string const& whole) { WriteLine(tickets, options, whole); });
    events.Stop();
    printing.join();
}
