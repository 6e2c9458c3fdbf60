#include "comgui/client/Tickets.h"

#include "comgui/access/MTICKET_READ.h"
#include "comgui/client/Client.h"
#include "comgui/client/SlotValue.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include "comgui/ticket/folder_variables.h"
#include <array>
#include <deque>
#include <limits>
#include <new>
#include <optional>

namespace comgui
{
namespace
{
using detail::Client;

std::string NameOf(TicketAddress ticket)
{
    return std::to_string(ticket.type) + "/" + std::to_string(ticket.id);
}

std::string NameOf(TicketAddress ticket, char const* key) { return NameOf(ticket) + " " + key; }

// The container's translator; null where the plug-in has none.
clFOLDER_VARIABLES const* FoldersOf(MTICKET_ACCESS const* container)
{
    clFOLDER_VARIABLES* folders = nullptr;
    container->MOPERATION(container->Instance, TICKET_ID_NONE, TICKET_ID_NONE, MTICKET_OP_FOLDER_VARIABLES,
                          &folders);
    return folders;
}

bool MayBeAbsolute(std::string const& text)
{
    return !text.empty() && (text[0] == '/' || text[0] == '\\' || (text.size() > 2 && text[1] == ':'));
}

void Resolve(clFOLDER_VARIABLES const* folders, std::string& text)
{
    if (folders && detail::NeedsDecode(text))
        text = folders->Decode(text, false);
}

// Only if it is read back as what was written.
void MakePortable(clFOLDER_VARIABLES const* folders, std::string& text)
{
    if (!folders || !MayBeAbsolute(text))
        return;
    std::string portable = folders->Encode(text);
    if (detail::NeedsDecode(portable) && folders->Decode(portable, false) == text)
        text = std::move(portable);
}

template <typename Change>
void ForEachText(Value& value, Change const& change)
{
    if (auto* const text = std::get_if<std::string>(&value))
        change(*text);
    else if (auto* const list = std::get_if<List>(&value))
        for (Element& element : *list)
            ForEachText(element.value, change);
}

// Ids and positions have 24 bits: a walk that gives more never ends.
constexpr std::size_t MostNumbers = std::size_t{1} << 24;

// What the task has thrown, as a code; 0 if nothing. For tasks that a plug-in calls: what they throw must not
// pass through its code, which was compiled elsewhere.
template <typename Task>
int CodeOf(Task const& task) noexcept
{
    try
    {
        task();
        return 0;
    }
    catch (std::bad_alloc const&)
    {
        return OutOfMemory;
    }
    catch (...)
    {
        return BadAnswer;  // such as bytes of a size that no text can have
    }
}

// A ticket that is open as long as this lives.
class OpenedTicket
{
public:
    OpenedTicket(MTICKET_ACCESS const* container, TicketAddress address)
        : m_container(container), m_address(address)
    {
        container->MOPERATION(container->Instance, address.type, address.id, MTICKET_OP_OPEN, &m_ticket);
    }
    ~OpenedTicket()
    {
        bool flag = false;
        if (m_ticket)
            m_container->MOPERATION(m_container->Instance, m_address.type, m_address.id, MTICKET_OP_CLOSE,
                                    &flag);
    }
    OpenedTicket(OpenedTicket const&) = delete;
    OpenedTicket& operator=(OpenedTicket const&) = delete;

    explicit operator bool() const { return m_ticket != nullptr; }

    // Calls take(key, type, word, pos) for each value whose key begins so. 0 if the plug-in has walked.
    template <typename Take>
    int Walk(char const* prefix, Take& take) const
    {
        struct WALK
        {
            Take& take;
            std::size_t values = 0;
            int code = 0;
        };
        WALK walk{take};
        constexpr int Everything = 8000;  // what the library asks for
        int const hasWalked = m_ticket->SWALKPARAMETERS(
            m_ticket->Instance,
            [](void* context, char const* key, PARAM_TYPE type, void const* word, int pos)
            {
                auto& all = *static_cast<WALK*>(context);
                if (detail::IsParameter(type))
                    all.code = CodeOf([&] { all.take(key, type, word, pos); });
                if (++all.values > MostNumbers)
                    all.code = BadAnswer;
                return all.code == 0;
            },
            &walk, prefix, Everything);
        return hasWalked || walk.code != 0 ? walk.code : BadAnswer;
    }

private:
    MTICKET_ACCESS const* const m_container;
    TicketAddress const m_address;
    STICKET_ACCESS const* m_ticket = nullptr;
};

Error NotLoggedInError() { return {NotLoggedIn, {}, {}}; }

bool NoteTicket(void* isThere, int, int, STICKET_ACCESS const*)
{
    *static_cast<bool*>(isThere) = true;
    return false;
}

// Whether a walk over the tickets of that type begins; isThere: whether there are any.
bool Walks(MTICKET_ACCESS const* container, int type, bool& isThere)
{
    return container->MWALKTICKETS(container->Instance, NoteTicket, &isThere, type) != 0 || isThere;
}

// Why the container's session cannot be asked any more, if so. Slots answer alike for what is not there and
// after the end of their session; a walk that the end cuts even answers that it has walked.
std::optional<Error> EndOf(Client const& client, MTICKET_ACCESS const* container)
{
    MTICKET_ACCESS const* const now = client.Container();
    if (!now)
        return NotLoggedInError();
    bool isThere = false;
    if (now != container || !Walks(container, SystemTickets, isThere))
        return Error{ServerAway, {}, {}};
    return std::nullopt;
}

// What a refused call has failed for: the end of the session or its server, which matters more, or that
// error.
Error CauseOf(Client const& client, MTICKET_ACCESS const* container, Error error)
{
    if (auto end = EndOf(client, container))
        return *std::move(end);
    if (!client.IsServerThere())
        return {ServerAway, {}, {}};
    return error;
}

Error MissingTicket(Client& client, MTICKET_ACCESS const* container, TicketAddress ticket)
{
    return CauseOf(client, container, client.Failure(NoSuchTicket, NameOf(ticket)));
}

// Walks over a ticket that nobody has opened yet: see OpenedTicket. A success: over all of it.
template <typename Take>
Outcome WalkTicket(Client& client, MTICKET_ACCESS const* container, TicketAddress ticket, char const* prefix,
                   Take take)
{
    OpenedTicket const opened(container, ticket);
    if (!opened)
        return MissingTicket(client, container, ticket);
    int const code = opened.Walk(prefix, take);
    Error const refused = code == 0 ? Error() : client.Failure(code, NameOf(ticket));
    if (auto end = EndOf(client, container))
        return *std::move(end);
    if (code == 0)
        return {};
    // Deleted meanwhile, or refused.
    return OpenedTicket(container, ticket) ? refused : MissingTicket(client, container, ticket);
}

// One value after another, in the order of a walk.
void AddValue(Value& value, int pos, Value&& next)
{
    if (value.IsNone() && pos <= 0)
        value = std::move(next);
    else if (auto* const list = std::get_if<List>(&value))
        list->push_back({pos, std::move(next)});
    else
    {
        List all;
        if (!value.IsNone())
            all.push_back({0, std::move(value)});
        all.push_back({pos, std::move(next)});
        value = std::move(all);
    }
}

template <typename T>
bool Get(MTICKET_ACCESS const* container, TicketAddress ticket, char const* key, PARAM_TYPE type, T& value,
         int pos)
{
    return container->MGETPARAMETER(container->Instance, ticket.type, ticket.id, key, type, &value, pos) != 0;
}

// The type that slots know for a T: a long is one of the others, under another name.
template <typename T>
using SlotNumber =
    std::conditional_t<std::is_same_v<T, long>, long long,
                       std::conditional_t<std::is_same_v<T, unsigned long>, unsigned long long, T>>;

// A number of just that type. The read of a list as a whole gives its first value, so the type is asked for
// in the same call.
template <typename T>
bool GetNumber(MTICKET_ACCESS const* container, TicketAddress ticket, char const* key, T& value, int pos)
{
    if (pos != WholeKey)
        return Get(container, ticket, key, GetParamType<T>(), value, pos);
    int type = PARAM_NONE;
    GETMULTIPAR table[] = {{key, PARAM_NONE, 0, &type, WholeKey, false, {}},
                           {key, GetParamType<T>(), 0, &value, WholeKey, false, {}},
                           {}};
    container->MGETMULTIPAR(container->Instance, ticket.type, ticket.id, table);
    return detail::IsOk(table[0]) && detail::IsOk(table[1]) && type == GetParamType<T>();
}

template <typename T>
Value Scalar(MTICKET_ACCESS const* container, TicketAddress ticket, char const* key, int pos)
{
    T value{};
    return Get(container, ticket, key, GetParamType<T>(), value, pos) ? Value(value) : Value();
}

// A single value of that type; none if it is gone meanwhile.
Value ReadScalar(MTICKET_ACCESS const* container, TicketAddress ticket, char const* key, PARAM_TYPE type,
                 int pos)
{
    switch (type)
    {
    case PARAM_INT:
        return Scalar<int>(container, ticket, key, pos);
    case PARAM_DOUBLE:
        return Scalar<double>(container, ticket, key, pos);
    case PARAM_INT64:
        return Scalar<long long>(container, ticket, key, pos);
    case PARAM_UNSIGNED:
        return Scalar<unsigned int>(container, ticket, key, pos);
    case PARAM_UNSIGNED64:
        return Scalar<unsigned long long>(container, ticket, key, pos);
    case PARAM_POINTER:
    {
        Pointer value;
        return Get(container, ticket, key, PARAM_POINTER, value.address, pos) ? Value(value) : Value();
    }
    case PARAM_STRING:
    {
        char const* text = nullptr;
        return Get(container, ticket, key, PARAM_STRING, text, pos) ? Value(std::string(text ? text : ""))
                                                                    : Value();
    }
    case PARAM_BINSTRING:
    {
        BIN_STRING bytes;
        return Get(container, ticket, key, PARAM_BINSTRING, bytes, pos)
                   ? detail::ValueOf(PARAM_BINSTRING, &bytes)
                   : Value();
    }
    default:
        return {};
    }
}

Error MissingValue(Client& client, MTICKET_ACCESS const* container, TicketAddress ticket, char const* key)
{
    if (!OpenedTicket(container, ticket))
        return MissingTicket(client, container, ticket);
    return CauseOf(client, container, client.Failure(NoSuchKey, NameOf(ticket, key)));
}

// What lies there, as stored, if it is of that type; none if it is not, or not any more.
Result<Value> ReadTyped(Client& client, MTICKET_ACCESS const* container, TicketAddress ticket,
                        char const* key, PARAM_TYPE type, int pos)
{
    if (type != PARAM_COUNT)
        return ReadScalar(container, ticket, key, type, pos);
    Value value;
    auto const take = [&value, key](char const* found, PARAM_TYPE each, void const* word, int place)
    {
        if (std::string_view(found) == key)
            AddValue(value, place, detail::ValueOf(each, word));
    };
    Outcome const walked = WalkTicket(client, container, ticket, key, take);
    return walked ? Result<Value>(std::move(value)) : walked.GetError();
}

// Whatever lies there, as stored. Another client may change the type between the question and the read, so
// a read that finds nothing asks again.
Result<Value> ReadStored(Client& client, MTICKET_ACCESS const* container, TicketAddress ticket,
                         KeyName const& name, int pos)
{
    constexpr int MostTries = 8;
    char const* const key = name;
    if (!name.IsValid())
        return Error{NoSuchKey, NameOf(ticket, key), {}};
    for (int tries = 0; tries < MostTries; ++tries)
    {
        int type = PARAM_NONE;
        if (!Get(container, ticket, key, PARAM_NONE, type, pos) || type == PARAM_NONE)
            break;
        Result<Value> value = ReadTyped(client, container, ticket, key, static_cast<PARAM_TYPE>(type), pos);
        if (!value || !value->IsNone())
            return value;
    }
    return MissingValue(client, container, ticket, key);
}

// A table of writes, with what its records point at.
class WriteTable
{
public:
    explicit WriteTable(clFOLDER_VARIABLES const* folders) : m_folders(folders) {}

    // Adds what the value comes to; false if no ticket can hold it, and then nothing.
    bool Add(KeyName const& key, Value const& value, int pos)
    {
        auto const* const list = std::get_if<List>(&value);
        if (!key.IsValid() || IsCut(value))
            return false;
        if (!list)
        {
            AddRecord(key, value, pos);
            return true;
        }
        if (pos != WholeKey)
            return false;
        int last = -1;
        for (Element const& element : *list)
            if (element.value.IsList() || element.value.IsNone() || IsCut(element.value) ||
                std::exchange(last, element.pos) >= element.pos)
                return false;
        // A write at -1 begins the key anew; without a first value, a deletion does.
        bool const beginsWithFirst = !list->empty() && list->front().pos == 0;
        if (!beginsWithFirst)
            AddRecord(key, Value(), WholeKey);
        for (Element const& element : *list)
            AddRecord(key, element.value, element.pos == 0 ? WholeKey : element.pos);
        return true;
    }

    // The records, ended by one without a key; as long as nothing is added.
    SETMULTIPAR* Records()
    {
        m_records.push_back({});
        return m_records.data();
    }
    std::size_t Size() const { return m_records.size(); }
    bool IsOk(std::size_t begin, std::size_t end) const
    {
        while (begin < end && detail::IsOk(m_records[begin]))
            ++begin;
        return begin == end;
    }

private:
    // Whether a ticket would keep the text only to its first zero byte.
    static bool IsCut(Value const& value)
    {
        auto const* const text = std::get_if<std::string>(&value);
        return text && text->find('\0') != std::string::npos;
    }

    void AddRecord(char const* key, Value const& value, int pos)
    {
        Value const* kept = &value;
        if (auto const* const text = std::get_if<std::string>(&value);
            text && m_folders && MayBeAbsolute(*text))
        {
            std::string portable = *text;
            MakePortable(m_folders, portable);
            kept = &m_texts.emplace_back(std::move(portable));
        }
        SETMULTIPAR record{};
        record.key = key;
        record.type = kept->Type();
        record.value = detail::WordOf(*kept, m_bytes.emplace_back());
        record.pos = pos;
        m_records.push_back(record);
    }

    clFOLDER_VARIABLES const* const m_folders;
    std::vector<SETMULTIPAR> m_records;
    std::deque<Value> m_texts;
    std::deque<BIN_STRING> m_bytes;
};

// Of a write that the plug-in has just refused.
Error RefusedWrite(Client& client, MTICKET_ACCESS const* container, TicketAddress ticket)
{
    Error error = client.Failure(WriteRefused, NameOf(ticket));  // first: it is of the last refusal
    if (!OpenedTicket(container, ticket))
        return MissingTicket(client, container, ticket);
    return CauseOf(client, container, std::move(error));
}

// The same error, about that key where it is about one.
Error About(TicketAddress ticket, char const* key, Error error)
{
    if (error.code == WriteRefused)
        error.about = NameOf(ticket, key);
    return error;
}

struct Listing
{
    std::vector<TicketAddress> tickets;
    int code = 0;
};

bool AddTicket(void* context, int type, int id, STICKET_ACCESS const*)
{
    auto& listing = *static_cast<Listing*>(context);
    listing.code = CodeOf([&listing, type, id] { listing.tickets.push_back({type, id}); });
    if (listing.tickets.size() > MostNumbers)
        listing.code = BadAnswer;
    return listing.code == 0;
}
}  // namespace

Result<std::vector<int>> Tickets::Types() const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    std::vector<int> types;
    for (int type = 0; type < TicketTypes; ++type)
    {
        bool isThere = false;
        Walks(container, type, isThere);
        if (isThere)
            types.push_back(type);
    }
    if (auto end = EndOf(*m_client, container))
        return *std::move(end);
    return types;
}

Result<std::vector<TicketAddress>> Tickets::List(int type) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    Listing listing;
    container->MWALKTICKETS(container->Instance, AddTicket, &listing, type);  // refused: no such type
    if (auto end = EndOf(*m_client, container))
        return *std::move(end);
    if (listing.code != 0)
        return Error{listing.code, std::to_string(type), {}};
    return std::move(listing.tickets);
}

Result<TicketAddress> Tickets::Create(int type) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    int id = TICKET_ID_NONE;
    if (!container->MOPERATION(container->Instance, type, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &id) ||
        id < 0)
        return CauseOf(*m_client, container, m_client->Failure(CreateRefused, std::to_string(type)));
    return TicketAddress{type, id};
}

Outcome Tickets::Delete(TicketAddress ticket) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    if (container->MOPERATION(container->Instance, ticket.type, ticket.id, MTICKET_OP_DELETE, nullptr))
        return {};
    Error error = m_client->Failure(DeleteRefused, NameOf(ticket));
    if (!OpenedTicket(container, ticket))
        return MissingTicket(*m_client, container, ticket);
    return CauseOf(*m_client, container, std::move(error));
}

bool Tickets::Exists(TicketAddress ticket) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    return container && OpenedTicket(container, ticket);
}

Result<std::vector<KeyInfo>> Tickets::Keys(TicketAddress ticket) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    std::vector<KeyInfo> keys;
    auto const take = [&keys](char const* key, PARAM_TYPE type, void const*, int pos)
    {
        if (keys.empty() || keys.back().key != key)
            keys.push_back({key, type, PARAM_NONE, 0});
        KeyInfo& info = keys.back();
        if (++info.count == 2 || pos > 0)
        {
            info.elementType = info.type == PARAM_COUNT ? info.elementType : info.type;
            info.type = PARAM_COUNT;
        }
    };
    Outcome const walked = WalkTicket(*m_client, container, ticket, "", take);
    return walked ? Result<std::vector<KeyInfo>>(std::move(keys)) : walked.GetError();
}

Result<Snapshot> Tickets::ReadAll(TicketAddress ticket, Paths paths) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    std::vector<SnapshotEntry> entries;
    auto const take = [&entries](char const* key, PARAM_TYPE type, void const* word, int pos)
    {
        if (entries.empty() || entries.back().key != key)
            entries.push_back({key, {}});
        AddValue(entries.back().value, pos, detail::ValueOf(type, word));
    };
    if (Outcome const walked = WalkTicket(*m_client, container, ticket, "", take); !walked)
        return walked.GetError();
    if (paths == Paths::Resolved)
        for (auto const* const folders = FoldersOf(container); SnapshotEntry & entry : entries)
            ForEachText(entry.value, [folders](std::string& text) { Resolve(folders, text); });
    return Snapshot(std::move(entries));
}

Result<Value> Tickets::Read(TicketAddress ticket, KeyName const& key, int pos, Paths paths) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    Result<Value> value = ReadStored(*m_client, container, ticket, key, pos);
    if (value && paths == Paths::Resolved)
        ForEachText(*value, [folders = FoldersOf(container)](std::string& text) { Resolve(folders, text); });
    return value;
}

template <typename T>
Result<detail::Readable<T>> Tickets::ReadAs(TicketAddress ticket, KeyName const& key, int pos) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    if constexpr (std::is_arithmetic_v<T>)
    {
        SlotNumber<T> value{};
        if (sizeof value == sizeof(T) && key.IsValid() && GetNumber(container, ticket, key, value, pos))
            return static_cast<T>(value);
    }
    Result<Value> const value = Read(ticket, key, pos);
    if (!value)
        return value.GetError();
    Result<T> as = As<T>(*value);
    return as ? as : Error{as.GetError().code, NameOf(ticket, key), {}};
}

Outcome Tickets::Write(TicketAddress ticket, KeyName const& key, Value const& value, int pos,
                       Paths paths) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    WriteTable table(paths == Paths::Resolved ? FoldersOf(container) : nullptr);
    if (!table.Add(key, value, pos))
        return Error{NotWritable, NameOf(ticket, key), {}};
    std::size_t const size = table.Size();
    container->MSETMULTIPAR(container->Instance, ticket.type, ticket.id, table.Records());
    return table.IsOk(0, size) ? Outcome() : About(ticket, key, RefusedWrite(*m_client, container, ticket));
}

Outcome Tickets::WriteText(TicketAddress ticket, KeyName const& key, std::string_view text, int pos) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return NotLoggedInError();
    Result<Value> const before = ReadStored(*m_client, container, ticket, key, pos);
    if (!before)
        return before.GetError();
    Result<Value> const value = FromText(text, *before);
    if (!value)
        return Error{value.GetError().code, NameOf(ticket, key), {}};
    return Write(ticket, key, *value, pos);
}

std::vector<Outcome> Tickets::WriteAll(TicketAddress ticket, std::vector<KeyValue> const& values,
                                       Paths paths) const
{
    MTICKET_ACCESS const* const container = m_client->Container();
    if (!container)
        return std::vector<Outcome>(values.size(), Outcome(NotLoggedInError()));
    WriteTable table(paths == Paths::Resolved ? FoldersOf(container) : nullptr);
    std::vector<std::size_t> ends;
    std::vector<Outcome> outcomes(values.size());
    for (std::size_t i = 0; i < values.size(); ++i)
    {
        if (!table.Add(values[i].key, values[i].value, WholeKey))
            outcomes[i] = Error{NotWritable, NameOf(ticket, values[i].key.c_str()), {}};
        ends.push_back(table.Size());
    }
    bool const hasWritten =
        container->MSETMULTIPAR(container->Instance, ticket.type, ticket.id, table.Records()) != 0;
    std::optional<Error> refused;
    std::size_t begin = 0;
    for (std::size_t i = 0; i < values.size(); begin = ends[i++])
    {
        if (!outcomes[i] || table.IsOk(begin, ends[i]))
            continue;
        if (!refused)
            refused = RefusedWrite(*m_client, container, ticket);
        outcomes[i] = About(ticket, values[i].key.c_str(), *refused);
        if (hasWritten)
            refused->reason.clear();  // there is one for the call, not one for each key
    }
    return outcomes;
}

Result<std::string> Tickets::ToXml(TicketAddress ticket) const { return m_client->TicketData(ticket); }

std::string Tickets::Resolved(std::string text) const
{
    if (MTICKET_ACCESS const* const container = m_client->Container())
        Resolve(FoldersOf(container), text);
    return text;
}

std::string Tickets::Portable(std::string text) const
{
    if (MTICKET_ACCESS const* const container = m_client->Container())
        MakePortable(FoldersOf(container), text);
    return text;
}

// NOLINTBEGIN(bugprone-macro-parentheses): T is a type
#define COMGUI_CLIENT_READ(T)                                                                                \
    template COMGUI_EXPORT Result<T> Tickets::ReadAs<T>(TicketAddress, KeyName const&, int) const;           \
    template COMGUI_EXPORT Result<std::vector<T>> Tickets::ReadAs<std::vector<T>>(                           \
        TicketAddress, KeyName const&, int) const;
COMGUI_CLIENT_READ(int)
COMGUI_CLIENT_READ(double)
COMGUI_CLIENT_READ(std::string)
COMGUI_CLIENT_READ(Bytes)
COMGUI_CLIENT_READ(Pointer)
COMGUI_CLIENT_READ(long)
COMGUI_CLIENT_READ(unsigned long)
COMGUI_CLIENT_READ(long long)
COMGUI_CLIENT_READ(unsigned int)
COMGUI_CLIENT_READ(unsigned long long)
#undef COMGUI_CLIENT_READ
// NOLINTEND(bugprone-macro-parentheses)
}  // namespace comgui
