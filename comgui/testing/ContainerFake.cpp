#include "comgui/testing/ContainerFake.h"

#include "comgui/ticket/TICKET_ID.h"

#include <cstring>
#include <stdexcept>
#include <tuple>

namespace comgui::test
{
namespace
{
constexpr int LargestPosition = 0xFFFFFF;

// Bytes of the number behind a value word; 0 for the types that are none.
std::size_t SizeOf(PARAM_TYPE type)
{
    switch (type)
    {
    case PARAM_INT:
    case PARAM_UNSIGNED:
        return 4;
    case PARAM_DOUBLE:
    case PARAM_INT64:
    case PARAM_UNSIGNED64:
    case PARAM_POINTER:
        return 8;
    default:
        return 0;
    }
}

char const* NameOf(SLOT slot)
{
    static char const* const names[] = {"MGETPARAMETER", "MGETMULTIPAR",  "MWALKTICKETS",
                                        "MSETPARAMETER", "MSETMULTIPAR",  "MOPERATION",
                                        "MENDISNOTIF",   "MCREATETICKET", "SWALKPARAMETERS"};
    return names[static_cast<int>(slot)];
}

std::vector<std::string> CopyOf(char const* const* keys)
{
    std::vector<std::string> copy;
    for (; keys && *keys; ++keys)
        copy.emplace_back(*keys);
    return copy;
}
}  // namespace

bool operator==(CALL const& left, CALL const& right)
{
    auto const fields = [](CALL const& call)
    {
        return std::tie(call.slot, call.type, call.id, call.key, call.ptype, call.pos, call.op, call.arg,
                        call.notification, call.enable, call.keys);
    };
    return fields(left) == fields(right);
}

void PrintTo(CALL const& call, std::ostream* out)
{
    *out << NameOf(call.slot) << '(' << call.type << ", " << call.id << ", \"" << call.key << "\", type "
         << call.ptype << ", pos " << call.pos << ", op " << call.op << ", arg " << call.arg
         << ", notification " << call.notification << (call.enable ? " on" : " off") << ", "
         << call.keys.size() << " keys)";
}

ContainerFake& ContainerFake::Of(void* instance)
{
    auto* const fake = static_cast<ContainerFake*>(instance);
    if (!fake || fake->m_mark != Mark)
        throw std::logic_error("a slot of ContainerFake was called with an Instance that is not its own");
    return *fake;
}

ContainerFake::ContainerFake()
{
    m_access.Instance = this;
    m_access.MGETPARAMETER = OnGet;
    m_access.MGETMULTIPAR = OnGetTable;
    m_access.MWALKTICKETS = OnWalk;
    m_access.MSETPARAMETER = OnSet;
    m_access.MSETMULTIPAR = OnSetTable;
    m_access.MOPERATION = OnOperation;
    m_access.MENDISNOTIF = OnSwitch;
    m_access.MCREATETICKET = OnCreate;
}

bool ContainerFake::Fails(std::optional<int> pos)
{
    bool const counted = m_failIn == 0;
    if (m_failIn >= 0)
        --m_failIn;
    return counted || (pos && pos == m_failPosition);
}

void ContainerFake::AddTicket(int type, int id) { m_tickets[{type, id}]; }

bool ContainerFake::HasTicket(int type, int id) const { return m_tickets.count({type, id}) != 0; }

void ContainerFake::Put(int type, int id, char const* key, int value, int pos)
{
    Put(type, id, key, PARAM_INT, &value, pos);
}

void ContainerFake::Put(int type, int id, char const* key, double value, int pos)
{
    Put(type, id, key, PARAM_DOUBLE, &value, pos);
}

void ContainerFake::Put(int type, int id, char const* key, char const* value, int pos)
{
    Put(type, id, key, PARAM_STRING, value, pos);
}

void ContainerFake::Put(int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos)
{
    AddTicket(type, id);
    Write(type, id, key, ptype, value, pos);
}

std::optional<int> ContainerFake::Int(int type, int id, char const* key, int pos) const
{
    int value = 0;
    return Read(type, id, key, PARAM_INT, &value, pos) ? std::optional(value) : std::nullopt;
}

std::optional<double> ContainerFake::Double(int type, int id, char const* key, int pos) const
{
    double value = 0;
    return Read(type, id, key, PARAM_DOUBLE, &value, pos) ? std::optional(value) : std::nullopt;
}

std::optional<std::string> ContainerFake::Text(int type, int id, char const* key, int pos) const
{
    char const* value = nullptr;
    return Read(type, id, key, PARAM_STRING, &value, pos) ? std::optional<std::string>(value) : std::nullopt;
}

unsigned long ContainerFake::Count(int type, int id, char const* key) const
{
    unsigned long count = 0;
    return Read(type, id, key, PARAM_COUNT, &count, -1) ? count : 0;
}

bool ContainerFake::Read(int type, int id, char const* key, PARAM_TYPE ptype, void* value, int pos) const
{
    auto const ticket = m_tickets.find({type, id});
    if (!key || !value || pos < -1 || ticket == m_tickets.end() || !ticket->second.count(key))
        return false;
    VALUES const& values = ticket->second.at(key);
    int const count = values.rbegin()->first + 1;
    if (ptype == PARAM_COUNT)
        return pos == -1 && (*static_cast<unsigned long*>(value) = static_cast<unsigned long>(count), true);
    if (ptype == PARAM_NONE && pos == -1 && count > 1)
        return *static_cast<int*>(value) = PARAM_COUNT, true;

    auto const found = values.find(pos == -1 ? 0 : pos);
    if (found == values.end() || (ptype != PARAM_NONE && ptype != found->second.type))
        return false;
    VALUE const& stored = found->second;
    if (ptype == PARAM_NONE)
        *static_cast<int*>(value) = stored.type;
    else if (ptype == PARAM_STRING)
        *static_cast<char const**>(value) = nullTexts ? nullptr : stored.bytes->c_str();
    else if (ptype == PARAM_BINSTRING)
        *static_cast<BIN_STRING*>(value) = {stored.bytes->data(), stored.bytes->size()};
    else
        std::memcpy(value, &stored.number, SizeOf(ptype));
    return true;
}

std::optional<ContainerFake::VALUE> ContainerFake::Made(PARAM_TYPE ptype, void const* value)
{
    if (ptype == PARAM_POINTER)
        return VALUE{ptype, reinterpret_cast<unsigned long long>(value), nullptr};
    if (!value)
        return std::nullopt;
    if (ptype == PARAM_STRING)
        return VALUE{ptype, 0, &m_texts.emplace_back(static_cast<char const*>(value))};
    if (ptype == PARAM_BINSTRING)
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(value);
        if (!bytes.data || !bytes.size)
            return std::nullopt;
        return VALUE{ptype, 0, &m_texts.emplace_back(static_cast<char const*>(bytes.data), bytes.size)};
    }
    if (!SizeOf(ptype))
        return std::nullopt;
    VALUE number{ptype, 0, nullptr};
    std::memcpy(&number.number, value, SizeOf(ptype));
    return number;
}

bool ContainerFake::Erase(TICKET& ticket, char const* key, int pos)
{
    if (pos == -2)
        return false;
    VALUES& values = ticket[key];
    if (pos == -1)
        values.clear();
    else
        values.erase(pos);
    if (values.empty())
        ticket.erase(key);
    return true;
}

bool ContainerFake::Write(int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos)
{
    auto const ticket = m_tickets.find({type, id});
    if (!key || !*key || pos < -2 || pos > LargestPosition || ticket == m_tickets.end())
        return false;
    if (ptype == PARAM_NONE)
        return !value && Erase(ticket->second, key, pos);
    auto const made = Made(ptype, value);
    if (!made)
        return false;
    VALUES& values = ticket->second[key];
    if (pos == -1)
        values.clear();
    if (pos == -2)
        pos = values.empty() ? 0 : values.rbegin()->first + 1;
    if (pos > LargestPosition)
        return false;
    values.insert_or_assign(pos == -1 ? 0 : pos, *made);
    return true;
}

int ContainerFake::WalkValues(int type, int id, SWALKPARAMETERS_ACTION action, void* context,
                              char const* prefix)
{
    std::string const beginning = prefix ? prefix : "";
    calls.push_back({SLOT::WALKVALUES, type, id, beginning});
    if (Fails({}) || !action || !HasTicket(type, id))
        return 0;
    TICKET const ticket = m_tickets.at({type, id});  // the action may write to it
    for (auto const& [key, values] : ticket)
        for (auto const& [pos, value] : values)
        {
            BIN_STRING binary;
            void const* word =
                &m_numbers.emplace_back(value.number);  // little-endian: a short number's bytes come first
            if (value.type == PARAM_POINTER)
                word = reinterpret_cast<void const*>(value.number);
            else if (value.type == PARAM_STRING)
                word = value.bytes->c_str();
            else if (value.type == PARAM_BINSTRING)
                word = &(binary = {value.bytes->data(), value.bytes->size()});
            if (key.starts_with(beginning) && !action(context, key.c_str(), value.type, word, pos))
                return success;
        }
    return success;
}

bool ContainerFake::Get(CALL call, char const* key, void* value)
{
    calls.push_back(call);
    return !Fails(call.pos) && Read(call.type, call.id, key, call.ptype, value, call.pos);
}

bool ContainerFake::Set(CALL call, char const* key, void const* value)
{
    calls.push_back(call);
    return !Fails(call.pos) && Write(call.type, call.id, key, call.ptype, value, call.pos);
}

int ContainerFake::OnGet(void* instance, int type, int id, char const* key, PARAM_TYPE ptype, void* value,
                         int pos)
{
    ContainerFake& fake = Of(instance);
    return fake.Get({SLOT::GET, type, id, key ? key : "", ptype, pos}, key, value) ? fake.success : 0;
}

int ContainerFake::OnGetTable(void* instance, int type, int id, GETMULTIPAR* table)
{
    ContainerFake& fake = Of(instance);
    fake.calls.push_back({SLOT::GETTABLE, type, id});
    bool const told = fake.Fails({});
    for (GETMULTIPAR* record = table; record && record->key; ++record)
        record->ok = !told && fake.Get({SLOT::GET, type, id, record->key, record->type, record->pos},
                                       record->key, record->value);
    return table && !told ? fake.success : 0;
}

int ContainerFake::OnSet(void* instance, int type, int id, char const* key, PARAM_TYPE ptype,
                         void const* value, int pos)
{
    ContainerFake& fake = Of(instance);
    return fake.Set({SLOT::SET, type, id, key ? key : "", ptype, pos}, key, value) ? fake.success : 0;
}

int ContainerFake::OnSetTable(void* instance, int type, int id, SETMULTIPAR* table)
{
    ContainerFake& fake = Of(instance);
    fake.calls.push_back({SLOT::SETTABLE, type, id});
    bool const refused = fake.Fails({}) || !fake.HasTicket(type, id);
    for (SETMULTIPAR* record = table; record && record->key; ++record)
        record->ok = !refused && fake.Set({SLOT::SET, type, id, record->key, record->type, record->pos},
                                          record->key, record->value);
    return table && !refused ? fake.success : 0;
}

int ContainerFake::OnWalk(void* instance, MWALKTICKETS_ACTION action, void* context, int type)
{
    ContainerFake& fake = Of(instance);
    fake.calls.push_back({SLOT::WALK, type});
    if (fake.Fails({}) || !action)
        return 0;
    std::vector<int> ids;  // the action may change the container
    for (auto const& [address, ticket] : fake.m_tickets)
        if (address.first == type)
            ids.push_back(address.second);
    for (int const id : ids)
        if (!action(context, type, id, &fake.m_ticket))
            break;
    return fake.success;
}

int ContainerFake::OnOperation(void* instance, int type, int id, TICKET_OP op, void* arg)
{
    ContainerFake& fake = Of(instance);
    fake.calls.push_back({SLOT::OPERATION, type, id, {}, PARAM_NONE, 0, op.GetInt(), arg});
    if (fake.Fails({}))
        return 0;
    if (op.GetInt() == MTICKET_OP_DELETE)
        return type != 0 && fake.m_tickets.erase({type, id}) ? fake.success : 0;
    if (op.GetInt() == MTICKET_OP_FOLDER_VARIABLES && fake.folders)
    {
        *static_cast<clFOLDER_VARIABLES**>(arg) = fake.folders;
        return fake.success;
    }
    if (op.GetInt() == MTICKET_OP_CREATE_NEXT && id == TICKET_ID_NEXT)
    {
        int next = 1;
        while (fake.HasTicket(type, next))
            ++next;
        fake.AddTicket(type, next);
        *static_cast<int*>(arg) = next;
        return fake.success;
    }
    if (op.GetInt() != MTICKET_OP_OPEN || !arg || !fake.HasTicket(type, id))
        return 0;
    *static_cast<STICKET_ACCESS const**>(arg) = fake.opened ? fake.opened : &fake.m_ticket;
    return fake.success;
}

int ContainerFake::OnSwitch(void* instance, int type, int id, int notification, bool enable,
                            char const* const* keys)
{
    ContainerFake& fake = Of(instance);
    fake.calls.push_back(
        {SLOT::SWITCH, type, id, {}, PARAM_NONE, 0, 0, nullptr, notification, enable, CopyOf(keys)});
    return fake.Fails({}) ? 0 : fake.success;
}

STICKET_ACCESS const* ContainerFake::OnCreate(void* instance, int type, int id, char const* const* keys)
{
    ContainerFake& fake = Of(instance);
    CALL call{SLOT::CREATE, type, id};
    call.keys = CopyOf(keys);
    fake.calls.push_back(call);
    if (fake.Fails({}))
        return nullptr;
    fake.AddTicket(type, id);
    return &fake.m_ticket;
}
}  // namespace comgui::test
