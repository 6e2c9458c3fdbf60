#include "FormCommands.h"

#include "Shown.h"
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <poll.h>
#include <unistd.h>
#include <utility>

namespace
{
constexpr char const* EveryKey[] = {nullptr};

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

void ListType(SESSION const& session, int type, Json& all)
{
    std::vector<int> ids;
    MTICKET_READ::Of(session.container)->GetTickets(type, ids);
    for (int const id : ids)
        try
        {
            TicketForm const form(session.manager, session.container, type, id);
            all.push_back({{"type", type}, {"id", id}, {"keys", form.Keys().size()}});
        }
        catch (Refusal const&)
        {
            continue;  // somebody has deleted it meanwhile
        }
}
}  // namespace

void List(SESSION const& session, OPTIONS const& options)
{
    Json all = Json::array();
    for (int type = 0; type < TicketTypes; ++type)
        if (options.type == EveryType || options.type == type)
            ListType(session, type, all);
    if (all.empty() && options.type == EveryType)
        throw Refusal("there are no tickets");
    if (all.empty())
        throw Refusal("there are no tickets of type " + std::to_string(options.type) +
                      "; ticket_form list tells which there are");
    if (options.json)
        return Print(Line(all));
    for (Json const& ticket : all)
        Print(Bold(Line(ticket["type"]) + " " + Line(ticket["id"])) + "  " +
              Dim(Line(ticket["keys"]) + " keys"));
}

namespace
{
Json Described(TicketForm const& form, FIELD const& field)
{
    Json result = {{"key", field.key}, {"type", NameOf(field.type)}};
    if (field.type == PARAM_COUNT)
        result["of"] = NameOf(field.elementType);
    result["value"] = form.Value(field);
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

void Keys(SESSION const& session, OPTIONS const& options)
{
    TicketForm const form = session.Open(options);
    Json fields = Json::array();
    FIELD field;
    for (std::string const& key : form.Keys())
        if (key.rfind(options.key, 0) == 0 && form.Has(key, field))  // somebody may delete it meanwhile
            fields.push_back(Described(form, field));
    if (fields.empty() && !options.key.empty())
        throw Refusal(form.Name() + " has no keys that begin with " + options.key);
    if (options.json)
        Print(Line(fields));
    else
        PrintFields(fields);
}

void Get(SESSION const& session, OPTIONS const& options)
{
    TicketForm const form = session.Open(options);
    FIELD const field = form.Field(options.key);
    Json const value = options.pos == WholeKey ? form.Value(field) : form.Value(field, options.pos);
    if (options.json || !value.is_array())
        return Print(options.json ? Line(value) : Plain(value));
    for (Json const& element : value)
        Print(element.is_null() ? "" : Plain(element));
}

namespace
{
// The type for a new value: the one that was asked for, or the one that is there.
PARAM_TYPE TypeFor(TicketForm const& form, std::string const& key, OPTIONS const& options, bool isList)
{
    FIELD field;
    bool const isThere = form.Has(key, field);
    if (isThere && field.type == PARAM_COUNT && !isList && options.pos == WholeKey)
        throw Refusal(key + " is a list; write one of its values with --pos, or all of them with set-list");
    if (!options.typeName.empty())
        return TypeOf(options.typeName);
    if (!isThere)
        throw Refusal(form.Name() + " has no " + key + "; to make it, say --type");
    if (field.type != PARAM_COUNT)
        return field.type;
    PARAM_TYPE const stored = options.pos == WholeKey ? PARAM_NONE : form.TypeAt(key, options.pos);
    PARAM_TYPE const type = stored == PARAM_NONE ? field.elementType : stored;
    if (type == PARAM_NONE)
        throw Refusal(key + " has no value any more that tells its type; say --type");
    return type;
}

void AddFields(SETMULTIPAR_LIST& list, TicketForm const& form, OPTIONS const& options)
{
    for (std::string const& text : options.fields)
    {
        auto const [key, value] = SplitField(text);
        AddValue(list, key, TypeFor(form, key, options, false), value, options.pos);
    }
}
}  // namespace

// All of them are checked before one is written.
void Set(SESSION const& session, OPTIONS const& options)
{
    TicketForm const form = session.Open(options);
    SETMULTIPAR_LIST list(false);
    AddFields(list, form, options);
    form.Write(list);
}

void SetList(SESSION const& session, OPTIONS const& options)
{
    TicketForm const form = session.Open(options);
    SETMULTIPAR_LIST list(false);
    for (std::string const& text : options.fields)
    {
        auto const [key, value] = SplitField(text);
        PARAM_TYPE const type = TypeFor(form, key, options, true);
        list.DelParameter(key.c_str(), WholeKey);  // what the old list has more than the new one
        int pos = 0;
        for (std::string const& element : SplitList(key, value))
            AddValue(list, key, type, element, pos++);
    }
    form.Write(list);
}

void Delete(SESSION const& session, OPTIONS const& options)
{
    TicketForm const form = session.Open(options);
    form.Delete(form.Field(options.key), options.pos);
}

namespace
{
Json ValueOf(NotifData const& data)
{
    switch (data.NotifValueType)
    {
    case PARAM_NONE:
        return {};
    case PARAM_STRING:
        return data.NotifText.utf8_string();
    case PARAM_DOUBLE:
        return data.NotifNumber;
    case PARAM_INT:
        return static_cast<int>(data.NotifNumber);
    default:
        return std::string("(") + NameOf(data.NotifValueType) + ")";
    }
}

char const* WhatHappened(NotifData const& data)
{
    constexpr int Parameter = 1;
    constexpr int Created = 4;
    constexpr int Deleted = 5;
    switch (data.NotifKind)
    {
    case Parameter:
        return data.NotifValueType == PARAM_NONE ? "deleted" : "changed";
    case Created:
        return "ticket created";
    case Deleted:
        return "ticket deleted";
    default:
        return "notified";
    }
}

void PrintEvent(NotifData const& data, bool json)
{
    std::string const key = data.NotifKey.utf8_string();
    Json const value = ValueOf(data);
    if (json)
        return Print(Line({{"type", data.NotifCode},
                           {"id", data.NotifArgA},
                           {"event", WhatHappened(data)},
                           {"key", key},
                           {"value", value}}));
    Print(std::to_string(data.NotifCode) + " " + std::to_string(data.NotifArgA) + "  " + Bold(Shown(key)) +
          "  " + Dim(WhatHappened(data)) + (value.is_null() ? "" : "  " + Line(value)));
}

// Prints events on the receiver's thread, quickly, since the plug-in waits meanwhile.
class Printer
{
public:
    explicit Printer(OPTIONS const& options) : m_options(options) {}

    void Print(NotifData const& data)
    {
        bool const isAsked = data.NotifCode == m_options.type &&
                             (m_options.id == EveryTicket || m_options.id == data.NotifArgA);
        if (!isAsked || (m_options.events != 0 && m_printed == m_options.events))
            return;
        PrintEvent(data, m_options.json);
        if (++m_printed == m_options.events)
            EndSignals::Raise();
    }

private:
    OPTIONS const& m_options;
    int m_printed = 0;
};

void WriteLine(SESSION const& session, OPTIONS options, std::string const& line)
try
{
    options.fields = {line};
    Set(session, options);
}
catch (Refusal const& refusal)
{
    Fail(refusal.what());
}

// Writes what comes on standard input, line by line, until that ends, or the program shall: then true.
bool WriteLines(SESSION const& session, OPTIONS const& options, EndSignals const& end)
{
    std::string line;
    while (!end.WaitFor(std::chrono::milliseconds(0)))
    {
        pollfd input = {STDIN_FILENO, POLLIN, 0};
        if (poll(&input, 1, 100) <= 0)
            continue;
        char bytes[4096];
        ssize_t const size = read(STDIN_FILENO, bytes, sizeof bytes);
        if (size <= 0)  // the last line may lack its end
        {
            if (!line.empty())
                WriteLine(session, options, line);
            return false;
        }
        for (char const byte : std::string(bytes, static_cast<std::size_t>(size)))
            if (byte != '\n')
                line += byte;
            else
                WriteLine(session, options, std::exchange(line, {}));
    }
    return true;
}
}  // namespace

void Watch(SESSION const& session, OPTIONS const& options, EndSignals const& end)
{
    if (options.id != EveryTicket)
        session.Open(options);  // or say that there is none
    if (session.manager.SetCallback(session.login, nullptr) != 0)
        throw std::runtime_error("the plug-in takes no callback");
    if (options.id == EveryTicket)
        session.manager.EnableNotifications(session.login, options.type, EveryKey);
    else
        session.manager.EnableNotifications(session.login, options.type, options.id, EveryKey);
    Printer printer(options);
    {
        EventReceiver const receiver([&](ServerNotificationEvent const& event)
                                     { printer.Print(event.GetNotifData()); });
        std::fprintf(stderr, "%s: watching; Ctrl-C ends it\n", ProgramName);
        bool hasEnded = options.edit && WriteLines(session, options, end);
        while (!hasEnded)
            hasEnded = end.WaitFor(std::chrono::seconds(1));
    }
    session.manager.DisableNotifications(session.login, options.type);
}
